#!/usr/bin/env bash
# Deliberate faults, one at a time, to show that the unit tests notice each of them.
#
#   scripts/mutants.sh [--dry-run] [pattern]
#
# Every line of scripts/mutants/*.txt is one fault:
#
#   <file><TAB><sed substitution><TAB><what it breaks>
#
# (blank lines and lines starting with # are skipped; <file> is relative to the repository root).
# With a pattern, only the faults whose line, or list name and line number ("mesh.txt:4"), match
# it (grep -E) are tried. --dry-run only
# applies each substitution to a copy of its file and shows the change, without building.
#
# The tree (tracked and untracked files, as they are now) is copied into a scratch directory,
# $MUTANTS_DIR or build-mutants/ beside the sources, and built there once in its own build
# directory (kept, so that a later run only rebuilds what changed). Then, for each fault: apply
# the substitution to the scratch copy, rebuild incrementally, run UnitTests, put the file back.
# A fault is caught when UnitTests fails (a failed test, a crash or the time limit). The run
# reports every fault the tests miss, every substitution that changes nothing and every fault
# that does not compile, and exits 1 if there is any of them.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
scratch=${MUTANTS_DIR:-$root/build-mutants}
src=$scratch/src
build=$scratch/build
dry_run=false
if [ "${1:-}" = "--dry-run" ]; then
  dry_run=true
  shift
fi
pattern=${1:-}
test_timeout=${MUTANTS_TEST_TIMEOUT:-600}
log=$scratch/last-fault.log

# Copies the tree into $src: only files whose contents differ, so that timestamps of unchanged
# files stay and the build stays incremental; files that are gone from the tree go from $src too.
sync_tree() {
  mkdir -p "$src"
  local list
  list=$(mktemp -p "$scratch" files.XXXXXX)
  (cd "$root" && git ls-files -co --exclude-standard) | sort >"$list"
  while IFS= read -r f; do
    [ -f "$root/$f" ] || continue
    if ! cmp -s "$root/$f" "$src/$f"; then
      mkdir -p "$(dirname "$src/$f")"
      cp "$root/$f" "$src/$f"
    fi
  done <"$list"
  (cd "$src" && find . -type f | sed 's|^\./||' | sort) | comm -23 - "$list" | while IFS= read -r f; do
    rm -f "$src/$f"
  done
  rm -f "$list"
}

build_scratch() {
  nice cmake --build "$build" -j2 --target UnitTests >"$log" 2>&1
}

# A faulty build may hang or crash and be killed half-way, which leaves the tests' temporary
# directories behind: they go to a folder of the scratch directory, emptied after every run.
run_tests() {
  local tmp=$scratch/tmp status=0
  rm -rf "$tmp" && mkdir -p "$tmp"
  (cd "$build" && TMPDIR=$tmp timeout "$test_timeout" ./bin/UnitTests >>"$log" 2>&1) || status=$?
  rm -rf "$tmp"
  return $status
}

# Calls the function named $1 with (where, file, substitution, what) for every selected fault.
# The lists are read on descriptor 3, so that nothing the handler runs can read them.
each_fault() {
  local handler=$1 list line number file substitution what
  shopt -s nullglob
  for list in "$root"/scripts/mutants/*.txt; do
    number=0
    while IFS= read -r line <&3 || [ -n "$line" ]; do
      number=$((number + 1))
      [[ -z "${line//[[:space:]]/}" || "$line" == \#* ]] && continue
      [ -n "$pattern" ] && ! grep -qE -- "$pattern" <<<"$(basename "$list"):$number $line" && continue
      IFS=$'\t' read -r file substitution what <<<"$line"
      "$handler" "$(basename "$list"):$number" "$file" "$substitution" "$what"
    done 3<"$list"
  done
}

# --dry-run: the substitution applied to a copy of its file, and the change it makes.
show_fault() {
  local where=$1 file=$2 substitution=$3 what=$4 copy
  echo "== $where  $what"
  copy=$(mktemp)
  if [ -z "$what" ] || [ ! -f "$root/$file" ] || ! sed -e "$substitution" "$root/$file" >"$copy" ||
    cmp -s "$root/$file" "$copy"; then
    echo "   NOT APPLIED"
    dry_run_status=1
  else
    diff "$root/$file" "$copy" | sed 's/^/   /' || true
  fi
  rm -f "$copy"
}

if $dry_run; then
  dry_run_status=0
  each_fault show_fault
  exit $dry_run_status
fi

mkdir -p "$scratch"
echo "mutants: scratch copy in $scratch"
sync_tree
if [ ! -f "$build/build.ninja" ]; then
  cmake -S "$src" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DCHARTBAKE_WERROR=OFF >/dev/null
fi
# The glTF output tests check their files with the validator in the build's tools folder.
BUILD_DIR=$build "$root/scripts/install-validator.sh"
echo "mutants: building the unchanged copy"
if ! build_scratch; then
  cat "$log"
  echo "mutants: the unchanged tree does not build" >&2
  exit 2
fi
echo "mutants: running the unit tests on the unchanged copy"
if ! run_tests; then
  tail -30 "$log"
  echo "mutants: the unit tests fail without any fault; fix that first" >&2
  exit 2
fi

# One fault: apply, rebuild, run the tests, put the file back.
try_fault() {
  local where=$1 file=$2 substitution=$3 what=$4 result
  total=$((total + 1))
  if [ -z "$file" ] || [ -z "$substitution" ] || [ -z "$what" ]; then
    problems+=("MALFORMED  $where: expected file<TAB>substitution<TAB>description")
    echo "  malformed    $where"
    return
  fi
  if [ ! -f "$src/$file" ]; then
    problems+=("NO FILE    $where: $file")
    echo "  no file      $where  $file"
    return
  fi
  if ! sed -i -e "$substitution" "$src/$file" 2>"$log" || cmp -s "$root/$file" "$src/$file"; then
    cp "$root/$file" "$src/$file"
    problems+=("NOT APPLIED $where: $file: $substitution")
    echo "  not applied  $where  $what"
    return
  fi
  if ! build_scratch; then
    result="no build"
    problems+=("NO BUILD   $where: $what (see scripts/mutants.sh --dry-run '$where')")
  elif run_tests; then
    result="MISSED"
    problems+=("MISSED     $where: $what ($file: $substitution)")
  else
    result="caught"
    caught=$((caught + 1))
  fi
  printf '  %-12s %s  %s\n' "$result" "$where" "$what"
  # A fresh copy (new timestamp), so that the next build compiles the file again.
  cp "$root/$file" "$src/$file"
}

total=0 caught=0
problems=()
each_fault try_fault

# Leave the scratch build matching the tree again.
build_scratch || true
echo "mutants: $caught of $total faults caught"
if [ ${#problems[@]} -gt 0 ]; then
  printf '%s\n' "${problems[@]}"
  exit 1
fi
