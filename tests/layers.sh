#!/usr/bin/env bash
# The library's folders are layers that include one way only. A folder may
# include the public headers (tplex/), its own headers and those of the
# folders below it, in the order of TPLEX_LAYERS in CMakeLists.txt (bottom
# first). The tool (tools/) includes the public headers and its own files
# only. Prints every include against the order and fails if there is one.
#
#   tests/layers.sh [ROOT]
set -euo pipefail
cd "${1:-$(dirname "$0")/..}"

read -r -a layers <<<"$(sed -n 's/^set(TPLEX_LAYERS \(.*\))$/\1/p' CMakeLists.txt)"
if [ ${#layers[@]} -eq 0 ]; then
    echo "layers.sh: no set(TPLEX_LAYERS ...) in CMakeLists.txt" >&2
    exit 2
fi
declare -A rank
for i in "${!layers[@]}"; do rank[${layers[$i]}]=$i; done

# allowed FOLDER TARGET: may a file in FOLDER include "TARGET"?
allowed() {
    local folder=$1 target=$2 dir=${2%%/*}
    [ "$dir" = tplex ] && return 0
    if [ "$folder" = tools ]; then
        [ "$dir" = "$target" ]  # a file of the tool's own, named without a folder
    else
        [ -n "${rank[$dir]:-}" ] && [ "${rank[$dir]}" -le "${rank[$folder]}" ]
    fi
}

faults=0
for folder in "${layers[@]}" tools; do
    for file in "$folder"/*.h "$folder"/*.cpp; do
        [ -e "$file" ] || continue
        while IFS=: read -r line include; do
            target=${include#*\"} target=${target%\"*}
            if ! allowed "$folder" "$target"; then
                echo "$file:$line: includes \"$target\" against the layers (${layers[*]})"
                faults=$((faults + 1))
            fi
        done < <(grep -n '^#include "' "$file" || true)
    done
done
[ "$faults" -eq 0 ]
