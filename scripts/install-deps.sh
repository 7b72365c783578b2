#!/usr/bin/env bash
# Installs, from Debian's packages, everything the build and the tests need.
# Safe to run repeatedly: it only calls apt-get when something is missing.
set -euo pipefail

packages=(build-essential cmake ninja-build pkg-config libunittest++-dev libgmp-dev clang lld llvm)

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
