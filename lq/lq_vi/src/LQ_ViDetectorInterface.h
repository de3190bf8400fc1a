#pragma once
// The engine base that turns ViInterface into a frame loop: it owns the root image nodes,
// the engine's state, the option parser and the frame counter, and runs the per-frame
// order of work. A concrete engine supplies detect() and what it builds on the first frame.

#include <map>
#include <string>

#include "LQ_CommandLineParser.h"
#include "LQ_ImageData.h"
#include "LQ_StateAggregator.h"
#include "LQ_ViInterface.h"

namespace LQ {

class ViDetectorInterface : public ViInterface {
public:
    ViDetectorInterface();
    ~ViDetectorInterface() override;

    ViEngineInfo& getEngineInfo() override;
    // gathers " --name=\"value\"" for the next initialisation
    void setParameter(const char* name, const char* value) override;
    // the next frame sets the engine up again with the gathered options
    void init() override;
    const ViResult& processFrame(const ViFrameParameters& parameters) override;
    void reset() override;
    void release() override { reset(); }

    virtual void init(const std::string& parameters) {}
    virtual void initWithImages(const std::string& parameters, const std::map<std::string, Image>& images) {
        initImages(images);
    }
    virtual void detect() = 0;
    // after a failure inside detect(): drop what the states hold
    virtual void catchAction() { reset(); }
    // mirrors the result left to right on the width of the first image
    virtual void flipResults();

    void initImages(const std::map<std::string, Image>& images);
    // "key-ring": the keys of each non-empty parameter map, each followed by a blank
    void generateParameterKeyRing(ViResult& result) const;
    // makes the profile directory if it is missing; writes no file
    void saveProfile();

    int frameNum() const { return frameNum_; }
    int resetCount() const { return resetCount_; }
    bool initialized() const { return initialized_; }
    const std::string& pendingParameters() const { return parameters_; }
    const std::map<std::string, SharedPtr<ImageData>>& imageDatas() const { return imageDatas_; }
    const SharedPtr<StateAggregator>& stateAggregator() const { return stateAggregator_; }
    CommandLineParser& commandLineParser() { return commandLineParser_; }

    static const char* profileDirectory() { return "/storage/emulated/0/tmp"; }
    static const char* dotPath() { return "/tmp/data.dot"; }

protected:
    std::string parameters_;
    bool initialized_ = false;
    std::map<std::string, SharedPtr<ImageData>> imageDatas_;
    std::map<std::string, std::string> frameParameters_;
    SharedPtr<StateAggregator> stateAggregator_;
    int frameNum_ = 0;
    int resetCount_ = 0;
    CommandLineParser commandLineParser_;

private:
    void runDetect();
};

}  // namespace LQ
