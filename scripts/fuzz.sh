#!/usr/bin/env bash
# Builds the libFuzzer targets of fuzz/ with clang (AddressSanitizer, UndefinedBehaviorSanitizer)
# in their own build folder and runs each for a bounded time, seeded with the built DLLs and the
# small meshes. Fails on any crash, sanitizer report, leak, time-out or memory blow-up; the input
# that caused it is left in <fuzz build>/artifacts/.
#     scripts/fuzz.sh [seconds per target, default 60]
# Environment: BUILD_DIR (the main build, for its DLLs; default build/), FUZZ_BUILD_DIR
# (default build-fuzz/).
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
seconds=${1:-60}
main_build=${BUILD_DIR:-$root/build}
fuzz_build=${FUZZ_BUILD_DIR:-$root/build-fuzz}

CXX=clang++ cmake -S "$root/fuzz" -B "$fuzz_build" -G Ninja -DCMAKE_BUILD_TYPE=Debug >/dev/null
cmake --build "$fuzz_build"

# Seeds: every DLL the main build made (the tool's libraries and the loader's fixtures).
seeds=$fuzz_build/seeds
rm -rf "$seeds"
mkdir -p "$seeds/loader" "$fuzz_build/artifacts"
dlls=$(find "$main_build/bin" -name '*.dll' 2>/dev/null || true)
if [ -z "$dlls" ]; then
  echo "fuzz.sh: no DLLs under $main_build/bin: build the project first" >&2
  exit 1
fi
cp $dlls "$seeds/loader/"

run() {
  local target=$1 seed_dir=$2
  shift 2
  local extra=("$@")
  local corpus=$fuzz_build/corpus/$target
  mkdir -p "$corpus"
  echo "== $target: $seconds s"
  # A load or a read must finish within 2 s and 1 GiB (sanitizers included); output of the code
  # under test (the loader's console lines) is dropped.
  "$fuzz_build/$target" "$corpus" "$seed_dir" \
    -max_total_time="$seconds" -timeout=2 -rss_limit_mb=1024 -malloc_limit_mb=512 \
    -close_fd_mask=1 -print_final_stats=1 -artifact_prefix="$fuzz_build/artifacts/$target-" "${extra[@]}"
}

status=0
# Images up to 64 KiB: any of them must load or be refused quickly and in little memory.
run LoaderFuzzer "$seeds/loader" -max_len=65536 || status=1
run ObjFuzzer "$root/fuzz/seeds/obj" -max_len=16384 || status=1
run BinaryFuzzer "$root/fuzz/seeds/binary" -max_len=16384 || status=1
if [ $status -ne 0 ]; then
  echo "fuzz.sh: a target failed; reproducers are in $fuzz_build/artifacts/" >&2
fi
exit $status
