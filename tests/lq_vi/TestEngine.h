#pragma once
// A small engine standing in for the real one, so the C interface can be tested
// alone: it records what it is told and returns the result a test sets.

#include <string>
#include <utility>
#include <vector>

#include "LQ_ViInterface.h"

class TestEngine : public LQ::ViInterface {
public:
    TestEngine();

    void setParameter(const char* name, const char* value) override;
    void init() override { ++inits; }
    const void* request(const std::string& name, const void* data) override;
    const LQ::ViResult& processFrame(const LQ::ViFrameParameters& parameters) override;
    void reset() override { ++resets; }
    void release() override { ++releases; }

    LQ::ViEngineInfo& info() { return viEngineInfo_; }

    std::vector<std::pair<std::string, std::string>> parameters;
    int inits = 0, resets = 0, releases = 0, frames = 0;
    LQ::ViFrameParameters lastFrame;  // a deep copy of what the last frame brought
    LQ::ViResult next;                // what the next frame reports
};

// The engine the interface made, for the tests to steer.
TestEngine& testEngine();
