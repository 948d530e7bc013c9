#!/usr/bin/env bash
# Checks the binary interface of tplex.dll from its headers and code:
#   - the export table holds exactly the sixteen names, undecorated;
#   - it imports nothing but Windows' own DLLs (no MinGW runtime DLLs), and
#     neither do the programs named after it (the tool);
#   - each exported function is caller-cleans (__cdecl): a callee-cleans
#     function ends in "ret $n" and carries an "@n" suffix in its symbol
#     (32-bit only: x86-64 Windows has one calling convention);
#   - loading it runs no code of the library's own: its constructor list
#     holds nothing but the runtime's registration of unwind tables.
# The DLL may be the 32-bit one (pei-i386) or the 64-bit one (pei-x86-64).
#
#   check_dll.sh OBJDUMP DLL [PROGRAM...]
set -euo pipefail
objdump=$1
dll=$2
shift 2

expected=$(cat "$(dirname "$0")/../exports.txt")  # the sixteen, one a line
allowed_imports="kernel32.dll msvcrt.dll"

failed=0
fail() { echo "FAIL: $*"; failed=1; }

headers=$("$objdump" -p "$dll")
# 32-bit symbols carry a leading underscore; pointers are 4 or 8 bytes.
case $("$objdump" -f "$dll") in
    *pei-i386*) bits=32 prefix=_ pointer=4 convention=" __cdecl" ;;
    *pei-x86-64*) bits=64 prefix= pointer=8 convention="" ;;
    *) echo "FAIL: $dll is neither a 32-bit nor a 64-bit x86 Windows DLL"; exit 1 ;;
esac

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

# The constructor list: all ones, the constructors' addresses, zero; each
# entry a pointer, little-endian.
symbols=$("$objdump" -t "$dll")
symbol_field() {  # name, field: "sec" number or "value"
    awk -v name="$1" -v field="$2" '$NF == name {
        if (field == "sec") { match($0, /\(sec +[0-9]+\)/); s = substr($0, RSTART + 4, RLENGTH - 5); print s + 0 }
        else print $(NF - 1)
        exit }' <<<"$symbols"
}
list=$(symbol_field ${prefix}__CTOR_LIST__ value)
list_end=$(symbol_field ${prefix}__DTOR_LIST__ value)
section=$(symbol_field ${prefix}__CTOR_LIST__ sec)
if [ -z "$list" ] || [ -z "$list_end" ]; then
    fail "no constructor list found (the DLL stripped?)"
else
    section_name=$("$objdump" -h "$dll" | awk -v n=$((section - 1)) '$1 == n { print $2 }')
    vma=$("$objdump" -h "$dll" | awk -v n=$((section - 1)) '$1 == n { print $4 }')
    bytes=$("$objdump" -s -j "$section_name" --start-address=$((0x$vma + list)) \
        --stop-address=$((0x$vma + list_end)) "$dll" |
        awk '/^ [0-9a-f]+ / { for (i = 2; i <= 5 && length($i) == 8 && $i ~ /^[0-9a-f]+$/; ++i) printf "%s", $i }')
    all_ones=$(printf 'f%.0s' $(seq $((2 * pointer))))
    for ((at = 0; at + 2 * pointer <= ${#bytes}; at += 2 * pointer)); do
        entry=${bytes:at:2*pointer} word=
        for ((b = 2 * pointer - 2; b >= 0; b -= 2)); do word+=${entry:b:2}; done
        [ "$word" = "$all_ones" ] && continue
        address=$((0x$word))
        [ "$address" = 0 ] && continue
        offset=$(printf "0x%0$((2 * pointer))x" $((address - 0x$vma)))
        name=$(awk -v sec="$(printf '(sec %2d)' "$section")" -v value="$offset" \
            'index($0, sec) && $(NF - 1) == value && $0 ~ /\(ty +20\)/ { print $NF; exit }' <<<"$symbols")
        case "${name#"$prefix"}" in
            register_frame_ctor) ;;
            *) fail "loading the DLL runs ${name:-the code at $offset}" ;;
        esac
    done
fi

if [ "$failed" -ne 0 ]; then
    echo "tplex.dll: binary interface check failed"
    exit 1
fi
echo "tplex.dll ($bits-bit): 16 undecorated${convention} exports; it and $# program(s) import only: $allowed_imports"
