#include "VI_MultiEngines.h"

#include "VI_Tactus_Interface.h"

VI_MultiEngines::VI_MultiEngines() {
    viEngineInfo_.imageNames.push_back("bgr");
    viEngineInfo_.parameters["zoom-twice"] = "1";
}

void VI_MultiEngines::setParameter(const char* name, const char* value) {
    parameters_ += " --";
    parameters_ += name;
    if (value && *value) {
        parameters_ += "=\"";
        parameters_ += value;
        parameters_ += "\"";
    }
}

void VI_MultiEngines::init() {}

const LQ::ViResult& VI_MultiEngines::processFrame(const LQ::ViFrameParameters& parameters) {
    LQ::ViResultState::viResult.reset();
    LQ::DebugImages::reset();
    ++frameNum_;
    return LQ::ViResultState::viResult;
}

void VI_MultiEngines::reset() { frameNum_ = 0; }

LQ::ViInterface* getEngine() { return new VI_MultiEngines; }
