#!/usr/bin/env bash
# Installs what the build, the tests and the benchmarks need, from Debian's packages.
# Idempotent: quick when everything is already there.
#   scripts/install-deps.sh            host build, tests, benchmarks
#   scripts/install-deps.sh --cross    also the AArch64 cross compiler and qemu
set -euo pipefail

packages=(cmake ninja-build g++ libgtest-dev libgmock-dev libbenchmark-dev libsimde-dev libyuv-dev libopencv-dev
          pkg-config libavformat-dev libavcodec-dev libavutil-dev libswscale-dev)
if [[ "${1:-}" == "--cross" ]]; then
  packages+=(g++-aarch64-linux-gnu qemu-user googletest)
fi

missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed' || missing+=("$p")
done
if ((${#missing[@]})); then
  sudo=""
  [[ $(id -u) -ne 0 ]] && sudo="sudo"
  $sudo apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi
