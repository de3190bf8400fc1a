#include "LQ_BaseDetector.h"

#include "LQ_States.h"

namespace LQ {

std::ostream& operator<<(std::ostream& stream, const DetectRegion& region) {
    return stream << "DetectRegion(" << region.rect << ", " << region.angleRange << ", " << region.widthRange << ", "
                  << region.side << ")";
}

void DetectRegionSetter::detect(SharedPtr<StateAggregator>& state) {
    int& counter = state->get<RegionCounterState>();
    state->get<DetectRegionState>() = regions_[counter];
    counter = (counter + 1) % static_cast<int>(regions_.size());
}

void RelativeDetectRegion::detect(SharedPtr<StateAggregator>& state) {
    DetectRegion& region = state->get<DetectRegionState>();
    region.reset();
    const ObjectLocation& location = state->get<LocationState>();
    if (!location.isSet()) return;
    const BaseRect<float> rect = location_.getLocationState(location).getRect();
    region.rect = BaseRect<int>(static_cast<int>(rect.left), static_cast<int>(rect.top), static_cast<int>(rect.right),
                                static_cast<int>(rect.bottom));
    region.widthRange = BaseRange<float>(location.size.width * widthFactors_.lower,
                                         location.size.width * widthFactors_.upper);
    region.angleRange.setRange(static_cast<int>(location.angle + angleOffsets_.lower()),
                               static_cast<int>(location.angle + angleOffsets_.upper()));
    if (copySide_) region.side = location.side;
}

}  // namespace LQ
