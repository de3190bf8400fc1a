#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "LQ_Integral.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
int tableAt(int a, int b) { return (a + 256) * 512 + b + 256; }

// The bin of a direction by the arc tangent alone, nearest of count bins of 30 degrees; -1
// where the direction lies exactly between two bins (|a| = |b|), which rounding decides.
int nearestBin(int a, int b, int count) {
    if (a != 0 && std::abs(a) == std::abs(b)) return -1;
    const double turn = count * 30.0 / 180.0 * M_PI;
    double angle = std::fmod(std::atan2(double(a), double(b)) + 2 * turn, turn);
    return static_cast<int>(std::lround(angle / (M_PI / 6))) % count;
}

// Gx and Gy of a pixel by its neighbourhood
void sobelAt(const Image& image, int x, int y, int& gx, int& gy) {
    const auto p = [&](int dx, int dy) { return int(image.pixel(x + dx, y + dy)[0]); };
    gx = p(1, 1) + p(1, -1) + 2 * (p(1, 0) - p(-1, 0)) - p(-1, 1) - p(-1, -1);
    gy = p(1, 1) + p(-1, 1) + 2 * (p(0, 1) - p(0, -1)) - p(1, -1) - p(-1, -1);
}
}  // namespace

TEST(IntegralImage, SumsOfEveryRectAtEverySize) {
    for (int width = 1; width <= 41; width += (width < 11 ? 1 : 10)) {
        for (int height = 1; height <= 7; ++height) {
            for (bool asView : {false, true}) {
                Image parent;
                const unsigned seed = width * 8 + height;
                const Image image = asView ? randomView(width, height, LQ::COLOR_MODE_MONO, seed, parent)
                                           : randomImage(width, height, LQ::COLOR_MODE_MONO, seed);
                Image integral(Size(width + 1, height + 1), LQ::COLOR_MODE_INTEGRAL);
                for (const Rect& given : {Rect(), Rect(width / 3, height / 2, width, height),
                                          Rect(0, height / 3, (width + 1) / 2, height), Rect(width - 1, 0, width, 1)}) {
                    const Rect rect = given.area() == 0 ? image.rect() : given;  // zero area: the whole image
                    // a reused target full of leftovers
                    for (int y = 0; y <= height; ++y) std::memset(integral.row(y), 0x5A, 4 * (width + 1));
                    LQ::computeIntegral(image, integral, given);
                    ASSERT_EQ(integral.size(), Size(width + 1, height + 1));
                    for (int y = 0; y <= height; ++y)
                        for (int x = 0; x <= width; ++x) {
                            unsigned int expected = 0;
                            if (x >= rect.left && x <= rect.right && y >= rect.top && y <= rect.bottom)
                                for (int j = rect.top; j < y; ++j)
                                    for (int i = rect.left; i < x; ++i) expected += image.pixel(i, j)[0];
                            ASSERT_EQ(integral.row<unsigned int>(y)[x], expected)
                                << width << "x" << height << (asView ? " view" : "") << " rect " << rect << " at " << x
                                << "," << y;
                        }
                }
                if (!asView) {
                    Image compact;
                    LQ::computeIntegral(image, integral);
                    LQ::computeIntegralOptimized(image, compact);
                    ASSERT_TRUE(samePixels(compact, integral));
                    // the inclusive form is the bordered one shifted by one
                    std::vector<unsigned int> inclusive(static_cast<size_t>(width) * height);
                    LQ::integral_image(image.data(), inclusive.data(), width, height);
                    for (int y = 0; y < height; ++y)
                        for (int x = 0; x < width; ++x)
                            ASSERT_EQ(inclusive[y * width + x], integral.row<unsigned int>(y + 1)[x + 1]);
                }
            }
        }
    }

    // the largest sums: a white working image
    Image white(Size(640, 360), LQ::COLOR_MODE_MONO), integral;
    for (int y = 0; y < 360; ++y) std::memset(white.row(y), 255, 640);
    LQ::computeIntegral(white, integral);
    EXPECT_EQ(integral.row<unsigned int>(360)[640], 255u * 640 * 360);
    EXPECT_EQ(integral.row<unsigned int>(17)[333], 255u * 333 * 17);
}

TEST(IntegralImage, FailedChecks) {
    Image integral;
    FailedCheck check = catchCheck([&] { LQ::computeIntegral(Image(Size(4, 4), LQ::COLOR_MODE_RMCT), integral); });
    EXPECT_EQ(check.expression, "(image).colorMode() == (COLOR_MODE_MONO)");
    EXPECT_EQ(check.tail, "have COLOR_MODE_RMCT, but need COLOR_MODE_MONO");
    check = catchCheck([&] { LQ::computeIntegral(Image(Size(4, 3), LQ::COLOR_MODE_MONO), integral, Rect(-1, 0, 2, 2)); });
    EXPECT_EQ(check.expression, "image.rect().contains(rect)");
    EXPECT_EQ(check.tail, "Rect must be inside image: rect = Rect(-1, 0, 2, 2), image.rect() = Rect(0, 0, 4, 3)");
    Image parent;
    const Image view = randomView(5, 5, LQ::COLOR_MODE_MONO, 1, parent);
    check = catchCheck([&] { LQ::computeIntegralOptimized(view, integral); });
    EXPECT_EQ(check.expression, "image.size().width == image.stripLength()");
    EXPECT_EQ(check.tail, "incorrect stripLength");
}

TEST(IntegralHog, TablesFollowTheDirections) {
    const unsigned char* magnitudes = LQ::getMagnitudes();
    const unsigned char* u6 = LQ::getHogUnsigned6();
    const unsigned char* s12 = LQ::getHogSigned12();
    EXPECT_EQ(u6, LQ::getHogUnsigned6());  // built once
    EXPECT_EQ(magnitudes[tableAt(255, 255)], 255);
    EXPECT_EQ(magnitudes[tableAt(180, -180)], 254);  // 254.56 truncated
    EXPECT_EQ(magnitudes[tableAt(-6, -8)], 10);
    EXPECT_EQ(magnitudes[tableAt(0, 0)], 0);
    const int hand[][4] = {{0, 1, 0, 0}, {1, 0, 3, 3}, {0, -1, 0, 6}, {-1, 0, 3, 9}, {0, 0, 0, 0}};
    for (const auto& h : hand) {
        EXPECT_EQ(u6[tableAt(h[0], h[1])], h[2]) << h[0] << "," << h[1];
        EXPECT_EQ(s12[tableAt(h[0], h[1])], h[3]) << h[0] << "," << h[1];
    }

    for (int a = -255; a <= 255; ++a)
        for (int b = -255; b <= 255; ++b) {
            if (a == 0 && b == 0) continue;
            const int u = u6[tableAt(a, b)], s = s12[tableAt(a, b)];
            const int nearest = nearestBin(a, b, 12);
            if (nearest >= 0) {
                ASSERT_EQ(s, nearest) << a << "," << b;
                ASSERT_EQ(u, nearestBin(a, b, 6)) << a << "," << b;
            } else {
                // on a diagonal, exactly between two bins: either of them
                const double angle = std::fmod(std::atan2(double(a), double(b)) + 2 * M_PI, 2 * M_PI);
                const int lower = static_cast<int>(angle / (M_PI / 6));
                ASSERT_TRUE(s == lower || s == (lower + 1) % 12) << a << "," << b << ": " << s;
            }
            ASSERT_EQ(u, s % 6) << a << "," << b;
            // built from one quadrant: opposite directions are exactly half a turn apart
            ASSERT_EQ(s12[tableAt(-a, -b)], (s + 6) % 12) << a << "," << b;
            ASSERT_EQ(u6[tableAt(-a, -b)], u) << a << "," << b;
            ASSERT_EQ(u6[tableAt(a, -b)], (6 - u) % 6) << a << "," << b;
        }
}

TEST(IntegralHog, SumsOfMagnitudesPerBinAtEverySize) {
    for (LQ::ColorMode mode : {LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6, LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12}) {
        const int bins = mode == LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12 ? 12 : 6;
        const unsigned char* table = bins == 12 ? LQ::getHogSigned12() : LQ::getHogUnsigned6();
        for (int width = 1; width <= 9; ++width)
            for (int height = 1; height <= 8; ++height) {
                Image parent;
                const Image image = randomView(width + 3, height + 2, LQ::COLOR_MODE_MONO, width * 9 + height, parent);
                const Rect region(2, 1, 2 + width, 1 + height);
                // per interior pixel of the region: its bin by the arc tangent, and its magnitude
                std::vector<int> bin(static_cast<size_t>(width) * height, -1), weight(bin.size(), 0);
                for (int j = 1; j + 1 < height; ++j)
                    for (int i = 1; i + 1 < width; ++i) {
                        int gx, gy;
                        sobelAt(image, region.left + i, region.top + j, gx, gy);
                        const int a = gx / 4, b = gy / 4;
                        const int nearest = nearestBin(a, b, bins);
                        bin[j * width + i] = nearest >= 0 ? nearest : table[tableAt(a, b)];
                        weight[j * width + i] =
                            std::min(255, static_cast<int>(std::sqrt(double(a * a + b * b))));
                    }
                Image target(Size(width + 1, height + 1), mode);
                for (int y = 0; y <= height; ++y) std::memset(target.row(y), 0xEE, 4 * (bins + 1) * (width + 1));
                const bool fromImage = (width + height) % 2 == 0;
                if (fromImage)
                    LQ::computeIntegralHog(image, target, region, mode);
                else
                    LQ::computeIntegralHog(image.data(), static_cast<int>(image.stripLength()), target, region, mode);
                ASSERT_EQ(target.size(), Size(width + 1, height + 1));
                ASSERT_EQ(target.colorMode(), mode);
                for (int y = 0; y <= height; ++y)
                    for (int x = 0; x <= width; ++x)
                        for (int k = 0; k <= bins; ++k) {
                            unsigned int expected = 0;
                            for (int j = 0; j < y; ++j)
                                for (int i = 0; i < x; ++i)
                                    if (k == bins || bin[j * width + i] == k) expected += weight[j * width + i];
                            ASSERT_EQ(target.row<unsigned int>(y)[x * (bins + 1) + k], expected)
                                << bins << " bins, " << width << "x" << height << " at " << x << "," << y << " channel "
                                << k;
                        }
            }
    }

    Image target;
    FailedCheck check = catchCheck(
        [&] { LQ::computeIntegralHog(randomImage(6, 6, LQ::COLOR_MODE_MONO, 1), target, Rect(0, 0, 6, 6), LQ::COLOR_MODE_RMCT); });
    EXPECT_EQ(check.expression, "0");
    EXPECT_EQ(check.tail, "incorrect color mode: COLOR_MODE_RMCT");
}

TEST(IntegralImage, VectorRowsEqualScalarRows) {
    std::mt19937 random(41);
    for (int width = 1; width <= 67; ++width)
        for (int kind = 0; kind < 2; ++kind) {
            std::vector<unsigned char> in = randomBytes(width, random);
            if (kind == 1) in.assign(width, 255);  // the largest partial sums
            std::vector<unsigned int> above(width + 1);
            for (auto& v : above) v = random();  // wrapping sums must wrap alike
            std::vector<unsigned int> expected(width + 1, 5);
            LQ::integralRowScalar(in.data(), above.data(), expected.data(), width);
            ASSERT_EQ(expected[0], 5u);
            std::vector<std::pair<const char*, decltype(&LQ::integralRowScalar)>> rowsToCompare;
#if defined(LQ_HAVE_NEON)
            rowsToCompare.emplace_back("neon", LQ::integralRowNeon);
#endif
#if defined(LQ_HAVE_SSSE3)
            rowsToCompare.emplace_back("sse", LQ::integralRowSse);
            if (__builtin_cpu_supports("avx2")) rowsToCompare.emplace_back("avx2", LQ::integralRowAvx2);
#endif
            for (const auto& vector : rowsToCompare) {
                std::vector<unsigned int> actual(width + 1, 5);
                vector.second(in.data(), above.data(), actual.data(), width);
                ASSERT_EQ(actual, expected) << vector.first << " width " << width;
            }
        }
}

TEST(IntegralHog, VectorRowsEqualScalarRows) {
    std::mt19937 random(31);
    for (int bins : {6, 12}) {
        const unsigned char* hog = bins == 12 ? LQ::getHogSigned12() : LQ::getHogUnsigned6();
        const size_t channels = bins + 1;
        for (int width = 3; width <= 67; ++width)
            for (int kind = 0; kind < 2; ++kind) {
                std::vector<unsigned char> rows[3];
                for (auto& row : rows) {
                    row = randomBytes(width, random);
                    if (kind == 1)  // the largest magnitudes
                        for (auto& b : row) b = b & 1 ? 255 : 0;
                }
                // exact-size rows, so that a vector store past the last position shows
                std::vector<unsigned int> previous((width + 1) * channels);
                for (auto& v : previous) v = random() % 1000000;
                std::vector<unsigned int> expected(previous.size(), 7u);
                LQ::integralHogRowScalar(rows[0].data(), rows[1].data(), rows[2].data(), width, hog, bins,
                                         previous.data(), expected.data());
                for (size_t k = 0; k < 2 * channels; ++k) ASSERT_EQ(expected[k], 7u);  // positions 0 and 1 untouched
#if defined(LQ_HAVE_NEON)
                std::vector<unsigned int> neon(previous.size(), 7u);
                LQ::integralHogRowNeon(rows[0].data(), rows[1].data(), rows[2].data(), width, hog, bins,
                                       previous.data(), neon.data());
                ASSERT_EQ(neon, expected) << bins << " bins, width " << width;
#endif
#if defined(LQ_HAVE_SSSE3)
                std::vector<unsigned int> sse(previous.size(), 7u);
                LQ::integralHogRowSse(rows[0].data(), rows[1].data(), rows[2].data(), width, hog, bins,
                                      previous.data(), sse.data());
                ASSERT_EQ(sse, expected) << bins << " bins, width " << width;
#endif
            }
    }
}
