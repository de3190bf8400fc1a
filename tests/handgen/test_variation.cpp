#include <gtest/gtest.h>

#include <cmath>
#include <sstream>
#include <string>
#include <vector>

#include "HandRandom.h"
#include "HandScene.h"

using namespace handgen;

TEST(HandVariation, SettingsReadBackWhatIsDescribed) {
    Variation changed;
    std::string error;
    for (const char* s : {"rotation=-40,25", "noise=3", "leftShare=0.25", "backgrounds=stripes,checker:2.5", "skinTone=0.5,1"})
        ASSERT_TRUE(setVariation(changed, s, error)) << s << ": " << error;
    EXPECT_TRUE(changed.rotation.low == -40 && changed.rotation.high == 25);
    EXPECT_TRUE(changed.noise.low == 3 && changed.noise.high == 3);
    const std::array<float, kBackgroundKindCount> stripesAndChecker{0, 0, 0, 1, 2.5f, 0};
    EXPECT_EQ(changed.backgrounds, stripesAndChecker);

    // every described line is a setting that gives the same description back
    const std::string description = describeVariation(changed);
    Variation copy;
    std::istringstream lines(description);
    std::string line;
    int count = 0;
    while (std::getline(lines, line)) {
        ASSERT_TRUE(setVariation(copy, line, error)) << line << ": " << error;
        ++count;
    }
    EXPECT_EQ(describeVariation(copy), description);
    EXPECT_EQ(copy.backgrounds, changed.backgrounds);
    EXPECT_GT(count, 20);
    // the defaults' uneven weights survive the trip too
    Variation defaults, back;
    std::istringstream defaultLines(describeVariation(defaults));
    while (std::getline(defaultLines, line)) ASSERT_TRUE(setVariation(back, line, error)) << line << ": " << error;
    EXPECT_EQ(back.backgrounds, defaults.backgrounds);
    EXPECT_EQ(back.noise.low, defaults.noise.low);
    EXPECT_EQ(back.blur.high, defaults.blur.high);

    const std::pair<const char*, const char*> bad[] = {
        {"rotation", "expected name=value in \"rotation\""},
        {"rotation=5,1", "bad range for rotation: \"5,1\" (low,high or one value)"},
        {"noise=loud", "bad range for noise: \"loud\" (low,high or one value)"},
        {"leftShare=1.5", "bad share for leftShare: \"1.5\" (0 .. 1)"},
        {"backgrounds=flat,plaid", "unknown background \"plaid\" (flat, gradient, noise, stripes, checker, clutter)"},
        {"backgrounds=flat:0", "bad weight for background flat: \"0\""},
        {"colour=1", "unknown setting \"colour\""},
    };
    for (const auto& [setting, message] : bad) {
        Variation v;
        EXPECT_FALSE(setVariation(v, setting, error)) << setting;
        EXPECT_EQ(error, message);
        EXPECT_EQ(describeVariation(v), describeVariation(Variation{})) << setting << " changed something";
    }
}

TEST(HandVariation, RandomDrawsHaveTheirShapes) {
    HandRandom random(42);
    const int n = 200000;
    double sum = 0, sum2 = 0, nsum = 0, nsum2 = 0, fsum = 0, fsum2 = 0;
    std::vector<int> bins(7, 0);
    for (int i = 0; i < n; ++i) {
        const double u = random.uniform(), z = random.normal(), f = random.fastNormal();
        ASSERT_TRUE(u >= 0 && u < 1) << u;
        sum += u, sum2 += u * u;
        nsum += z, nsum2 += z * z;
        fsum += f, fsum2 += f * f;
        const int k = random.below(7);
        ASSERT_TRUE(k >= 0 && k < 7) << k;
        ++bins[k];
    }
    EXPECT_NEAR(sum / n, 0.5, 0.005);
    EXPECT_NEAR(sum2 / n - (sum / n) * (sum / n), 1.0 / 12, 0.002);
    EXPECT_NEAR(nsum / n, 0, 0.01);
    EXPECT_NEAR(nsum2 / n, 1, 0.02);
    EXPECT_NEAR(fsum / n, 0, 0.01);
    EXPECT_NEAR(fsum2 / n, 1, 0.02);
    for (int b : bins) EXPECT_NEAR(b, n / 7.0, 5 * std::sqrt(n / 7.0));

    // streams from one seed are unrelated to each other, and repeat exactly
    HandRandom a(mixSeed(9, 0)), b(mixSeed(9, 1)), again(mixSeed(9, 0));
    int equal = 0;
    for (int i = 0; i < 1000; ++i) {
        const std::uint32_t x = a.raw();
        equal += x == b.raw();
        ASSERT_EQ(x, again.raw());
    }
    EXPECT_LT(equal, 3);
}
