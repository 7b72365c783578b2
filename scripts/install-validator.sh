#!/usr/bin/env bash
# Installs the Khronos glTF validator (npm package gltf-validator) into tools/node_modules of the
# build directory, for the tests that check chartbake-mesh's glTF output. Skips the download when
# it is already there.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
build=${BUILD_DIR:-$root/build}
prefix="$build/tools"
if [ -f "$prefix/node_modules/gltf-validator/package.json" ]; then
  exit 0
fi
if ! command -v npm >/dev/null 2>&1; then
  echo "npm is missing: run scripts/install-deps.sh" >&2
  exit 1
fi
mkdir -p "$prefix"
npm install --prefix "$prefix" --no-audit --no-fund --silent gltf-validator@2.0.0-dev.3.10
