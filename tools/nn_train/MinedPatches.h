#pragma once
// Training patches cut from real cascade hits: generated clips go through the camera's
// conversion to the working image, the chain's trigger (its ring and settings) scans them
// with the engine's AdaBoostDetector and grouping, and every grouped hit is labelled
// against the clip's ground truth and cut where the chain's verifier cuts it.

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Evaluation.h"
#include "HandClip.h"
#include "LQ_ImageData.h"
#include "LQ_ObjectLocation.h"
#include "PatchData.h"

class ClassifierRing;

namespace nntrain {

// what the chain's trigger is, as the engine builders set it up at orientation 0
struct TriggerSetup {
    ClassifierRing* (*ring)();
    int minWidth, step, minWeight;
    float similarity;
    LQ::RelativeLocation result;  // from the hit to the reported rectangle
};
// null for a recipe whose chain has no trigger to mine with
const TriggerSetup* triggerFor(const Recipe& recipe);

enum class HitLabel { Positive, Negative, Dropped };

// rectangles and their overlap as the evaluation matches reports with the truth
using evaluation::Rect;
using evaluation::overlap;
struct TruthHand {
    std::optional<handgen::Gesture> gesture;  // none while changing shape or mostly outside
    Rect rect;
};

// Positive when the reported rectangle overlaps a hand of the gesture by positiveOverlap
// (what tactus_evaluate counts as a detection);
// negative when it overlaps no hand of the gesture, nor an unlabelled hand, by
// negativeOverlap; dropped in between.
HitLabel labelHit(const Rect& reported, const std::vector<TruthHand>& hands, handgen::Gesture gesture,
                  float positiveOverlap = 0.3f, float negativeOverlap = 0.15f);

// interleaved RGB frame -> NV21 -> the engine's BGR working image at half size
LQ::Image workingImage(const std::vector<std::uint8_t>& rgb, int width, int height);

struct Hit {
    LQ::ObjectLocation location;  // as the trigger hands it to the verifier
    Rect reported;
    HitLabel label;
    std::uint8_t kind;  // handgen::SampleKind: positive, background or another gesture's hand
};

// The trigger's grouped hits on a BGR working image, labelled; chainImage receives the
// image the chain's verifier reads (mono or BGR node over the same frame).
std::vector<Hit> mineFrame(const Recipe& recipe, const TriggerSetup& trigger, const LQ::Image& bgr,
                           const std::vector<TruthHand>& truth, LQ::Image& chainImage);

// the verifier's patch of a hit, by the chain's relative location and getPatch
LQ::Image cutPatch(const Recipe& recipe, const LQ::Image& chainImage, const LQ::ObjectLocation& hit);

struct MiningOptions {
    std::uint64_t seed = 1;
    int clips = 10, frames = 240, frameStep = 4;
    int width = 1280, height = 720;
    handgen::Variation variation;
    std::vector<handgen::Gesture> gestures;  // drawn with repeats as weights; empty: the recipe's default
    int jitter = 2;              // extra patches per hit, moved as the tracker's hits move
    int maxNegativesPerFrame = 6;
    int threads = 1;
};

struct MiningStats {
    long frames = 0, hits = 0, positives = 0, negatives = 0, dropped = 0, onOtherHands = 0;
    double seconds = 0;
    std::string describe() const;
};

PatchSet minePatches(const Recipe& recipe, const MiningOptions& options, MiningStats& stats);

// a after b, as one set
PatchSet concatenate(const PatchSet& a, const PatchSet& b);

// A mined set and its figures kept in a file, so that variants of a training run don't
// draw and scan the same clips again; false when the file can't be read.
bool loadPatches(const std::string& path, PatchSet& set, MiningStats& stats);
void savePatches(const std::string& path, const PatchSet& set, const MiningStats& stats);

}  // namespace nntrain
