#!/usr/bin/env bash
# Sets up, builds and runs the whole test suite: the release preset, the sanitizer
# preset, and the AArch64 cross-build under qemu.
#   scripts/test.sh                  all three
#   scripts/test.sh release asan     only those presets
set -euo pipefail
cd "$(dirname "$0")/.."
presets=("$@")
((${#presets[@]})) || presets=(release asan aarch64)

cross=""
for p in "${presets[@]}"; do [[ "$p" == aarch64 ]] && cross="--cross"; done
scripts/install-deps.sh $cross

for p in "${presets[@]}"; do
  echo "=== $p"
  cmake --preset "$p" >/dev/null
  cmake --build --preset "$p"
  ctest --preset "$p"
done
