#!/usr/bin/env bash
# Reproduces the README's evaluation of the trained models: draws held-out clips of
# synthetic hands (seeds and lengths not used in training) and runs tactus_evaluate on
# them per mode twice, with the trained networks of models/networks and with permissive
# chain networks (the glyph stand-ins' .nn files, which pass every patch), so that the
# table shows what the verifiers remove and what they cost. Rings and the palm rejector's
# two verifiers come compiled in either way: the glyph palm verifiers would see a palm
# everywhere and refuse every victory and pointer.
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
"$tools/make_glyph_models" "$out/glyph" --frames 1 >/dev/null
rm -f "$out"/permissive/*.nn
for f in "$out"/glyph/*.nn; do
  [[ "$(basename "$f")" == palm_verifier* ]] || cp "$f" "$out/permissive/"
done
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
