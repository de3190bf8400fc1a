#pragma once
// A scanner double for the generated ring functions that return one: it keeps what it
// was made with, so the tests can see which ring, angles and parameters reached it.

#include <ostream>

#include "BaseDetector.h"
#include "ClassifierRing.h"
#include "LQ_ObjectLocation.h"
#include "LQ_Range.h"

class PatternDetector : public BaseDetector {
public:
    struct Parameters {
        Parameters() = default;
        Parameters(int step_, int minWeight_, float similarity_, const LQ::BaseRange<float>& widthRange_)
            : step(step_), minWeight(minWeight_), similarity(similarity_), widthRange(widthRange_) {}
        int step = 1;
        int minWeight = 1;
        float similarity = 0.1f;
        LQ::BaseRange<float> widthRange;
        bool motion = false;
    };

    PatternDetector(ClassifierRing* ring_, const LQ::AngleRange& angleRange_, LQ::Side::Value side_,
                    const Parameters& parameters_)
        : ring(ring_), angleRange(angleRange_), side(side_), parameters(parameters_) {}
    void detect(DetectorData&, const LQ::DetectRegion&, DetectorResult&) override {}

    ClassifierRing* ring;
    LQ::AngleRange angleRange;
    LQ::Side::Value side;
    Parameters parameters;
};

inline std::ostream& operator<<(std::ostream& stream, const PatternDetector::Parameters& p) {
    return stream << "PatternDetector::Parameters(" << p.step << ", " << p.minWeight << ", " << p.similarity << ", "
                  << p.widthRange.lower << " " << p.widthRange.upper << ")";
}
