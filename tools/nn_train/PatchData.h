#pragma once
// Training patches for the verifier networks, cut by the runtime's own code: a generated
// scene holds a hand whose reference box sits where a cascade hit would put it; the hit's
// location goes through the chain's relative location and ObjectLocation::getPatch, and
// the patch becomes the network's input through NnDetector::convert.

#include <cstdint>
#include <string>
#include <vector>

#include "HandScene.h"
#include "LQ_ColorMode.h"
#include "LQ_Image.h"
#include "LQ_ObjectLocation.h"
#include "TrainLayers.h"

namespace nntrain {

enum class Task {
    Verify,  // class 1: the gesture, well placed
    Side     // class 1: the hit's side is the wrong one, so the step turns it
};

enum class Shape { Palm35x33, Palm50x60, Small };

// one network of the engine: what it sees, how it is read and by what threshold
struct Recipe {
    std::string name;  // the model's name and file stem
    handgen::Gesture gesture;
    Task task;
    float scale, shiftX, shiftY;  // the chain's relative location R(scale, shift, 0, 0)
    int width, height;            // network input
    LQ::ColorMode mode;
    float threshold;  // the chain's threshold on the probability of class 1
    float boxFraction;  // the hand's reference box width over the hit's width
    float boxAspect;    // reference box height over width at the neutral build
    Shape shape;
    LQ::RelativeLocation relative() const {
        return LQ::RelativeLocation(scale, LQ::BasePoint<float>(shiftX, shiftY), 0, 0, 0);
    }
};

const std::vector<Recipe>& recipes();
// null when no recipe has the name
const Recipe* findRecipe(const std::string& name);

struct DataOptions {
    std::uint64_t seed = 1;
    int positives = 1000, negatives = 2000;
    handgen::Variation variation;
    float angleRange = 30;   // hits come at angles uniform in +-angleRange degrees
    float oversample = 1.5f; // scene pixels per patch pixel, so patches are scaled down as in frames
    int supersample = 2;
    int threads = 1;
    float otherGestureShare = 0.45f, misplacedShare = 0.2f;
};

struct PatchSet {
    Tensor inputs;            // N x depth x height x width, as NnDetector::convert writes them
    std::vector<int> labels;  // 0 or 1
    std::vector<std::uint8_t> kinds;  // handgen::SampleKind of the scene
};

PatchSet makePatches(const Recipe& recipe, const DataOptions& options);

// the scene and hit of one sample, for inspection; returns the patch
LQ::Image makePatch(const Recipe& recipe, const DataOptions& options, int index, int& label, std::uint8_t& kind);

}  // namespace nntrain
