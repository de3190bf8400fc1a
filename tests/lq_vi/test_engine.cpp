#include "TestEngine.h"

#include "VI_Tactus_Interface.h"

namespace {
TestEngine* made = nullptr;
}

TestEngine::TestEngine() {
    viEngineInfo_.imageNames.push_back("bgr");
    viEngineInfo_.parameters["zoom-twice"] = "1";
}

void TestEngine::setParameter(const char* name, const char* value) {
    parameters.emplace_back(name, value ? value : "");
}

const void* TestEngine::request(const std::string& name, const void* data) {
    if (name == "echo") return data;
    return LQ::ViInterface::request(name, data);
}

const LQ::ViResult& TestEngine::processFrame(const LQ::ViFrameParameters& frame) {
    ++frames;
    lastFrame = frame;
    LQ::ViResultState::viResult = next;
    return LQ::ViResultState::viResult;
}

LQ::ViInterface* getEngine() {
    made = new TestEngine;
    return made;
}

TestEngine& testEngine() {
    ViInterfaceSingleton::get();
    return *made;
}
