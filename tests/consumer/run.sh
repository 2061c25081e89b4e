#!/usr/bin/env bash
# Installs the build into a scratch prefix, as a user would, and checks what a user meets there: the installed
# tool runs without any environment, a consumer builds with find_package and with pkg-config, and the README's
# example builds and runs on a 12-bit JPEG image, a file without images, a text file and (with the corpus) a
# JPEG 2000 file, ending with a result or a clean error, never an abort.
#   run.sh BUILD_DIR CONSUMER_SOURCE_DIR CXX INPUT_MAKER README
set -euo pipefail
build=$1
source=$2
cxx=$3
inputs_maker=$4
readme=$5
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake --install "$build" --prefix "$work/prefix" >/dev/null
prefix="$work/prefix"
"$inputs_maker" "$work"

# The installed tool finds its libraries from its own place.
env -u LD_LIBRARY_PATH "$prefix/bin/nitf" info "$work/jpeg12.ntf" >/dev/null

cmake -S "$source" -B "$work/consumer" -DCMAKE_PREFIX_PATH="$prefix" -DCMAKE_CXX_COMPILER="$cxx" \
    -DCMAKE_CXX_FLAGS="${CONSUMER_FLAGS:-}" >/dev/null
cmake --build "$work/consumer" >/dev/null
"$work/consumer/consumer" "$work/fields.bin"

# pkg-config gives the flags a Makefile-based application would use.
export PKG_CONFIG_PATH="$prefix/lib/pkgconfig:$prefix/lib64/pkgconfig"
flags=$(pkg-config --cflags --libs nitf)
libdir=$(pkg-config --variable=libdir nitf)
"$cxx" -std=c++17 ${CONSUMER_FLAGS:-} "$source/main.cpp" -o "$work/consumer-pc" $flags -Wl,-rpath,"$libdir"
"$work/consumer-pc" "$work/fields2.bin" >/dev/null

# The README's example, exactly as the README shows it.
awk '/^```cpp$/ {inside = 1; next} /^```$/ && inside {exit} inside {print}' "$readme" >"$work/example.cpp"
"$cxx" -std=c++17 ${CONSUMER_FLAGS:-} "$work/example.cpp" -o "$work/example" $flags -Wl,-rpath,"$libdir"

# Runs the example on a file; `expect` is "ok" (status 0) or "error" (status 1 with a message naming the file).
run_example() {
    local file=$1 expect=$2 status=0
    "$work/example" "$file" >"$work/out.txt" 2>"$work/err.txt" || status=$?
    case "$expect:$status" in
    ok:0 | error:1) ;;
    *)
        echo "README example on $file: exit status $status (expected $expect)" >&2
        cat "$work/out.txt" "$work/err.txt" >&2
        exit 1
        ;;
    esac
    if [ "$status" = 1 ] && ! grep -q "$file" "$work/err.txt"; then
        echo "README example on $file: the error does not name the file" >&2
        exit 1
    fi
    echo "README example on $(basename "$file"): $(cat "$work/out.txt" "$work/err.txt" | head -1)"
}
run_example "$work/jpeg12.ntf" ok
run_example "$work/no-images.ntf" ok
run_example "$work/text.txt" error
corpus=${NITF_TEST_DATA:-$(dirname "$readme")/../shared/testdata}
j2k="$corpus/jpeg2000/001_006_64x64_s_8_1_mono_j2c.ntf"
if [ -f "$j2k" ]; then
    run_example "$j2k" ok
else
    echo "no test corpus: the JPEG 2000 case is skipped"
fi
echo "installed package works with find_package and pkg-config; the README example runs"
