#pragma once
// The builders of the gesture chains: each wires one MultiEngine out of a ring's trigger
// and tracker cascades, its verifier networks and, for victory and pointer, a palm
// rejector. The networks belong to the caller and must outlive the chain.

#include "LQ_BaseDetector.h"
#include "LQ_ImageData.h"
#include "LQ_ImagePyramidData.h"
#include "LQ_Range.h"
#include "MultiEngine.h"
#include "NnDetector.h"

// Refuses an object when a palm is found where it stands: a veto for gestures that an
// open hand resembles.
class RejectorPalmDetector : public LQ::BaseDetector {
public:
    RejectorPalmDetector(LQ::SharedPtr<LQ::ImagePyramidData>& pyramid, LQ::SharedPtr<LQ::ImageData>& image,
                         LQ::RelativeLocation location, LQ::BaseRange<float> widthFactors);

    void detect(LQ::SharedPtr<LQ::StateAggregator>& state) override;

private:
    LQ::SharedPtr<LQ::BaseDetector> detector_;
};

MultiEngine* fistEngine(LQ::SharedPtr<LQ::ImageData>& image, LQ::SharedPtr<LQ::ImagePyramidData>& pyramid,
                        int minWidth, int angle, NnDetector& network);
MultiEngine* thumbUpEngine(LQ::SharedPtr<LQ::ImageData>& image, LQ::SharedPtr<LQ::ImagePyramidData>& pyramid,
                           int minWidth, int angle, NnDetector& network);
MultiEngine* victoryPalmEngine(LQ::SharedPtr<LQ::ImageData>& image, LQ::SharedPtr<LQ::ImagePyramidData>& pyramid,
                               int minWidth, int angle, NnDetector& network);
MultiEngine* pointerEngine(LQ::SharedPtr<LQ::ImageData>& image, LQ::SharedPtr<LQ::ImagePyramidData>& pyramid,
                           int minWidth, int angle, NnDetector& verifier, NnDetector& handSide);
