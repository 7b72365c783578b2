#!/usr/bin/env bash
# One command from a fresh machine to a green test run: install, configure, build, test.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
"$root/scripts/install-deps.sh"
"$root/scripts/build.sh"
"$root/scripts/install-validator.sh"
cd "${BUILD_DIR:-$root/build}"
ctest --output-on-failure
