#!/usr/bin/env bash
# Sets up, builds the release preset, writes the glyph stand-in models with a sample clip
# drawn for the orientation given, and runs the engine over it through its C interface:
# one JSON line per frame. Options go to tactus_run (--mode, --orientation, --is-flip, ...).
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/install-deps.sh
cmake --preset release >/dev/null
cmake --build --preset release
make_args=()
args=("$@")
for ((i = 0; i < ${#args[@]}; ++i)); do
  case "${args[i]}" in
    --orientation) make_args+=(--orientation "${args[i + 1]:-0}") ;;
    --is-flip) [[ "${args[i + 1]:-true}" == "false" ]] && make_args+=(--back-camera) ;;
  esac
done
build/release/tools/make_glyph_models build/sample "${make_args[@]}"
build/release/tools/tactus_run --y4m build/sample/sample.y4m --nn-path build/sample --mode fist "$@"
