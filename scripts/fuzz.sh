#!/bin/bash
# Builds the libFuzzer targets with clang and runs each of them for a bounded time over a copy of
# its seed corpus. Fails when an input crashes, leaks, trips a sanitizer or times out, or when a
# committed crash input (fuzz/regressions/<target>/) fails again.
#
#   scripts/fuzz.sh                      all three targets, FUZZ_SECONDS (default 60) each
#   scripts/fuzz.sh fuzz_object_path     only the named targets
#
# Environment:
#   FUZZ_SECONDS   time per target in seconds (default 60)
#   FUZZ_BUILD     build folder (default build-fuzz in the source tree)
#   FUZZ_JOBS      parallel compile jobs (default 2)
#   FUZZ_TIMEOUT   seconds one input may take before it counts as a hang (default 10)
#   FUZZ_TMPDIR    where the fuzzers write the tree files they read back (default /dev/shm when
#                  it is writable, else build-fuzz/fuzz-run/tmp); on a busy disk writing them
#                  there makes fuzz_json_tree ten times slower
#
# A run leaves build-fuzz/fuzz-run/<target>/: corpus/ (the seeds and what the run added),
# artifacts/ (crash-*, leak-*, timeout-* inputs) and log.txt. To replay one input:
#   build-fuzz/fuzz/<target> <input>
set -euo pipefail

root="$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)"
build="${FUZZ_BUILD:-$root/build-fuzz}"
seconds="${FUZZ_SECONDS:-60}"
jobs="${FUZZ_JOBS:-2}"
timeout="${FUZZ_TIMEOUT:-10}"
all_targets=(fuzz_json_tree fuzz_object_path fuzz_operations)
if [ "$#" -gt 0 ]; then
  targets=("$@")
else
  targets=("${all_targets[@]}")
fi

for tool in clang clang++ cmake; do
  command -v "$tool" >/dev/null || { echo "fuzz.sh: $tool is missing" >&2; exit 2; }
done

echo "== configuring $build"
CC=clang CXX=clang++ cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=Debug \
  -DBLUELIGHT_FUZZ=ON -DBLUELIGHT_BUILD_TESTS=OFF -DBLUELIGHT_BUILD_BENCHMARKS=OFF -DBLUELIGHT_IPMI_LAN=OFF -DBLUELIGHT_REDFISH=OFF >/dev/null
echo "== building ${targets[*]}"
cmake --build "$build" --target "${targets[@]}" -j "$jobs"

work="$build/fuzz-run"
if [ -n "${FUZZ_TMPDIR:-}" ]; then
  tmp="$FUZZ_TMPDIR"
elif [ -d /dev/shm ] && [ -w /dev/shm ]; then
  tmp="$(mktemp -d /dev/shm/bluelight-fuzz.XXXXXX)"
  trap 'rm -rf "$tmp"' EXIT
else
  tmp="$work/tmp"
fi
mkdir -p "$work" "$tmp"
export TMPDIR="$tmp"
# Leaks are failures; the undefined-behaviour checker already aborts on the first finding.
export ASAN_OPTIONS="${ASAN_OPTIONS:-detect_leaks=1:abort_on_error=1}"
export UBSAN_OPTIONS="${UBSAN_OPTIONS:-print_stacktrace=1:halt_on_error=1}"

failed=()
for target in "${targets[@]}"; do
  binary="$build/fuzz/$target"
  seeds="$root/fuzz/corpus/$target"
  run="$work/$target"
  rm -rf "$run"
  mkdir -p "$run/corpus" "$run/artifacts"
  # A target without its seed corpus would start from nothing and prove little: that is an error.
  if ! compgen -G "$seeds/*" >/dev/null; then
    echo "== $target: no seed corpus in $seeds" >&2
    exit 2
  fi
  cp "$seeds"/* "$run/corpus/"

  # Inputs that crashed once must not crash again.
  for input in "$root/fuzz/regressions/$target"/*; do
    [ -f "$input" ] || continue
    if ! "$binary" -timeout="$timeout" "$input" >>"$run/log.txt" 2>&1; then
      echo "== $target: regression input $(basename "$input") fails again (see $run/log.txt)"
      failed+=("$target:regression:$(basename "$input")")
    fi
  done

  options=(-max_total_time="$seconds" -timeout="$timeout" -rss_limit_mb=2048
           -print_final_stats=1 -artifact_prefix="$run/artifacts/")
  if [ -f "$root/fuzz/dict/$target.dict" ]; then
    options+=(-dict="$root/fuzz/dict/$target.dict")
  fi
  echo "== $target: fuzzing for ${seconds}s over $(ls "$run/corpus" | wc -l) seed inputs"
  status=0
  "$binary" "${options[@]}" "$run/corpus" >>"$run/log.txt" 2>&1 || status=$?
  executed="$(sed -n 's/^stat::number_of_executed_units: *//p' "$run/log.txt" | tail -n 1)"
  speed="$(sed -n 's/^stat::average_exec_per_sec: *//p' "$run/log.txt" | tail -n 1)"
  echo "   executions: ${executed:-?}, per second: ${speed:-?}, corpus now: $(ls "$run/corpus" | wc -l) inputs"
  if [ "$status" -ne 0 ] || [ -n "$(ls -A "$run/artifacts")" ]; then
    echo "== $target FAILED (exit code $status); inputs kept in $run/artifacts:"
    ls "$run/artifacts" | sed 's/^/   /'
    grep -E '^(==[0-9]+==ERROR|SUMMARY|.*runtime error)' "$run/log.txt" | head -n 5 | sed 's/^/   /'
    failed+=("$target")
  fi
done

if [ "${#failed[@]}" -ne 0 ]; then
  echo "== fuzzing failed: ${failed[*]}"
  exit 1
fi
echo "== fuzzing passed: ${targets[*]}"
