#!/usr/bin/env bash
# The project's own C and C++ code against its style (.clang-format) and its checks (.clang-tidy).
# Fails on the first difference or finding kind; prints what to run to fix it.
#   scripts/lint.sh              both, on every tracked source (tidy needs a configured build)
#   LINT=format scripts/lint.sh  only the format check
#   LINT=tidy scripts/lint.sh    only clang-tidy
#   BUILD_DIR                    the build whose compile_commands.json tidy reads (default build)
set -euo pipefail
cd "$(dirname "$0")/.."
what="${LINT:-format tidy}"
build_dir="${BUILD_DIR:-build}"
jobs="${JOBS:-$(nproc 2>/dev/null || echo 2)}"

# The bundled CMPI headers mirror the published ones and keep their layout; fuzz corpora are data.
mapfile -t sources < <(git ls-files '*.c' '*.cpp' '*.h' '*.inc' | grep -v '^cmpi/include/' |
  grep -v '^tests/abi/abi_\(expected\|macro_checks\)\.inc$')

status=0
if [[ " $what " == *" format "* ]]; then
  echo "== clang-format: ${#sources[@]} files"
  if ! clang-format --dry-run -Werror "${sources[@]}"; then
    echo "lint.sh: run clang-format -i on the files above" >&2
    status=1
  fi
fi

if [[ " $what " == *" tidy "* ]]; then
  if [[ ! -f "$build_dir/compile_commands.json" ]]; then
    cmake -S . -B "$build_dir" -DBLUELIGHT_BUILD_TESTS=ON >/dev/null
  fi
  # The translation units of the project's own code that the build compiles (generated files
  # and the bundled headers' own checks are not ours to restyle).
  mapfile -t units < <(git ls-files '*.cpp' | grep -v '^tests/abi/')
  echo "== clang-tidy: ${#units[@]} translation units, $jobs at a time"
  if ! run-clang-tidy -quiet -p "$build_dir" -j "$jobs" "${units[@]/#/$PWD/}" >"$build_dir/clang-tidy.log" 2>&1; then
    grep -E "(warning|error):" "$build_dir/clang-tidy.log" | sort -u | head -n 100 >&2
    echo "lint.sh: clang-tidy findings (all of them in $build_dir/clang-tidy.log)" >&2
    status=1
  fi
fi
exit "$status"
