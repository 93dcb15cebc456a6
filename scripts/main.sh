#!/usr/bin/env bash
# Installs the dependencies, builds the kernel and the command-line host, and renders the
# built-in demo through a plug-in (or runs `torvane` with the arguments given).
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh
cmake -S . -B build/release -G Ninja -DCMAKE_BUILD_TYPE=Release -DTORVANE_TESTS=OFF -DTORVANE_BENCHMARKS=OFF
cmake --build build/release
if [ $# -eq 0 ]; then
  set -- render KCompressorPlugin demo-compressed.wav --set threshold=0.2 --set ratio=4 --set kneemode=Soft
fi
./build/release/tools/torvane "$@"
