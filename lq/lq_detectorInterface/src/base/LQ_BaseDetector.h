#pragma once
// The unit engines are assembled from: a detector that works on an aggregator's states,
// and the small detectors that chain others and write the search region.

#include <vector>

#include "LQ_DetectRegion.h"
#include "LQ_ObjectLocation.h"
#include "LQ_Range.h"
#include "LQ_SharedPtr.h"
#include "LQ_StateAggregator.h"

namespace LQ {

class BaseDetector {
public:
    virtual ~BaseDetector() = default;
    virtual void detect(SharedPtr<StateAggregator>& state) = 0;
};

// Runs its detectors in order on the same state; a later one always runs and sees what
// the earlier ones left.
class DetectorAggregator : public BaseDetector {
public:
    DetectorAggregator() = default;
    DetectorAggregator(BaseDetector* first, BaseDetector* second) { add(first, second); }
    DetectorAggregator(BaseDetector* first, BaseDetector* second, BaseDetector* third) { add(first, second, third); }
    DetectorAggregator(BaseDetector* first, BaseDetector* second, BaseDetector* third, BaseDetector* fourth) {
        add(first, second, third, fourth);
    }
    DetectorAggregator(const SharedPtr<BaseDetector>& first, const SharedPtr<BaseDetector>& second) {
        add(first, second);
    }
    DetectorAggregator(const SharedPtr<BaseDetector>& first, const SharedPtr<BaseDetector>& second,
                       const SharedPtr<BaseDetector>& third) {
        add(first, second, third);
    }
    DetectorAggregator(const SharedPtr<BaseDetector>& first, const SharedPtr<BaseDetector>& second,
                       const SharedPtr<BaseDetector>& third, const SharedPtr<BaseDetector>& fourth) {
        add(first, second, third, fourth);
    }

    // the raw form takes ownership
    void addDetector(BaseDetector* detector) { detectors_.push_back(SharedPtr<BaseDetector>(detector)); }
    void addDetector(const SharedPtr<BaseDetector>& detector) { detectors_.push_back(detector); }
    const std::vector<SharedPtr<BaseDetector>>& detectors() const { return detectors_; }
    // releases the detectors; no state is touched
    void reset() { detectors_.clear(); }

    void detect(SharedPtr<StateAggregator>& state) override {
        for (SharedPtr<BaseDetector>& detector : detectors_) detector->detect(state);
    }

private:
    template <class... Detectors>
    void add(Detectors&&... detectors) {
        (addDetector(detectors), ...);
    }

    std::vector<SharedPtr<BaseDetector>> detectors_;
};

// Writes one of its regions per frame, round robin; the position belongs to the state.
class DetectRegionSetter : public BaseDetector {
public:
    LQ_DECLARE_STATE(RegionCounterState, NumericState, int);

    // the relative location is taken and not used
    DetectRegionSetter(const DetectRegion& region, const RelativeLocation& = RelativeLocation())
        : regions_(1, region) {}
    DetectRegionSetter(const std::vector<DetectRegion>& regions, const RelativeLocation& = RelativeLocation())
        : regions_(regions) {}

    void detect(SharedPtr<StateAggregator>& state) override;
    const std::vector<DetectRegion>& regions() const { return regions_; }

private:
    std::vector<DetectRegion> regions_;
};

// Writes the region that follows from the object's location: a relative box, widths as
// factors of the object's width, angles as offsets from its angle.
class RelativeDetectRegion : public BaseDetector {
public:
    RelativeDetectRegion(const RelativeLocation& location, const BaseRange<float>& widthFactors, bool copySide,
                         const AngleRange& angleOffsets)
        : location_(location), widthFactors_(widthFactors), copySide_(copySide), angleOffsets_(angleOffsets) {}

    void detect(SharedPtr<StateAggregator>& state) override;

private:
    RelativeLocation location_;
    BaseRange<float> widthFactors_;
    bool copySide_;
    AngleRange angleOffsets_;
};

}  // namespace LQ
