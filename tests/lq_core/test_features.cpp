#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "LQ_Gradients.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
Image flat(int width, int height, unsigned char value) {
    Image image(Size(width, height), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < height; ++y) std::memset(image.row(y), value, width);
    return image;
}
}  // namespace

TEST(Rmct, ThresholdBitsAndBorders) {
    Image image = flat(5, 5, 100), census;
    LQ::computeRmct(image, census);
    for (int y = 0; y < 5; ++y)
        for (int x = 0; x < 5; ++x) EXPECT_EQ(census.pixel(x, y)[0], 0);

    // one neighbour of (2, 2) at 103: S = 803, T = 102, only its bit; at 102 nothing
    image.pixel(3, 1)[0] = 103;  // (x + 1, y - 1): bit 5
    image.pixel(2, 2)[0] = 250;  // the centre takes no part
    LQ::computeRmct(image, census);
    EXPECT_EQ(census.pixel(2, 2)[0], 1 << 5);
    image.pixel(3, 1)[0] = 102;
    LQ::computeRmct(image, census);
    EXPECT_EQ(census.pixel(2, 2)[0], 0);
    const Image bright = flat(3, 3, 255);
    EXPECT_EQ(LQ::computeRmctPixel(bright.pixel(1, 1), std::vector<int>{-4, -3, -2, -1, 1, 2, 3, 4}.data()), 0);

    // borders: the whole rect copies row 1 / column 1 outward; an inner rect leaves them 0
    Image random = randomImage(7, 6, LQ::COLOR_MODE_MONO, 21);
    LQ::computeRmct(random, census, Rect());  // the zero rect: no border fill
    EXPECT_EQ(census.pixel(0, 0)[0], 0);
    LQ::computeRmct(random, census);
    EXPECT_EQ(census.pixel(0, 0)[0], census.pixel(1, 1)[0]);
    EXPECT_EQ(census.pixel(6, 5)[0], census.pixel(5, 4)[0]);
    EXPECT_EQ(census.pixel(3, 0)[0], census.pixel(3, 1)[0]);
    LQ::computeRmct(random, census, Rect(1, 1, 6, 5));
    for (int x = 0; x < 7; ++x) EXPECT_EQ(census.pixel(x, 0)[0] | census.pixel(x, 5)[0], 0);
    for (int y = 0; y < 6; ++y) EXPECT_EQ(census.pixel(0, y)[0] | census.pixel(6, y)[0], 0);
    LQ::computeRmct(randomImage(2, 9, LQ::COLOR_MODE_MONO, 1), census);
    for (int y = 0; y < 9; ++y) EXPECT_EQ(census.pixel(0, y)[0] | census.pixel(1, y)[0], 0);

    FailedCheck check = catchCheck([&] { LQ::computeRmct(Image(Size(3, 3), LQ::COLOR_MODE_BGR), census); });
    EXPECT_EQ(check.expression, "(image).colorMode() == (COLOR_MODE_MONO)");

    // bit differences
    Image a(Size(2, 1), LQ::COLOR_MODE_RMCT), b(Size(2, 1), LQ::COLOR_MODE_RMCT), diff;
    a.data()[0] = 0xF0, a.data()[1] = 0x01, b.data()[0] = 0x0F, b.data()[1] = 0x03;
    LQ::bitDiff(a, b, diff, Rect());
    EXPECT_EQ(diff.pixel(0, 0)[0], 8);
    EXPECT_EQ(diff.pixel(1, 0)[0], 1);
    EXPECT_EQ(LQ::bitDiffSum(a, b), 9u);
    EXPECT_EQ(LQ::bitDiffSum(a, b, 1, 0, 1, 0, 1, 1), 1u);
    EXPECT_EQ(LQ::bitDiffSum(a, b, 0, 0, 0, 0, 0, 1), 0u);
    EXPECT_EQ(LQ::getNumbits256()[0xB7], 6);
    check = catchCheck([&] { LQ::bitDiff(a, random, diff, Rect()); });
    EXPECT_EQ(check.expression, "(source2).colorMode() == (COLOR_MODE_RMCT)");
}

TEST(Integral, SumsOfRectanglesAndChecks) {
    Image one = flat(1, 1, 7), integral;
    LQ::computeIntegral(one, integral);
    ASSERT_EQ(integral.size(), Size(2, 2));
    EXPECT_EQ(integral.row<unsigned int>(1)[1], 7u);
    EXPECT_EQ(integral.row<unsigned int>(0)[1] + integral.row<unsigned int>(1)[0], 0u);

    // against a brute-force sum, on a view with a wide stride
    Image parent;
    const Image view = randomView(37, 21, LQ::COLOR_MODE_MONO, 9, parent);
    const Rect part(3, 2, 30, 19);
    LQ::computeIntegral(view, integral, part);
    for (int y = part.top; y <= part.bottom; y += 4)
        for (int x = part.left; x <= part.right; x += 3) {
            unsigned int sum = 0;
            for (int j = part.top; j < y; ++j)
                for (int i = part.left; i < x; ++i) sum += view.pixel(i, j)[0];
            ASSERT_EQ(integral.row<unsigned int>(y)[x], sum) << x << "," << y;
        }
    EXPECT_EQ(integral.row<unsigned int>(20)[35], 0u);  // outside rect: 0
    EXPECT_EQ(integral.row<unsigned int>(10)[31], 0u);

    std::vector<unsigned int> inclusive(3 * 2);
    const Image small = randomImage(3, 2, LQ::COLOR_MODE_MONO, 2);
    LQ::integral_image(small.data(), inclusive.data(), 3, 2);
    LQ::computeIntegral(small, integral);
    EXPECT_EQ(inclusive[5], integral.row<unsigned int>(2)[3]);

    FailedCheck check = catchCheck([&] { LQ::computeIntegral(view, integral, Rect(0, 0, 38, 5)); });
    EXPECT_EQ(check.expression, "image.rect().contains(rect)");
    EXPECT_EQ(check.tail, "Rect must be inside image: rect = Rect(0, 0, 38, 5), image.rect() = Rect(0, 0, 37, 21)");
    check = catchCheck([&] { LQ::computeIntegralOptimized(view, integral); });
    EXPECT_EQ(check.tail, "incorrect stripLength");
}

TEST(Integral, HogTablesAndSums) {
    const unsigned char* u6 = LQ::getHogUnsigned6();
    const unsigned char* s12 = LQ::getHogSigned12();
    const auto at = [](int a, int b) { return (a + 256) * 512 + b + 256; };
    EXPECT_EQ(u6[at(0, 1)], 0);
    EXPECT_EQ(s12[at(0, 1)], 0);
    EXPECT_EQ(u6[at(1, 0)], 3);
    EXPECT_EQ(s12[at(1, 0)], 3);
    EXPECT_EQ(u6[at(0, -1)], 0);
    EXPECT_EQ(s12[at(0, -1)], 6);
    EXPECT_EQ(u6[at(-1, 0)], 3);
    EXPECT_EQ(s12[at(-1, 0)], 9);
    EXPECT_EQ(LQ::getMagnitudes()[at(255, 255)], 255);
    EXPECT_EQ(LQ::getMagnitudes()[at(-3, 4)], 5);
    // mirrored directions get mirrored bins
    for (int a = -255; a <= 255; a += 17)
        for (int b = -255; b <= 255; b += 13) {
            ASSERT_LT(u6[at(a, b)], 6);
            ASSERT_LT(s12[at(a, b)], 12);
            ASSERT_EQ(u6[at(a, b)], u6[at(-a, -b)]) << a << "," << b;  // unsigned: opposite directions agree
        }

    Image target;
    LQ::computeIntegralHog(flat(9, 7, 80), target, Rect(0, 0, 9, 7), LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12);
    for (int y = 0; y < 8; ++y)
        for (int x = 0; x < 10 * 13; ++x) ASSERT_EQ(target.row<unsigned int>(y)[x], 0u);
    LQ::computeIntegralHog(randomImage(2, 100, LQ::COLOR_MODE_MONO, 3), target, Rect(0, 0, 2, 100),
                           LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
    EXPECT_EQ(target.size(), Size(3, 101));

    const Image image = randomImage(24, 18, LQ::COLOR_MODE_MONO, 4);
    const Rect region(3, 2, 20, 15);
    LQ::computeIntegralHog(image, target, region, LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
    ASSERT_EQ(target.size(), Size(18, 14));
    const int channels = 7;
    for (int y = 0; y <= 13; ++y)
        for (int x = 0; x <= 17; ++x) {
            const unsigned int* sums = target.row<unsigned int>(y) + x * channels;
            unsigned int bins = 0;
            for (int k = 0; k < 6; ++k) bins += sums[k];
            ASSERT_EQ(bins, sums[6]) << x << "," << y;  // the total channel
        }
    // the last two rows agree, and so do the last two columns
    EXPECT_EQ(0, std::memcmp(target.row(13), target.row(12), 18 * channels * 4));
    EXPECT_EQ(0, std::memcmp(target.row<unsigned int>(9) + 17 * channels, target.row<unsigned int>(9) + 16 * channels,
                             channels * 4));
    // an inner position against the sums taken pixel by pixel
    for (int k = 0; k < 7; ++k) {
        unsigned int sum = 0;
        for (int j = 1; j <= 8; ++j)
            for (int i = 1; i <= 9; ++i) {
                const auto p = [&](int dx, int dy) { return int(image.pixel(region.left + i + dx, region.top + j + dy)[0]); };
                const int gx = p(1, 1) + p(1, -1) + 2 * (p(1, 0) - p(-1, 0)) - p(-1, 1) - p(-1, -1);
                const int gy = p(1, 1) + p(-1, 1) + 2 * (p(0, 1) - p(0, -1)) - p(1, -1) - p(-1, -1);
                if (k == 6 || u6[at(gx / 4, gy / 4)] == k) sum += LQ::getMagnitudes()[at(gx / 4, gy / 4)];
            }
        EXPECT_EQ(target.row<unsigned int>(9)[10 * channels + k], sum) << "bin " << k;
    }
    FailedCheck check = catchCheck([&] { LQ::computeIntegralHog(image, target, region, LQ::COLOR_MODE_INTEGRAL); });
    EXPECT_EQ(check.tail, "incorrect color mode: COLOR_MODE_INTEGRAL");
}

TEST(Gradients, SobelSectorsAndEdges) {
    // a vertical step from 0 to 80: Gx = 4 * 80 on the step, Gy = 0
    Image step = flat(6, 5, 0), gradient;
    for (int y = 0; y < 5; ++y)
        for (int x = 3; x < 6; ++x) step.pixel(x, y)[0] = 80;
    LQ::SobelGradient(step, gradient);
    EXPECT_EQ(static_cast<signed char>(gradient.pixel(2, 2)[0]), 40);
    EXPECT_EQ(static_cast<signed char>(gradient.pixel(3, 2)[0]), 40);
    EXPECT_EQ(gradient.pixel(2, 2)[1], 0);
    EXPECT_EQ(gradient.pixel(0, 2)[0] | gradient.pixel(2, 0)[0], 0);  // borders
    Image first, second;
    LQ::computeSobelGradient(step, first, second);
    EXPECT_EQ(first.row<short>(2)[3], 320);
    Image absolute;
    LQ::SobelAbsolute(step, absolute);
    EXPECT_EQ(absolute.pixel(3, 2)[0], 40);
    Image roberts;
    LQ::robertCross(step, roberts);
    EXPECT_EQ(roberts.pixel(2, 1)[0], 80);
    EXPECT_EQ(roberts.pixel(5, 4)[0], 0);

    LQ::computeGradients(step, gradient);
    EXPECT_EQ(gradient.pixel(2, 2)[0], static_cast<int>(std::atan2(320.0, 0.0) * 4 / 3.1415927410125732 + 4.5) % 4);
    EXPECT_EQ(gradient.pixel(2, 2)[1], 40);  // (|320| + 0) >> 3
    Image edges;
    LQ::canny(step, edges, 10, 30);
    for (int y = 1; y < 4; ++y) EXPECT_EQ(edges.pixel(2, y)[0] | edges.pixel(3, y)[0], 255);
    EXPECT_EQ(edges.pixel(1, 2)[0], 0);

    FailedCheck check = catchCheck([&] { LQ::canny(step, edges, 30, 30); });
    EXPECT_EQ(check.expression, "(minThreshold) < (maxThreshold)");
    EXPECT_EQ(check.tail, "30 >= 30");
    check = catchCheck([&] { LQ::computeSobelGradient(flat(2, 5, 0), gradient); });
    EXPECT_EQ(check.expression, "(src.width()) >= (3)");
    check = catchCheck([&] {
        Image target(Size(6, 5), LQ::COLOR_MODE_GRADIENT);
        LQ::SobelGradientInRect(step, target, Rect(0, 1, 3, 3));
    });
    EXPECT_EQ(check.expression, "Rect(source.rect()).resize(-1, -1).contains(rect)");
    Image inRect(Size(6, 5), LQ::COLOR_MODE_GRADIENT);
    LQ::SobelGradientInRect(step, inRect, Rect(2, 2, 3, 3));
    EXPECT_EQ(static_cast<signed char>(inRect.pixel(2, 2)[0]), 40);
    EXPECT_EQ(inRect.pixel(3, 2)[0], 0);
}
