#!/bin/sh
# Trains the engine's verifier networks on generated patches, one after another, and
# writes each as NAME.nn (the palm verifiers also as NAME.cpp) with NAME.log beside it.
#   models/networks/train.sh [BUILD_DIR] [NAME...]
# Held-out patches come from another seed and wider ranges of skin, noise, blur and turn.
# The fist, victory and pointer verifiers also learn from the hits of their chain's trigger on
# generated clips (--mine-*), and are scored on hits mined from clips of other seeds.
# MINED_CACHE=DIR keeps the mined sets there for another run (the result doesn't change).
set -e
here=$(cd "$(dirname "$0")" && pwd)
build=${1:-$here/../../build/release}
shift || true
train="$build/tools/nn_train"
heldout="--heldout-seed 9001 --heldout-set skinTone=0,1 --heldout-set noise=2,9 --heldout-set blur=0,1.0 --heldout-set rotation=-15,15"
run() {
    name=$1
    shift
    if [ -n "$only" ] && ! echo " $only " | grep -q " $name "; then return; fi
    nice "$train" --network "$name" --out "$here" --threads 2 $heldout ${cache:+--mined-cache "$cache"} "$@"
}
only="$*"
cache=${MINED_CACHE:-}
run palm_verifier__iter_250000 --seed 11 --rate 0.01 --positives 5000 --negatives 10000 --heldout-positives 1500 --heldout-negatives 3000 --epochs 14
run palm_verifier_iter_140000 --seed 12 --rate 0.01 --positives 3500 --negatives 7000 --heldout-positives 1500 --heldout-negatives 3000 --epochs 12
mined="--mine-frames 240 --mine-step 4 --mine-jitter 3 --heldout-mine-clips 10"
run fist_verifier_iter_135000 --seed 13 --positives 3000 --negatives 6000 --heldout-positives 1500 --heldout-negatives 3000 --epochs 12 \
    $mined --mine-clips 60 --mine-seed 113 --heldout-mine-seed 9113 --mined-repeat 2
run thumbUp_verifier_iter_55000 --seed 14 --positives 4000 --negatives 8000 --heldout-positives 1500 --heldout-negatives 3000 --epochs 10
run victory_verifier_face_pos_color_2017_12_14__iter_39000 --seed 15 --positives 4000 --negatives 8000 --heldout-positives 1500 --heldout-negatives 3000 --epochs 10 \
    $mined --mine-clips 40 --mine-seed 115 --heldout-mine-seed 9115 --mined-repeat 2
run pointer_verifier__iter_18000 --seed 16 --positives 4000 --negatives 8000 --heldout-positives 1500 --heldout-negatives 3000 --epochs 10 \
    $mined --mine-clips 40 --mine-seed 116 --heldout-mine-seed 9116 --mined-repeat 2 --ring-dir "$here/../rings"
run pointer_hand_side__iter_7500 --seed 17 --positives 6000 --negatives 6000 --heldout-positives 2250 --heldout-negatives 2250 --epochs 10
run heart_verifier_vent_iter_60000 --seed 18 --positives 4000 --negatives 8000 --heldout-positives 1500 --heldout-negatives 3000 --epochs 10
