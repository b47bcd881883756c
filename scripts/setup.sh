#!/usr/bin/env bash
# Installs what zelcv needs, builds it, and runs the demo. The demo's pictures
# go to build/demo/.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/deps.sh --bench
cmake -S . -B build/release -DCMAKE_BUILD_TYPE=Release -DZELCV_BUILD_TESTS=OFF
cmake --build build/release -j"$(nproc)"
mkdir -p build/demo
build/release/examples/zelcv-demo build/demo
