#!/usr/bin/env bash
# From a fresh machine to an unwrapped sample: installs what is missing, builds ChartBake and its
# bundled Tessary.dll / Unwrap.dll, and runs it on examples/sample.obj. The result lands in
# examples/out/sample_unwrapped.obj.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
build=${BUILD_DIR:-$root/build}
"$root/scripts/install-deps.sh"
"$root/scripts/build.sh"
mkdir -p "$root/examples/out"
cd "$root/examples"
"$build/bin/ChartBake" -obj sample.obj out/sample_unwrapped.obj
echo "Wrote $root/examples/out/sample_unwrapped.obj"
