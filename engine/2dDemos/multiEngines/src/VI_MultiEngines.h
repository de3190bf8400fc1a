#pragma once
// The concrete engine of the library.
//
// Not finished: the frame driver, the detector chains and the networks come in
// later steps. Until then it publishes its image name and settings, keeps the
// option text it is given, and reports no gestures.

#include <string>

#include "LQ_ViInterface.h"

class VI_MultiEngines : public LQ::ViInterface {
public:
    VI_MultiEngines();

    void setParameter(const char* name, const char* value) override;
    void init() override;
    const LQ::ViResult& processFrame(const LQ::ViFrameParameters& parameters) override;
    void reset() override;
    void release() override { reset(); }

private:
    std::string parameters_;
    int frameNum_ = 0;
};
