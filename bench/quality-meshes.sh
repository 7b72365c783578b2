#!/usr/bin/env bash
# The unwrap quality benchmark on the Debian libcgal-demo meshes plus generated tori and
# spheres (10k, 100k, 1M triangles). Installs libcgal-demo when it is missing, takes the nine
# meshes out of its data archive into a temporary folder, and runs bin/UnwrapQualityBench.
#
#   bench/quality-meshes.sh [build dir] [UnwrapQualityBench options, e.g. -runs 5 -no-large]
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
build=${1:-$root/build}
shift || true
meshes=(bunny00 refined_elephant armadillo fandisk ChineseDragon-10kv camel couplingdown rotor_small blade)

if ! dpkg-query -W -f='${Status}' libcgal-demo 2>/dev/null | grep -q "install ok installed"; then
  SUDO=""
  [ "$(id -u)" -eq 0 ] || SUDO="sudo"
  export DEBIAN_FRONTEND=noninteractive
  $SUDO apt-get update -qq
  $SUDO apt-get install -y -qq libcgal-demo
fi
archive=$(dpkg -L libcgal-demo libcgal-dev 2>/dev/null | grep -m1 '/data\.tar\.gz$' || true)
[ -n "$archive" ] || { echo "libcgal-demo's data archive was not found" >&2; exit 1; }

work=$(mktemp -d /tmp/quality-meshes-XXXXXX)
trap 'rm -rf "$work"' EXIT
members=()
for m in "${meshes[@]}"; do members+=("data/meshes/$m.off"); done
tar -xzf "$archive" -C "$work" "${members[@]}"
files=()
for m in "${meshes[@]}"; do files+=("$work/data/meshes/$m.off"); done
nice "$build/bin/UnwrapQualityBench" "$@" "${files[@]}"
