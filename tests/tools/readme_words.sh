#!/usr/bin/env bash
# README.md's tables of reserved words and hash words are what the library
# holds: the lines between the two markers below equal word_table's output.
# With TPLEX_UPDATE_EXPECTED=1 README.md is rewritten instead.
#
#   readme_words.sh WORD_TABLE README
set -u
program=$1 readme=$2
begin='<!-- word tables: tests/tools/word_table.cpp writes them -->'
end='<!-- end of word tables -->'
tables=$(mktemp)
trap 'rm -f "$tables"' EXIT
"$program" >"$tables" || { echo "FAILED: word_table exited with $?"; exit 1; }

if [ "${TPLEX_UPDATE_EXPECTED:-0}" = 1 ]; then
    awk -v b="$begin" -v e="$end" -v t="$tables" '
        $0 == e { skip = 0 }
        !skip { print }
        $0 == b { while ((getline line < t) > 0) print line; skip = 1 }' "$readme" >"$readme.new" &&
        mv "$readme.new" "$readme"
    echo "updated $readme"
fi
if diff -u "$tables" <(awk -v b="$begin" -v e="$end" '$0 == e { on = 0 } on { print } $0 == b { on = 1 }' "$readme"); then
    echo "1 passed, 0 failed"
else
    echo "FAILED: README.md's word tables differ from the library's (TPLEX_UPDATE_EXPECTED=1 rewrites them)"
    exit 1
fi
