#!/usr/bin/env bash
# Fuzzes the XML reader: builds tests/core/fuzz with clang (libFuzzer, AddressSanitizer and
# UndefinedBehaviorSanitizer) and runs it for SECONDS (default 60) on a copy of the seed
# corpus, so that the corpus in the tree stays as committed. Fails on any finding; the input
# that caused it is left in the build folder (TORVANE_FUZZ_BUILD, default build/fuzz).
#   usage: scripts/fuzz.sh [SECONDS]
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${1:-60}
build=${TORVANE_FUZZ_BUILD:-build/fuzz}

CC=clang CXX=clang++ cmake -S tests/core/fuzz -B "$build" -G Ninja >/dev/null
cmake --build "$build"

rm -rf "$build/corpus"
cp -r tests/core/fuzz/corpus "$build/corpus"
UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 "$build/torvane_fuzz_xml_reader" \
  -max_total_time="$seconds" -timeout=10 -print_final_stats=1 \
  -dict=tests/core/fuzz/xml.dict -artifact_prefix="$build/" "$build/corpus"
