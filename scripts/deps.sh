#!/usr/bin/env bash
# Installs the Debian packages that zelcv's build needs, when they are missing.
#   scripts/deps.sh          what building and testing need
#   scripts/deps.sh --bench  also Google Benchmark for bench/
# The Windows builds need the MinGW-w64 compilers (both widths) and Wine for
# x86-64; a 32-bit Wine (wine32, from the i386 architecture) is tried as well
# and runs the 32-bit Windows suite when it installs.
set -euo pipefail
cd "$(dirname "$0")/.."

# OpenCV is a test dependency: the conformity tests compare results with it.
# clang and its runtime build the fuzz targets (libFuzzer) of the sanitizer run.
# opencv-data holds the stock Haar cascades that the classifier tests convert.
packages=(build-essential clang cmake g++-multilib libclang-rt-dev libgtest-dev libopencv-dev opencv-data pkg-config
          g++-mingw-w64-x86-64-posix g++-mingw-w64-i686-posix wine64)
if [[ "${1:-}" == "--bench" ]]; then
  packages+=(libbenchmark-dev)
fi

installed() { dpkg-query -W -f='${Status}' "$1" 2>/dev/null | grep -q "install ok installed"; }

sudo=""
[[ $(id -u) -ne 0 ]] && sudo="sudo"
export DEBIAN_FRONTEND=noninteractive

missing=()
for p in "${packages[@]}"; do
  installed "$p" || missing+=("$p")
done
if [[ ${#missing[@]} -gt 0 ]]; then
  echo "Installing: ${missing[*]}"
  # An index that fails to download (say, of another architecture) must not
  # stop the installation of what the others provide.
  $sudo apt-get update -qq || true
  $sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi

# The 32-bit Wine: one attempt per work tree (build/.no-wine32 records a
# failure; delete it to try again).
if ! installed wine32:i386 && [[ ! -e build/.no-wine32 ]]; then
  echo "Installing: wine32:i386 (optional)"
  if ! { $sudo dpkg --add-architecture i386 && { $sudo apt-get update -qq || true; } &&
         $sudo apt-get install -y -qq --no-install-recommends wine32:i386; } > build-wine32.log 2>&1; then
    echo "wine32 could not be installed (see build/.no-wine32): the 32-bit Windows suite will be built but not run"
    mkdir -p build
    mv build-wine32.log build/.no-wine32
  fi
  rm -f build-wine32.log
fi

# The sample photograph of the Haar classifier tests, benchmarks and demo:
# python3-skimage ships it; take the file alone, without the package's Python
# dependencies.
photo=build/testdata/astronaut.png
if [[ ! -e $photo ]]; then
  echo "Extracting: $photo (from python3-skimage)"
  mkdir -p build/testdata
  tmp=$(mktemp -d)
  if (cd "$tmp" && apt-get download python3-skimage > /dev/null 2>&1) && dpkg -x "$tmp"/python3-skimage_*.deb "$tmp/x"; then
    cp "$(find "$tmp/x" -path '*skimage/data/astronaut.png' | head -n 1)" "$photo"
  else
    echo "python3-skimage could not be downloaded: the face tests will fail until $photo exists"
  fi
  rm -rf "$tmp"
fi
