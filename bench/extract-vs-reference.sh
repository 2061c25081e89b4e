#!/usr/bin/env bash
# Whole-process extraction against reference tools, in one run: nitf extract (one and two threads) beside
# gdal_translate -of ENVI and cp of the same bytes, on 8192 x 8192 RGB images made by nitf-bench-files.
#   bench/extract-vs-reference.sh [BUILD_DIR] [WORK_DIR]
set -euo pipefail
build=${1:-build}
work=${2:-${TMPDIR:-/tmp}/nitf-bench}
nitf="$build/tools/nitf"
mkdir -p "$work"
[ -f "$work/nc-bsq-8192.ntf" ] || "$build/bench/nitf-bench-files" "$work"
command -v hyperfine >/dev/null || { echo "hyperfine is not installed (apt-get install hyperfine)"; exit 1; }
gdal=()
command -v gdal_translate >/dev/null && gdal=(1)

# Each run starts with the previous outputs written back (sync), so that no run pays for another's writes.
run() { # name, then the commands to compare
    local name=$1; shift
    echo "== $name"
    hyperfine --warmup 1 --runs "${RUNS:-7}" --prepare sync --style basic "$@" 2>&1 | grep -E "Benchmark|Time|faster than"
}

jpeg=("$nitf extract $work/jpeg-ycbcr-8192.ntf -f raw -o $work/out.raw -j 1"
      "$nitf extract $work/jpeg-ycbcr-8192.ntf -f raw -o $work/out.raw -j 2")
[ ${#gdal[@]} -gt 0 ] && jpeg+=("gdal_translate -q -of ENVI $work/jpeg-ycbcr-8192.ntf $work/gdal.raw")
run "8192^2 RGB, YCbCr JPEG blocks of 1024^2 (C3, IMODE P)" "${jpeg[@]}"

nc=("$nitf extract $work/nc-rgb-8192.ntf -f raw -o $work/out.raw -j 1"
    "$nitf extract $work/nc-rgb-8192.ntf -f raw -o $work/out.raw -j 2"
    "cp $work/nc-rgb-8192.ntf $work/copy.raw")
[ ${#gdal[@]} -gt 0 ] && nc+=("gdal_translate -q -of ENVI $work/nc-rgb-8192.ntf $work/gdal.raw")
run "8192^2 RGB uncompressed (NC, IMODE B, 201 MB)" "${nc[@]}"

bsq=("$nitf extract $work/nc-bsq-8192.ntf -f raw -o $work/out.raw"
     "cp $work/nc-bsq-8192.ntf $work/copy.raw")
[ ${#gdal[@]} -gt 0 ] && bsq+=("gdal_translate -q -of ENVI $work/nc-bsq-8192.ntf $work/gdal.raw")
run "8192^2 RGB uncompressed, stored as the raw form (NC, IMODE S, one block column)" "${bsq[@]}"

echo "== peak memory (KiB)"
for f in jpeg-ycbcr-8192 nc-rgb-8192 nc-bsq-8192; do
    printf '%-20s ' "$f"
    /usr/bin/time -f %M "$nitf" extract "$work/$f.ntf" -f raw -o "$work/out.raw" 2>&1 >/dev/null | tail -1
done
rm -f "$work/out.raw" "$work/gdal.raw" "$work/gdal.hdr" "$work/copy.raw"
