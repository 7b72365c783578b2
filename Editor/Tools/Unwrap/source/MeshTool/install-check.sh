#!/usr/bin/env bash
# Installs the build into a temporary prefix and runs both installed programs from an unrelated
# working directory: they must find Tessary.dll and Unwrap.dll beside themselves.
#   install-check.sh <build dir>
set -euo pipefail
build=$1
tmp=$(mktemp -d /tmp/chartbake-install-XXXXXX)
trap 'rm -rf "$tmp"' EXIT
cmake --install "$build" --prefix "$tmp/prefix" >/dev/null
mkdir "$tmp/work"
cd "$tmp/work"
printf 'v 0 0 0\nv 1 0 0\nv 1 1 0\nv 0 1 0\nvt 0 0\nvn 0 0 1\nf 1/1/1 2/1/1 3/1/1\nf 1/1/1 3/1/1 4/1/1\n' > quad.obj
"$tmp/prefix/bin/chartbake-mesh" --quiet quad.obj quad.glb
"$tmp/prefix/bin/ChartBake" -obj quad.obj quad_unwrapped.obj
test -s quad.glb
grep -q '^f 1/1 2/2 3/3$' quad_unwrapped.obj
echo "installed ChartBake and chartbake-mesh ran from $tmp/work"
