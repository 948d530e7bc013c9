#!/usr/bin/env bash
# The library's folders are layers that include one way only: a folder may
# include the public headers (tplex/), its own headers and those of the
# folders below it, in the order of TPLEX_LAYERS in CMakeLists.txt (bottom
# first). The tool (tools/) includes the public headers and its own files
# only. Prints every include against the order and fails if there is one.
#
#   tests/layers.sh [ROOT]
set -euo pipefail
cd "${1:-$(dirname "$0")/..}"
read -r -a layers <<<"$(sed -n 's/^set(TPLEX_LAYERS \(.*\))$/\1/p' CMakeLists.txt)"
[ ${#layers[@]} -gt 0 ] || { echo "layers.sh: no set(TPLEX_LAYERS ...) in CMakeLists.txt" >&2; exit 2; }
declare -A rank=([tplex]=-1)
for i in "${!layers[@]}"; do rank[${layers[$i]}]=$i; done

faults=0
for folder in "${layers[@]}" tools; do
    for file in "$folder"/*.h "$folder"/*.cpp; do
        [ -e "$file" ] || continue
        while IFS=: read -r line include; do
            target=${include#*\"} target=${target%\"*} dir=${target%%/*}
            if [ "$folder" = tools ]; then  # tplex/... or a file of its own, without a folder
                [ "$dir" = tplex ] || [ "$dir" = "$target" ] && continue
            elif [ -n "${rank[$dir]:-}" ] && [ "${rank[$dir]}" -le "${rank[$folder]}" ]; then
                continue
            fi
            echo "$file:$line: includes \"$target\" against the layers (${layers[*]})"
            faults=$((faults + 1))
        done < <(grep -n '^#include "' "$file" || true)
    done
done
[ "$faults" -eq 0 ]
