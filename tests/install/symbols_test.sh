#!/usr/bin/env bash
# The library's dynamic symbols are its interface: the designed namespaces and classes and
# their run-time type records, defined strongly; no standard-library instantiation, no
# internal helper and no weak copy of an inline function.
set -euo pipefail
library="$1"
allowed='^(ZYRStd|ZYRPublic|ZYRStreams|ZYRFileSys|ZYRFileName|ZYRWinFileSys|ZYROEMFileSys|VariableSizeAllocator|FixedSizeAllocator)(::|$)'
status=0
count=0
while read -r type name; do
    count=$((count + 1))
    bare="$name"
    for prefix in "typeinfo name for " "typeinfo for " "vtable for " "VTT for " \
                  "non-virtual thunk to " "virtual thunk to "; do
        bare="${bare#"$prefix"}"
    done
    if ! [[ "$bare" =~ $allowed ]]; then
        echo "outside the interface: $type $name"
        status=1
    fi
    # Vague-linkage type records (V) are weak by nature; functions must not be.
    if [[ "$type" == W || "$type" == w || "$type" == u ]]; then
        echo "weak or unique symbol: $type $name"
        status=1
    fi
done < <(nm -D --defined-only -C "$library" | sed -E 's/^[0-9a-f]+ //; s/^([A-Za-z]) /\1\t/' |
         awk -F'\t' '{print $1 " " $2}')
if [ "$count" -lt 100 ]; then
    echo "only $count dynamic symbols: is this the library?"
    status=1
fi
[ "$status" -eq 0 ] && echo "$count exported symbols, all in the interface"
exit "$status"
