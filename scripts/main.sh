#!/usr/bin/env bash
# Installs the dependencies, builds the kernel and the command-line host, and renders the
# built-in demo through the compressor (or runs `torvane` with the arguments given, relative
# paths taken from the folder it is called in).
set -euo pipefail
repo=$(cd "$(dirname "$0")/.." && pwd)
bash "$repo/scripts/install-deps.sh"
cmake -S "$repo" -B "$repo/build/release" -G Ninja -DCMAKE_BUILD_TYPE=Release -DTORVANE_TESTS=OFF -DTORVANE_BENCHMARKS=OFF
cmake --build "$repo/build/release"
if [ $# -eq 0 ]; then
  demo="$repo/build/demo-compressed.wav"
  "$repo/build/release/tools/torvane" render KCompressorPlugin "$demo" --set threshold=0.2 --set ratio=4 --set kneemode=Soft
  echo "The demo, compressed: $demo"
else
  "$repo/build/release/tools/torvane" "$@"
fi
