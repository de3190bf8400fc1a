#pragma once
// The scanner interface: a detector that looks at feature images inside a search region
// and fills a result, as opposed to LQ::BaseDetector, which works on an aggregator.

#include <limits>
#include <ostream>
#include <string>

#include "LQ_DetectRegion.h"
#include "LQ_Rect.h"
#include "LQ_SharedPtr.h"
#include "LQ_States.h"

class DetectorData;

struct DetectorResult {
    DetectorResult() = default;
    explicit DetectorResult(bool detected_) : detected(detected_) {}
    explicit DetectorResult(const std::string& name_) : name(name_) {}
    explicit DetectorResult(const LQ::LocationState& location_) : location(location_) {}
    DetectorResult(const std::string& name_, const LQ::LocationState& location_) : name(name_), location(location_) {}

    // clears everything but the chained result
    void reset();

    bool detected = false;
    std::string name;
    LQ::LocationState location;
    // kept for a scanner's own scores; nothing here reads them
    float value0 = 0.f;
    float value1 = std::numeric_limits<float>::max();
    LQ::SharedPtr<DetectorResult> next;
};

class BaseDetector {
public:
    virtual ~BaseDetector() = default;
    // the rectangle of the data this detector reads for the region; empty by default
    virtual LQ::BaseRect<int> getDataRoi(const DetectorData& data, const LQ::DetectRegion& region);
    virtual void detect(DetectorData& data, const LQ::DetectRegion& region, DetectorResult& result) = 0;
    virtual void reset() {}
    // the detector's address as text unless a detector names itself
    virtual std::string name();
};
