#!/usr/bin/env bash
# Installs the build into a scratch prefix, then builds and runs a consumer with find_package(nitf) and one
# with pkg-config.   run.sh BUILD_DIR CONSUMER_SOURCE_DIR CXX
set -euo pipefail
build=$1
source=$2
cxx=$3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake --install "$build" --prefix "$work/prefix" >/dev/null
cmake -S "$source" -B "$work/consumer" -DCMAKE_PREFIX_PATH="$work/prefix" -DCMAKE_CXX_COMPILER="$cxx" \
    -DCMAKE_CXX_FLAGS="${CONSUMER_FLAGS:-}" >/dev/null
cmake --build "$work/consumer" >/dev/null
LD_LIBRARY_PATH="$work/prefix/lib:$work/prefix/lib64:${LD_LIBRARY_PATH:-}" "$work/consumer/consumer" "$work/fields.bin"

# pkg-config gives the flags a Makefile-based application would use.
export PKG_CONFIG_PATH="$work/prefix/lib/pkgconfig:$work/prefix/lib64/pkgconfig"
"$cxx" -std=c++17 ${CONSUMER_FLAGS:-} "$source/main.cpp" -o "$work/consumer-pc" $(pkg-config --cflags --libs nitf)
LD_LIBRARY_PATH="$work/prefix/lib:$work/prefix/lib64:${LD_LIBRARY_PATH:-}" "$work/consumer-pc" "$work/fields2.bin" >/dev/null
echo "installed package works with find_package and pkg-config"
