#!/usr/bin/env bash
# Installs the dependencies, builds the kernel and the command-line host, and runs the host.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh
cmake -S . -B build/release -G Ninja -DCMAKE_BUILD_TYPE=Release -DTORVANE_TESTS=OFF -DTORVANE_BENCHMARKS=OFF
cmake --build build/release
./build/release/tools/torvane "$@"
