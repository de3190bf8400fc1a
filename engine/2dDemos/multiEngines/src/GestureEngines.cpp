#include "GestureEngines.h"

#include "AdaBoostDetector.h"
#include "GestureRings.h"
#include "LQ_ColorModeData.h"
#include "LQ_States.h"
#include "NnTracker.h"
#include "PalmVerifiers.h"

using LQ::BasePoint;
using LQ::BaseRange;
using LQ::RelativeLocation;
using LQ::SharedPtr;

namespace {

// scale s, shift (dx, dy) in source widths, no turn, target aspect a
RelativeLocation R(float s, float dx, float dy, float a) { return RelativeLocation(s, BasePoint<float>(dx, dy), 0, a, 0); }

const RelativeLocation kNoMove = R(1, 0, 0, 0);

std::vector<CascadedClassifier*> classifiers(ClassifierRing* ring, int angle) {
    return ring->getClassifiers(LQ::AngleRange(angle - 30, angle + 30), LQ::Side::BOTH);
}

SharedPtr<LQ::BaseDetector> trigger(const std::vector<CascadedClassifier*>& cascades,
                                    SharedPtr<LQ::ImagePyramidData>& pyramid, int minWidth, int step, int minWeight,
                                    float similarity, const SharedPtr<LQ::BaseDetector>& verifier) {
    LQ::BaseDetector* region = new LQ::DetectRegionSetter(LQ::DetectRegion(
        pyramid->rect(), BaseRange<float>(static_cast<float>(minWidth), 1000), LQ::AngleRange(), LQ::Side::BOTH));
    return SharedPtr<LQ::BaseDetector>(new AdaBoostDetector(
        cascades, pyramid, AdaBoostDetector::StoreTarget::CHILD_STATES, region, step, minWeight, similarity, verifier,
        SharedPtr<LQ::BaseDetector>(), SharedPtr<LQ::BaseDetector>(), kNoMove, 1000));
}

SharedPtr<LQ::BaseDetector> tracker(const std::vector<CascadedClassifier*>& cascades,
                                    SharedPtr<LQ::ImagePyramidData>& pyramid, const RelativeLocation& location,
                                    BaseRange<float> widthFactors, bool copySide, int step, int minWeight,
                                    float similarity, const SharedPtr<LQ::BaseDetector>& verifier) {
    LQ::BaseDetector* region = new LQ::RelativeDetectRegion(location, widthFactors, copySide, LQ::AngleRange());
    return SharedPtr<LQ::BaseDetector>(new AdaBoostDetector(
        cascades, pyramid, AdaBoostDetector::StoreTarget::FIRST_OBJECT, region, step, minWeight, similarity,
        verifier, SharedPtr<LQ::BaseDetector>(), SharedPtr<LQ::BaseDetector>(), kNoMove, 1000));
}

// the caller keeps the network; the chain only borrows it
SharedPtr<NnDetector> borrowed(NnDetector& network) { return SharedPtr<NnDetector>(&network, false); }

SharedPtr<LQ::BaseDetector> nnTracker(NnTracker::Type::Value type, const SharedPtr<NnDetector>& network,
                                      const SharedPtr<LQ::ImageData>& image, const RelativeLocation& location,
                                      float threshold) {
    return SharedPtr<LQ::BaseDetector>(
        new NnTracker(NnTracker::Parameters(type, network, image, location, threshold, false, false)));
}

SharedPtr<LQ::BaseDetector> verifier(NnDetector& network, const SharedPtr<LQ::ImageData>& image,
                                     const RelativeLocation& location, float threshold) {
    return nnTracker(NnTracker::Type::VERIFIER, borrowed(network), image, location, threshold);
}

SharedPtr<LQ::BaseDetector> chain(const SharedPtr<LQ::BaseDetector>& first, const SharedPtr<LQ::BaseDetector>& second,
                                  const SharedPtr<LQ::BaseDetector>& third = SharedPtr<LQ::BaseDetector>()) {
    LQ::DetectorAggregator* aggregator = new LQ::DetectorAggregator(first, second);
    if (third) aggregator->addDetector(third);
    return SharedPtr<LQ::BaseDetector>(aggregator);
}

MultiEngine* multiEngine(const std::string& name, int triggerPeriod, int historyLength, int minDetects,
                         const SharedPtr<LQ::BaseDetector>& trigger, const SharedPtr<LQ::BaseDetector>& tracker,
                         const RelativeLocation& resultLocation) {
    return new MultiEngine(MultiEngine::Parameters(name, triggerPeriod, 1, historyLength, minDetects, trigger,
                                                   tracker, resultLocation, 3, false));
}

}  // namespace

RejectorPalmDetector::RejectorPalmDetector(SharedPtr<LQ::ImagePyramidData>& pyramid, SharedPtr<LQ::ImageData>& image,
                                           RelativeLocation location, BaseRange<float> widthFactors) {
    // each rejector has a pair of its own: the networks keep scratch blobs per object
    const SharedPtr<LQ::BaseDetector> palmVerifiers =
        chain(nnTracker(NnTracker::Type::VERIFIER, palm_verifier__iter_250000(), image, kNoMove, 0.2f),
              nnTracker(NnTracker::Type::VERIFIER, palm_verifier_iter_140000(), image, kNoMove, 0.5f));
    detector_ = tracker(classifiers(ada__ada_staticPalm_2014_12_05__17_40_12(), 0), pyramid, location, widthFactors,
                        false, 2, 1, 0.2f, palmVerifiers);
}

void RejectorPalmDetector::detect(SharedPtr<LQ::StateAggregator>& state) {
    LQ::LocationState& location = state->get<LQ::LocationState>();
    const LQ::ObjectLocation before = location;
    if (!before.isSet()) return;  // already refused further up the chain
    detector_->detect(state);
    LQ::LocationState& after = state->get<LQ::LocationState>();
    if (after.isSet())
        after.reset();  // a palm stands where the object is
    else
        after = before;
}

MultiEngine* fistEngine(SharedPtr<LQ::ImageData>& image, SharedPtr<LQ::ImagePyramidData>& pyramid, int minWidth,
                        int angle, NnDetector& network) {
    const std::vector<CascadedClassifier*> cascades = classifiers(ada_Fist_2013_10_02__16_45_30(), angle);
    const SharedPtr<LQ::BaseDetector> v1 = verifier(network, image, R(2.83f, 0, 0, 0), 0.3f);
    return multiEngine("fist", 5, 5, 3, trigger(cascades, pyramid, minWidth, 2, 3, 0.3f, v1),
                       tracker(cascades, pyramid, R(1.5f, 0, 0, 0), BaseRange<float>(0.9f, 1.1f), false, 2, 1, 0.3f,
                               v1),
                       MultiEngine::Parameters::defaultResultLocation());
}

MultiEngine* thumbUpEngine(SharedPtr<LQ::ImageData>& image, SharedPtr<LQ::ImagePyramidData>& pyramid, int minWidth,
                           int angle, NnDetector& network) {
    const std::vector<CascadedClassifier*> cascades = classifiers(ada_thumbUp_ada__2017_11_13__20_01_17(), angle);
    const SharedPtr<LQ::BaseDetector> v2 = verifier(network, image, R(1.43f, 0, 0, 0), 0.5f);
    return multiEngine("thumbUp", 3, 3, 2, trigger(cascades, pyramid, minWidth, 3, 7, 0.3f, v2),
                       tracker(cascades, pyramid, R(2, 0, 0, 0), BaseRange<float>(0.76f, 1.3f), false, 2, 8, 0.3f,
                               v2),
                       R(0.9f, 0, -0.1f, 1.9f));
}

MultiEngine* victoryPalmEngine(SharedPtr<LQ::ImageData>& image, SharedPtr<LQ::ImagePyramidData>& pyramid,
                               int minWidth, int angle, NnDetector& network) {
    const std::vector<CascadedClassifier*> cascades =
        classifiers(ada_mono_ada_staticVictory_2017_11_10__14_34_17(), angle);
    SharedPtr<LQ::ImageData> mono(new LQ::ColorModeData(image, LQ::COLOR_MODE_MONO));
    const SharedPtr<LQ::BaseDetector> verifiers =
        chain(verifier(network, image, R(2, 0, -0.1f, 0), 0.05f),
              SharedPtr<LQ::BaseDetector>(new RejectorPalmDetector(pyramid, mono, R(2, 0, 0, 0),
                                                                    BaseRange<float>(0.76f, 2.3f))));
    return multiEngine("victory", 3, 3, 2, trigger(cascades, pyramid, minWidth, 3, 2, 0.3f, verifiers),
                       tracker(cascades, pyramid, R(1.7f, 0, 0, 0), BaseRange<float>(0.85f, 1.45f), false, 2, 1,
                               0.3f, verifiers),
                       R(0.7f, 0, 0, 2.2f));
}

MultiEngine* pointerEngine(SharedPtr<LQ::ImageData>& image, SharedPtr<LQ::ImagePyramidData>& pyramid, int minWidth,
                           int angle, NnDetector& pointerVerifier, NnDetector& handSide) {
    const std::vector<CascadedClassifier*> cascades =
        classifiers(ada_mono_ada_staticPointer0_2015_06_23__19_25_48(), angle);
    const RelativeLocation patch = R(2, 0, -0.4f, 0);
    const SharedPtr<LQ::BaseDetector> side =
        nnTracker(NnTracker::Type::SIDE, borrowed(handSide), image, patch, 0.5f);
    const SharedPtr<LQ::BaseDetector> rejector(
        new RejectorPalmDetector(pyramid, image, R(3.5f, 0, -0.2f, 0), BaseRange<float>(1.1f, 2.3f)));
    // strict to be born, lax to live on
    const SharedPtr<LQ::BaseDetector> born = chain(side, verifier(pointerVerifier, image, patch, 0.9f), rejector);
    const SharedPtr<LQ::BaseDetector> kept = chain(side, verifier(pointerVerifier, image, patch, 0.1f), rejector);
    return multiEngine("pointer", 3, 3, 2, trigger(cascades, pyramid, minWidth, 3, 1, 0.3f, born),
                       tracker(cascades, pyramid, R(1.6f, 0, 0, 0), BaseRange<float>(0.76f, 1.3f), false, 2, 1, 0.3f,
                               kept),
                       R(1.2f, 0, 0, 1.6f));
}
