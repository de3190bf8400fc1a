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
    const int saved = dup(2);
    FILE* file = fopen(path.c_str(), "w");
    dup2(fileno(file), 2);
    try {
        f();
    } catch (...) {
        fflush(stderr);
        dup2(saved, 2);
        close(saved);
        fclose(file);
        throw;
    }
    fflush(stderr);
    dup2(saved, 2);
    close(saved);
    fclose(file);
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

std::vector<Gesture> run(Frame& frame, const char* key = "orientation", const char* value = "0") {
    VI_Tactus_SetFrame(frame.nv21().data(), glyphModels::kCameraWidth, glyphModels::kCameraHeight * 3 / 2, 0);
    if (key) VI_Tactus_SetFrameParameter(key, value);
    VI_Tactus_ProcessFrame();
    return results();
}

// the device turn of each orientation as the engine applies it: 0 degrees holds the camera
// sideways, so the engine turns a quarter; a back camera turns the other way
int turnsOf(int orientation, bool isFlip) {
    static const int front[4] = {1, 2, 3, 0};
    const int t = front[orientation / 90];
    return isFlip ? t : (4 - t) % 4;
}

// the camera box of a square upright window, mirrored left to right for a front camera
BaseRect<float> expectedBox(const Frame& frame, float left, float top, float size, bool isFlip) {
    BaseRect<float> box = frame.cameraBox(BaseRect<float>(left, top, left + size, top + size));
    if (isFlip) box = BaseRect<float>(glyphModels::kCameraWidth - box.right, box.top,
                                      glyphModels::kCameraWidth - box.left, box.bottom);
    return box;
}

void expectNear(const BaseRect<float>& got, const BaseRect<float>& want, const std::string& where) {
    const float tolerance = 0.15f * (want.right - want.left);
    EXPECT_NEAR(got.left, want.left, tolerance) << where;
    EXPECT_NEAR(got.top, want.top, tolerance) << where;
    EXPECT_NEAR(got.right, want.right, tolerance) << where;
    EXPECT_NEAR(got.bottom, want.bottom, tolerance) << where;
}

const float kScale = 2.f;                      // the glyph at twice its window: 48 pixels
const float kSize = glyphs::kWindow * kScale;  // in the upright half-size image

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

// A fist that appears, moves and leaves: it is reported after its flags fill, follows
// the glyph frame by frame in camera coordinates (turned back, mirrored, doubled), and
// goes once the glyph has been away for the length of its history.
TEST(EngineClip, AFistIsReportedFollowedAndDropped) {
    start("fist");
    const int appear = 2, leave = 16, end = 26;
    int firstReport = -1, lastReport = -1;
    for (int n = 0; n < end; ++n) {
        Frame frame(turnsOf(0, true));
        const float left = 120 + 3 * n, top = 300 - 2 * n;
        if (n >= appear && n < leave) frame.draw(glyphs::kF, left, top, kScale);
        const std::vector<Gesture> found = run(frame);
        ASSERT_LE(found.size(), 1u) << "frame " << n;
        if (found.empty()) {
            // once reported it stays while the glyph is there
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
        if (n < leave) expectNear(g.rect, expectedBox(frame, left, top, kSize, true), "frame " + std::to_string(n));
    }
    // the trigger runs every fifth frame and three flags are needed
    ASSERT_GE(firstReport, appear + 2);
    EXPECT_LE(firstReport, appear + 5 + 2);
    EXPECT_GE(lastReport, leave - 1);
    EXPECT_LE(lastReport, leave + 4);
}

// Every orientation with a front and a back camera: the glyph drawn upright for the
// device's turn is found, and its rectangle comes back where it is in the camera frame.
TEST(EngineClip, EveryOrientationAndBothCameras) {
    for (const bool isFlip : {true, false}) {
        start("fist", isFlip ? "true" : "false");
        for (const int orientation : {0, 90, 180, 270}) {
            VI_Tactus_Reset();
            const std::string where = "orientation " + std::to_string(orientation) + (isFlip ? " front" : " back");
            Frame frame(turnsOf(orientation, isFlip));
            frame.draw(glyphs::kF, 100, 80, kScale);
            std::vector<Gesture> found;
            for (int n = 0; n < 8 && found.empty(); ++n) found = run(frame, "orientation", std::to_string(orientation).c_str());
            ASSERT_EQ(found.size(), 1u) << where;
            expectNear(found[0].rect, expectedBox(frame, 100, 80, kSize, isFlip), where);
            // the same glyph turned the wrong way isn't a fist
            VI_Tactus_Reset();
            Frame wrong((turnsOf(orientation, isFlip) + 1) % 4);
            wrong.draw(glyphs::kF, 100, 80, kScale);
            for (int n = 0; n < 8; ++n)
                EXPECT_TRUE(run(wrong, "orientation", std::to_string(orientation).c_str()).empty()) << where;
        }
    }
}

// Without an orientation the accelerometer decides; with neither, the last turn stays.
// An orientation outside the four values empties that frame only.
TEST(EngineClip, AccelerometerDefaultTurnAndBadOrientation) {
    start("fist");
    Frame upright(0), sideways(1);
    upright.draw(glyphs::kF, 100, 80, kScale);
    sideways.draw(glyphs::kF, 100, 80, kScale);
    std::vector<Gesture> found;
    run(sideways, "orientation", "0");
    // gravity along x: no turn, but three readings are needed; with one the quarter turn stays
    for (int n = 0; n < 8 && found.empty(); ++n) found = run(upright, "accelx", "9.8");
    EXPECT_TRUE(found.empty());
    for (int n = 0; n < 8 && found.empty(); ++n) {
        VI_Tactus_SetFrameParameter("accely", "0");
        VI_Tactus_SetFrameParameter("accelz", "0");
        found = run(upright, "accelx", "9.8");
    }
    ASSERT_EQ(found.size(), 1u);
    expectNear(found[0].rect, expectedBox(upright, 100, 80, kSize, true), "accelerometer, no turn");
    // no data: the turn stays
    EXPECT_EQ(run(upright, nullptr).size(), 1u);

    VI_Tactus_Reset();
    found.clear();
    for (int n = 0; n < 8 && found.empty(); ++n) {
        VI_Tactus_SetFrameParameter("accelx", "0");
        VI_Tactus_SetFrameParameter("accelz", "0.5");
        found = run(sideways, "accely", "9.8");
    }
    ASSERT_EQ(found.size(), 1u);
    expectNear(found[0].rect, expectedBox(sideways, 100, 80, kSize, true), "accelerometer, a quarter");

    std::string log = stderrOf([&] { EXPECT_TRUE(run(sideways, "orientation", "45").empty()); });
    EXPECT_NE(log.find("Unknown angle = 45, possible angles: 0, 90, 180, 270"), std::string::npos) << log;
    // 450 is 90
    found.clear();
    for (int n = 0; n < 8 && found.empty(); ++n) found = run(sideways, "orientation", "450");
    Frame ninety(turnsOf(90, true));
    ninety.draw(glyphs::kF, 100, 80, kScale);
    for (int n = 0; n < 8 && found.empty(); ++n) found = run(ninety, "orientation", "450");
    ASSERT_EQ(found.size(), 1u);
    expectNear(found[0].rect, expectedBox(ninety, 100, 80, kSize, true), "orientation 450");
}

// Turning the device from 0 to 180 degrees rebuilds the chain; the fist, upright in both,
// stays reported through the change and its rectangle turns with the frame.
TEST(EngineClip, ARebuildOnATurnKeepsTheObject) {
    start("fist");
    int reported = 0;
    for (int n = 0; n < 20; ++n) {
        const int orientation = n < 10 ? 0 : 180;
        Frame frame(turnsOf(orientation, true));
        frame.draw(glyphs::kF, 150, 200, kScale);
        const std::vector<Gesture> found = run(frame, "orientation", std::to_string(orientation).c_str());
        if (reported == 0 && found.empty()) continue;
        ASSERT_EQ(found.size(), 1u) << "frame " << n;
        ++reported;
        expectNear(found[0].rect, expectedBox(frame, 150, 200, kSize, true), "frame " + std::to_string(n));
    }
    EXPECT_GE(reported, 12);
}

// The thumb-up's and victory's result boxes are taller than wide in the upright image; the
// device's turn lays them on their side in the camera frame. A pointer needs the strict
// verifier to be born; ours answers 0.5, so no pointer ever is.
TEST(EngineClip, ResultBoxesTurnWithTheDeviceAndPointersNeedTheStrictVerifier) {
    Frame frame(turnsOf(0, true));
    frame.draw(glyphs::kF, 100, 200, kScale);
    struct Box {
        const char* mode;
        float across, aspect;  // of the object's width, and height over width
    };
    for (const Box& box : {Box{"thumbUp", 0.9f, 1.9f}, Box{"victory", 0.7f, 2.2f}}) {
        start(box.mode);
        std::vector<Gesture> found;
        for (int n = 0; n < 8 && found.empty(); ++n) found = run(frame);
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
