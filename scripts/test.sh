#!/usr/bin/env bash
# Builds zelcv and runs every test in these configurations: x86-64 Release,
# 32-bit x86 (SSE2), AddressSanitizer + UndefinedBehaviorSanitizer (then the
# fuzz targets, built with clang, each for a short bounded time), and
# ThreadSanitizer (the concurrent-call tests only).
#   scripts/test.sh [release|x86|sanitize|tsan ...]   (default: all four)
#   ZELCV_FUZZ_SECONDS=n scripts/test.sh sanitize     fuzz each target n seconds (default 15)
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/deps.sh

jobs=$(nproc)
# ccache, where the machine has it, shares objects between configurations
# and work trees; results do not depend on it.
launcher=()
command -v ccache > /dev/null && launcher=(-DCMAKE_C_COMPILER_LAUNCHER=ccache -DCMAKE_CXX_COMPILER_LAUNCHER=ccache)
configs=("$@")
[[ ${#configs[@]} -eq 0 ]] && configs=(release x86 sanitize tsan)

for config in "${configs[@]}"; do
  case "$config" in
    release)  flags=(-DCMAKE_BUILD_TYPE=Release) ;;
    x86)      flags=(-DCMAKE_BUILD_TYPE=Release -DCMAKE_C_FLAGS=-m32 -DCMAKE_CXX_FLAGS=-m32
                     -DCMAKE_ASM_FLAGS=-m32 -DCMAKE_LIBRARY_ARCHITECTURE=i386-linux-gnu) ;;
    sanitize) flags=(-DCMAKE_BUILD_TYPE=RelWithDebInfo -DZELCV_SANITIZE=ON) ;;
    tsan)     flags=(-DCMAKE_BUILD_TYPE=RelWithDebInfo -DZELCV_TSAN=ON) ;;
    *) echo "unknown configuration: $config" >&2; exit 2 ;;
  esac
  echo "=== $config"
  cmake -S . -B "build/test-$config" "${flags[@]}" "${launcher[@]}" > "build-$config.log" 2>&1 || { cat "build-$config.log"; exit 1; }
  rm -f "build-$config.log"
  if [[ "$config" == tsan ]]; then
    # Only the concurrent calls: several threads through every export at once.
    cmake --build "build/test-$config" -j"$jobs" --target zelcv_torture_tests
    ctest --test-dir "build/test-$config" -j"$jobs" --output-on-failure -R '^Threads\.'
    continue
  fi
  cmake --build "build/test-$config" -j"$jobs"
  ctest --test-dir "build/test-$config" -j"$jobs" --output-on-failure
  if [[ "$config" == sanitize ]]; then
    echo "=== fuzz"
    cmake -S . -B build/test-fuzz -DCMAKE_BUILD_TYPE=RelWithDebInfo -DZELCV_FUZZ=ON \
          -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ \
          "-DZELCV_FUZZ_SECONDS=${ZELCV_FUZZ_SECONDS:-15}" "${launcher[@]}" > build-fuzz.log 2>&1 ||
      { cat build-fuzz.log; exit 1; }
    rm -f build-fuzz.log
    cmake --build build/test-fuzz -j"$jobs"
    ctest --test-dir build/test-fuzz -j"$jobs" --output-on-failure
  fi
done
