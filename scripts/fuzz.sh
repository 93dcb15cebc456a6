#!/usr/bin/env bash
# Fuzzes the XML reader and the help-text mark-up: builds tests/core/fuzz and tests/ui/fuzz with
# clang (libFuzzer, AddressSanitizer and UndefinedBehaviorSanitizer) and runs each target for
# SECONDS (default 60) on a copy of its seed corpus, so that the corpora in the tree stay as
# committed. Fails on any finding (a crash, a sanitizer report, a run over 10 s, memory over
# libFuzzer's 2 GB limit); the input that caused it is left in the target's build folder
# (under TORVANE_FUZZ_BUILD, default build/fuzz).
#   usage: scripts/fuzz.sh [SECONDS]
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${1:-60}
root=${TORVANE_FUZZ_BUILD:-build/fuzz}

# fuzz SOURCE_FOLDER TARGET DICTIONARY [LIBFUZZER OPTIONS...]
fuzz() {
  local source=$1 target=$2 dictionary=$3 build="$root/$2"
  shift 3
  CC=clang CXX=clang++ cmake -S "$source" -B "$build" -G Ninja >/dev/null
  cmake --build "$build"
  rm -rf "$build/corpus"
  cp -r "$source/corpus" "$build/corpus"
  UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 "$build/$target" \
    -max_total_time="$seconds" -timeout=10 -print_final_stats=1 \
    -dict="$dictionary" -artifact_prefix="$build/" "$@" "$build/corpus"
}

fuzz tests/core/fuzz torvane_fuzz_xml_reader tests/core/fuzz/xml.dict
# Longer inputs than the default, so that nesting and tables grow deep and wide.
fuzz tests/ui/fuzz torvane_fuzz_markup tests/ui/fuzz/markup.dict -max_len=65536
