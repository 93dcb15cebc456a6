#!/usr/bin/env bash
# Installs the dependencies, then builds and runs every test: once as shipped (optimised), once
# under AddressSanitizer with UndefinedBehaviorSanitizer, the thread-heavy core suite under
# ThreadSanitizer, and the 64-bit Windows build under Wine (scripts/windows-test.sh, which
# cross-builds its libraries from Debian's sources once per cache); TORVANE_WINDOWS=0 leaves
# Windows out.
set -euo pipefail
cd "$(dirname "$0")/.."
windows=${TORVANE_WINDOWS:-1}
if [ "$windows" = 1 ]; then bash scripts/install-deps.sh --hosts --windows; else bash scripts/install-deps.sh --hosts; fi
jobs=$(nproc)

# run_suite NAME "CTEST ARGS" CMAKE ARGS...
run_suite() {
  local name=$1 ctest_args=$2
  shift 2
  echo "=== $name"
  cmake -S . -B "build/$name" -G Ninja "$@" >/dev/null
  cmake --build "build/$name" -j "$jobs"
  (cd "build/$name" && ctest --output-on-failure -j "$jobs" $ctest_args)
}

run_suite tests "" -DCMAKE_BUILD_TYPE=RelWithDebInfo
ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 UBSAN_OPTIONS=print_stacktrace=1 \
  run_suite asan "" -DCMAKE_BUILD_TYPE=Debug -DTORVANE_SANITIZE=address,undefined -DTORVANE_BENCHMARKS=OFF
TSAN_OPTIONS=halt_on_error=1 \
  run_suite tsan "-L core" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTORVANE_SANITIZE=thread -DTORVANE_BENCHMARKS=OFF
[ "$windows" != 1 ] || bash scripts/windows-test.sh build/tests
echo "=== fuzz"
bash scripts/fuzz.sh 60
