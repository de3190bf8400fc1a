#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <iterator>
#include <optional>
#include <string>
#include <vector>

#include "HandClip.h"
#include "HandgenTestUtils.h"
#include "clips.h"

using namespace handgen;

namespace {

// a plain background with no noise or blur, so that a frame changes only where the hand is
ClipSetup plainSetup(int frames) {
    ClipSetup setup;
    setup.width = 160;
    setup.height = 96;
    setup.frames = frames;
    setup.seed = 21;
    setup.gap = {6, 6};
    setup.duration = {40, 60};
    std::string error;
    for (const char* s : {"backgrounds=flat", "noise=0", "blur=0", "gradient=0", "faceShare=0", "armShare=0"})
        EXPECT_TRUE(setVariation(setup.variation, s, error)) << error;
    return setup;
}

std::string readAll(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

}  // namespace

TEST(HandClip, FilesHoldTheFramesInNv21AndY4m) {
    const HandgenTempDir dir;
    ClipSetup setup = plainSetup(4);
    setup.width = 64;
    setup.height = 48;
    setup.gap = {20, 20};  // the first hand comes at frame 10: these frames are the background alone
    const ClipMaker maker(setup);
    std::vector<std::uint8_t> rgb;
    maker.render(0, rgb);
    const double r = rgb[0], g = rgb[1], b = rgb[2];
    for (size_t i = 0; i < rgb.size(); i += 3) ASSERT_TRUE(rgb[i] == r && rgb[i + 1] == g && rgb[i + 2] == b) << i;

    writeClip(setup, dir / "plain.y4m", dir / "plain.jsonl", 2);
    writeClip(setup, dir / "plain.nv21", "", 1);
    const std::string y4m = readAll(dir / "plain.y4m");
    EXPECT_EQ(y4m.substr(0, y4m.find('\n')), "YUV4MPEG2 W64 H48 F30:1 Ip A1:1 C420jpeg");

    // the host program's reader gives NV21: luma, then V, U pairs
    Y4mClip clip(dir / "plain.y4m");
    ASSERT_TRUE(clip.width == 64 && clip.height == 48);
    std::vector<unsigned char> frame;
    std::string frames;
    int count = 0;
    while (clip.next(frame)) {
        for (int i = 0; i < 64 * 48; ++i) ASSERT_NEAR(frame[i], exactLuma(r, g, b), 1.0) << i;
        for (int i = 64 * 48; i < 64 * 48 * 3 / 2; i += 2) {
            ASSERT_NEAR(frame[i], exactCr(r, g, b), 1.0) << i;
            ASSERT_NEAR(frame[i + 1], exactCb(r, g, b), 1.0) << i;
        }
        frames.append(frame.begin(), frame.end());
        ++count;
    }
    EXPECT_EQ(count, 4);
    // the raw clip is the same frames end to end
    EXPECT_EQ(readAll(dir / "plain.nv21"), frames);
    EXPECT_EQ(readAll(dir / "plain.jsonl"),
              "{\"frame\":0,\"gestures\":[]}\n{\"frame\":1,\"gestures\":[]}\n"
              "{\"frame\":2,\"gestures\":[]}\n{\"frame\":3,\"gestures\":[]}\n");
}

TEST(HandClip, TruthAgreesWithTheFrames) {
    const ClipSetup setup = plainSetup(150);
    const ClipMaker maker(setup);
    std::vector<std::uint8_t> background, rgb;
    maker.render(0, background);
    ASSERT_FALSE(maker.truth(0).present);

    int absent = 0, partial = 0, labelled = 0, bare = 0;
    for (int f = 0; f < setup.frames; ++f) {
        const FrameTruth truth = maker.truth(f);
        maker.render(f, rgb);
        const bool untouched = rgb == background;
        const std::string json = truthJson(f, truth);
        if (!truth.present) {
            ++absent;
            EXPECT_EQ(json, "{\"frame\":" + std::to_string(f) + ",\"gestures\":[]}");
            bare += untouched;
            continue;
        }
        // a frame with nothing drawn has no hand to report
        EXPECT_FALSE(untouched) << f;
        EXPECT_EQ(json.find("\"gestures\":[]"), std::string::npos) << json;
        const auto& rect = truth.rect;
        EXPECT_TRUE(0 <= rect[0] && rect[0] < rect[2] && rect[2] <= setup.width) << f;
        EXPECT_TRUE(0 <= rect[1] && rect[1] < rect[3] && rect[3] <= setup.height) << f;
        EXPECT_TRUE(truth.visible > 0 && truth.visible <= 1) << f;
        if (truth.visible < 1) ++partial;
        if (truth.gesture) {
            ++labelled;
            EXPECT_GE(truth.visible, setup.minVisible) << f;
            EXPECT_NE(json.find(std::string("\"gesture\":\"") + gestureName(*truth.gesture) + "\""), std::string::npos);
        } else {
            EXPECT_NE(json.find("\"gesture\":\"none\""), std::string::npos) << json;
        }
        // the hand is drawn inside its rectangle: a good share of it changed from the background
        if (truth.visible == 1) {
            int changed = 0, all = 0;
            for (int y = static_cast<int>(rect[1]); y < static_cast<int>(rect[3]); ++y)
                for (int x = static_cast<int>(rect[0]); x < static_cast<int>(rect[2]); ++x, ++all) {
                    const size_t i = (static_cast<size_t>(y) * setup.width + x) * 3;
                    changed += rgb[i] != background[i] || rgb[i + 1] != background[i + 1] || rgb[i + 2] != background[i + 2];
                }
            EXPECT_GT(changed, all / 5) << f;
        }
    }
    // the clip has frames of every kind: gaps, entering or leaving, and shown gestures
    EXPECT_GT(bare, 5);
    EXPECT_GT(absent, bare - 1);
    EXPECT_GT(partial, 5);
    EXPECT_GT(labelled, 30);
}

TEST(HandClip, SameSeedSameFramesOnAnyNumberOfWorkers) {
    const HandgenTempDir dir;
    ClipSetup setup = plainSetup(12);
    setup.variation = Variation{};  // textures, noise and blur this time
    setup.gap = {0, 2};
    writeClip(setup, dir / "one.y4m", dir / "one.jsonl", 1);
    writeClip(setup, dir / "two.y4m", dir / "two.jsonl", 2);
    EXPECT_EQ(readAll(dir / "one.y4m"), readAll(dir / "two.y4m"));
    EXPECT_EQ(readAll(dir / "one.jsonl"), readAll(dir / "two.jsonl"));
    setup.seed += 1;
    writeClip(setup, dir / "other.y4m", "", 2);
    EXPECT_NE(readAll(dir / "one.y4m"), readAll(dir / "other.y4m"));
}

TEST(HandClip, BoxesAreClippedToTheFrame) {
    // a 20 x 20 square centred on the corner: a quarter inside
    const std::vector<Point> corner = {{-10, -10}, {10, -10}, {10, 10}, {-10, 10}};
    const std::vector<Point> inside = clipToFrame(corner, 100, 50);
    EXPECT_NEAR(polygonArea(inside), 100, 1e-3);
    for (const Point& p : inside) EXPECT_TRUE(p.x >= 0 && p.y >= 0);
    // a turned square within the frame keeps its area; one outside has none
    const std::vector<Point> diamond = {{50, 10}, {60, 20}, {50, 30}, {40, 20}};
    EXPECT_NEAR(polygonArea(clipToFrame(diamond, 100, 50)), 200, 1e-3);
    const std::vector<Point> away = {{120, 10}, {130, 10}, {130, 20}, {120, 20}};
    EXPECT_LT(clipToFrame(away, 100, 50).size(), 3u);
    // across the right and bottom edges together
    const std::vector<Point> across = {{90, 40}, {110, 40}, {110, 60}, {90, 60}};
    EXPECT_NEAR(polygonArea(clipToFrame(across, 100, 50)), 100, 1e-3);
}

TEST(HandClip, ShapeChangesAreLeftUnnamedWhileTheHandBlends) {
    ClipSetup setup = plainSetup(700);
    setup.duration = {90, 120};
    const ClipMaker maker(setup);
    // runs of "none" in full view between two named frames are the blends between shapes
    int changes = 0;
    std::optional<Gesture> before;
    int run = 0;
    bool inView = true;
    for (int f = 0; f < setup.frames; ++f) {
        const FrameTruth truth = maker.truth(f);
        if (!truth.present) {
            before.reset();
            run = 0;
            continue;
        }
        if (truth.gesture) {
            if (before && run > 0 && inView) {
                EXPECT_EQ(run, setup.transition) << "frame " << f;
                EXPECT_NE(*truth.gesture, *before) << "frame " << f;
                ++changes;
            }
            before = truth.gesture;
            run = 0;
            inView = true;
        } else {
            ++run;
            inView = inView && truth.visible >= setup.minVisible;
        }
    }
    EXPECT_GT(changes, 2);
}
