#!/usr/bin/env bash
# Sets up, builds the release preset, draws a 1280x720 clip of synthetic hands (fist, thumb
# up, victory) with its ground truth, and runs the engine over it through its C interface
# with the trained rings compiled in and the trained networks of models/networks: one JSON
# line per frame on standard output. Options go to tactus_run (--mode, --is-flip, ...); the
# clip is drawn upright, which the default orientation 270 with a back camera expects.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/install-deps.sh
cmake --preset release >/dev/null
cmake --build --preset release >&2
mkdir -p build/sample
if [[ ! -s build/sample/hands.y4m || ! -s build/sample/hands.jsonl ]]; then
  build/release/tools/handgen clip --seed 7 --frames 240 --size 1280x720 --gestures fist,thumbUp,victory \
    --out build/sample/hands.y4m --truth build/sample/hands.jsonl >&2
fi
build/release/tools/tactus_run --y4m build/sample/hands.y4m --nn-path models/networks --mode fist \
  --orientation 270 --is-flip false "$@"
