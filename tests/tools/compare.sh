#!/usr/bin/env bash
# Runs the tool and compares its standard output and exit status with the
# expected ones:
#
#   compare.sh TOOL EXPECTED_FILE EXPECTED_STATUS ARGS...
#
# Run in the folder the arguments are relative to; standard input is empty.
# With TPLEX_UPDATE_EXPECTED=1 the expected file is rewritten instead.
set -u
tool=$1 expected=$2 status=$3
shift 3
actual=$(mktemp)
trap 'rm -f "$actual"' EXIT

"$tool" "$@" </dev/null >"$actual"
rc=$?
# On Windows the tool shows its paths with "\" (doubled in JSON), where the
# expected files, written on POSIX, have "/"; the examples' paths all go
# through the folder include.
if [ "${TPLEX_TARGET_SYSTEM:-}" = Windows ]; then
    sed -i 's#include\\\{1,2\}#include/#g' "$actual"
fi

if [ "${TPLEX_UPDATE_EXPECTED:-0}" = 1 ]; then
    cp "$actual" "$expected"
    echo "updated $expected (exit status $rc)"
fi
ok=1
if [ "$rc" != "$status" ]; then
    echo "exit status $rc, expected $status: tplex $*"
    ok=0
fi
if ! diff -u "$expected" "$actual"; then
    echo "output differs from $expected: tplex $*"
    ok=0
fi
[ $ok = 1 ]
