#pragma once
// Where and what a scanner may search: a rectangle, object widths, angles, zooms and side.

#include <ostream>

#include "LQ_ObjectLocation.h"
#include "LQ_Range.h"
#include "LQ_Rect.h"
#include "LQ_StateAggregator.h"

namespace LQ {

struct DetectRegion {
    DetectRegion() = default;
    DetectRegion(const BaseRect<int>& rect_, const BaseRange<float>& widthRange_, const AngleRange& angleRange_,
                 Side::Value side_)
        : rect(rect_), widthRange(widthRange_), angleRange(angleRange_), side(side_) {}

    void reset() { *this = DetectRegion(); }
    bool operator==(const DetectRegion& o) const {
        return rect == o.rect && widthRange == o.widthRange && angleRange == o.angleRange &&
               zoomRange == o.zoomRange && side == o.side;
    }

    BaseRect<int> rect;
    BaseRange<float> widthRange;
    AngleRange angleRange;
    // a scanner refuses this together with its own width range
    BaseRange<float> zoomRange;
    Side::Value side = Side::BOTH;
};

std::ostream& operator<<(std::ostream& stream, const DetectRegion& region);

LQ_DECLARE_STATE(DetectRegionState, InheritedState, DetectRegion);

}  // namespace LQ
