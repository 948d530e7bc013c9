#!/usr/bin/env bash
# The shared library's dynamic symbol table defines the sixteen exports of
# tplex/lexer.h and nothing else.
#
#   exports.sh LIBRARY
set -u
lib=$1
expected=$(LC_ALL=C sort "$(dirname "$0")/../exports.txt")  # the sixteen, one a line
actual=$(nm -D --defined-only "$lib" | awk 'NF == 3 { print $3 }' | LC_ALL=C sort)
diff <(echo "$expected") <(echo "$actual") ||
    { echo "FAILED: the dynamic symbols of $lib differ from the sixteen exports"; exit 1; }
echo "1 passed, 0 failed: $lib defines exactly the sixteen exports"
