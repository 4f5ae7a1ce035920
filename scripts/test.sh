#!/usr/bin/env bash
# Builds the project and runs every test; fails when a test fails or when no test ran.
#   scripts/test.sh                      plain (Debug: the tests compile four times faster than
#                                        optimised) build in build/
#   SANITIZERS=address,undefined scripts/test.sh    build in build-address-undefined/
#   SANITIZERS=thread TESTS='concurrency' scripts/test.sh   only tests matching a regex
#   TARGETS='a b' ...                    build only these targets
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/ensure-packages.sh test

sanitizers="${SANITIZERS:-}"
build_dir="${BUILD_DIR:-build${sanitizers:+-${sanitizers//,/-}}}"
jobs="${JOBS:-$(nproc 2>/dev/null || echo 2)}"

# The tests are switched on explicitly: a folder configured earlier without them (as the install
# recipe does) would otherwise build nothing to run.
cmake -S . -B "$build_dir" -DCMAKE_BUILD_TYPE="${BUILD_TYPE:-Debug}" \
  -DBLUELIGHT_SANITIZERS="$sanitizers" -DBLUELIGHT_BUILD_TESTS=ON >/dev/null
build_args=(--build "$build_dir" -j "$jobs")
# TARGETS: build only these (space-separated), e.g. for a sanitizer run of a few tests.
if [[ -n "${TARGETS:-}" ]]; then build_args+=(--target ${TARGETS}); fi
cmake "${build_args[@]}"

ctest_args=(--test-dir "$build_dir" --output-on-failure --no-tests=error -j "$jobs")
if [[ -n "${TESTS:-}" ]]; then ctest_args+=(-R "$TESTS"); fi
if [[ -n "${EXCLUDE:-}" ]]; then ctest_args+=(-E "$EXCLUDE"); fi
ctest "${ctest_args[@]}"
