#!/usr/bin/env bash
# The main job: the nitf tool on the project's own demo sample.
set -euo pipefail
build=${1:-build}
nitf="$build/tools/nitf"
sample="$build/sample.ntf"

"$nitf" --version
"$nitf" sample "$sample"
"$nitf" info "$sample"
"$nitf" extract "$sample" -f raw -o "$build/sample.raw"
"$nitf" extract "$sample" -f png -o "$build/sample.png"
echo "decoded image 0: $build/sample.raw ($(stat -c %s "$build/sample.raw") bytes), $build/sample.png"
"$nitf" selfcheck "$build"
