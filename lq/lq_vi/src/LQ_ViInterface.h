#pragma once
// The abstract engine and the records that pass through it. Nothing here knows
// about gestures.

#include <map>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include "LQ_Image.h"
#include "LQ_Point.h"
#include "LQ_Rect.h"
#include "LQ_StateAggregator.h"

namespace LQ {

// What an engine says about itself.
struct ViEngineInfo {
    std::vector<std::string> imageNames;  // index i of VI_Tactus_SetFrame selects one; the name tells the mode
    std::map<std::string, std::string> parameters;  // settings published to the interface layer
    std::string version;
};

// What goes into a frame.
struct ViFrameParameters {
    std::map<std::string, Image> images;
    std::map<std::string, std::string> parameters;

    void reset() {
        images.clear();
        parameters.clear();
    }
};

// What comes out of a frame. gestures, floats, rects and parameters are parallel:
// entry k of each speaks of the same object.
struct ViResult {
    std::vector<std::string> gestures;
    std::vector<float> floats;
    std::vector<BaseRect<float>> rects;
    std::vector<BasePoint<float>> points;
    std::vector<BasePoint3d<float>> points3d;
    std::vector<std::map<std::string, std::string>> parameters;
    std::vector<Image> images;

    // empties all seven, keeping their capacity
    void reset();
};

std::ostream& operator<<(std::ostream& stream, const ViResult& result);

// Abstract base of every engine.
class ViInterface {
public:
    virtual ~ViInterface() = default;
    virtual ViEngineInfo& getEngineInfo() { return viEngineInfo_; }
    virtual void setParameter(const char* name, const char* value) = 0;
    virtual void init() = 0;
    // An engine that knows no requests answers every request with null.
    virtual const void* request(const std::string& name, const void* data) { return nullptr; }
    virtual const ViResult& processFrame(const ViFrameParameters& parameters) = 0;
    virtual void reset() {}
    virtual void release() {}

    // The colour mode named by the first word that stands at the start of the name.
    static ColorMode parseImageName(const std::string& name);

protected:
    ViEngineInfo viEngineInfo_;
};

// The one result of the process, as a state: it holds no data of its own, so the result
// is the same object whichever aggregator the state is fetched from. reset() leaves it
// alone; the frame driver clears the result at the start of each frame.
class ViResultState : public BaseState {
public:
    LQ_STATE_ID
    static ViResult viResult;

    ViResult& result() { return viResult; }
    void reset() override {}
    void print(std::ostream& stream) const override;
    void saveToDot(std::ostream& stream, StateAggregator* owner) override;
};

// The process-wide list of debug pictures that the host can read.
class DebugImages {
public:
    static std::vector<std::pair<std::string, Image>> debugImages_;
    static void reset() { debugImages_.clear(); }
};

}  // namespace LQ
