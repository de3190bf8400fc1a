#pragma once
// Whole cascades and rings from generated hands: the rings the engines ask for with their
// window geometry, the positives and negatives drawn by handgen, bootstrapping of negatives
// that the cascade so far accepts, and the held-out measures.

#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

#include "CascadeTrainer.h"
#include "CascadedClassifier.h"
#include "ClassifierRing.h"
#include "HandModel.h"
#include "HandScene.h"

namespace ctrain {

struct CascadePlan {
    int width = 0, height = 0;          // the window, monoSize
    int baseWidth = 0, baseHeight = 0;  // the object
    int centerX = 0, centerY = 0;
    int angle = 0;
    std::vector<int> stageSizes;  // weak classifiers per stage of the reference layout
};

struct RingPlan {
    std::string name;
    std::string cascadeName;  // empty: the ring's name, "_r" and the cascade's number
    handgen::Gesture gesture = handgen::Gesture::Fist;
    std::string shape;        // the shape label kept in the config
    bool setsCenter = false;  // the object centre is set apart from the window's middle
    std::vector<CascadePlan> cascades;
};

const std::vector<RingPlan>& ringPlans();
// by ring name or gesture name ("fist", "thumbUp", ...); null if unknown
const RingPlan* findRingPlan(const std::string& name);

struct TrainOptions {
    std::uint64_t seed = 1;
    int positives = 3000;
    int negatives = 6000;
    // weak classifiers per stage; the number of stages is its length
    std::vector<int> stageSizes;
    int haarStart = 3, hogStart = 4;  // stage, counted from 1, at which each kind comes in
    int haarPool = 1500, hogPool = 1500;
    StageOptions stage;
    int sceneWidth = 160, sceneHeight = 120;
    int maxMiningRounds = 40;  // batches of generated windows and scenes per stage
    handgen::Variation variation;
    int threads = 2;
};

// the cascade's object rectangle in its window
LQ::BaseRect<int> objectRect(const CascadePlan& plan);
// a cascade with the plan's geometry and no stages
CascadedClassifier emptyCascade(const CascadePlan& plan, const std::string& name, bool setsCenter);

// Window crops (with the trainer's margin) of the gesture or of its negatives, by handgen.
SampleSet positiveSamples(const CascadePlan& plan, handgen::Gesture gesture,
                          const handgen::Variation& variation, std::uint64_t seed, std::uint64_t first,
                          int count, int threads);

// Accepts crops with the scan's own evaluation, on a copy of the cascade that is activated
// for the crops' strides.
class CropJudge {
public:
    explicit CropJudge(const CascadedClassifier& cascade);
    bool accepts(const std::uint8_t* crop, int cropWidth, int cropHeight, int* score = nullptr);

private:
    CascadedClassifier cascade_;
    LQ::Image mono_, rmct_, integral_;
    bool activated_ = false;
};

// Scans mono scenes at zoom 1 with the engine's layer scan; hit windows' crops (with the
// margin, where it lies in the scene) are appended to crops. With variants 2 or 4 each
// scene is also scanned mirrored and upside down: more windows for one rendering.
struct SceneScan {
    long long windows = 0, hits = 0;
};
SceneScan scanScenes(const CascadedClassifier& cascade, const std::vector<std::uint8_t>& scenes,
                     int sceneWidth, int sceneHeight, int maxCropsPerScene, std::vector<std::uint8_t>* crops,
                     int variants = 1);

// background scenes with other gestures, never the gesture itself at a place a positive could be
std::vector<std::uint8_t> negativeScenes(const CascadePlan& plan, handgen::Gesture gesture,
                                         const handgen::Variation& variation, std::uint64_t seed,
                                         std::uint64_t first, int count, int width, int height, int threads);

struct CascadeResult {
    CascadedClassifier cascade;
    std::vector<StageReport> stages;
};
CascadeResult trainCascade(const RingPlan& ring, size_t cascadeIndex, const TrainOptions& options,
                           std::ostream& log);

struct HeldOut {
    double hitRate = 0;
    long long positives = 0;
    double falsePositivesPerWindow = 0;
    long long windows = 0, falsePositives = 0;
};
HeldOut measureHeldOut(const CascadedClassifier& cascade, const CascadePlan& plan, handgen::Gesture gesture,
                       const handgen::Variation& variation, std::uint64_t seed, int positives, int scenes,
                       int threads);

// how the ring was made, in the ring's config
mapStringString ringConfig(const RingPlan& ring, const TrainOptions& options);

}  // namespace ctrain
