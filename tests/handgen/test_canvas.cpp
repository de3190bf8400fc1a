#include <gtest/gtest.h>

#include <cmath>

#include "Canvas.h"

using namespace handgen;

TEST(HandCanvas, BlurKeepsLevelsAndSpreadsByItsSigma) {
    // one bright pixel in the middle: its light is kept and spread with the asked sigma
    for (float sigma : {0.7f, 1.5f, 3.0f}) {
        Canvas canvas(41, 41);
        canvas.row(20)[3 * 20] = 1;
        gaussianBlur(canvas, sigma);
        double sum = 0, spread = 0;
        for (int y = 0; y < 41; ++y)
            for (int x = 0; x < 41; ++x) {
                const double v = canvas.row(y)[3 * x];
                sum += v;
                spread += v * (x - 20) * (x - 20);
                EXPECT_NEAR(canvas.row(y)[3 * x], canvas.row(x)[3 * y], 1e-6) << "not round at " << x << "," << y;
                EXPECT_EQ(canvas.row(y)[3 * x + 1], 0.f);
            }
        EXPECT_NEAR(sum, 1, 1e-4) << sigma;
        EXPECT_NEAR(std::sqrt(spread / sum), sigma, 0.03 * sigma + 0.02) << sigma;
    }
    // a flat picture stays flat to its edges, and a sigma too small to matter changes nothing
    Canvas flat(9, 7, Rgb{0.25f, 0.5f, 0.75f});
    gaussianBlur(flat, 2);
    for (int y = 0; y < 7; ++y)
        for (int x = 0; x < 9; ++x) EXPECT_NEAR(flat.row(y)[3 * x + 2], 0.75f, 1e-6f);
    Canvas sharp(5, 5);
    sharp.row(2)[6] = 1;
    gaussianBlur(sharp, 0.1f);
    EXPECT_EQ(sharp.row(2)[6], 1.f);
}

TEST(HandCanvas, NoiseHasItsSigmaInLevelsAndItsChromaShare) {
    for (float chroma : {0.f, 0.3f, 1.f}) {
        Canvas canvas(128, 128, Rgb{0.5f, 0.5f, 0.5f});
        HandRandom random(3);
        sensorNoise(canvas, 4, chroma, random);
        double r2 = 0, g2 = 0, rg = 0, mean = 0;
        const int n = 128 * 128;
        for (int y = 0; y < 128; ++y)
            for (int x = 0; x < 128; ++x) {
                const double r = (canvas.row(y)[3 * x] - 0.5) * 255, g = (canvas.row(y)[3 * x + 1] - 0.5) * 255;
                mean += r;
                r2 += r * r;
                g2 += g * g;
                rg += r * g;
            }
        EXPECT_NEAR(mean / n, 0, 0.1) << chroma;
        EXPECT_NEAR(std::sqrt(r2 / n), 4, 0.1) << chroma;
        EXPECT_NEAR(std::sqrt(g2 / n), 4, 0.1) << chroma;
        // the common part makes the channels move together
        EXPECT_NEAR(rg / std::sqrt(r2 * g2), 1 - chroma, 0.03) << chroma;
    }
}

TEST(HandCanvas, LatticeNoiseIsSmoothAndTheSameAtAnyCrop) {
    // whole cells land on lattice values; between them the noise moves by small steps
    float previous = valueNoise(0, 0.5f, 9), largest = 0, low = 1, high = 0;
    for (int i = 1; i <= 4000; ++i) {
        const float v = valueNoise(i * 0.01f, 0.5f, 9);
        largest = std::max(largest, std::fabs(v - previous));
        low = std::min(low, v);
        high = std::max(high, v);
        previous = v;
    }
    EXPECT_LT(largest, 0.05f);
    EXPECT_GE(low, 0.f);
    EXPECT_LE(high, 1.f);
    EXPECT_GT(high - low, 0.5f);
    // a value depends on where it is and the seed, not on what was asked before
    EXPECT_EQ(valueNoise(12.25f, -3.5f, 4), valueNoise(12.25f, -3.5f, 4));
    EXPECT_NE(valueNoise(12.25f, -3.5f, 4), valueNoise(12.25f, -3.5f, 5));
}
