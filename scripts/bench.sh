#!/usr/bin/env bash
# Builds and runs the benchmarks against OpenCV. Arguments go to zelcv-bench.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/deps.sh --bench
cmake -S . -B build/bench -DCMAKE_BUILD_TYPE=Release -DZELCV_BUILD_BENCH=ON -DZELCV_BUILD_TESTS=OFF > /dev/null
cmake --build build/bench -j"$(nproc)" --target zelcv-bench
build/bench/bench/zelcv-bench "$@"
