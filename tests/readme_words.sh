#!/usr/bin/env bash
# README's tables of reserved words and hash words hold what the library
# holds: the reserved words of tplex/services.h in code order (the list the
# keyword table is built from) and the hash word codes of tplex/lexer.h.
set -euo pipefail
cd "$(dirname "$0")/.."
library=$({
    sed -n 's/^ *X(rw_[a-z0-9_]*, *"\(.*\)").*/\1/p' include/tplex/services.h | awk '{ print NR - 1, $0 }'
    sed -n 's/^ *hw_\([a-z]*\) = \([0-9]*\).*/\2 #\1/p' include/tplex/lexer.h | tr 'a-z' 'A-Z'
} | sort -n)
readme=$(sed -n '/<!-- word tables/,/<!-- end of word tables/p' README.md |
    grep -o '| [0-9]* | `[^`]*`' | sed 's/^| \([0-9]*\) | `\(.*\)`$/\1 \2/' | sort -n)
if [ "$library" != "$readme" ] || [ "$(wc -l <<<"$library")" != 123 ]; then
    echo "README's word tables differ from the library's lists:"
    diff <(echo "$library") <(echo "$readme") || true
    exit 1
fi
echo "README: the 118 reserved words and 5 hash words as the library holds them"
