#!/usr/bin/env bash
# Checks the binary interface of tplex.dll (32-bit pei-i386 or 64-bit
# pei-x86-64) from its headers and code:
#   - the export table holds exactly the sixteen names, undecorated, and no
#     export by ordinal only;
#   - it imports nothing but Windows' own DLLs (no MinGW runtime DLLs), and
#     neither do the programs named after it (the tool);
#   - each export is caller-cleans (__cdecl): no "ret $n" in its code (32-bit
#     only: x86-64 Windows has one calling convention);
#   - loading it runs no code of the library's own (no dynamic initialisers).
#
#   check_dll.sh OBJDUMP DLL [PROGRAM...]
set -euo pipefail
objdump=$1 dll=$2
shift 2
expected=$(LC_ALL=C sort "$(dirname "$0")/../exports.txt")  # the sixteen, one a line
allowed_imports="kernel32.dll msvcrt.dll"
failed=0
fail() { echo "FAIL: $*"; failed=1; }

headers=$("$objdump" -p "$dll")
case $("$objdump" -f "$dll") in  # 32-bit symbols carry a leading underscore
    *pei-i386*) bits=32 prefix=_ convention=" __cdecl" ;;
    *pei-x86-64*) bits=64 prefix= convention="" ;;
    *) echo "FAIL: $dll is neither a 32-bit nor a 64-bit x86 Windows DLL"; exit 1 ;;
esac

# "[Ordinal/Name Pointer] Table" lists the exported names, one a line.
names=$(awk '/^\[Ordinal\/Name Pointer\] Table/ { on = 1; next }
             on && /^[[:space:]]*\[ *[0-9]+\]/ { print $NF; next }
             on { on = 0 }' <<<"$headers" | LC_ALL=C sort)
[ "$names" = "$expected" ] || fail "export names differ from the sixteen:" \
    "$(diff <(echo "$expected") <(echo "$names") || true)"
addresses=$(grep -c 'Export RVA' <<<"$headers" || true)
[ "$addresses" = 16 ] || fail "export address table has $addresses entries, not 16"

for file in "$dll" "$@"; do
    for name in $("$objdump" -p "$file" | awk '/DLL Name:/ { print tolower($3) }' | sort -u); do
        [[ " $allowed_imports " == *" $name "* ]] || fail "$(basename "$file") imports $name"
    done
done

# The code of each export, up to the next symbol.
code=$("$objdump" -d --no-show-raw-insn "$dll")
[ $bits = 64 ] && echo "skipped: the __cdecl check (x86-64 Windows has one calling convention)"
for name in $expected; do
    body=$(awk -v label="<${prefix}${name}>:" '$2 == label { on = 1; next }
                                       on && /^[0-9a-f]+ <.*>:$/ { exit }
                                       on { print }' <<<"$code")
    if [ -z "$body" ]; then
        fail "no code under the symbol ${prefix}$name (decorated, or the DLL stripped?)"
    elif [ $bits = 32 ] && grep -Eq '[[:space:]]ret[lw]?[[:space:]]+\$' <<<"$body"; then
        fail "$name removes its own arguments (ret \$n): not __cdecl"
    fi
done

# GCC names the function that initialises a file's non-constant globals
# _GLOBAL__sub_I_*; the DLL must have none.
initialisers=$("$objdump" -t "$dll" | grep -o '_GLOBAL__sub_I_[A-Za-z0-9_.]*' || true)
[ -z "$initialisers" ] || fail "loading the DLL runs" $initialisers

[ "$failed" = 0 ] || { echo "tplex.dll: binary interface check failed"; exit 1; }
echo "tplex.dll ($bits-bit): 16 undecorated${convention} exports; it and $# program(s) import only: $allowed_imports"
