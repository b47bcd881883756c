#!/usr/bin/env bash
# Builds zelcv and runs every test in three configurations: x86-64 Release,
# 32-bit x86 (SSE2), and AddressSanitizer + UndefinedBehaviorSanitizer.
#   scripts/test.sh [release|x86|sanitize ...]   (default: all three)
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/deps.sh

jobs=$(nproc)
# ccache, where the machine has it, shares objects between configurations
# and work trees; results do not depend on it.
launcher=()
command -v ccache > /dev/null && launcher=(-DCMAKE_C_COMPILER_LAUNCHER=ccache -DCMAKE_CXX_COMPILER_LAUNCHER=ccache)
configs=("$@")
[[ ${#configs[@]} -eq 0 ]] && configs=(release x86 sanitize)

for config in "${configs[@]}"; do
  case "$config" in
    release)  flags=(-DCMAKE_BUILD_TYPE=Release) ;;
    x86)      flags=(-DCMAKE_BUILD_TYPE=Release -DCMAKE_C_FLAGS=-m32 -DCMAKE_CXX_FLAGS=-m32
                     -DCMAKE_ASM_FLAGS=-m32 -DCMAKE_LIBRARY_ARCHITECTURE=i386-linux-gnu) ;;
    sanitize) flags=(-DCMAKE_BUILD_TYPE=RelWithDebInfo -DZELCV_SANITIZE=ON) ;;
    *) echo "unknown configuration: $config" >&2; exit 2 ;;
  esac
  echo "=== $config"
  cmake -S . -B "build/test-$config" "${flags[@]}" "${launcher[@]}" > "build-$config.log" 2>&1 || { cat "build-$config.log"; exit 1; }
  rm -f "build-$config.log"
  cmake --build "build/test-$config" -j"$jobs"
  ctest --test-dir "build/test-$config" -j"$jobs" --output-on-failure
done
