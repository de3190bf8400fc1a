// The engine as a camera application sees it: only the exported C functions, frames of
// NV21 at 1280 x 720, and the test's own rings and networks in the model directory.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "GlyphModels.h"
#include "VI_Tactus_Interface.h"

using LQ::BaseRect;
using glyphModels::Frame;

namespace {

struct Gesture {
    std::string name, text, side, keyRing;
    BaseRect<float> rect;
    float angle = 0;
};

std::vector<Gesture> results() {
    std::vector<Gesture> out;
    const char* name = nullptr;
    for (int i = 0; VI_Tactus_GetGesture(name, i); ++i) {
        Gesture g;
        g.name = name;
        VI_Tactus_GetRect(g.rect.left, g.rect.top, g.rect.right, g.rect.bottom, i);
        VI_Tactus_GetFloat(g.angle, i);
        const char* value = nullptr;
        if (VI_Tactus_GetParameter("text", value, i)) g.text = value;
        if (VI_Tactus_GetParameter("side", value, i)) g.side = value;
        if (VI_Tactus_GetParameter("key-ring", value, i)) g.keyRing = value;
        out.push_back(g);
    }
    return out;
}

// everything the library writes to stderr (its log) while f runs
template <class F>
std::string stderrOf(F f) {
    const std::string path = ::testing::TempDir() + "tactus_stderr_" + std::to_string(getpid());
    fflush(stderr);
    struct Redirect {  // restores stderr on the way out, also when f throws
        int saved;
        FILE* file;
        ~Redirect() { fflush(stderr), dup2(saved, 2), close(saved), fclose(file); }
    };
    {
        Redirect redirect{dup(2), fopen(path.c_str(), "w")};
        dup2(fileno(redirect.file), 2);
        f();
    }
    std::ifstream in(path);
    std::stringstream text;
    text << in.rdbuf();
    return text.str();
}

std::string makeDirectory(const std::string& name) {
    const std::string path = ::testing::TempDir() + "tactus_" + name + "_" + std::to_string(getpid());
    mkdir(path.c_str(), 0700);
    return path;
}

std::string& modelDirectory() {
    static std::string directory;
    if (directory.empty()) {
        directory = makeDirectory("models");
        glyphModels::write(directory);
    }
    return directory;
}

void start(const char* mode, const char* isFlip = "true") {
    VI_Tactus_SetParameter("mode", mode);
    VI_Tactus_SetParameter("nn-path", modelDirectory().c_str());
    VI_Tactus_SetParameter("is-flip", isFlip);
    VI_Tactus_Init();
    VI_Tactus_Reset();
}

std::vector<Gesture> run(Frame& frame, const char* key = "orientation", const std::string& value = "0") {
    VI_Tactus_SetFrame(frame.nv21().data(), glyphModels::kCameraWidth, glyphModels::kCameraHeight * 3 / 2, 0);
    if (key) VI_Tactus_SetFrameParameter(key, value.c_str());
    VI_Tactus_ProcessFrame();
    return results();
}

// up to eight frames of step, until one reports something
template <class F>
std::vector<Gesture> untilFound(F step) {
    std::vector<Gesture> found;
    for (int n = 0; n < 8 && found.empty(); ++n) found = step();
    return found;
}

// the device turn of each orientation as the engine applies it: 0 degrees holds the camera
// sideways, so the engine turns a quarter; a back camera turns the other way
int turnsOf(int orientation, bool isFlip) {
    static const int front[4] = {1, 2, 3, 0};
    const int t = front[orientation / 90];
    return isFlip ? t : (4 - t) % 4;
}

const float kScale = 2.f;                      // the glyph at twice its window: 48 pixels
const float kSize = glyphs::kWindow * kScale;  // in the upright half-size image

Frame fistFrame(int turns, float left = 100, float top = 80) {
    Frame frame(turns);
    frame.draw(glyphs::kF, left, top, kScale);
    return frame;
}

// one gesture, whose rectangle is the camera box of the upright glyph window (mirrored
// left to right for a front camera) within 15% of its size
void expectOneAt(const std::vector<Gesture>& found, const Frame& frame, float left, float top, bool isFlip,
                 const std::string& where) {
    ASSERT_EQ(found.size(), 1u) << where;
    BaseRect<float> want = frame.cameraBox(BaseRect<float>(left, top, left + kSize, top + kSize));
    if (isFlip) want = BaseRect<float>(glyphModels::kCameraWidth - want.right, want.top,
                                       glyphModels::kCameraWidth - want.left, want.bottom);
    const BaseRect<float>& got = found[0].rect;
    const float tolerance = 0.15f * (want.right - want.left);
    EXPECT_NEAR(got.left, want.left, tolerance) << where;
    EXPECT_NEAR(got.top, want.top, tolerance) << where;
    EXPECT_NEAR(got.right, want.right, tolerance) << where;
    EXPECT_NEAR(got.bottom, want.bottom, tolerance) << where;
}

}  // namespace

// Failure paths first: a process loads its networks once, and these must see the first load.
TEST(EngineClip, AMissingNetworkFileReachesTheHostAndEveryFrameTriesAgain) {
    const std::string empty = makeDirectory("empty");
    VI_Tactus_SetParameter("mode", "fist");
    VI_Tactus_SetParameter("nn-path", empty.c_str());
    VI_Tactus_Init();
    Frame frame(1);
    for (int attempt = 0; attempt < 2; ++attempt) {
        const std::string log = stderrOf([&] { EXPECT_ANY_THROW(run(frame)); });
        EXPECT_NE(log.find("cannot open " + empty + "/thumbUp_verifier_iter_55000.nn"), std::string::npos) << log;
    }
}

TEST(EngineClip, UnknownModesAndTheHeartFailWithTheirTexts) {
    Frame frame(1);
    start("fist thumbUp");
    std::string log = stderrOf([&] { EXPECT_ANY_THROW(run(frame)); });
    EXPECT_NE(log.find("Assertion `false` failed in "), std::string::npos) << log;
    EXPECT_NE(log.find("Unknown mode = fist thumbUp Possible modes: heart, thumbUp, victory, fist, pointer"),
              std::string::npos)
        << log;
    start("heart");
    log = stderrOf([&] { EXPECT_ANY_THROW(run(frame)); });
    EXPECT_NE(log.find("correlation tracker"), std::string::npos) << log;
    // a good mode afterwards builds and runs
    start("fist");
    EXPECT_NO_THROW(run(frame));
}

// A fist that appears, moves and leaves: reported once its flags fill (the trigger runs
// every fifth frame, three flags are needed), followed in camera coordinates, and dropped
// once the glyph has been away for the length of its history.
TEST(EngineClip, AFistIsReportedFollowedAndDropped) {
    start("fist");
    const int appear = 2, leave = 16, end = 26;
    int firstReport = -1, lastReport = -1;
    for (int n = 0; n < end; ++n) {
        const float left = 120 + 3 * n, top = 300 - 2 * n;
        Frame frame = n >= appear && n < leave ? fistFrame(turnsOf(0, true), left, top)
                                               : Frame(turnsOf(0, true));
        const std::vector<Gesture> found = run(frame);
        ASSERT_LE(found.size(), 1u) << "frame " << n;
        if (found.empty()) {
            EXPECT_FALSE(firstReport >= 0 && n < leave) << "lost on frame " << n;
            continue;
        }
        ASSERT_GE(n, appear);
        if (firstReport < 0) firstReport = n;
        lastReport = n;
        const Gesture& g = found[0];
        EXPECT_EQ(g.name, "fist");
        EXPECT_TRUE(g.text == "3/5" || g.text == "4/5" || g.text == "5/5") << g.text;
        EXPECT_EQ(g.side, "RIGHT");
        EXPECT_EQ(g.angle, 0.f);
        EXPECT_NE(g.keyRing.find("side "), std::string::npos);
        EXPECT_NE(g.keyRing.find("text "), std::string::npos);
        if (n < leave) expectOneAt(found, frame, left, top, true, "frame " + std::to_string(n));
    }
    ASSERT_GE(firstReport, appear + 2);
    EXPECT_LE(firstReport, appear + 5 + 2);
    EXPECT_GE(lastReport, leave - 1);
    EXPECT_LE(lastReport, leave + 4);
}

// Every orientation with a front and a back camera: the glyph drawn upright for the
// device's turn is found where it is in the camera frame; turned the wrong way it is not.
TEST(EngineClip, EveryOrientationAndBothCameras) {
    for (const bool isFlip : {true, false}) {
        start("fist", isFlip ? "true" : "false");
        for (const int orientation : {0, 90, 180, 270}) {
            const std::string where = "orientation " + std::to_string(orientation) + (isFlip ? " front" : " back");
            const std::string value = std::to_string(orientation);
            VI_Tactus_Reset();
            Frame frame = fistFrame(turnsOf(orientation, isFlip));
            const std::vector<Gesture> found = untilFound([&] { return run(frame, "orientation", value); });
            expectOneAt(found, frame, 100, 80, isFlip, where);
            VI_Tactus_Reset();
            Frame wrong = fistFrame((turnsOf(orientation, isFlip) + 1) % 4);
            for (int n = 0; n < 8; ++n) EXPECT_TRUE(run(wrong, "orientation", value).empty()) << where;
        }
    }
}

// Without an orientation the accelerometer decides; with neither, the last turn stays.
// An orientation outside the four values empties that frame only.
TEST(EngineClip, AccelerometerDefaultTurnAndBadOrientation) {
    start("fist");
    Frame upright = fistFrame(0), sideways = fistFrame(1);
    run(sideways, "orientation", "0");
    // gravity along x: no turn, but three readings are needed; with one the quarter turn stays
    EXPECT_TRUE(untilFound([&] { return run(upright, "accelx", "9.8"); }).empty());
    const auto gravity = [&](Frame& frame, const char* x, const char* y, const char* z) {
        return untilFound([&] {
            VI_Tactus_SetFrameParameter("accelx", x);
            VI_Tactus_SetFrameParameter("accely", y);
            VI_Tactus_SetFrameParameter("accelz", z);
            return run(frame, nullptr);
        });
    };
    expectOneAt(gravity(upright, "9.8", "0", "0"), upright, 100, 80, true, "accelerometer, no turn");
    EXPECT_EQ(run(upright, nullptr).size(), 1u);  // no data: the turn stays
    VI_Tactus_Reset();
    expectOneAt(gravity(sideways, "0", "9.8", "0.5"), sideways, 100, 80, true, "accelerometer, a quarter");

    std::string log = stderrOf([&] { EXPECT_TRUE(run(sideways, "orientation", "45").empty()); });
    EXPECT_NE(log.find("Unknown angle = 45, possible angles: 0, 90, 180, 270"), std::string::npos) << log;
    // 450 is 90
    Frame ninety = fistFrame(turnsOf(90, true));
    std::vector<Gesture> found = untilFound([&] { return run(sideways, "orientation", "450"); });
    if (found.empty()) found = untilFound([&] { return run(ninety, "orientation", "450"); });
    expectOneAt(found, ninety, 100, 80, true, "orientation 450");
}

// Turning the device from 0 to 180 degrees rebuilds the chain; the fist, upright in both,
// stays reported through the change and its rectangle turns with the frame.
TEST(EngineClip, ARebuildOnATurnKeepsTheObject) {
    start("fist");
    int reported = 0;
    for (int n = 0; n < 20; ++n) {
        const int orientation = n < 10 ? 0 : 180;
        Frame frame = fistFrame(turnsOf(orientation, true), 150, 200);
        const std::vector<Gesture> found = run(frame, "orientation", std::to_string(orientation));
        if (reported == 0 && found.empty()) continue;
        ++reported;
        expectOneAt(found, frame, 150, 200, true, "frame " + std::to_string(n));
    }
    EXPECT_GE(reported, 12);
}

// The thumb-up's and victory's result boxes are taller than wide in the upright image; the
// device's turn lays them on their side in the camera frame. A pointer needs the strict
// verifier to be born; ours answers 0.5, so no pointer ever is.
TEST(EngineClip, ResultBoxesTurnWithTheDeviceAndPointersNeedTheStrictVerifier) {
    Frame frame = fistFrame(turnsOf(0, true), 100, 200);
    struct Box {
        const char* mode;
        float across, aspect;  // of the object's width, and height over width
    };
    for (const Box& box : {Box{"thumbUp", 0.9f, 1.9f}, Box{"victory", 0.7f, 2.2f}}) {
        start(box.mode);
        const std::vector<Gesture> found = untilFound([&] { return run(frame); });
        ASSERT_EQ(found.size(), 1u) << box.mode;
        EXPECT_EQ(found[0].name, box.mode);
        // in camera pixels, twice the half-size image
        const float across = 2 * box.across * kSize, along = box.aspect * across;
        EXPECT_NEAR(found[0].rect.right - found[0].rect.left, along, 0.15f * along) << box.mode;
        EXPECT_NEAR(found[0].rect.bottom - found[0].rect.top, across, 0.15f * across) << box.mode;
    }
    start("pointer");
    for (int n = 0; n < 12; ++n) EXPECT_TRUE(run(frame).empty()) << "frame " << n;
}
