#!/usr/bin/env bash
# readme_words.sh WORD_TABLE README: README.md's tables of reserved words and
# hash words (between the two markers) are word_table's output, the library's
# own; TPLEX_UPDATE_EXPECTED=1 rewrites README.md instead.
set -u
begin='<!-- word tables: tests/tools/word_table.cpp writes them -->' end='<!-- end of word tables -->'
tables=$("$1") || { echo "FAILED: word_table exited with $?"; exit 1; }
if [ "${TPLEX_UPDATE_EXPECTED:-0}" = 1 ]; then
    awk -v b="$begin" -v e="$end" -v t="$tables" '$0 == e { skip = 0 } !skip { print }
        $0 == b { print t; skip = 1 }' "$2" >"$2.new" && mv "$2.new" "$2"
fi
diff -u <(echo "$tables") <(awk -v b="$begin" -v e="$end" '$0 == e { on = 0 } on { print } $0 == b { on = 1 }' "$2") ||
    { echo "FAILED: README.md's word tables differ from the library's"; exit 1; }
