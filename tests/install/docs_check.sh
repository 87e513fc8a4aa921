#!/usr/bin/env bash
# Doxygen over the installed headers: every installed declaration must be documented.
#   docs_check.sh BUILD_DIR SOURCE_DIR            warnings only (no output): fails on any
#   docs_check.sh BUILD_DIR SOURCE_DIR --html DIR the HTML reference into DIR/html
set -euo pipefail
build="$1"
source="$2"
work="$(mktemp -d)"
trap 'rm -rf "$work"' EXIT

cmake --install "$build" --prefix "$work/prefix" >/dev/null
version="$(sed -n 's/^project(ZYRStd VERSION \([0-9.]*\).*/\1/p' "$source/CMakeLists.txt")"
html=NO
output="$work/out"
if [ "${3:-}" = "--html" ]; then
    html=YES
    output="$4"
    mkdir -p "$output"
fi
sed -e "s|@VERSION@|$version|" -e "s|@OUTPUT@|$output|" \
    -e "s|@INCLUDE@|$work/prefix/include/zyrstd|g" -e "s|@README@|$source/README.md|g" \
    -e "s|@HTML@|$html|" -e "s|@XML@|NO|" -e "s|@WARN_AS_ERROR@|NO|" \
    "$source/docs/Doxyfile.in" >"$work/Doxyfile"
# Without an output format doxygen still parses everything and warns.
[ "$html" = NO ] && echo "GENERATE_XML = YES" >>"$work/Doxyfile"
doxygen "$work/Doxyfile" 2>"$work/warnings" >/dev/null
# Warnings name the installed copy; point them back at the tree.
sed -i "s|$work/prefix/include/zyrstd/|include/|" "$work/warnings"
if [ -s "$work/warnings" ]; then
    head -n 60 "$work/warnings"
    echo "$(wc -l <"$work/warnings") documentation warnings (the first 60 above)"
    exit 1
fi
[ "$html" = YES ] && echo "reference written: $output/html/index.html"
exit 0
