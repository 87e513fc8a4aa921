#!/usr/bin/env bash
# Installs the build into a fresh prefix, moves the prefix, and checks what a new user
# does there: the tool starts without LD_LIBRARY_PATH, and a program including ZYRStd.h
# builds and runs through pkg-config and through find_package.
set -euo pipefail
build="$1"
here="$2"
work="$(mktemp -d)"
trap 'rm -rf "$work"' EXIT
unset LD_LIBRARY_PATH

cmake --install "$build" --prefix "$work/first" >/dev/null
# Relocatable: nothing may remember where it was installed.
mv "$work/first" "$work/prefix"
prefix="$work/prefix"

"$prefix/bin/zyrstd" --help >/dev/null
# The manual page, with the version filled in, where man looks beside bin/.
grep -q '^\.TH ZYRSTD 1 .*ZYRStd [0-9]' "$prefix/share/man/man1/zyrstd.1" || {
    echo "no manual page with a version under share/man/man1"; exit 1
}
if command -v man >/dev/null; then
    MANPATH="$prefix/share/man" man zyrstd 2>/dev/null | grep -q 'EXIT STATUS' || {
        echo "man zyrstd shows no manual page"; exit 1
    }
fi

# Only the interface is installed.
if find "$prefix/include" -name '*.cpp' | grep -q .; then
    echo "sources installed"; exit 1
fi
source="$(cd "$here/../.." && pwd)"
while read -r internal; do
    if find "$prefix/include" -name "$(basename "$internal")" | grep -q .; then
        echo "internal header installed: $internal"; exit 1
    fi
done < <(find "$source/source" -path '*/internal/*' -o -path '*/posix/*' -name '*.h')
if grep -rlE '#include <(unicode|boost)/' "$prefix/include"; then
    echo "an installed header needs ICU or Boost"; exit 1
fi

pcdir="$(dirname "$(find "$prefix" -name zyrstd.pc)")"
export PKG_CONFIG_PATH="$pcdir"
if ! pkg-config --cflags zyrstd | grep -q -- "$prefix"; then
    echo "zyrstd.pc does not point into the prefix: $(pkg-config --cflags zyrstd)"; exit 1
fi
# shellcheck disable=SC2046
g++ -std=c++20 "$here/consumer/app.cpp" -o "$work/app-pc" \
    $(pkg-config --cflags --libs zyrstd-hostkit) -Wl,-rpath,"$(dirname "$pcdir")"
"$work/app-pc"

cmake -S "$here/consumer" -B "$work/consumer" -G Ninja -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$work/consumer" >/dev/null
"$work/consumer/app"

# The worked examples, each built against the prefix and run.
cmake -S "$here/../../examples" -B "$work/examples" -G Ninja -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$work/examples" >/dev/null
for example in startup flush_client values setup_and_trace ascii85_file; do
    TMPDIR="$work" "$work/examples/$example" >"$work/$example.out" 2>&1 || {
        cat "$work/$example.out"; echo "example $example failed"; exit 1
    }
done

# The demo logs analytics through the libKelvrin.so installed beside the library; without
# it (a host that ships none) the demo still runs and analytics stay inactive.
export TMPDIR="$work"
out="$("$prefix/bin/zyrstd" demo)"
grep -q "session file: $work/.*\.jsonl" <<<"$out" || {
    echo "the installed demo wrote no telemetry session"; exit 1
}
if ! /sbin/ldconfig -p | grep -q libKelvrin.so; then
    rm -f "$prefix"/lib/libKelvrin.so*
    out="$("$prefix/bin/zyrstd" demo)" || { echo "the demo fails without libKelvrin.so"; exit 1; }
    grep -q "libKelvrin.so was not found: analytics stay inactive" <<<"$out" || {
        echo "without libKelvrin.so the demo did not say that analytics stay inactive"; exit 1
    }
fi
echo "install test: ok"
