#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "LQ_Integral.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
int tableAt(int a, int b) { return (a + 256) * 512 + b + 256; }

// The nearest of count bins of 30 degrees to the direction atan2(a, b); -1 on the diagonals
// |a| = |b|, which lie exactly between two bins.
int nearestBin(int a, int b, int count) {
    if (a != 0 && std::abs(a) == std::abs(b)) return -1;
    const double angle = std::fmod(std::atan2(double(a), double(b)) + 4 * M_PI, count * M_PI / 6);
    return static_cast<int>(std::lround(angle / (M_PI / 6))) % count;
}
}  // namespace

TEST(IntegralImage, SumsOfEveryRectAtEverySize) {
    for (int width = 1; width <= 41; width += (width < 11 ? 1 : 10))
        for (int height = 1; height <= 7; ++height)
            for (bool asView : {false, true}) {
                Image parent, integral(Size(width + 1, height + 1), LQ::COLOR_MODE_INTEGRAL);
                const Image image = asView ? randomView(width, height, LQ::COLOR_MODE_MONO, width * 8 + height, parent)
                                           : randomImage(width, height, LQ::COLOR_MODE_MONO, width * 8 + height);
                for (const Rect& given : {Rect(width / 3, height / 2, width, height), Rect(width - 1, 0, width, 1),
                                          Rect(0, height / 3, (width + 1) / 2, height), Rect()}) {
                    for (int y = 0; y <= height; ++y) std::memset(integral.row(y), 0x5A, 4 * (width + 1));  // leftovers
                    LQ::computeIntegral(image, integral, given);
                    const Rect rect = given.area() == 0 ? image.rect() : given;
                    for (int y = 0; y <= height; ++y)
                        for (int x = 0; x <= width; ++x) {
                            unsigned int expected = 0;
                            for (int j = rect.top; j < y && x <= rect.right && y <= rect.bottom; ++j)
                                for (int i = rect.left; i < x; ++i) expected += image.pixel(i, j)[0];
                            ASSERT_EQ(integral.row<unsigned int>(y)[x], expected) << width << "x" << height
                                << (asView ? " view" : "") << " rect " << rect << " at " << x << "," << y;
                        }
                }
                // the last rect was the whole image: the other forms agree with those sums
                Image whole, compact;
                LQ::computeIntegral(image, whole);
                ASSERT_TRUE(samePixels(whole, integral));
                if (asView) continue;
                LQ::computeIntegralOptimized(image, compact);
                ASSERT_TRUE(samePixels(compact, integral));
                std::vector<unsigned int> inclusive(width * height);
                LQ::integral_image(image.data(), inclusive.data(), width, height);
                for (int y = 0; y < height; ++y)
                    for (int x = 0; x < width; ++x)
                        ASSERT_EQ(inclusive[y * width + x], compact.row<unsigned int>(y + 1)[x + 1]);
            }

    Image integral;
    FailedCheck check = catchCheck([&] { LQ::computeIntegral(Image(Size(4, 4), LQ::COLOR_MODE_RMCT), integral); });
    EXPECT_EQ(check.expression, "(image).colorMode() == (COLOR_MODE_MONO)");
    EXPECT_EQ(check.tail, "have COLOR_MODE_RMCT, but need COLOR_MODE_MONO");
    check = catchCheck([&] { LQ::computeIntegral(Image(Size(4, 3), LQ::COLOR_MODE_MONO), integral, Rect(-1, 0, 2, 2)); });
    EXPECT_EQ(check.expression, "image.rect().contains(rect)");
    EXPECT_EQ(check.tail, "Rect must be inside image: rect = Rect(-1, 0, 2, 2), image.rect() = Rect(0, 0, 4, 3)");
    Image parent;
    check = catchCheck([&] { LQ::computeIntegralOptimized(randomView(5, 5, LQ::COLOR_MODE_MONO, 1, parent), integral); });
    EXPECT_EQ(check.expression, "image.size().width == image.stripLength()");
    EXPECT_EQ(check.tail, "incorrect stripLength");
}

TEST(IntegralHog, TablesFollowTheDirections) {
    const unsigned char *magnitudes = LQ::getMagnitudes(), *u6 = LQ::getHogUnsigned6(), *s12 = LQ::getHogSigned12();
    EXPECT_EQ(magnitudes[tableAt(255, 255)], 255);
    EXPECT_EQ(magnitudes[tableAt(180, -180)], 254);  // 254.56 truncated
    EXPECT_EQ(magnitudes[tableAt(-6, -8)], 10);
    const int hand[][4] = {{0, 1, 0, 0}, {1, 0, 3, 3}, {0, -1, 0, 6}, {-1, 0, 3, 9}, {0, 0, 0, 0}};
    for (const auto& h : hand) {
        EXPECT_EQ(u6[tableAt(h[0], h[1])], h[2]) << h[0] << "," << h[1];
        EXPECT_EQ(s12[tableAt(h[0], h[1])], h[3]) << h[0] << "," << h[1];
    }
    for (int a = -255; a <= 255; ++a)
        for (int b = -255; b <= 255; ++b) {
            if (a == 0 && b == 0) continue;
            const int u = u6[tableAt(a, b)], s = s12[tableAt(a, b)], nearest = nearestBin(a, b, 12);
            if (nearest >= 0) {
                ASSERT_EQ(s, nearest) << a << "," << b;
            } else {  // on a diagonal: either neighbour
                const int lower = static_cast<int>(std::fmod(std::atan2(double(a), double(b)) + 2 * M_PI, 2 * M_PI) / (M_PI / 6));
                ASSERT_TRUE(s == lower || s == (lower + 1) % 12) << a << "," << b << ": " << s;
            }
            ASSERT_EQ(u, s % 6) << a << "," << b;
            // built from one quadrant: exact mirrors
            ASSERT_EQ(s12[tableAt(-a, -b)], (s + 6) % 12) << a << "," << b;
            ASSERT_EQ(u6[tableAt(a, -b)], (6 - u) % 6) << a << "," << b;
        }
}

TEST(IntegralHog, SumsOfMagnitudesPerBinAtEverySize) {
    for (int bins : {6, 12}) {
        const LQ::ColorMode mode = bins == 12 ? LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12 : LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6;
        const unsigned char* table = bins == 12 ? LQ::getHogSigned12() : LQ::getHogUnsigned6();
        for (int width = 1; width <= 13; width += 1 + width / 9)
            for (int height = 1; height <= 7; ++height) {
                Image parent;
                const Image image = randomView(width + 3, height + 2, LQ::COLOR_MODE_MONO, width * 9 + height, parent);
                const Rect region(2, 1, 2 + width, 1 + height);
                // per interior pixel of the region: its bin by the arc tangent, and its magnitude
                std::vector<int> bin(width * height, -1), weight(width * height, 0);
                for (int j = 1; j + 1 < height; ++j)
                    for (int i = 1; i + 1 < width; ++i) {
                        const auto p = [&](int dx, int dy) { return int(image.pixel(region.left + i + dx, region.top + j + dy)[0]); };
                        const int a = (p(1, 1) + p(1, -1) + 2 * (p(1, 0) - p(-1, 0)) - p(-1, 1) - p(-1, -1)) / 4;
                        const int b = (p(1, 1) + p(-1, 1) + 2 * (p(0, 1) - p(0, -1)) - p(1, -1) - p(-1, -1)) / 4;
                        bin[j * width + i] = nearestBin(a, b, bins) >= 0 ? nearestBin(a, b, bins) : table[tableAt(a, b)];
                        weight[j * width + i] = std::min(255, static_cast<int>(std::sqrt(double(a * a + b * b))));
                    }
                Image target(Size(width + 1, height + 1), mode);
                for (int y = 0; y <= height; ++y) std::memset(target.row(y), 0xEE, 4 * (bins + 1) * (width + 1));
                if (height % 2)
                    LQ::computeIntegralHog(image, target, region, mode);
                else
                    LQ::computeIntegralHog(image.data(), static_cast<int>(image.stripLength()), target, region, mode);
                ASSERT_EQ(target.size(), Size(width + 1, height + 1));
                for (int y = 0; y <= height; ++y)
                    for (int x = 0; x <= width; ++x)
                        for (int k = 0; k <= bins; ++k) {
                            unsigned int expected = 0;
                            for (int j = 0; j < y; ++j)
                                for (int i = 0; i < x; ++i)
                                    if (k == bins || bin[j * width + i] == k) expected += weight[j * width + i];
                            ASSERT_EQ(target.row<unsigned int>(y)[x * (bins + 1) + k], expected)
                                << bins << " bins, " << width << "x" << height << " at " << x << "," << y << " channel " << k;
                        }
            }
    }
    Image target;
    const FailedCheck check = catchCheck([&] {
        LQ::computeIntegralHog(randomImage(6, 6, LQ::COLOR_MODE_MONO, 1), target, Rect(0, 0, 6, 6), LQ::COLOR_MODE_RMCT);
    });
    EXPECT_EQ(check.expression, "0");
    EXPECT_EQ(check.tail, "incorrect color mode: COLOR_MODE_RMCT");
}

