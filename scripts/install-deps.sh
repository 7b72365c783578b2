#!/usr/bin/env bash
# Installs, from Debian's packages, everything the build and the tests need.
# Safe to run repeatedly: it only calls apt-get when something is missing.
set -euo pipefail

packages=(build-essential cmake ninja-build pkg-config libunittest++-dev libgmp-dev clang lld llvm
          # the libFuzzer and sanitizer runtimes for scripts/fuzz.sh
          libclang-rt-14-dev
          # chartbake-mesh: mesh import (OBJ, PLY, STL, FBX), glTF round trip, layout pictures
          libassimp-dev libtinygltf-dev nlohmann-json3-dev libpng-dev)
# The glTF validator the tests run comes from npm (scripts/install-validator.sh); npm itself from
# Debian when the machine has none.
command -v npm >/dev/null 2>&1 || packages+=(nodejs npm)

missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done

if [ ${#missing[@]} -gt 0 ]; then
  echo "Installing: ${missing[*]}"
  SUDO=""
  [ "$(id -u)" -eq 0 ] || SUDO="sudo"
  export DEBIAN_FRONTEND=noninteractive
  $SUDO apt-get update -qq
  $SUDO apt-get install -y -qq "${missing[@]}"
fi
