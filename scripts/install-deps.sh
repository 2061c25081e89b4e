#!/usr/bin/env bash
# Installs the Debian packages the build, the tests, the benchmarks and the fuzzer need.
# Only packages that are missing are installed, so a second run costs a second.
set -euo pipefail

packages=(
    build-essential cmake pkg-config git ca-certificates xz-utils dpkg-dev
    clang libclang-rt-14-dev nasm
    libgtest-dev libgmock-dev libbenchmark-dev
    libopenjp2-7-dev libopenjp2-tools libgeographiclib-dev libpng-dev libtiff-dev libgeotiff-dev zlib1g-dev
    python3 nlohmann-json3-dev
)

missing=()
for p in "${packages[@]}"; do
    dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done

if [ ${#missing[@]} -gt 0 ]; then
    echo "Installing: ${missing[*]}"
    sudo_cmd=""
    [ "$(id -u)" -eq 0 ] || sudo_cmd="sudo"
    export DEBIAN_FRONTEND=noninteractive
    $sudo_cmd apt-get update -qq
    $sudo_cmd apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi
