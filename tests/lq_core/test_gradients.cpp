#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "LQ_Gradients.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
void sobelAt(const Image& image, int x, int y, int& gx, int& gy) {
    const auto p = [&](int dx, int dy) { return int(image.pixel(x + dx, y + dy)[0]); };
    gx = p(1, 1) + p(1, -1) + 2 * (p(1, 0) - p(-1, 0)) - p(-1, 1) - p(-1, -1);
    gy = p(1, 1) + p(-1, 1) + 2 * (p(0, 1) - p(0, -1)) - p(1, -1) - p(-1, -1);
}

bool interior(const Image& image, int x, int y) {
    return x >= 1 && y >= 1 && x + 1 < image.width() && y + 1 < image.height();
}

void fill(Image& image, unsigned char value) {
    for (int y = 0; y < image.height(); ++y) std::memset(image.row(y), value, static_cast<size_t>(image.width()) * image.depth());
}

// the whole image's magnitude bytes or sector bytes of a gradient image, row by row
std::string bytes(const Image& image, int channel) {
    std::string out;
    for (int y = 0; y < image.height(); ++y) {
        for (int x = 0; x < image.width(); ++x) out += std::to_string(image.pixel(x, y)[channel]) + " ";
        out += "/ ";
    }
    return out;
}
}  // namespace

TEST(GradientOperators, EveryPixelAtEverySize) {
    for (int width = 1; width <= 40; width += (width < 10 ? 1 : 15)) {
        for (int height = 1; height <= 6; ++height) {
            for (bool asView : {false, true}) {
                SCOPED_TRACE(::testing::Message() << width << "x" << height << (asView ? " view" : ""));
                Image parent;
                const unsigned seed = width * 7 + height;
                Image image = asView ? randomView(width, height, LQ::COLOR_MODE_MONO, seed, parent)
                                     : randomImage(width, height, LQ::COLOR_MODE_MONO, seed);
                if (seed % 3 == 0)  // all extremes: the largest gradients
                    for (int y = 0; y < height; ++y)
                        for (int x = 0; x < width; ++x) image.pixel(x, y)[0] = image.pixel(x, y)[0] < 128 ? 0 : 255;

                Image sobel(image.size(), LQ::COLOR_MODE_GRADIENT), absolute, roberts, gradients, first, second;
                fill(sobel, 0x77);  // a reused target with leftovers
                LQ::SobelGradient(image, sobel);
                LQ::SobelAbsolute(image, absolute);
                LQ::robertCross(image, roberts);
                LQ::computeGradients(image, gradients);
                const bool large = width >= 3 && height >= 3;
                if (large) LQ::computeSobelGradient(image, first, second);
                for (int y = 0; y < height; ++y)
                    for (int x = 0; x < width; ++x) {
                        int gx = 0, gy = 0;
                        if (interior(image, x, y)) sobelAt(image, x, y, gx, gy);
                        ASSERT_EQ(static_cast<signed char>(sobel.pixel(x, y)[0]), gx / 8) << x << "," << y;
                        ASSERT_EQ(static_cast<signed char>(sobel.pixel(x, y)[1]), gy / 8) << x << "," << y;
                        ASSERT_EQ(absolute.pixel(x, y)[0], (std::abs(gx) + std::abs(gy)) / 8);
                        if (large) {
                            ASSERT_EQ(first.row<short>(y)[x], gx);
                            ASSERT_EQ(second.row<short>(y)[x], gy);
                        }
                        int sector = 0;
                        if (interior(image, x, y)) {
                            // eight sectors of 45 degrees around the Gy axis, opposite ones alike
                            const double turns = std::atan2(double(gx), double(gy)) / (2 * M_PI) + 1;
                            sector = static_cast<int>(std::floor(turns * 8 + 0.5)) % 4;
                        }
                        ASSERT_EQ(gradients.pixel(x, y)[0], sector) << x << "," << y << " Gx " << gx << " Gy " << gy;
                        ASSERT_EQ(gradients.pixel(x, y)[1], (std::abs(gx) + std::abs(gy)) >> 3);
                        int cross = 0;
                        if (x + 1 < width && y + 1 < height)
                            cross = (std::abs(image.pixel(x + 1, y)[0] - image.pixel(x, y + 1)[0]) +
                                     std::abs(image.pixel(x, y)[0] - image.pixel(x + 1, y + 1)[0])) / 2;
                        ASSERT_EQ(roberts.pixel(x, y)[0], cross);
                    }

                // inside a rect the same values; elsewhere cleared
                if (large) {
                    const Rect rect(1 + width / 4, 1, width - 1, height - 1 - height / 4);
                    Image inRect(image.size(), LQ::COLOR_MODE_GRADIENT);
                    fill(inRect, 0x77);
                    LQ::SobelGradientInRect(image, inRect, rect);
                    for (int y = 0; y < height; ++y)
                        for (int x = 0; x < width; ++x)
                            for (int c = 0; c < 2; ++c)
                                ASSERT_EQ(inRect.pixel(x, y)[c],
                                          rect.contains(LQ::BasePoint<int>(x, y)) ? sobel.pixel(x, y)[c] : 0)
                                    << x << "," << y;
                }
            }
        }
    }
}

TEST(GradientOperators, VectorRowsEqualScalarRows) {
    std::mt19937 random(29);
    for (int width = 3; width <= 67; ++width)
        for (int kind = 0; kind < 3; ++kind) {
            std::vector<unsigned char> rows[3];
            for (auto& row : rows) {
                row = randomBytes(width, random);
                if (kind == 1)  // extremes: |Gx| and |Gy| up to 1020, quotients up to 127
                    for (auto& b : row) b = b & 1 ? 255 : 0;
                if (kind == 2)  // small gradients of either sign: the truncation toward zero
                    for (auto& b : row) b = static_cast<unsigned char>(120 + b % 9);
            }
            std::vector<signed char> expected(2 * width, 55);
            LQ::sobelRowScalar(rows[0].data(), rows[1].data(), rows[2].data(), expected.data(), width);
            EXPECT_EQ(expected[0], 55);  // the end columns are not touched
            EXPECT_EQ(expected[2 * width - 1], 55);
#if defined(LQ_HAVE_NEON)
            std::vector<signed char> neon(2 * width, 55);
            LQ::sobelRowNeon(rows[0].data(), rows[1].data(), rows[2].data(), neon.data(), width);
            ASSERT_EQ(neon, expected) << "width " << width;
#endif
#if defined(LQ_HAVE_SSSE3)
            std::vector<signed char> sse(2 * width, 55);
            LQ::sobelRowSse(rows[0].data(), rows[1].data(), rows[2].data(), sse.data(), width);
            ASSERT_EQ(sse, expected) << "width " << width;
#endif
        }
}

TEST(GradientOperators, ThinningHysteresisAndCanny) {
    // A 5x3 gradient image by hand: sectors in byte 0, magnitudes in byte 1.
    Image g(Size(5, 3), LQ::COLOR_MODE_GRADIENT);
    fill(g, 0);
    const int magnitude[3][5] = {{0, 9, 3, 7, 0}, {4, 9, 9, 5, 2}, {0, 9, 1, 5, 0}};
    const int sector[3] = {0, 2, 1};  // for the interior pixels (1..3, 1)
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 5; ++x) g.pixel(x, y)[1] = static_cast<unsigned char>(magnitude[y][x]);
    for (int x = 1; x <= 3; ++x) g.pixel(x, 1)[0] = static_cast<unsigned char>(sector[x - 1]);
    LQ::thinGradients(g);
    // (1,1) sector 0: 9 >= below 9 but not > above 9; (2,1) sector 2: 9 >= right 5, > left 9? no;
    // (3,1) sector 1: 5 >= (4,2) 0 and > (2,0) 3: kept
    EXPECT_EQ(g.pixel(1, 1)[0], 255);
    EXPECT_EQ(g.pixel(2, 1)[0], 255);
    EXPECT_EQ(g.pixel(3, 1)[0], 1);
    // sectors above 3 count as 3: forward (-1, +1) is 9, backward (+1, -1) now 9 too
    g.pixel(2, 1)[0] = 7;
    g.pixel(3, 0)[1] = 9;
    LQ::thinGradients(g);
    EXPECT_EQ(g.pixel(2, 1)[0], 255);

    // Hysteresis: a chain of magnitudes above low is raised to 255 and grows through its
    // neighbours; what it touches at or below low, or suppressed, drops to 0.
    Image h(Size(6, 4), LQ::COLOR_MODE_GRADIENT);
    fill(h, 0);
    const int chain[4][6] = {{0, 0, 0, 0, 0, 0}, {0, 30, 11, 10, 40, 0}, {0, 0, 0, 12, 0, 0}, {0, 0, 0, 0, 0, 0}};
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 6; ++x) h.pixel(x, y)[1] = static_cast<unsigned char>(chain[y][x]);
    h.pixel(4, 1)[0] = 255;  // suppressed
    LQ::updateGradients(h.pixel(1, 1), 10, static_cast<int>(h.stripLength()));
    EXPECT_EQ(bytes(h, 1), "0 0 0 0 0 0 / 0 255 255 0 0 0 / 0 0 0 255 0 0 / 0 0 0 0 0 0 / ");
    // a magnitude of 255 ends the step at once: its neighbours stay as they are
    h.pixel(1, 2)[1] = 50;
    LQ::updateGradients(h.pixel(1, 1), 10, static_cast<int>(h.stripLength()));
    EXPECT_EQ(h.pixel(1, 2)[1], 50);

    // Canny on a long horizontal step: Gy = 760 on rows 2 and 3, magnitude 95, thinned to
    // row 2, below the high threshold but for a bright dot on row 3 that lifts row 2 to 108.
    // The walk from there runs along the whole row without recursion.
    Image step(Size(20000, 6), LQ::COLOR_MODE_MONO), edges;
    for (int y = 0; y < 6; ++y) std::memset(step.row(y), y < 3 ? 10 : 200, 20000);
    step.pixel(10000, 3)[0] = 255;
    LQ::canny(step, edges, 20, 100);
    ASSERT_EQ(edges.size(), step.size());
    int wrong = 0;
    for (int y = 0; y < 6; ++y)
        for (int x = 0; x < 20000; ++x) wrong += edges.pixel(x, y)[0] != (y == 2 && x >= 1 && x <= 19998 ? 255 : 0);
    EXPECT_EQ(wrong, 0);
    LQ::canny(step, edges, 20, 108);  // no seed now
    for (int x = 0; x < 20000; ++x) ASSERT_EQ(edges.pixel(x, 2)[0], 0) << x;

    // a flat image and a 2x2 image have no edges
    Image flat(Size(7, 7), LQ::COLOR_MODE_MONO);
    fill(flat, 90);
    LQ::canny(flat, edges, 0, 1);
    for (int y = 0; y < 7; ++y)
        for (int x = 0; x < 7; ++x) ASSERT_EQ(edges.pixel(x, y)[0], 0);
    LQ::canny(randomImage(2, 2, LQ::COLOR_MODE_MONO, 3), edges, 0, 1);
    EXPECT_EQ(edges.size(), Size(2, 2));
}

TEST(GradientOperators, FailedChecks) {
    const Image mono = randomImage(6, 5, LQ::COLOR_MODE_MONO, 8);
    Image target(Size(6, 5), LQ::COLOR_MODE_GRADIENT), wrongSize(Size(5, 5), LQ::COLOR_MODE_GRADIENT),
        wrongMode(Size(6, 5), LQ::COLOR_MODE_MONO16), first, second;
    const struct {
        std::function<void()> call;
        const char* expression;
        const char* tail;
    } failures[] = {
        {[&] { LQ::SobelGradientInRect(mono, wrongMode, Rect(1, 1, 2, 2)); },
         "(target).colorMode() == (COLOR_MODE_GRADIENT)", "have COLOR_MODE_MONO16, but need COLOR_MODE_GRADIENT"},
        {[&] { LQ::SobelGradientInRect(mono, wrongSize, Rect(1, 1, 2, 2)); }, "(target).size() == (source.size())",
         "have Size(5, 5), but need Size(6, 5)"},
        {[&] { LQ::SobelGradientInRect(mono, target, Rect(1, 1, 6, 4)); },
         "Rect(source.rect()).resize(-1, -1).contains(rect)", "input rect should lie inside input image"},
        {[&] { LQ::computeSobelGradient(randomImage(2, 5, LQ::COLOR_MODE_MONO, 1), target); }, "(src.width()) >= (3)",
         "2 < 3"},
        {[&] { LQ::computeSobelGradient(randomImage(5, 1, LQ::COLOR_MODE_MONO, 1), first, second); },
         "(src.height()) >= (3)", "1 < 3"},
        {[&] { LQ::canny(target, first, 1, 2); }, "(source).colorMode() == (COLOR_MODE_MONO)",
         "have COLOR_MODE_GRADIENT, but need COLOR_MODE_MONO"},
        {[&] { LQ::canny(mono, first, 40, 20); }, "(minThreshold) < (maxThreshold)", "40 >= 20"},
        {[&] { LQ::canny(mono, first, -1, 20); }, "(minThreshold) >= (0)", "-1 < 0"},
    };
    for (const auto& failure : failures) {
        const FailedCheck check = catchCheck(failure.call);
        EXPECT_TRUE(check.thrown) << failure.expression;
        EXPECT_EQ(check.expression, failure.expression);
        EXPECT_EQ(check.tail, failure.tail);
    }
}
