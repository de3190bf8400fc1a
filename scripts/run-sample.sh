#!/usr/bin/env bash
# Sets up, builds the release preset and runs the engine through its C interface over
# a generated sample clip, one JSON line per frame.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/install-deps.sh
cmake --preset release >/dev/null
cmake --build --preset release
build/release/tools/tactus_run --sample 30 "$@"
