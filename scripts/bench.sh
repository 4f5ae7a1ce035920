#!/usr/bin/env bash
# Builds the provider and the benchmarks in Release mode and runs them: the table of figures and
# the ratios against the performance targets (docs/PERFORMANCE.md).
#   scripts/bench.sh                                   full run in build-bench/ (about 2 minutes)
#   BENCH_STRICT=1 scripts/bench.sh                    exit status 1 when a ratio misses its target
#   BENCH_ARGS='--benchmark_min_time=0.01 --benchmark_repetitions=1 --bench-growth-ops=1000' \
#     scripts/bench.sh                                 a short smoke run (CI)
#   BENCH_ARGS='--benchmark_filter=Enumerate' scripts/bench.sh   only some benchmarks
set -euo pipefail
cd "$(dirname "$0")/.."

build_dir="${BUILD_DIR:-build-bench}"
jobs="${JOBS:-2}"
# Three repetitions per benchmark; the figures are their medians.
default_args=(--benchmark_repetitions=3 --benchmark_min_time=0.2
              --benchmark_report_aggregates_only=true)
read -r -a extra_args <<<"${BENCH_ARGS:-}"

cmake -S . -B "$build_dir" -DCMAKE_BUILD_TYPE=Release -DBLUELIGHT_BUILD_TESTS=OFF >/dev/null
cmake --build "$build_dir" -j "$jobs" --target bluelight-bench bluelightprofileprovider >/dev/null

if [[ ! -x "$build_dir/bin/bluelight-bench" ]]; then
  echo "bench.sh: the benchmarks were not built (is libbenchmark-dev installed?)" >&2
  exit 2
fi
exec "$build_dir/bin/bluelight-bench" "${default_args[@]}" "${extra_args[@]}"
