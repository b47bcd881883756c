#!/usr/bin/env bash
# Installs the Debian packages that zelcv's build needs, when they are missing.
#   scripts/deps.sh          what building and testing need
#   scripts/deps.sh --bench  also Google Benchmark for bench/
set -euo pipefail

# OpenCV is a test dependency: the conformity tests compare results with it.
# clang and its runtime build the fuzz targets (libFuzzer) of the sanitizer run.
packages=(build-essential clang cmake g++-multilib libclang-rt-dev libgtest-dev libopencv-dev pkg-config)
if [[ "${1:-}" == "--bench" ]]; then
  packages+=(libbenchmark-dev)
fi

missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done
[[ ${#missing[@]} -eq 0 ]] && exit 0

echo "Installing: ${missing[*]}"
sudo=""
[[ $(id -u) -ne 0 ]] && sudo="sudo"
export DEBIAN_FRONTEND=noninteractive
$sudo apt-get update -qq
$sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
