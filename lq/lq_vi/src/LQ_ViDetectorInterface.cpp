#include "LQ_ViDetectorInterface.h"

#include <dirent.h>
#include <sys/stat.h>

#include <fstream>
#include <new>
#include <sstream>
#include <stdexcept>

#include "LQ_States.h"

namespace LQ {

namespace {
std::string printed(const std::map<std::string, SharedPtr<ImageData>>& images) {
    std::ostringstream text;
    StreamO(text) << images;
    return text.str();
}
}  // namespace

ViDetectorInterface::ViDetectorInterface() : commandLineParser_("Engine options:", "") {
    LQ_LOG_FORCED(LOG_LEVEL_INFO, "Build time: " << __DATE__ << " " << __TIME__);
    stateAggregator_ = StateAggregator::newDetectorState();
    commandLineParser_.add("-f", "--flip", "false", 0, 4, "Flip output results position corresponding first image.");
}

ViDetectorInterface::~ViDetectorInterface() {
    // objects hold the engine's state through their parent link and the engine's state
    // holds the objects: emptying the states breaks that ring so both can go
    if (stateAggregator_) stateAggregator_->reset();
}

ViEngineInfo& ViDetectorInterface::getEngineInfo() {
    std::vector<std::string>& names = viEngineInfo_.imageNames;
    if (!names.empty() && !imageDatas_.empty()) {
        LQ_ASSERT_EQ(viEngineInfo_.imageNames.size(), imageDatas_.size());
        for (size_t i = 0; i < names.size(); ++i) {
            LQ_ASSERT_MSG(imageDatas_.count(viEngineInfo_.imageNames[i]),
                          "no " << viEngineInfo_.imageNames[i] << " in " << printed(imageDatas_));
        }
    }
    if (names.empty())
        for (const auto& entry : imageDatas_) names.push_back(entry.first);
    return viEngineInfo_;
}

void ViDetectorInterface::setParameter(const char* name, const char* value) {
    parameters_ += " --";
    parameters_ += name;
    if (value && *value) {
        parameters_ += "=\"";
        parameters_ += value;
        parameters_ += "\"";
    }
}

void ViDetectorInterface::init() {
    init(parameters_);
    initialized_ = false;
}

void ViDetectorInterface::reset() {
    saveProfile();
    if (stateAggregator_) stateAggregator_->reset();
    frameNum_ = 0;
    ++resetCount_;
}

void ViDetectorInterface::saveProfile() {
    const std::string path = profileDirectory();
    for (size_t i = 1; i <= path.size(); ++i) {
        if (i < path.size() && path[i] != '/') continue;
        const std::string prefix = path.substr(0, i);
        DIR* directory = opendir(prefix.c_str());
        if (directory)
            closedir(directory);
        else
            mkdir(prefix.c_str(), 0777);
    }
}

void ViDetectorInterface::initImages(const std::map<std::string, Image>& images) {
    for (const auto& entry : images) {
        SharedPtr<ImageData>& node = imageDatas_[entry.first];
        if (!node || node->getRaw().size() != entry.second.size() ||
            node->colorMode() != entry.second.colorMode())
            node = SharedPtr<ImageData>(new ImageData(entry.second.size(), entry.second.colorMode()));
        node->set(entry.second);
    }
}

void ViDetectorInterface::generateParameterKeyRing(ViResult& result) const {
    for (std::map<std::string, std::string>& parameters : result.parameters) {
        if (parameters.empty()) continue;
        std::string keys;
        for (const auto& entry : parameters) keys += entry.first + " ";
        parameters["key-ring"] = keys;
    }
}

void ViDetectorInterface::flipResults() {
    if (imageDatas_.empty()) return;
    const float width = static_cast<float>(imageDatas_.begin()->second->size().width);
    ViResult& result = ViResultState::viResult;
    for (BaseRect<float>& rect : result.rects) {
        const int left = static_cast<int>(width - rect.right);
        const int right = static_cast<int>(width - rect.left);
        rect = BaseRect<float>(left, static_cast<int>(rect.top), right, static_cast<int>(rect.bottom));
    }
    for (BasePoint<float>& point : result.points) point.x = width - point.x - 1;
}

void ViDetectorInterface::runDetect() {
    const char* const prefix = "during execution of command 'detect();' ";
    try {
        detect();
        return;
    } catch (const std::bad_alloc& error) {
        LQ_LOG_FORCED(LOG_LEVEL_INFO, prefix << "bad_alloc exception occured: " << error.what());
    } catch (const std::exception& error) {
        LQ_LOG_FORCED(LOG_LEVEL_INFO, prefix << "standart exception occured: " << error.what());
    } catch (...) {
        LQ_LOG_FORCED(LOG_LEVEL_INFO, prefix << "non-standart exception occured\n");
    }
    catchAction();
}

const ViResult& ViDetectorInterface::processFrame(const ViFrameParameters& parameters) {
    LQ_LOGI("------------------------- frameNum_ = " << frameNum_ << " ------------------------------");
    for (const auto& entry : parameters.parameters) {
        if (entry.first == "log")
            LQ_LOG_FORCED(LOG_LEVEL_INFO, entry.second);
        else
            LQ_LOGI(alignString(entry.first, 25) << " = " << entry.second);
    }
    stateAggregator_->get<FrameNumState>() = frameNum_;
    frameParameters_ = parameters.parameters;

    if (!initialized_) {
        initWithImages(parameters_, parameters.images);
        for (auto& entry : imageDatas_) entry.second->updateRecursive();
        initialized_ = true;
        parameters_.clear();
    } else {
        const auto key = frameParameters_.find("key");
        if (key != frameParameters_.end() && fromStr<int>(key->second) == 100) {
            // the graph of this frame, for a look with graphviz
            std::ofstream dot(dotPath(), std::ios::out | std::ios::trunc);
            dot << "digraph {\n" << "rankdir=LR;\n" << "node[shape=\"box\" fontname=\"monospace\"]\n";
            for (auto& entry : imageDatas_) entry.second->resetRecursive(dot);
            dot << "}\n";
        } else {
            for (auto& entry : imageDatas_) entry.second->resetRecursive();
        }
        for (auto it = parameters.images.begin(); it != parameters.images.end(); ++it) {
            LQ_ASSERT_MSG(imageDatas_.count(it->first) > 0, "no key '" << it->first << "' in imageDatas_");
            imageDatas_[it->first]->set(it->second);
        }
        for (auto& entry : imageDatas_) entry.second->updateRecursive();
    }
    stateAggregator_->get<FrameParametersState>() = frameParameters_;
    ViResultState::viResult.reset();
    DebugImages::reset();

    runDetect();

    if (commandLineParser_.getBool("--flip")) flipResults();
    generateParameterKeyRing(ViResultState::viResult);
    ++frameNum_;
    if (frameNum_ % 100 == 0) saveProfile();
    LQ_LOGI("------------------------- end of processing ------------------------------");
    return ViResultState::viResult;
}

}  // namespace LQ
