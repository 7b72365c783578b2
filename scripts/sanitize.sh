#!/usr/bin/env bash
# Builds the host side (ChartBake, UnitTests, benchmarks) with AddressSanitizer and
# UndefinedBehaviorSanitizer (g++), in its own build directory, and runs every test and a few
# unwraps under them: the sample mesh and a generated grid of 20,000 triangles in both formats.
# Any sanitizer report ends the run with a non-zero status.
#
#   scripts/sanitize.sh            (build directory: build-sanitize/, or $SANITIZE_BUILD_DIR)
#
# Warnings are not errors here: instrumented code makes g++ report uninitialised values inside
# the standard library that are not there (the ordinary build is the -Werror one).
#
# Settings that the system needs under the sanitizers:
# - handle_segv/handle_sigbus/handle_sigfpe=0 and allow_user_segv_handler=1: the test harness turns
#   crash signals into test failures (tests crash on purpose), so the signals must reach it.
# - allocator_may_return_null=1: an allocation the host cannot give answers null (the emulated
#   allocation functions hand that on, and tests ask for it) instead of ending the process.
# - detect_stack_use_after_return=0: DLL code runs on the same stack; a fake stack frame of an
#   instrumented host function that calls into a DLL must stay where the DLL's return expects it.
# - Leaks: ChartBake keeps its mesh arrays and libraries until exit by design; the suppressions
#   below name exactly those owners. Everything else leaking is reported.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
build=${SANITIZE_BUILD_DIR:-$root/build-sanitize}

"$root/scripts/install-deps.sh"

sanitizers="-fsanitize=address,undefined -fno-sanitize-recover=all -fno-omit-frame-pointer"
cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DCHARTBAKE_WERROR=OFF \
  -DCMAKE_C_FLAGS="$sanitizers" -DCMAKE_CXX_FLAGS="$sanitizers" \
  -DCMAKE_EXE_LINKER_FLAGS="-fsanitize=address,undefined" >/dev/null
nice cmake --build "$build" -j2

work=$(mktemp -d "${TMPDIR:-/tmp}/chartbake-sanitize-XXXXXX")
trap 'rm -rf "$work"' EXIT
cat >"$work/lsan.supp" <<'EOF'
# ChartBake owns the mesh arrays and the loaded libraries until the process ends.
leak:LoadFromObj
leak:LoadFromHalvorBinary
leak:MallocArray
leak:Unwrap
leak:PELoadLibrary
EOF
export ASAN_OPTIONS=allocator_may_return_null=1:handle_segv=0:handle_sigbus=0:handle_sigfpe=0:allow_user_segv_handler=1:detect_stack_use_after_return=0:abort_on_error=0:exitcode=99
export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1:exitcode=98
export LSAN_OPTIONS=suppressions=$work/lsan.supp:print_suppressions=0:exitcode=97

echo "sanitize: all tests"
(cd "$build" && ctest --output-on-failure)

echo "sanitize: unwraps"
cp "$root/examples/sample.obj" "$work/sample.obj"
"$build/bin/ChartBakeBench" 20000 1 -keep "$work/grid" >"$work/bench.log"
run() {
  local status=0
  (cd "$work" && "$build/bin/ChartBake" "$@" >"$work/run.out" 2>"$work/run.err") || status=$?
  if [ $status -ne 0 ] || grep -q "Sanitizer" "$work/run.err"; then
    cat "$work/run.out" "$work/run.err"
    echo "sanitize: ChartBake $* ended with status $status" >&2
    exit 1
  fi
  echo "  ChartBake $*: ok"
}
run -obj sample.obj sample_out.obj
run -obj grid/mesh.obj grid_out.obj
run grid/mesh.bin grid_out.bin
if grep -q "Sanitizer" "$work/bench.log"; then
  cat "$work/bench.log"
  exit 1
fi
echo "sanitize: clean"
