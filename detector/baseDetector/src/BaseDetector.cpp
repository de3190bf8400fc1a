#include "BaseDetector.h"

#include <sstream>

void DetectorResult::reset() {
    detected = false;
    name.clear();
    location = LQ::LocationState();
    value0 = 0.f;
    value1 = std::numeric_limits<float>::max();
}

LQ::BaseRect<int> BaseDetector::getDataRoi(const DetectorData&, const LQ::DetectRegion&) {
    return LQ::BaseRect<int>();
}

std::string BaseDetector::name() {
    std::ostringstream stream;
    stream << static_cast<const void*>(this);
    return stream.str();
}
