#!/usr/bin/env bash
# Runs every fuzz target for a while, seeded with the test corpus (when present) and the regression inputs.
#   scripts/run-fuzzers.sh BUILD_DIR SECONDS
# An input that crashes a target is kept under fuzz/regressions/TARGET/ (the regression test replays them)
# and the run fails.
set -uo pipefail
build=${1:?usage: run-fuzzers.sh BUILD_DIR SECONDS}
seconds=${2:-60}
root=$(cd "$(dirname "$0")/.." && pwd)
corpus=${NITF_TEST_DATA:-$root/../shared/testdata}
status=0

for target in "$build"/fuzz/*Fuzz; do
    [ -x "$target" ] || continue
    name=$(basename "$target")
    work="$build/fuzz-corpus/$name"
    findings="$build/fuzz-findings/$name"
    mkdir -p "$work" "$findings"
    seeds=()
    [ -d "$corpus" ] && seeds+=("$corpus")
    [ -d "$root/fuzz/regressions/$name" ] && seeds+=("$root/fuzz/regressions/$name")
    echo "== $name for ${seconds}s"
    if ! "$target" -max_total_time="$seconds" -max_len=65536 -timeout=10 -rss_limit_mb=2048 \
        -artifact_prefix="$findings/" -print_final_stats=0 "$work" "${seeds[@]}" 2>"$build/fuzz-$name.log"; then
        tail -n 40 "$build/fuzz-$name.log"
        mkdir -p "$root/fuzz/regressions/$name"
        cp "$findings"/* "$root/fuzz/regressions/$name/" 2>/dev/null
        echo "!! $name found a failure; its input is kept in fuzz/regressions/$name/"
        status=1
    else
        grep -E "^#[0-9]+.*DONE|Done [0-9]+ runs" "$build/fuzz-$name.log" | tail -n 1
    fi
done
exit $status
