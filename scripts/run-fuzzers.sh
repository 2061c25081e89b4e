#!/usr/bin/env bash
# Runs every fuzz target for a while, seeded with the test corpus when it is present.
#   scripts/run-fuzzers.sh BUILD_DIR SECONDS
set -euo pipefail
build=${1:?usage: run-fuzzers.sh BUILD_DIR SECONDS}
seconds=${2:-60}
root=$(cd "$(dirname "$0")/.." && pwd)
corpus=${NITF_TEST_DATA:-$root/../shared/testdata}

for target in "$build"/fuzz/*Fuzz; do
    [ -x "$target" ] || continue
    name=$(basename "$target")
    work="$build/fuzz-corpus/$name"
    mkdir -p "$work"
    seeds=()
    if [ -d "$corpus" ]; then
        seeds=("$corpus")
    fi
    echo "== $name for ${seconds}s"
    "$target" -max_total_time="$seconds" -max_len=65536 -timeout=10 -rss_limit_mb=2048 "$work" "${seeds[@]}"
done
