#pragma once
// The cascade link of an engine's chain: from the search region and the image pyramid to
// grouped, verified objects in the aggregator. Feature images are computed only in the
// rectangles that the chosen cascades will touch.

#include <map>
#include <string>
#include <vector>

#include "AdaObject.h"
#include "CascadedClassifier.h"
#include "LQ_BaseDetector.h"
#include "LQ_DetectRegion.h"
#include "LQ_ImagePyramidData.h"
#include "LQ_ObjectLocation.h"

class AdaBoostDetector : public LQ::BaseDetector {
public:
    struct StoreTarget {
        enum Value : int32_t {
            // the first accepted object goes into the aggregator that detect was given
            FIRST_OBJECT = 1,
            // one child aggregator per accepted object, listed in its MultiState
            CHILD_STATES = 2,
        };
    };

    struct Parameters {
        // not owned: they belong to their ring
        std::vector<CascadedClassifier*> pCascadedClassifiers;
        LQ::SharedPtr<LQ::ImagePyramidData> pyramid;
        StoreTarget::Value storeTarget = StoreTarget::FIRST_OBJECT;
        LQ::SharedPtr<LQ::BaseDetector> regionDetector;
        int step = 1;
        int minWeight = 1;
        float similarity = 0.3f;
        LQ::SharedPtr<LQ::BaseDetector> verifier;
        LQ::SharedPtr<LQ::BaseDetector> onDetected;
        LQ::SharedPtr<LQ::BaseDetector> onLost;
        LQ::RelativeLocation location = LQ::RelativeLocation(1, LQ::BasePoint<float>(0, 0), 0, 0, 0);
        int maxObjects = 1000;
    };

    explicit AdaBoostDetector(const Parameters& parameters);
    // takes over regionDetector
    AdaBoostDetector(const std::vector<CascadedClassifier*>& classifiers,
                     const LQ::SharedPtr<LQ::ImagePyramidData>& pyramid, StoreTarget::Value storeTarget,
                     LQ::BaseDetector* regionDetector, int step, int minWeight, float similarity,
                     const LQ::SharedPtr<LQ::BaseDetector>& verifier, const LQ::SharedPtr<LQ::BaseDetector>& onDetected,
                     const LQ::SharedPtr<LQ::BaseDetector>& onLost, const LQ::RelativeLocation& location,
                     int maxObjects);
    ~AdaBoostDetector() override;

    Parameters& parameters() { return parameters_; }
    std::string name() const;

    void detect(LQ::SharedPtr<LQ::StateAggregator>& state) override;

    LQ::DetectRegion& computeDetectRegionState(LQ::SharedPtr<LQ::StateAggregator>& state);
    void computeClassifierMap(const LQ::DetectRegion& region);
    void prepareRois(const LQ::DetectRegion& region);
    std::vector<AdaObject> getAdaObjects(const LQ::DetectRegion& region);
    bool processAdaObjects(LQ::SharedPtr<LQ::StateAggregator>& state, const std::vector<AdaObject>& objects);
    void processDetectedState(LQ::SharedPtr<LQ::StateAggregator>& state, bool detected);

    // the working data of the last frame, for tests and debugging
    const std::map<float, std::vector<CascadedClassifier*>>& classifierMap() const { return classifierMap_; }
    const std::map<float, LQ::BaseRect<int>>& layerRois() const { return layerRois_; }
    const LQ::BaseRect<int>& integralRoi() const { return integralRoi_; }
    const LQ::BaseRect<int>& monoRoi() const { return monoRoi_; }
    float maxZoom() const { return maxZoom_; }

private:
    Parameters parameters_;
    std::map<float, std::vector<CascadedClassifier*>> classifierMap_;
    std::map<float, LQ::BaseRect<int>> layerRois_;
    LQ::BaseRect<int> integralRoi_;
    LQ::BaseRect<int> monoRoi_;
    float maxZoom_ = 0.f;
    LayerHog layerHog_;
};

std::ostream& operator<<(std::ostream& stream, AdaBoostDetector::StoreTarget::Value value);
