#!/usr/bin/env bash
# The main job: the nitf tool on the project's own demo sample.
set -euo pipefail
build=${1:-build}
nitf="$build/tools/nitf"
sample="$build/sample.ntf"

"$nitf" --version
"$nitf" sample "$sample"
"$nitf" info "$sample"
"$nitf" selfcheck "$build"
