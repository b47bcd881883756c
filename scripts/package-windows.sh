#!/usr/bin/env bash
# Makes the Windows package: build/zelcv-<version>-windows.zip with
#   include/            zelcv.h, zelcv/*.h, zelcore.h
#   x86/ and x64/       bin/zelcv.dll, bin/zelcore.dll,
#                       lib/libzelcv.dll.a, lib/libzelcore.dll.a (MinGW import libraries),
#                       lib/zelcv.def, lib/zelcore.def (for MSVC's lib /def)
#   README.md           (section "Windows": linking from MinGW and from MSVC)
# Builds both widths with the MinGW-w64 toolchain files, or takes existing
# build trees:
#   scripts/package-windows.sh [--from <x86 build dir> <x64 build dir>]
set -euo pipefail
cd "$(dirname "$0")/.."

if [[ "${1:-}" == "--from" ]]; then
  x86_dir=$2
  x64_dir=$3
else
  scripts/deps.sh
  launcher=()
  command -v ccache > /dev/null && launcher=(-DCMAKE_C_COMPILER_LAUNCHER=ccache -DCMAKE_CXX_COMPILER_LAUNCHER=ccache)
  x86_dir=build/package-windows-x86
  x64_dir=build/package-windows-x64
  for pair in "i686:$x86_dir" "x86_64:$x64_dir"; do
    cmake -S . -B "${pair#*:}" -DCMAKE_BUILD_TYPE=Release -DZELCV_BUILD_TESTS=OFF -DZELCV_BUILD_DEMO=OFF \
          -DCMAKE_TOOLCHAIN_FILE="cmake/toolchains/mingw-w64-${pair%%:*}.cmake" "${launcher[@]}" > /dev/null
    cmake --build "${pair#*:}" -j"$(nproc)" --target zelcv zelcore
  done
fi

version=$(sed -n 's/^project(zelcv VERSION \([0-9.]*\).*/\1/p' CMakeLists.txt)
name="zelcv-$version-windows"
stage="build/$name"
rm -rf "$stage" "build/$name.zip"
mkdir -p "$stage/include"
cp -r include/zelcv.h include/zelcv include/zelcore.h "$stage/include/"
cp README.md "$stage/"
for pair in "x86:$x86_dir" "x64:$x64_dir"; do
  arch=${pair%%:*}
  dir=${pair#*:}
  mkdir -p "$stage/$arch/bin" "$stage/$arch/lib"
  cp "$dir/zelcv.dll" "$dir/zelcore.dll" "$stage/$arch/bin/"
  cp "$dir/libzelcv.dll.a" "$dir/libzelcore.dll.a" "$stage/$arch/lib/"
  cp "$dir/generated/zelcv.def" zelcore/zelcore.def "$stage/$arch/lib/"
done
(cd build && cmake -E tar cf "$name.zip" --format=zip "$name")
echo "build/$name.zip"
