#!/usr/bin/env bash
# Runs every black-box test program under valgrind's memcheck and fails on any memory error and
# on any byte definitely or indirectly lost.
#
#   scripts/valgrind-blackbox.sh                  builds build/ (RelWithDebInfo) and runs them
#   BUILD_DIR=build-x scripts/valgrind-blackbox.sh
#   NO_BUILD=1 scripts/valgrind-blackbox.sh       uses the programs as they are
#   GTEST_FILTER='LightTest.*' scripts/valgrind-blackbox.sh
#
# The build must be a plain one: valgrind cannot run programs built with a sanitizer. The logs
# of every program are kept in <build>/valgrind/, one file per program.
set -euo pipefail
cd "$(dirname "$0")/.."

build_dir="${BUILD_DIR:-build}"
jobs="${JOBS:-$(nproc 2>/dev/null || echo 2)}"

if ! command -v valgrind >/dev/null; then
  echo "valgrind-blackbox: valgrind is not installed (Debian package: valgrind)" >&2
  exit 2
fi

if grep -q '^BLUELIGHT_SANITIZERS:STRING=.' "$build_dir/CMakeCache.txt" 2>/dev/null; then
  echo "valgrind-blackbox: $build_dir is a sanitizer build; valgrind needs a plain one" >&2
  exit 2
fi

if [[ -z "${NO_BUILD:-}" ]]; then
  # A new build folder gets RelWithDebInfo; an existing one keeps its build type unless
  # BUILD_TYPE is given.
  configure_args=()
  if [[ -n "${BUILD_TYPE:-}" || ! -f "$build_dir/CMakeCache.txt" ]]; then
    configure_args+=(-DCMAKE_BUILD_TYPE="${BUILD_TYPE:-RelWithDebInfo}")
  fi
  cmake -S . -B "$build_dir" "${configure_args[@]}" >/dev/null
  # Only the black-box programs (and what they need) are built.
  mapfile -t targets < <(cmake --build "$build_dir" --target help |
    sed -n 's/^\.\.\. \(blackbox_[A-Za-z0-9_]*\).*/\1/p' | grep -v '^blackbox_fixture$' || true)
  if [[ ${#targets[@]} -gt 0 ]]; then
    cmake --build "$build_dir" -j "$jobs" --target "${targets[@]}"
  fi
fi

shopt -s nullglob
programs=("$build_dir"/bin/blackbox_*)
if [[ ${#programs[@]} -eq 0 ]]; then
  echo "valgrind-blackbox: no black-box test programs in $build_dir/bin" >&2
  exit 2
fi

log_dir="$build_dir/valgrind"
mkdir -p "$log_dir"
# --errors-for-leak-kinds makes definite and indirect leaks count as errors, so that
# --error-exitcode reports them; possibly lost and still reachable blocks (the loader's and the
# C++ runtime's own) are listed in the log but do not fail the run.
valgrind_args=(
  --tool=memcheck
  --error-exitcode=97
  --leak-check=full
  --show-leak-kinds=definite,indirect
  --errors-for-leak-kinds=definite,indirect
  --track-origins=yes
  --num-callers=40
)

failed=()
start=$SECONDS
for program in "${programs[@]}"; do
  name="$(basename "$program")"
  log="$log_dir/$name.log"
  printf '%-50s ' "$name"
  program_start=$SECONDS
  status=0
  valgrind "${valgrind_args[@]}" --log-file="$log" "$program" --gtest_color=no \
    ${GTEST_FILTER:+--gtest_filter="$GTEST_FILTER"} >"$log_dir/$name.out" 2>&1 || status=$?
  summary="$(grep -E 'ERROR SUMMARY' "$log" | tail -n 1 | sed 's/^==[0-9]*== //')"
  lost="$(grep -E '(definitely|indirectly) lost:' "$log" | sed 's/^==[0-9]*== *//' |
    tr '\n' ' ')"
  echo "$((SECONDS - program_start)) s, exit $status; $summary ${lost:-no leaks}"
  if [[ $status -ne 0 ]]; then
    failed+=("$name (exit $status, see $log and $log_dir/$name.out)")
  fi
done

echo "valgrind-blackbox: ${#programs[@]} programs in $((SECONDS - start)) s"
if [[ ${#failed[@]} -gt 0 ]]; then
  printf 'valgrind-blackbox: FAILED %s\n' "${failed[@]}" >&2
  exit 1
fi
echo "valgrind-blackbox: no memory errors, nothing definitely or indirectly lost"
