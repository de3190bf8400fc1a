// The C interface as a host sees it, over the small engine of TestEngine.h.

#include <gtest/gtest.h>

#include <cstring>
#include <sstream>
#include <vector>

#include "LogCapture.h"
#include "TestEngine.h"
#include "VI_Tactus_Interface.h"

namespace {

// A 4x3 luma picture with 2 chroma rows, as a host passes it (height counts all rows).
std::vector<unsigned char> smallFrame() {
    return {
        100, 1,  81, 2,  // luma row 0: the even columns are read when zooming
        9,   9,  9,  9,  // luma row 1: skipped when zooming
        255, 3,  0,  4,  // luma row 2
        9,   9,  9,  9,  // luma row 3
        128, 128, 240, 90,  // chroma row 0: V, U pairs
        128, 128, 128, 128,  // chroma row 1
    };
}

LQ::ViResult filledResult() {
    LQ::ViResult result;
    result.gestures = {"fist", "victory"};
    result.floats = {12.5f};
    result.rects = {LQ::BaseRect<float>(1.5f, 2, 30, 40.25f)};
    result.points = {LQ::BasePoint<float>(3, 4)};
    result.points3d = {LQ::BasePoint3d<float>(5, 6, 7)};
    result.parameters = {{{"side", "RIGHT"}, {"text", "0.9"}}};
    LQ::Image image(LQ::Size(3, 2), LQ::COLOR_MODE_MONO);
    std::memset(image.data(), 42, 6);
    result.images = {image};
    return result;
}

void runFrame(const LQ::ViResult& result) {
    testEngine().next = result;
    VI_Tactus_ProcessFrame();
}

}  // namespace

TEST(CInterface, GetFunctionsReadTheCopyAndClearPastTheEnd) {
    runFrame(filledResult());
    // the interface keeps its own copy: changing the engine's result later doesn't show
    LQ::ViResultState::viResult.reset();

    const char* gesture = nullptr;
    ASSERT_EQ(VI_Tactus_GetGesture(gesture, 1), 1);
    EXPECT_STREQ(gesture, "victory");
    ASSERT_EQ(VI_Tactus_GetGesture(gesture, 2), 0);
    ASSERT_NE(gesture, nullptr);  // an empty string, not null
    EXPECT_STREQ(gesture, "");

    // past the end every output is zeroed
    LQ::BaseRect<float> rect(9, 9, 9, 9);
    ASSERT_EQ(VI_Tactus_GetRect(rect.left, rect.top, rect.right, rect.bottom, 0), 1);
    EXPECT_EQ(rect, LQ::BaseRect<float>(1.5f, 2, 30, 40.25f));
    EXPECT_EQ(VI_Tactus_GetRect(rect.left, rect.top, rect.right, rect.bottom, 1), 0);
    EXPECT_EQ(rect, LQ::BaseRect<float>(0, 0, 0, 0));
    LQ::BasePoint3d<float> p(9, 9, 9);
    float value = 9;
    EXPECT_EQ(VI_Tactus_GetPoint(p.x, p.y, 0), 1);
    EXPECT_EQ(p, LQ::BasePoint3d<float>(3, 4, 9));
    EXPECT_EQ(VI_Tactus_GetPoint(p.x, p.y, 1), 0);
    EXPECT_EQ(p, LQ::BasePoint3d<float>(0, 0, 9));
    EXPECT_EQ(VI_Tactus_GetPoint3d(p.x, p.y, p.z, 0), 1);
    EXPECT_EQ(p, LQ::BasePoint3d<float>(5, 6, 7));
    EXPECT_EQ(VI_Tactus_GetPoint3d(p.x, p.y, p.z, 1), 0);
    EXPECT_EQ(p, LQ::BasePoint3d<float>(0, 0, 0));
    EXPECT_EQ(VI_Tactus_GetFloat(value, 0), 1);
    EXPECT_EQ(value, 12.5f);
    EXPECT_EQ(VI_Tactus_GetFloat(value, 1), 0);
    EXPECT_EQ(value, 0.f);

    const char* text = nullptr;
    ASSERT_EQ(VI_Tactus_GetParameter("side", text, 0), 1);
    EXPECT_STREQ(text, "RIGHT");
    // a missing key answers 1 and an empty text
    ASSERT_EQ(VI_Tactus_GetParameter("nothing", text, 0), 1);
    EXPECT_STREQ(text, "");
    EXPECT_EQ(VI_Tactus_GetParameter("side", text, 1), 0);
    EXPECT_EQ(text, nullptr);

    unsigned char* data = nullptr;
    int width = 0, height = 0;
    ASSERT_EQ(VI_Tactus_GetFrame(data, width, height, 0), 1);
    EXPECT_EQ(width, 3);
    EXPECT_EQ(height, 2);
    ASSERT_NE(data, nullptr);
    EXPECT_EQ(data[5], 42);
    EXPECT_EQ(VI_Tactus_GetFrame(data, width, height, 1), 0);
    EXPECT_EQ(data, nullptr);
    EXPECT_EQ(width + height, 0);

    const char* mode = nullptr;
    ASSERT_EQ(VI_Tactus_GetFrameColorMode_(mode, 0), 1);
    EXPECT_STREQ(mode, "COLOR_MODE_MONO");
    const char* again = nullptr;
    VI_Tactus_GetFrameColorMode_(again, 0);
    EXPECT_EQ(mode, again);  // names are cached for the life of the process
    EXPECT_EQ(VI_Tactus_GetFrameColorMode_(mode, 1), 0);
    EXPECT_EQ(mode, nullptr);

    // an empty result answers 0 at once
    runFrame(LQ::ViResult());
    EXPECT_EQ(VI_Tactus_GetGesture(gesture, 0), 0);
    EXPECT_STREQ(gesture, "");
}

TEST(CInterface, NegativeIndexFailsInEveryGetFunction) {
    runFrame(filledResult());
    const char* s = nullptr;
    unsigned char* data = nullptr;
    float a, b, c, d;
    int w, h, stride;
    const std::vector<std::function<void()>> calls = {
        [&] { VI_Tactus_GetGesture(s, -1); },
        [&] { VI_Tactus_GetRect(a, b, c, d, -1); },
        [&] { VI_Tactus_GetPoint(a, b, -1); },
        [&] { VI_Tactus_GetPoint3d(a, b, c, -1); },
        [&] { VI_Tactus_GetFloat(a, -1); },
        [&] { VI_Tactus_GetParameter("side", s, -1); },
        [&] { VI_Tactus_GetFrame(data, w, h, -1); },
        [&] { VI_Tactus_GetDebugImage_(s, data, s, w, h, stride, -1); },
        [&] { VI_Tactus_GetFrameColorMode_(s, -1); },
    };
    for (const auto& call : calls) {
        const FailedCheck check = catchCheck(call);
        EXPECT_TRUE(check.thrown);
        EXPECT_EQ(check.expression, "(i) >= (0)");
        EXPECT_EQ(check.tail, "-1 < 0");
    }
}

TEST(CInterface, FrameParametersCollectUntilTheFrame) {
    TestEngine& engine = testEngine();
    VI_Tactus_SetFrameParameter("k", "1");
    VI_Tactus_SetFrameParameter("k", "2");
    VI_Tactus_SetRoi(1, 2, 3, 4);
    VI_Tactus_SetRoi(-5, 6, 70, 800);
    std::vector<unsigned char> frame = smallFrame();
    VI_Tactus_SetFrame(frame.data(), 4, 6, 0);
    // the host may reuse its buffer at once
    std::fill(frame.begin(), frame.end(), 0);
    runFrame(LQ::ViResult());

    const LQ::ViFrameParameters& seen = engine.lastFrame;
    EXPECT_EQ(seen.parameters.at("k"), "1");
    EXPECT_EQ(seen.parameters.at("rect"), "Rect(-5, 6, 70, 800)");
    ASSERT_EQ(seen.images.count("bgr"), 1u);
    const LQ::Image& bgr = seen.images.at("bgr");
    EXPECT_EQ(bgr.colorMode(), LQ::COLOR_MODE_BGR);
    EXPECT_EQ(bgr.size(), LQ::Size(2, 2));
    EXPECT_EQ(bgr.pixel(0, 0)[0], 116);  // Y 100 with neutral chroma

    // everything is gone after the frame
    EXPECT_TRUE(viFrameParameters.parameters.empty());
    EXPECT_TRUE(viFrameParameters.images.empty());
    runFrame(LQ::ViResult());
    EXPECT_TRUE(engine.lastFrame.parameters.empty());
    EXPECT_TRUE(engine.lastFrame.images.empty());
}

TEST(CInterface, SetFrameChecksItsArguments) {
    std::vector<unsigned char> frame = smallFrame();

    FailedCheck check = catchCheck([] { VI_Tactus_SetFrame(nullptr, 4, 6, 0); });
    EXPECT_TRUE(check.thrown);
    EXPECT_EQ(check.expression, "(frame)");
    EXPECT_EQ(check.tail, " == NULL");
    EXPECT_EQ(check.function, "VI_Tactus_SetFrame");
    check = catchCheck([&] { VI_Tactus_SetFrame(frame.data(), 4, 6, -2); });
    EXPECT_EQ(check.expression, "(i) >= (0)");
    EXPECT_EQ(check.tail, "-2 < 0");
    // one image name, so index 1 is out
    check = catchCheck([&] { VI_Tactus_SetFrame(frame.data(), 4, 6, 1); });
    EXPECT_TRUE(check.thrown);
    EXPECT_EQ(check.expression, "(i) < ((int)ViInterfaceSingleton::get()->getEngineInfo().imageNames.size())");
    EXPECT_EQ(check.tail, "1 >= 1");
    // sizes from outside that make no picture end in a check, not a crash
    EXPECT_TRUE(catchCheck([&] { VI_Tactus_SetFrame(frame.data(), -4, 6, 0); }).thrown);
    check = catchCheck([&] { VI_Tactus_SetFrame(frame.data(), 1, 6, 0); });
    EXPECT_TRUE(check.thrown);
    EXPECT_EQ(check.expression, "rect.area()");
    viFrameParameters.reset();
}

// Init reads the published settings; the rest goes to the one engine.
TEST(CInterface, InitAndForwardsToTheOneEngine) {
    TestEngine& engine = testEngine();
    zoomTwice = false;
    swapRedBlue = true;
    engine.info().parameters = {{"zoom-twice", "1"}};
    const int inits = engine.inits;
    VI_Tactus_Init();
    EXPECT_EQ(engine.inits, inits + 1);
    EXPECT_TRUE(zoomTwice);
    EXPECT_TRUE(swapRedBlue);  // an absent key leaves the flag alone

    engine.info().parameters = {{"zoom-twice", "0"}, {"swap-red-blue", "0"}};
    VI_Tactus_Init();
    EXPECT_FALSE(zoomTwice);
    EXPECT_FALSE(swapRedBlue);

    engine.info().parameters = {{"zoom-twice", "yes"}};
    EXPECT_TRUE(catchCheck([] { VI_Tactus_Init(); }).thrown);
    engine.info().parameters = {{"zoom-twice", "1"}};

    LQ::ViInterface* before = ViInterfaceSingleton::get().get();

    engine.parameters.clear();
    VI_Tactus_SetParameter("mode", "fist");
    EXPECT_EQ(engine.parameters, (std::vector<std::pair<std::string, std::string>>{{"mode", "fist"}}));

    const int resets = engine.resets, releases = engine.releases;
    VI_Tactus_Reset();
    VI_Tactus_Release();
    EXPECT_EQ(engine.resets, resets + 1);
    EXPECT_EQ(engine.releases, releases + 1);
    EXPECT_EQ(ViInterfaceSingleton::get().get(), before);  // released, not replaced

    int token = 0;
    EXPECT_EQ(VI_Tactus_Request_("echo", &token), &token);
    EXPECT_EQ(VI_Tactus_Request_("draw-bgr", &token), nullptr);  // not known: null

    EXPECT_STREQ(VI_Tactus_GetVersion(), "");
    engine.info().version = "1.2";
    EXPECT_STREQ(VI_Tactus_GetVersion(), "1.2");
    EXPECT_EQ(&VI_Tactus_GetEngineInfo_(), &engine.info());
}

TEST(CInterface, DebugImagesAreReadFromTheProcessList) {
    LQ::DebugImages::reset();
    const char* name = "x";
    const char* mode = "x";
    unsigned char* data = reinterpret_cast<unsigned char*>(&name);
    int width = 1, height = 1, stride = 1;
    EXPECT_EQ(VI_Tactus_GetDebugImage_(name, data, mode, width, height, stride, 0), 0);
    EXPECT_EQ(name, nullptr);
    EXPECT_EQ(data, nullptr);
    EXPECT_EQ(mode, nullptr);
    EXPECT_EQ(width + height + stride, 0);

    LQ::Image parent(LQ::Size(8, 4), LQ::COLOR_MODE_BGR);
    LQ::Image view;
    view.createRef(parent, LQ::Rect(1, 1, 4, 3));
    LQ::DebugImages::debugImages_.emplace_back("hands", view);
    ASSERT_EQ(VI_Tactus_GetDebugImage_(name, data, mode, width, height, stride, 0), 1);
    EXPECT_STREQ(name, "hands");
    EXPECT_STREQ(mode, "COLOR_MODE_BGR");
    EXPECT_EQ(width, 3);
    EXPECT_EQ(height, 2);
    // the list holds a compact copy of what was added
    EXPECT_EQ(stride, 9);
    EXPECT_EQ(VI_Tactus_GetDebugImage_(name, data, mode, width, height, stride, 1), 0);
    LQ::DebugImages::reset();
}

TEST(ViInterface, ParseImageNameTakesTheFirstWordAtTheStart) {
    using LQ::ViInterface;
    const std::pair<const char*, LQ::ColorMode> names[] = {
        {"mono16", LQ::COLOR_MODE_MONO16}, {"mono16_left", LQ::COLOR_MODE_MONO16},
        {"monochrome", LQ::COLOR_MODE_MONO}, {"bgr_camera", LQ::COLOR_MODE_BGR},
        {"rgba", LQ::COLOR_MODE_RGBA},       {"rgb", LQ::COLOR_MODE_RGB},
        {"float2", LQ::COLOR_MODE_FLOAT2},   {"float", LQ::COLOR_MODE_FLOAT},
        {"yuv", LQ::COLOR_MODE_YUV}};
    for (const auto& [name, mode] : names) EXPECT_EQ(ViInterface::parseImageName(name), mode) << name;

    for (const char* bad : {"xbgr", "", "mon", "BGR"}) {
        const FailedCheck check = catchCheck([&] { ViInterface::parseImageName(bad); });
        EXPECT_TRUE(check.thrown) << bad;
        EXPECT_EQ(check.expression, "0");
        EXPECT_EQ(check.tail, std::string("cannot parse color mode from ") + bad);
    }
}

TEST(ViInterface, ResultPrintForm) {
    LQ::ViResult result = filledResult();
    result.gestures = {"a\"b"};
    result.floats = {0.1f, 1.0f / 3.0f};
    result.images.clear();
    std::ostringstream text;
    text << result;
    EXPECT_EQ(text.str(),
              "ViResult(\n\tgestures=vector[1](\"a\\\"b\")\n\tfloats=vector[2](0.1, 0.3333333)"
              "\n\trects=vector[1](Rect(1.5, 2, 30, 40.25))\n\tpoints=vector[1](PointF(3, 4))"
              "\n\tpoints3d=vector[1](Point3dF(5, 6, 7))"
              "\n\tparameters=vector[1](map[2](\"side\" = \"RIGHT\", \"text\" = \"0.9\"))"
              "\n\timages=vector[0]()\n)");

    // reset empties all seven and keeps capacity
    const size_t capacity = result.floats.capacity();
    result.reset();
    EXPECT_TRUE(result.gestures.empty() && result.floats.empty() && result.rects.empty() && result.points.empty() &&
                result.points3d.empty() && result.parameters.empty() && result.images.empty());
    EXPECT_EQ(result.floats.capacity(), capacity);
}
