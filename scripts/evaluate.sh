#!/usr/bin/env bash
# Reproduces the README's evaluation of the trained models: draws held-out clips of
# synthetic hands (seeds and lengths not used in training) and runs tactus_evaluate on
# them per mode twice, with the trained networks of models/networks and with permissive
# ones (glyph stand-ins with fixed answers: every verifier passes, no palm is seen, no
# side is turned), so that the table shows what the networks remove and what they cost.
# The rings come compiled in either way.
# Every clip shows a fist, a thumb up, a victory sign and a pointer in turn.
#   scripts/evaluate.sh [modes] [seeds]     defaults: fist,thumbUp,victory,pointer  101 102 103 104
set -euo pipefail
cd "$(dirname "$0")/.."
modes="${1:-fist,thumbUp,victory,pointer}"
seeds="${2:-101 102 103 104}"
cmake --preset release >/dev/null
cmake --build --preset release --target handgen tactus_evaluate make_glyph_models >&2
out=build/eval
mkdir -p "$out/glyph" "$out/permissive"
tools=build/release/tools
# only the networks: a glyph .ring file here would win over the compiled ring
"$tools/make_glyph_models" "$out/glyph" --frames 1 --permissive >/dev/null
rm -f "$out"/permissive/*
cp "$out"/glyph/*.nn "$out/permissive/"
results="$out/results.jsonl"
: > "$results"
for seed in $seeds; do
  clip="$out/held$seed"
  if [[ ! -s "$clip.y4m" || ! -s "$clip.jsonl" ]]; then
    "$tools/handgen" clip --seed "$seed" --frames 300 --size 1280x720 --gestures fist,thumbUp,victory,pointer \
      --out "$clip.y4m" --truth "$clip.jsonl" >&2
  fi
  for nets in models/networks "$out/permissive"; do
    echo "== clip $seed networks $nets"
    "$tools/tactus_evaluate" --y4m "$clip.y4m" --truth "$clip.jsonl" --modes "$modes" --nn-path "$nets" 2>/dev/null |
      grep -v '^I/' | tee >(grep '^{' | sed "s#^{#{\"networks\":\"$nets\",#" >> "$results")
  done
done
wait
# the clips together: frames summed, then the shares
command -v python3 >/dev/null || exit 0
python3 - "$results" <<'PY'
import json, sys
rows = {}
for line in open(sys.argv[1]):
    r = json.loads(line)
    t = rows.setdefault((r["gesture"], "trained" if r["networks"] == "models/networks" else "permissive"),
                        dict(frames=0, counted=0, detected=0, false=0))
    t["frames"] += r["frames"]; t["counted"] += r["counted_frames"]
    t["detected"] += r["detected_frames"]; t["false"] += r["false_reports"]
print("\n| mode | networks | frames showing it | detected | false reports per 1,000 frames |")
print("|---|---|---|---|---|")
for (gesture, nets), t in sorted(rows.items()):
    share = 100.0 * t["detected"] / t["counted"] if t["counted"] else 0
    print(f"| {gesture} | {nets} | {t['counted']} | {share:.1f} % | {1000.0 * t['false'] / t['frames']:.1f} |")
PY
