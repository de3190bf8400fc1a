#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "LQ_Gradients.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
void fill(Image& image, unsigned char value) {
    for (int y = 0; y < image.height(); ++y) std::memset(image.row(y), value, static_cast<size_t>(image.width()) * image.depth());
}
}  // namespace

TEST(GradientOperators, EveryPixelAtEverySize) {
    for (int width = 1; width <= 40; width += (width < 10 ? 1 : 15))
        for (int height = 1; height <= 6; ++height)
            for (bool asView : {false, true}) {
                SCOPED_TRACE(::testing::Message() << width << "x" << height << (asView ? " view" : ""));
                Image parent;
                Image image = asView ? randomView(width, height, LQ::COLOR_MODE_MONO, width * 7 + height, parent)
                                     : randomImage(width, height, LQ::COLOR_MODE_MONO, width * 7 + height);
                for (int y = 0; y < height && (width + height) % 3 == 0; ++y)  // extremes: the largest gradients
                    for (int x = 0; x < width; ++x) image.pixel(x, y)[0] = image.pixel(x, y)[0] < 128 ? 0 : 255;
                const bool large = width >= 3 && height >= 3;
                const Rect rect(1 + width / 4, 1, width - 1, height - 1 - height / 4);
                Image sobel(image.size(), LQ::COLOR_MODE_GRADIENT), inRect = sobel, absolute, roberts, gradients, first, second;
                fill(sobel, 0x77);  // leftovers
                fill(inRect, 0x77);
                LQ::SobelGradient(image, sobel);
                if (large) LQ::SobelGradientInRect(image, inRect, rect);
                if (large) LQ::computeSobelGradient(image, first, second);
                LQ::SobelAbsolute(image, absolute);
                LQ::robertCross(image, roberts);
                LQ::computeGradients(image, gradients);
                for (int y = 0; y < height; ++y)
                    for (int x = 0; x < width; ++x) {
                        int gx = 0, gy = 0, sector = 0, cross = 0;
                        const auto p = [&](int dx, int dy) { return int(image.pixel(x + dx, y + dy)[0]); };
                        if (x >= 1 && y >= 1 && x + 1 < width && y + 1 < height) {
                            gx = p(1, 1) + p(1, -1) + 2 * (p(1, 0) - p(-1, 0)) - p(-1, 1) - p(-1, -1);
                            gy = p(1, 1) + p(-1, 1) + 2 * (p(0, 1) - p(0, -1)) - p(1, -1) - p(-1, -1);
                            // eight sectors of 45 degrees from the Gy axis, opposite ones alike
                            sector = static_cast<int>(std::floor(std::atan2(gx, gy) / (M_PI / 4) + 8.5)) % 4;
                        }
                        if (x + 1 < width && y + 1 < height) cross = (std::abs(p(1, 0) - p(0, 1)) + std::abs(p(0, 0) - p(1, 1))) / 2;
                        ASSERT_EQ(static_cast<signed char>(sobel.pixel(x, y)[0]), gx / 8) << x << "," << y;
                        ASSERT_EQ(static_cast<signed char>(sobel.pixel(x, y)[1]), gy / 8) << x << "," << y;
                        const bool inside = rect.contains(LQ::BasePoint<int>(x, y));
                        ASSERT_EQ(inRect.pixel(x, y)[0] | inRect.pixel(x, y)[1] << 8,
                                  large ? (inside ? sobel.pixel(x, y)[0] | sobel.pixel(x, y)[1] << 8 : 0) : 0x7777);
                        ASSERT_EQ(!large || (first.row<short>(y)[x] == gx && second.row<short>(y)[x] == gy), true);
                        ASSERT_EQ(absolute.pixel(x, y)[0], (std::abs(gx) + std::abs(gy)) / 8);
                        ASSERT_EQ(gradients.pixel(x, y)[0], sector) << x << "," << y << " Gx " << gx << " Gy " << gy;
                        ASSERT_EQ(gradients.pixel(x, y)[1], (std::abs(gx) + std::abs(gy)) >> 3);
                        ASSERT_EQ(roberts.pixel(x, y)[0], cross);
                    }
            }
}

TEST(GradientOperators, ThinningHysteresisAndCanny) {
    // by hand: magnitudes in byte 1, sectors of the interior pixels (1..3, 1) in byte 0
    Image g(Size(5, 3), LQ::COLOR_MODE_GRADIENT);
    fill(g, 0);
    const int magnitude[3][5] = {{0, 9, 3, 7, 0}, {4, 9, 9, 5, 2}, {0, 9, 1, 5, 0}};
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 5; ++x) g.pixel(x, y)[1] = static_cast<unsigned char>(magnitude[y][x]);
    g.pixel(1, 1)[0] = 0, g.pixel(2, 1)[0] = 2, g.pixel(3, 1)[0] = 1;
    LQ::thinGradients(g);
    // (1,1): 9 >= 9 below, not > 9 above; (2,1): 9 >= 5 right, not > 9 left; (3,1): 5 >= 0, 5 > 3
    EXPECT_EQ(g.pixel(1, 1)[0] + g.pixel(2, 1)[0] + g.pixel(3, 1)[0], 255 + 255 + 1);
    g.pixel(2, 1)[0] = 7;  // counts as 3: forward (1,2) = 9, backward (3,0) = 7, so kept
    LQ::thinGradients(g);
    EXPECT_EQ(g.pixel(2, 1)[0], 7);
    g.pixel(3, 0)[1] = 9;  // now not above the backward neighbour
    LQ::thinGradients(g);
    EXPECT_EQ(g.pixel(2, 1)[0], 255);

    // Hysteresis: the chain above low grows to 255, what it touches at or below low or
    // suppressed drops to 0; a magnitude of 255 ends the step at once.
    Image h(Size(6, 4), LQ::COLOR_MODE_GRADIENT);
    fill(h, 0);
    const int chain[4][6] = {{0, 0, 0, 0, 0, 0}, {0, 30, 11, 10, 40, 0}, {0, 0, 0, 12, 0, 0}, {0, 0, 0, 0, 0, 0}};
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 6; ++x) h.pixel(x, y)[1] = static_cast<unsigned char>(chain[y][x]);
    h.pixel(4, 1)[0] = 255;
    LQ::updateGradients(h.pixel(1, 1), 10, static_cast<int>(h.stripLength()));
    const int walked[4][6] = {{0, 0, 0, 0, 0, 0}, {0, 255, 255, 0, 0, 0}, {0, 0, 0, 255, 0, 0}, {0, 0, 0, 0, 0, 0}};
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 6; ++x) EXPECT_EQ(h.pixel(x, y)[1], walked[y][x]) << x << "," << y;
    h.pixel(1, 2)[1] = 50;
    LQ::updateGradients(h.pixel(1, 1), 10, static_cast<int>(h.stripLength()));
    EXPECT_EQ(h.pixel(1, 2)[1], 50);

    // A long horizontal step: Gy = 760 on rows 2 and 3 (magnitude 95), thinned to row 2, and
    // below the high threshold but where a bright dot on row 3 lifts row 2 to 108. From there
    // the walk runs along the whole row, 20000 pixels, without recursion.
    Image step(Size(20000, 6), LQ::COLOR_MODE_MONO), edges;
    for (int y = 0; y < 6; ++y) std::memset(step.row(y), y < 3 ? 10 : 200, 20000);
    step.pixel(10000, 3)[0] = 255;
    LQ::canny(step, edges, 20, 100);
    int wrong = 0;
    for (int y = 0; y < 6; ++y)
        for (int x = 0; x < 20000; ++x) wrong += edges.pixel(x, y)[0] != (y == 2 && x >= 1 && x <= 19998 ? 255 : 0);
    EXPECT_EQ(wrong, 0);
    LQ::canny(step, edges, 20, 108);  // no seed
    for (int x = 0; x < 20000; ++x) ASSERT_EQ(edges.pixel(x, 2)[0], 0) << x;
}

TEST(GradientOperators, FailedChecks) {
    const Image mono = randomImage(6, 5, LQ::COLOR_MODE_MONO, 8);
    Image target(Size(6, 5), LQ::COLOR_MODE_GRADIENT), narrow(Size(5, 5), LQ::COLOR_MODE_GRADIENT),
        wrongMode(Size(6, 5), LQ::COLOR_MODE_MONO16), first, second;
    const struct {
        std::function<void()> call;
        const char *expression, *tail;
    } failures[] = {
        {[&] { LQ::SobelGradientInRect(mono, wrongMode, Rect(1, 1, 2, 2)); }, "(target).colorMode() == (COLOR_MODE_GRADIENT)",
         "have COLOR_MODE_MONO16, but need COLOR_MODE_GRADIENT"},
        {[&] { LQ::SobelGradientInRect(mono, narrow, Rect(1, 1, 2, 2)); }, "(target).size() == (source.size())",
         "have Size(5, 5), but need Size(6, 5)"},
        {[&] { LQ::SobelGradientInRect(mono, target, Rect(1, 1, 6, 4)); },
         "Rect(source.rect()).resize(-1, -1).contains(rect)", "input rect should lie inside input image"},
        {[&] { LQ::computeSobelGradient(randomImage(2, 5, LQ::COLOR_MODE_MONO, 1), target); }, "(src.width()) >= (3)", "2 < 3"},
        {[&] { LQ::computeSobelGradient(randomImage(5, 1, LQ::COLOR_MODE_MONO, 1), first, second); }, "(src.height()) >= (3)",
         "1 < 3"},
        {[&] { LQ::canny(target, first, 1, 2); }, "(source).colorMode() == (COLOR_MODE_MONO)",
         "have COLOR_MODE_GRADIENT, but need COLOR_MODE_MONO"},
        {[&] { LQ::canny(mono, first, 40, 20); }, "(minThreshold) < (maxThreshold)", "40 >= 20"},
        {[&] { LQ::canny(mono, first, -1, 20); }, "(minThreshold) >= (0)", "-1 < 0"},
    };
    for (const auto& failure : failures) {
        const FailedCheck check = catchCheck(failure.call);
        EXPECT_EQ(check.expression, failure.expression);
        EXPECT_EQ(check.tail, failure.tail);
    }
}
