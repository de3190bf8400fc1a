#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <new>
#include <sstream>
#include <stdexcept>

#include "LQ_States.h"
#include "LQ_ViDetectorInterface.h"
#include "LogCapture.h"

using LQ::Image;
using LQ::ImageData;
using LQ::SharedPtr;
using LQ::Size;

namespace {
// A node below a frame root that counts the per-frame resets it sees.
class WatchData : public ImageData {
public:
    explicit WatchData(const SharedPtr<ImageData>& parent) : ImageData(parent->size(), parent->colorMode()) {
        addParent(parent);
    }
    void reset() override {
        ++resets;
        ImageData::reset();
    }
    std::string name() const override { return derivedName("WatchData"); }
    int resets = 0;
};

// An engine whose detect() does what the test says.
class ScriptedEngine : public LQ::ViDetectorInterface {
public:
    void initWithImages(const std::string& parameters, const std::map<std::string, Image>& images) override {
        ++initCalls;
        initText = parameters;
        commandLineParser_.reset();
        commandLineParser_.parse(parameters);
        initImages(images);
        if (!watch) watch = SharedPtr<WatchData>(new WatchData(imageDatas_.begin()->second));
    }
    void detect() override {
        seenFrameNums.push_back(stateAggregator_->get<LQ::FrameNumState>());
        if (onDetect) onDetect();
    }
    int initCalls = 0;
    std::string initText;
    std::vector<int> seenFrameNums;
    std::function<void()> onDetect;
    SharedPtr<WatchData> watch;
};

LQ::ViFrameParameters frame(int width = 8, int height = 6) {
    LQ::ViFrameParameters parameters;
    parameters.images["bgr"] = Image(Size(width, height), LQ::COLOR_MODE_BGR);
    return parameters;
}
}  // namespace

TEST(FrameDriver, FirstFrameInitialisesLaterFramesResetTheGraph) {
    ScriptedEngine engine;
    engine.setParameter("mode", "fist");
    engine.setParameter("is-flip", "");
    engine.setParameter("verbose", nullptr);
    EXPECT_EQ(engine.pendingParameters(), " --mode=\"fist\" --is-flip --verbose");
    engine.init();
    EXPECT_FALSE(engine.initialized());

    engine.processFrame(frame());
    EXPECT_EQ(engine.initCalls, 1);
    EXPECT_EQ(engine.initText, " --mode=\"fist\" --is-flip --verbose");
    EXPECT_EQ(engine.pendingParameters(), "");
    EXPECT_EQ(engine.watch->resets, 0);  // the first frame resets nothing
    engine.processFrame(frame());
    engine.processFrame(frame());
    EXPECT_EQ(engine.initCalls, 1);
    EXPECT_EQ(engine.watch->resets, 2);
    EXPECT_EQ(engine.seenFrameNums, (std::vector<int>{0, 1, 2}));
    EXPECT_EQ(engine.getEngineInfo().imageNames, std::vector<std::string>{"bgr"});

    // init() again: the next frame sets up with the new text, on the existing graph
    engine.setParameter("mode", "victory");
    engine.init();
    engine.processFrame(frame());
    EXPECT_EQ(engine.initCalls, 2);
    EXPECT_EQ(engine.initText, " --mode=\"victory\"");
    EXPECT_EQ(engine.frameNum(), 4);

    // an image the engine does not know fails from the second frame on
    LQ::ViFrameParameters extra = frame();
    extra.parameters["orientation"] = "90";
    extra.images["mono"] = Image(Size(8, 6), LQ::COLOR_MODE_MONO);
    FailedCheck check = catchCheck([&] { engine.processFrame(extra); });
    EXPECT_EQ(check.expression, "imageDatas_.count(it->first) > 0");
    EXPECT_EQ(check.tail, "no key 'mono' in imageDatas_");
    extra.images.erase("mono");
    engine.processFrame(extra);
    EXPECT_EQ(engine.stateAggregator()->get<LQ::FrameParametersState>().at("orientation"), "90");
}

TEST(FrameDriver, GuardLogsEachClassOfFailureAndResets) {
    ScriptedEngine engine;
    engine.init();
    engine.processFrame(frame());
    engine.processFrame(frame());
    engine.stateAggregator()->get<LQ::ScoreState>() = 2.5f;
    const std::string prefix = "during execution of command 'detect();' ";
    const struct {
        std::function<void()> fail;
        std::string text;
    } cases[] = {
        {[] { throw "assertion"; }, prefix + "non-standart exception occured\n"},
        {[] { throw std::runtime_error("no luck"); }, prefix + "standart exception occured: no luck"},
        {[] { throw std::bad_alloc(); }, prefix + "bad_alloc exception occured: std::bad_alloc"},
    };
    int resets = engine.resetCount();
    for (const auto& c : cases) {
        engine.onDetect = [&] {
            LQ::ViResultState::viResult.gestures.push_back("partial");
            c.fail();
        };
        LogCapture log;
        const LQ::ViResult& result = engine.processFrame(frame());
        EXPECT_NE(log.text().find(c.text), std::string::npos) << log.text();
        EXPECT_EQ(result.gestures, std::vector<std::string>{"partial"});  // the frame goes on
        EXPECT_EQ(engine.frameNum(), 1);  // reset to 0, then counted
        EXPECT_EQ(engine.resetCount(), ++resets);
        EXPECT_EQ(static_cast<float>(engine.stateAggregator()->get<LQ::ScoreState>()), 0.f);
    }
}

TEST(FrameDriver, FlipKeyRingLogAndGraphDump) {
    ScriptedEngine engine;
    engine.setParameter("flip", "true");
    engine.init();
    engine.onDetect = [] {
        LQ::ViResult& result = LQ::ViResultState::viResult;
        result.rects.push_back(LQ::RectF(10.5f, 20, 30, 40));
        result.points.push_back(LQ::PointF(10, 5));
        result.parameters.push_back({{"text", "fist"}, {"side", "RIGHT"}});
        result.parameters.push_back({});
    };
    const LQ::ViResult& result = engine.processFrame(frame(100, 50));
    ASSERT_EQ(result.rects.size(), 1u);
    EXPECT_EQ(result.rects[0], LQ::RectF(70, 20, 89, 40));
    EXPECT_EQ(result.points[0].x, 89);
    EXPECT_EQ(result.parameters[0].at("key-ring"), "side text ");
    EXPECT_TRUE(result.parameters[1].empty());

    // "log" goes out whatever the level; "key" 100 dumps the graph for that frame only
    LQ::ViFrameParameters next = frame(100, 50);
    next.parameters["log"] = "abc";
    next.parameters["key"] = "100";
    std::remove(LQ::ViDetectorInterface::dotPath());
    LogCapture log;
    engine.processFrame(next);
    EXPECT_NE(log.text().find("abc"), std::string::npos);
    std::ifstream dot(LQ::ViDetectorInterface::dotPath());
    std::stringstream text;
    text << dot.rdbuf();
    EXPECT_EQ(text.str().rfind("digraph {\nrankdir=LR;\nnode[shape=\"box\" fontname=\"monospace\"]\n", 0), 0u);
    EXPECT_NE(text.str().find("ImageData at ") , std::string::npos);
    EXPECT_NE(text.str().find(": WatchData of ("), std::string::npos);
    EXPECT_EQ(engine.watch->resets, 1);
}
