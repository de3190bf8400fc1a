#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <vector>

#include "LQ_RmctTransform.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
// the census code of an interior pixel, straight from the neighbour rule
int codeAt(const Image& image, int x, int y) {
    static const int order[8][2] = {{-1, -1}, {0, -1}, {1, -1}, {-1, 0}, {1, 0}, {-1, 1}, {0, 1}, {1, 1}};
    int sum = 20;
    for (const auto& d : order) sum += image.pixel(x + d[0], y + d[1])[0];
    int code = 0;
    for (const auto& d : order) code = code * 2 + (image.pixel(x + d[0], y + d[1])[0] > sum / 8);
    return code;
}

// The whole expected census image: interior codes, then the border lines that the clipped
// rect reaches, rows before columns.
std::vector<int> expectedCensus(const Image& image, Rect rect) {
    const int w = image.width(), h = image.height();
    std::vector<int> out(static_cast<size_t>(w) * h, 0);
    const auto at = [&](int x, int y) -> int& { return out[static_cast<size_t>(y) * w + x]; };
    if (w * h < 3) return out;
    for (int y = 1; y + 1 < h; ++y)
        for (int x = 1; x + 1 < w; ++x) at(x, y) = codeAt(image, x, y);
    rect = rect.intersect(image.rect());
    if (rect.width() < 3 || rect.height() < 3) return out;
    for (int x = rect.left; x < rect.right; ++x) {
        if (rect.top == 0) at(x, 0) = at(x, 1);
        if (rect.bottom == h) at(x, h - 1) = at(x, h - 2);
    }
    for (int y = rect.top; y < rect.bottom; ++y) {
        if (rect.left == 0) at(0, y) = at(1, y);
        if (rect.right == w) at(w - 1, y) = at(w - 2, y);
    }
    return out;
}
}  // namespace

TEST(RmctTransform, EveryPixelFollowsTheNeighbourRuleAtEverySize) {
    std::mt19937 random(5);
    for (int width = 1; width <= 37; width += (width < 12 ? 1 : 5)) {
        for (int height = 1; height <= 8; ++height) {
            for (bool asView : {false, true}) {
                Image parent;
                const unsigned seed = width * 16 + height;
                Image image = asView ? randomView(width, height, LQ::COLOR_MODE_MONO, seed, parent)
                                     : randomImage(width, height, LQ::COLOR_MODE_MONO, seed);
                // near-flat content exercises the margin; the extremes the saturated threshold
                const int kind = (width + height) % 3;
                for (int y = 0; y < height; ++y)
                    for (int x = 0; x < width; ++x) {
                        unsigned char& p = image.pixel(x, y)[0];
                        if (kind == 1) p = static_cast<unsigned char>(100 + p % 5);
                        if (kind == 2) p = p < 128 ? 0 : 255;
                    }
                const Rect rects[] = {image.rect(), Rect(), Rect(-4, -2, width + 9, height + 1),
                                      Rect(1, 0, width, height - 1), Rect(0, 1, width - 1, height),
                                      Rect(1, 1, width - 1, height - 1)};
                Image census(Size(width, height), LQ::COLOR_MODE_RMCT);
                for (const Rect& rect : rects) {
                    // leftovers in a reused target must not survive
                    for (int y = 0; y < height; ++y) std::fill(census.row(y), census.row(y) + width, 0xA5);
                    LQ::computeRmct(image, census, rect);
                    ASSERT_EQ(census.colorMode(), LQ::COLOR_MODE_RMCT);
                    const std::vector<int> expected = expectedCensus(image, rect);
                    for (int y = 0; y < height; ++y)
                        for (int x = 0; x < width; ++x)
                            ASSERT_EQ(census.pixel(x, y)[0], expected[y * width + x])
                                << width << "x" << height << (asView ? " view" : "") << " rect " << rect << " at "
                                << x << "," << y;
                }
            }
        }
    }

    // the pixel form with explicit offsets: natural order agrees, reversed order mirrors the bits
    const Image image = randomImage(9, 4, LQ::COLOR_MODE_MONO, 77);
    const int s = static_cast<int>(image.stripLength());
    const int natural[8] = {-s - 1, -s, -s + 1, -1, 1, s - 1, s, s + 1};
    int reversed[8];
    std::reverse_copy(natural, natural + 8, reversed);
    for (int x = 1; x < 8; ++x) {
        const int code = codeAt(image, x, 2);
        EXPECT_EQ(LQ::computeRmctPixel(image.pixel(x, 2), natural), code);
        int mirrored = 0;
        for (int b = 0; b < 8; ++b) mirrored |= ((code >> b) & 1) << (7 - b);
        EXPECT_EQ(LQ::computeRmctPixel(image.pixel(x, 2), reversed), mirrored);
    }
}

TEST(RmctTransform, BitDifferencesAndTheirChecks) {
    const unsigned char* bits = LQ::getNumbits256();
    for (int v = 0; v < 256; ++v) {
        int count = 0;
        for (int b = v; b; b >>= 1) count += b & 1;
        ASSERT_EQ(bits[v], count) << v;
    }

    Image parentA, parentB;
    const Image a = randomView(11, 7, LQ::COLOR_MODE_RMCT, 1, parentA);
    const Image b = randomView(11, 7, LQ::COLOR_MODE_RMCT, 2, parentB);
    const auto differ = [&](int ax, int ay, int bx, int by) { return bits[a.pixel(ax, ay)[0] ^ b.pixel(bx, by)[0]]; };

    // inside rect the counts; outside what the target held
    Image target(a.size(), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < 7; ++y) std::fill(target.row(y), target.row(y) + 11, 99);
    const Rect rect(2, 1, 9, 5);
    LQ::bitDiff(a, b, target, rect);
    unsigned int total = 0;
    for (int y = 0; y < 7; ++y)
        for (int x = 0; x < 11; ++x) {
            total += differ(x, y, x, y);
            ASSERT_EQ(target.pixel(x, y)[0], rect.contains(LQ::BasePoint<int>(x, y)) ? differ(x, y, x, y) : 99);
        }
    EXPECT_EQ(LQ::bitDiffSum(a, b), total);

    // a window at different places in the two images
    unsigned int window = 0;
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 4; ++x) window += differ(5 + x, 1 + y, 2 + x, 4 + y);
    EXPECT_EQ(LQ::bitDiffSum(a, b, 5, 1, 2, 4, 4, 3), window);
    EXPECT_EQ(LQ::bitDiffSum(a, b, 5, 1, 2, 4, 4, 0), 0u);
    EXPECT_EQ(LQ::bitDiffSum(a, b, 5, 1, 2, 4, -1, 3), 0u);
    // every byte of a wider pixel counts
    Image wide1 = randomImage(3, 2, LQ::COLOR_MODE_BGR, 3), wide2 = wide1;
    wide2.pixel(2, 1)[2] ^= 0x13;
    EXPECT_EQ(LQ::bitDiffSum(wide1, wide2), 3u);

    const Image mono = randomImage(11, 7, LQ::COLOR_MODE_MONO, 4);
    const Image small = randomImage(10, 7, LQ::COLOR_MODE_RMCT, 5);
    const struct {
        std::function<void()> call;
        const char* expression;
    } failures[] = {
        {[&] { LQ::bitDiff(a, b, target, Rect(0, 0, 12, 7)); }, "(source1.rect()).contains(rect)"},
        {[&] { LQ::bitDiff(mono, b, target, rect); }, "(source1).colorMode() == (COLOR_MODE_RMCT)"},
        {[&] { LQ::bitDiff(a, mono, target, rect); }, "(source2).colorMode() == (COLOR_MODE_RMCT)"},
        {[&] { LQ::bitDiff(a, small, target, rect); }, "(source1).size() == (source2.size())"},
        {[&] { LQ::bitDiffSum(a, mono); }, "(source1).colorMode() == ((source2).colorMode())"},
        {[&] { LQ::bitDiffSum(a, small, 0, 0, 0, 0, 1, 1); }, "(source1).size() == ((source2).size())"},
        {[&] { LQ::computeRmct(a, target); }, "(image).colorMode() == (COLOR_MODE_MONO)"},
    };
    for (const auto& failure : failures) {
        const FailedCheck check = catchCheck(failure.call);
        EXPECT_TRUE(check.thrown) << failure.expression;
        EXPECT_EQ(check.expression, failure.expression);
    }
    EXPECT_EQ(catchCheck([&] { LQ::bitDiff(a, small, target, rect); }).tail, "have Size(11, 7), but need Size(10, 7)");
}

TEST(RmctTransform, VectorRowsEqualScalarRows) {
    std::mt19937 random(37);
    for (int width = 3; width <= 99; ++width)
        for (int kind = 0; kind < 3; ++kind) {
            std::vector<unsigned char> rows[3];
            for (auto& row : rows) {
                row = randomBytes(width, random);
                if (kind == 1)  // all neighbours 255: a threshold of 257, saturated in the vectors
                    for (auto& b : row) b = b < 40 ? b : 255;
                if (kind == 2)  // near-flat: the margin decides
                    for (auto& b : row) b = static_cast<unsigned char>(100 + b % 4);
            }
            std::vector<unsigned char> expected(width, 77);
            LQ::rmctRowScalar(rows[0].data(), rows[1].data(), rows[2].data(), expected.data(), width);
            ASSERT_EQ(expected[0] + expected[width - 1], 2 * 77);  // the end columns are not touched
            std::vector<std::pair<const char*, decltype(&LQ::rmctRowScalar)>> rowsToCompare;
#if defined(LQ_HAVE_NEON)
            rowsToCompare.emplace_back("neon", LQ::rmctRowNeon);
#endif
#if defined(LQ_HAVE_SSSE3)
            rowsToCompare.emplace_back("sse", LQ::rmctRowSse);
            if (__builtin_cpu_supports("avx2")) rowsToCompare.emplace_back("avx2", LQ::rmctRowAvx2);
#endif
            for (const auto& vector : rowsToCompare) {
                std::vector<unsigned char> actual(width, 77);
                vector.second(rows[0].data(), rows[1].data(), rows[2].data(), actual.data(), width);
                ASSERT_EQ(actual, expected) << vector.first << " width " << width;
            }
        }
}
