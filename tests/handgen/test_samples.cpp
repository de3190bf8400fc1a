#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <fstream>
#include <functional>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "HandSamples.h"
#include "HandgenTestUtils.h"

using namespace handgen;

namespace {

SampleSet smallSet(Gesture gesture, std::uint64_t seed, bool negatives) {
    SampleSet set;
    set.gesture = gesture;
    set.seed = seed;
    set.negatives = negatives;
    set.window.width = set.window.height = 24;
    set.supersample = 2;
    return set;
}

const std::uint8_t* window(const std::vector<std::uint8_t>& all, int i) { return all.data() + 24 * 24 * i; }
bool same(const std::vector<std::uint8_t>& a, int i, const std::vector<std::uint8_t>& b, int j) {
    return std::equal(window(a, i), window(a, i) + 24 * 24, window(b, j));
}

std::string readAll(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

std::string thrown(const std::function<void()>& f) {
    try {
        f();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "";
}

}  // namespace

TEST(HandSamples, WindowsDependOnTheSeedAndTheirIndexOnly) {
    const SampleSet set = smallSet(Gesture::Victory, 7, false);
    const std::vector<std::uint8_t> one = generateSamples(set, 0, 12, 1);
    const std::vector<std::uint8_t> two = generateSamples(set, 0, 12, 2);
    EXPECT_EQ(one, two);
    EXPECT_EQ(one, generateSamples(set, 0, 12, 3));
    // a later run from the middle gives the same windows
    const std::vector<std::uint8_t> tail = generateSamples(set, 6, 6, 2);
    for (int i = 0; i < 6; ++i) EXPECT_TRUE(same(one, 6 + i, tail, i)) << i;

    // another seed, the negatives of the same seed, and another gesture's positives differ window by window
    const std::vector<std::uint8_t> otherSeed = generateSamples(smallSet(Gesture::Victory, 8, false), 0, 12, 2);
    const std::vector<std::uint8_t> negatives = generateSamples(smallSet(Gesture::Victory, 7, true), 0, 12, 2);
    const std::vector<std::uint8_t> otherGesture = generateSamples(smallSet(Gesture::Fist, 7, false), 0, 12, 2);
    for (int i = 0; i < 12; ++i) {
        EXPECT_FALSE(same(one, i, otherSeed, i)) << i;
        EXPECT_FALSE(same(one, i, negatives, i)) << i;
        EXPECT_FALSE(same(one, i, otherGesture, i)) << i;
    }
    // windows are not all alike
    std::set<std::vector<std::uint8_t>> distinct;
    for (int i = 0; i < 12; ++i) distinct.insert(std::vector<std::uint8_t>(window(one, i), window(one, i) + 24 * 24));
    EXPECT_EQ(distinct.size(), 12u);
}

TEST(HandSamples, PositivesFitTheObjectRectangle) {
    SampleSet set = smallSet(Gesture::Pointer, 3, false);
    set.window = SampleWindow{32, 40, 4, 6, 20, 30, 90};
    std::string error;
    // no jitter: the box must sit exactly as the window says
    for (const char* fixed : {"scale=1", "shift=0", "rotation=0"}) ASSERT_TRUE(setVariation(set.variation, fixed, error)) << error;
    std::vector<SampleLabel> labels;
    generateSamples(set, 0, 20, 2, &labels);
    std::set<HandSide> sides;
    for (const SampleLabel& label : labels) {
        EXPECT_EQ(label.kind, SampleKind::Positive);
        EXPECT_EQ(label.shown, Gesture::Pointer);
        EXPECT_NEAR(label.box.cx, 4 + 10, 1e-3f);
        EXPECT_NEAR(label.box.cy, 6 + 15, 1e-3f);
        EXPECT_NEAR(label.box.angle, 90, 1e-4f);
        // as large as fits: one side of the box meets the rectangle, the other stays inside
        const float fit = std::max(label.box.width / 20, label.box.height / 30);
        EXPECT_NEAR(fit, 1, 1e-3f);
        sides.insert(label.side);
    }
    EXPECT_EQ(sides.size(), 2u);
}

TEST(HandSamples, NegativesNeverShowTheGestureWhereAPositiveWould) {
    const SampleSet set = smallSet(Gesture::Fist, 11, true);
    std::vector<SampleLabel> labels;
    generateSamples(set, 0, 160, 2, &labels);
    int counts[4] = {};
    for (const SampleLabel& label : labels) {
        ++counts[static_cast<int>(label.kind)];
        switch (label.kind) {
            case SampleKind::Positive: ADD_FAILURE() << "a positive among the negatives"; break;
            case SampleKind::Background: EXPECT_FALSE(label.shown.has_value()); break;
            case SampleKind::OtherGesture:
                ASSERT_TRUE(label.shown.has_value());
                EXPECT_NE(*label.shown, Gesture::Fist);
                break;
            case SampleKind::Misplaced: {
                EXPECT_EQ(label.shown, Gesture::Fist);
                // too small, too large, off centre or turned away
                const float fit = std::max(label.box.width, label.box.height) / 18;
                const float off = std::hypot(label.box.cx - 12, label.box.cy - 12) / 18;
                const bool turned = std::fabs(label.box.angle) > 30;
                EXPECT_TRUE(fit < 0.7f || fit > 1.5f || off > 0.4f || turned) << labelJson(0, label);
                break;
            }
        }
    }
    // about half backgrounds, a third other gestures, the rest misplaced
    EXPECT_GT(counts[1], 50);
    EXPECT_GT(counts[2], 30);
    EXPECT_GT(counts[3], 10);
}

TEST(HandSamples, MonoIsTheCameraLuma) {
    Canvas canvas(4, 1);
    const float colours[4][3] = {{1, 0, 0}, {0, 1, 0}, {0, 0, 1}, {0.5f, 0.5f, 0.5f}};
    for (int x = 0; x < 4; ++x)
        for (int k = 0; k < 3; ++k) canvas.row(0)[3 * x + k] = colours[x][k];
    std::uint8_t mono[4];
    toMono(canvas, mono);
    for (int x = 0; x < 4; ++x) {
        const double r = std::round(colours[x][0] * 255), g = std::round(colours[x][1] * 255), b = std::round(colours[x][2] * 255);
        EXPECT_NEAR(mono[x], exactLuma(r, g, b), 1.0) << x;
    }
}

TEST(HandSamples, CropFilesReadBackAndRejectDamage) {
    const HandgenTempDir dir;
    const std::vector<std::uint8_t> windows = generateSamples(smallSet(Gesture::Heart, 5, false), 0, 5, 2);
    writeCrops(dir / "heart.crops", 24, 24, windows);
    int width = 0, height = 0;
    EXPECT_EQ(readCrops(dir / "heart.crops", width, height), windows);
    EXPECT_TRUE(width == 24 && height == 24);

    // one byte short, one byte over, and not a crop file at all
    const std::string bytes = readAll(dir / "heart.crops");
    std::ofstream(dir / "short.crops", std::ios::binary) << bytes.substr(0, bytes.size() - 1);
    std::ofstream(dir / "long.crops", std::ios::binary) << bytes << 'x';
    std::ofstream(dir / "text.crops", std::ios::binary) << "P5\n24 24\n255\n";
    for (const std::string& bad : {dir / "short.crops", dir / "long.crops"})
        EXPECT_EQ(thrown([&] { readCrops(bad, width, height); }),
                  bad + ": the window count does not match the file's length");
    EXPECT_EQ(thrown([&] { readCrops(dir / "text.crops", width, height); }), dir / "text.crops" + " is not a crop file");
    EXPECT_EQ(thrown([&] { readCrops(dir / "missing.crops", width, height); }), "cannot open " + dir / "missing.crops");

    // a PGM of one window holds exactly its bytes after the header
    writePgm(dir / "one.pgm", 24, 24, windows.data());
    EXPECT_EQ(readAll(dir / "one.pgm"),
              "P5\n24 24\n255\n" + std::string(windows.begin(), windows.begin() + 24 * 24));
}
