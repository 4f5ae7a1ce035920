#!/usr/bin/env bash
# Builds the project and runs every test.
#   scripts/test.sh                      plain (Debug: the tests compile four times faster than
#                                        optimised) build in build/
#   SANITIZERS=address,undefined scripts/test.sh    build in build-address-undefined/
#   SANITIZERS=thread TESTS='concurrency' scripts/test.sh   only tests matching a regex
#   TARGETS='a b' ...                    build only these targets
set -euo pipefail
cd "$(dirname "$0")/.."

sanitizers="${SANITIZERS:-}"
build_dir="${BUILD_DIR:-build${sanitizers:+-${sanitizers//,/-}}}"
jobs="${JOBS:-$(nproc 2>/dev/null || echo 2)}"

cmake -S . -B "$build_dir" -DCMAKE_BUILD_TYPE="${BUILD_TYPE:-Debug}" \
  -DBLUELIGHT_SANITIZERS="$sanitizers" >/dev/null
build_args=(--build "$build_dir" -j "$jobs")
# TARGETS: build only these (space-separated), e.g. for a sanitizer run of a few tests.
if [[ -n "${TARGETS:-}" ]]; then build_args+=(--target ${TARGETS}); fi
cmake "${build_args[@]}"

ctest_args=(--test-dir "$build_dir" --output-on-failure -j "$jobs")
if [[ -n "${TESTS:-}" ]]; then ctest_args+=(-R "$TESTS"); fi
if [[ -n "${EXCLUDE:-}" ]]; then ctest_args+=(-E "$EXCLUDE"); fi
ctest "${ctest_args[@]}"
