#!/usr/bin/env bash
# Reproduces the README's evaluation of the trained models: draws held-out clips of
# synthetic hands (seeds and lengths not used in training) and runs tactus_evaluate on
# them per mode twice, with the trained networks of models/networks and with permissive
# ones (glyph stand-ins with fixed answers: every verifier passes, no palm is seen, no
# side is turned), so that the table shows what the networks remove and what they cost.
# The rings come compiled in either way.
# Every clip shows a fist, a thumb up, a victory sign and a pointer in turn.
#   scripts/evaluate.sh [modes] [seeds]     defaults: fist,thumbUp  101 102
set -euo pipefail
cd "$(dirname "$0")/.."
modes="${1:-fist,thumbUp}"
seeds="${2:-101 102}"
cmake --preset release >/dev/null
cmake --build --preset release --target handgen tactus_evaluate make_glyph_models >&2
out=build/eval
mkdir -p "$out/glyph" "$out/permissive"
tools=build/release/tools
# only the networks: a glyph .ring file here would win over the compiled ring
"$tools/make_glyph_models" "$out/glyph" --frames 1 --permissive >/dev/null
rm -f "$out"/permissive/*
cp "$out"/glyph/*.nn "$out/permissive/"
for seed in $seeds; do
  clip="$out/held$seed"
  if [[ ! -s "$clip.y4m" || ! -s "$clip.jsonl" ]]; then
    "$tools/handgen" clip --seed "$seed" --frames 300 --size 1280x720 --gestures fist,thumbUp,victory,pointer \
      --out "$clip.y4m" --truth "$clip.jsonl" >&2
  fi
  for nets in models/networks "$out/permissive"; do
    echo "== clip $seed networks $nets"
    "$tools/tactus_evaluate" --y4m "$clip.y4m" --truth "$clip.jsonl" --modes "$modes" --nn-path "$nets" 2>/dev/null |
      grep -v '^I/'
  done
done
