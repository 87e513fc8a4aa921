#!/usr/bin/env bash
# The exported interface against its baseline (abi/libZYRStd.abi). Additions pass; a removed
# or changed function or variable, or a changed record layout or virtual table, fails with
# abidiff's report. `make abi-baseline` records a deliberate change (see the README).
# Usage: abi_test.sh BUILD_DIR BASELINE [--write]
set -euo pipefail
build="$1"
baseline="$2"
work="$(mktemp -d)"
trap 'rm -rf "$work"' EXIT

cmake --install "$build" --prefix "$work/prefix" >/dev/null
library="$(find "$work/prefix" -name 'libZYRStd.so.*.*' | head -n 1)"
abidw --headers-dir "$work/prefix/include/zyrstd" --no-corpus-path --no-show-locs \
      --no-comp-dir-path --drop-private-types --exported-interfaces-only --type-id-style hash \
      "$library" >"$work/current.abi"
if [ "${3:-}" = "--write" ]; then
    cp "$work/current.abi" "$baseline"
    echo "baseline written: $baseline"
    exit 0
fi

status=0
abidiff "$baseline" "$work/current.abi" >"$work/report" || status=$?
# abidiff's status bits: 1 error, 2 usage error, 4 a change, 8 an incompatible change.
if (( status & 3 )); then
    cat "$work/report"; echo "abidiff could not compare (status $status)"; exit 1
fi
if (( status & 8 )) || grep -qE '^(Functions|Variables) changes summary: ([1-9][0-9]* Removed|[0-9]+ Removed, [1-9][0-9]* Changed)' "$work/report"; then
    cat "$work/report"
    echo "the exported interface changed incompatibly: see above (make abi-baseline records a deliberate change)"
    exit 1
fi
if (( status & 4 )); then
    echo "additions only:"; grep -E 'changes summary' "$work/report"
fi
exit 0
