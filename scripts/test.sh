#!/usr/bin/env bash
# Builds zelcv and runs every test in these configurations: x86-64 Release,
# 32-bit x86 (SSE2), AddressSanitizer + UndefinedBehaviorSanitizer (clang; the
# fuzz targets too, each run for a short bounded time),
# ThreadSanitizer (the concurrent-call tests only), and the Windows DLLs
# cross-built with MinGW-w64: x86-64 (suite under Wine) and 32-bit x86 (tables
# checked; suite under a 32-bit Wine where one is installed).
#   scripts/test.sh [release|x86|sanitize|tsan|windows|windows-x86 ...]   (default: all)
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
[[ ${#configs[@]} -eq 0 ]] && configs=(release x86 sanitize tsan windows windows-x86)

# Whether this machine runs 32-bit x86 programs: some kernels and hypervisors
# do not. Where it does not, the x86 configuration builds the library and the
# demo only (tests that cannot run are not worth their build time); the
# summary says so. Likewise the 32-bit Windows configuration without a 32-bit
# Wine builds the DLLs and checks their tables only.
runs_x86() {
  mkdir -p build
  printf 'int main(void) { return 0; }\n' > build/.probe32.c
  cc -m32 build/.probe32.c -o build/.probe32 2> /dev/null && build/.probe32 2> /dev/null
}

summary=()
for config in "${configs[@]}"; do
  case "$config" in
    release)  flags=(-DCMAKE_BUILD_TYPE=Release) ;;
    # The C and C++ flags alone choose the target, the entry table included.
    x86)      flags=(-DCMAKE_BUILD_TYPE=Release -DCMAKE_C_FLAGS=-m32 -DCMAKE_CXX_FLAGS=-m32
                     -DCMAKE_LIBRARY_ARCHITECTURE=i386-linux-gnu) ;;
    # clang, so that the fuzz targets (libFuzzer) share the instrumented
    # library with the suites; each suite runs in a few processes, since a
    # sanitized process is slow to start.
    sanitize) flags=(-DCMAKE_BUILD_TYPE=RelWithDebInfo -DZELCV_SANITIZE=ON -DZELCV_FUZZ=ON
                     -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ -DZELCV_TEST_SHARDS=4
                     "-DZELCV_FUZZ_SECONDS=${ZELCV_FUZZ_SECONDS:-15}") ;;
    tsan)     flags=(-DCMAKE_BUILD_TYPE=RelWithDebInfo -DZELCV_TSAN=ON) ;;
    windows)  flags=(-DCMAKE_BUILD_TYPE=Release -DZELCV_BUILD_DEMO=OFF
                     -DCMAKE_TOOLCHAIN_FILE=cmake/toolchains/mingw-w64-x86_64.cmake) ;;
    windows-x86) flags=(-DCMAKE_BUILD_TYPE=Release -DZELCV_BUILD_DEMO=OFF
                     -DCMAKE_TOOLCHAIN_FILE=cmake/toolchains/mingw-w64-i686.cmake) ;;
    *) echo "unknown configuration: $config" >&2; exit 2 ;;
  esac
  run_tests=1
  [[ "$config" == x86 ]] && ! runs_x86 && run_tests=0
  echo "=== $config"
  dir="build/test-$config"
  # A build directory made with other options (another compiler, say) is
  # started afresh: CMake does not carry a cache across such a change. The
  # fuzzing time is a plain cache value and does not count.
  options=$(printf '%s\n' "${flags[@]}" | grep -v '^-DZELCV_FUZZ_SECONDS=' || true)
  if [[ -e "$dir/CMakeCache.txt" && "$(cat "$dir/.options" 2> /dev/null)" != "$options" ]]; then
    rm -rf "$dir"
  fi
  cmake -S . -B "$dir" "${flags[@]}" "${launcher[@]}" > "build-$config.log" 2>&1 || { cat "build-$config.log"; exit 1; }
  rm -f "build-$config.log"
  printf '%s' "$options" > "$dir/.options"
  if [[ "$config" == tsan ]]; then
    # Only the concurrent calls: several threads through every export at once.
    cmake --build "$dir" -j"$jobs" --target zelcv_torture_tests
    ctest --test-dir "$dir" -j"$jobs" --output-on-failure -R '^Threads\.'
    summary+=("$config: concurrent-call tests run")
    continue
  fi
  if [[ $run_tests == 0 ]]; then
    cmake --build "$dir" -j"$jobs" --target zelcv zelcv-demo
    echo "This machine does not run 32-bit x86 programs: $config library and demo built, its tests not run."
    summary+=("$config: library and demo built, tests NOT built or run (this machine does not execute 32-bit x86 programs)")
    continue
  fi
  if [[ "$config" == windows* ]] && ! ctest --test-dir "$dir" -N | grep -q " abi$"; then
    cmake --build "$dir" -j"$jobs" --target zelcv zelcore
    ctest --test-dir "$dir" --output-on-failure -R '^Windows\.DllTables$'
    summary+=("$config: DLL tables checked, test suite NOT built or run (no Wine for this target)")
    continue
  fi
  cmake --build "$dir" -j"$jobs"
  ctest --test-dir "$dir" -j"$jobs" --output-on-failure
  case "$config" in
    windows*) summary+=("$config: DLL tables checked, test suite run under Wine") ;;
    *) summary+=("$config: all tests run") ;;
  esac
  if [[ "$config" == sanitize ]]; then
    summary+=("fuzz: each target run for ${ZELCV_FUZZ_SECONDS:-15} s")
  fi
done
printf '%s\n' "=== summary" "${summary[@]}"
