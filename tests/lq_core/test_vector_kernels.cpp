#include <gtest/gtest.h>

#include <random>
#include <vector>

#include "LQ_ColorSpaceConversion.h"
#include "LQ_ImageResize.h"
#include "TestImages.h"

// The colour and halving rows against their scalar references (the census, integral and
// gradient rows have theirs beside their own tests) on random rows of widths 1 to 67, in
// exact-size buffers so that a read or write past the row shows under the sanitizer.
// Extreme rows (all 0, all 255) are mixed in: they hit the saturation cases.

namespace {
std::vector<unsigned char> testRow(size_t count, std::mt19937& random, int kind) {
    std::vector<unsigned char> row = randomBytes(count, random);
    if (kind == 1) row.assign(count, 255);
    if (kind == 2)
        for (auto& b : row) b = static_cast<unsigned char>(100 + b % 4);  // near-flat, around the margin
    return row;
}

template <class Vector>
void compareLuma(Vector vectorRow, int step) {
    std::mt19937 random(7);
    for (int width = 1; width <= 99; ++width)
        for (int kind = 0; kind < 3; ++kind)
            for (int r : {0, 2}) {
                const std::vector<unsigned char> in = testRow(static_cast<size_t>(width) * step, random, kind);
                std::vector<unsigned char> expected(width), actual(width);
                LQ::lumaRowScalar(in.data(), expected.data(), width, step, r, 1, 2 - r);
                vectorRow(in.data(), actual.data(), width, step, r);
                ASSERT_EQ(actual, expected) << "width " << width << " step " << step << " red at " << r;
            }
}

template <class Vector>
void compareEvenBytes(Vector vectorRow) {
    std::mt19937 random(23);
    for (int width = 1; width <= 99; ++width) {
        const std::vector<unsigned char> in = randomBytes(2 * width, random);
        std::vector<unsigned char> expected(width), actual(width);
        LQ::evenBytesRowScalar(in.data(), expected.data(), width);
        vectorRow(in.data(), actual.data(), width);
        ASSERT_EQ(actual, expected) << "width " << width;
    }
}

template <class Vector>
void compareHalving(Vector vectorRow) {
    std::mt19937 random(11);
    for (int width = 1; width <= 99; ++width)
        for (int kind = 0; kind < 3; ++kind) {
            const std::vector<unsigned char> row0 = testRow(2 * width, random, kind);
            const std::vector<unsigned char> row1 = testRow(2 * width, random, kind);
            std::vector<unsigned char> expected(width), actual(width);
            LQ::zoomMonoTwiceRowScalar(row0.data(), row1.data(), expected.data(), width);
            vectorRow(row0.data(), row1.data(), actual.data(), width);
            ASSERT_EQ(actual, expected) << "width " << width;
        }
}

}  // namespace

#if defined(LQ_HAVE_NEON)
TEST(VectorKernels, NeonRowsEqualScalarRows) {
    compareLuma(LQ::lumaRowNeon, 3);
    compareLuma(LQ::lumaRowNeon, 4);
    compareHalving(LQ::zoomMonoTwiceRowNeon);
    compareEvenBytes(LQ::evenBytesRowNeon);
}
#endif

#if defined(LQ_HAVE_SSSE3)
TEST(VectorKernels, X86RowsEqualScalarRows) {
    if (!__builtin_cpu_supports("ssse3")) GTEST_SKIP() << "no SSSE3 on this processor";
    compareLuma([](const unsigned char* in, unsigned char* out, int width, int, int r) { LQ::lumaRowSse(in, out, width, r); }, 3);
    compareHalving(LQ::zoomMonoTwiceRowSse);
    if (__builtin_cpu_supports("avx2")) compareHalving(LQ::zoomMonoTwiceRowAvx2);
    compareEvenBytes(LQ::evenBytesRowSse);
    if (__builtin_cpu_supports("avx2")) compareEvenBytes(LQ::evenBytesRowAvx2);

    if (__builtin_cpu_supports("avx2"))
        compareLuma([](const unsigned char* in, unsigned char* out, int width, int, int r) { LQ::lumaRowAvx2(in, out, width, r); }, 3);

    // YUV and RGB both ways: the rows against the conversions' own plain pixel loops
    for (int width = 1; width <= 67; ++width) {
        for (int r : {0, 2}) {
            const LQ::Image pixels = randomImage(width, 1, LQ::COLOR_MODE_YUV, width);
            LQ::Image reference, rgb(pixels.size(), LQ::COLOR_MODE_RGB), wide(pixels.size(), LQ::COLOR_MODE_RGB);
            LQ::yuvToRgba(pixels, reference, LQ::Rect());  // four-byte pixels take the plain loop
            LQ::yuvToRgbRowSse(pixels.data(), rgb.data(), width, r);
            if (__builtin_cpu_supports("avx2")) {
                LQ::yuvToRgbRowAvx2(pixels.data(), wide.data(), width, r);
                ASSERT_TRUE(samePixels(wide, rgb)) << width;
            }
            for (int x = 0; x < width; ++x) {
                ASSERT_EQ(rgb.pixel(x, 0)[r], reference.pixel(x, 0)[0]) << width;
                ASSERT_EQ(rgb.pixel(x, 0)[1], reference.pixel(x, 0)[1]) << width;
                ASSERT_EQ(rgb.pixel(x, 0)[2 - r], reference.pixel(x, 0)[2]) << width;
            }
            // and back, against the four-byte source, which takes the plain loop
            LQ::Image rgba(pixels.size(), LQ::COLOR_MODE_RGBA), yuv(pixels.size(), LQ::COLOR_MODE_YUV), expected;
            for (int x = 0; x < width; ++x)
                for (int c = 0; c < 3; ++c) rgba.pixel(x, 0)[c] = rgb.pixel(x, 0)[c == 0 ? r : (c == 2 ? 2 - r : 1)];
            LQ::rgbaToYuv(rgba, expected, LQ::Rect());
            LQ::rgbToYuvRowSse(rgb.data(), yuv.data(), width, r);
            ASSERT_TRUE(samePixels(yuv, expected)) << width;
        }
    }

    // the byte moves of the colour conversions, against their plain loops
    std::mt19937 random(19);
    for (int width = 1; width <= 67; ++width) {
        const std::vector<unsigned char> pixels = randomBytes(3 * width, random), bytes = randomBytes(width, random);
        std::vector<unsigned char> channel(width), spread(3 * width), swapped(3 * width);
        LQ::channelRowSse(pixels.data(), channel.data(), width, 0);
        LQ::spreadRowSse(bytes.data(), spread.data(), width);
        LQ::swapRowSse(pixels.data(), swapped.data(), width);
        for (int x = 0; x < width; ++x) {
            ASSERT_EQ(channel[x], pixels[3 * x]) << width;
            ASSERT_EQ(spread[3 * x + 2], bytes[x]) << width;
            ASSERT_EQ(spread[3 * x], bytes[x]) << width;
            ASSERT_EQ(swapped[3 * x], pixels[3 * x + 2]) << width;
            ASSERT_EQ(swapped[3 * x + 1], pixels[3 * x + 1]) << width;
            ASSERT_EQ(swapped[3 * x + 2], pixels[3 * x]) << width;
        }
    }
}
#endif
