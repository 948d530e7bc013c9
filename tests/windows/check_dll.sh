#!/usr/bin/env bash
# Checks the binary interface of tplex.dll from its headers and code:
#   - the export table holds exactly the sixteen names, undecorated;
#   - it imports nothing but Windows' own DLLs (no MinGW runtime DLLs), and
#     neither do the programs named after it (the tool);
#   - each exported function is caller-cleans (__cdecl): a callee-cleans
#     function ends in "ret $n" and carries an "@n" suffix in its symbol.
#
#   check_dll.sh OBJDUMP DLL [PROGRAM...]
set -euo pipefail
objdump=$1
dll=$2
shift 2

expected="back_token
dict_check
dict_extend
lex_free
lex_initialise
open_source_file
parse_ident
rewind_input
sc_lex_init
sc_lex_init_defines
sc_lex_init_file
sc_lex_setup
sc_next_token
sg_DisplayError
sg_GetError
sg_closesources"
allowed_imports="kernel32.dll msvcrt.dll"

failed=0
fail() { echo "FAIL: $*"; failed=1; }

headers=$("$objdump" -p "$dll")

# "[Ordinal/Name Pointer] Table" lists the exported names, one a line.
names=$(awk '/^\[Ordinal\/Name Pointer\] Table/ { on = 1; next }
             on && /^[[:space:]]*\[ *[0-9]+\]/ { print $NF; next }
             on { on = 0 }' <<<"$headers" | LC_ALL=C sort)
if [ "$names" != "$(LC_ALL=C sort <<<"$expected")" ]; then
    fail "export names differ from the sixteen:"
    diff <(LC_ALL=C sort <<<"$expected") <(echo "$names") | sed 's/^/    /' || true
fi

# Every exported address has a name: no exports by ordinal only.
addresses=$(grep -c 'Export RVA' <<<"$headers" || true)
[ "$addresses" = 16 ] || fail "export address table has $addresses entries, not 16"

imports_of() { awk '/DLL Name:/ { print tolower($3) }' | sort -u; }
check_imports() {  # file, its imports
    for dll_name in $2; do
        case " $allowed_imports " in
            *" $dll_name "*) ;;
            *) fail "$(basename "$1") imports $dll_name" ;;
        esac
    done
}
imports=$(imports_of <<<"$headers")
check_imports "$dll" "$imports"
for program in "$@"; do
    check_imports "$program" "$("$objdump" -p "$program" | imports_of)"
done

# The code of each export, up to the next symbol.
code=$("$objdump" -d --no-show-raw-insn "$dll")
for name in $expected; do
    body=$(awk -v label="<_${name}>:" '$2 == label { on = 1; next }
                                       on && /^[0-9a-f]+ <.*>:$/ { exit }
                                       on { print }' <<<"$code")
    if [ -z "$body" ]; then
        fail "no code under the symbol _$name (decorated, or the DLL stripped?)"
    elif grep -Eq '[[:space:]]ret[lw]?[[:space:]]+\$' <<<"$body"; then
        fail "$name removes its own arguments (ret \$n): not __cdecl"
    fi
done

if [ "$failed" -ne 0 ]; then
    echo "tplex.dll: binary interface check failed"
    exit 1
fi
echo "tplex.dll: 16 undecorated __cdecl exports; it and $# program(s) import only: $allowed_imports"
