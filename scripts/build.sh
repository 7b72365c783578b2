#!/usr/bin/env bash
# Configures and builds everything (host tools, Windows DLLs, tests) into build/.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
build=${BUILD_DIR:-$root/build}
extra=()
[ "${CI:-}" = "true" ] && extra+=(-DCHARTBAKE_WERROR=ON)
cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo "${extra[@]}" "$@"
cmake --build "$build"
