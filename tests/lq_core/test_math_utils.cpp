#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <set>
#include <vector>

#include "LQ_MathUtils.h"
#include "LogCapture.h"

using namespace LQ;

TEST(MathPeriodic, normalizeAndMix) {
    // into (a, b]: b itself stays, a moves up a period
    EXPECT_FLOAT_EQ(normalizePeriodic(360.f, 0.f, 360.f), 360.f);
    EXPECT_FLOAT_EQ(normalizePeriodic(0.f, 0.f, 360.f), 360.f);
    EXPECT_FLOAT_EQ(normalizePeriodic(725.f, -180.f, 180.f), 5.f);
    EXPECT_EQ(catchCheck([] { normalizePeriodic(1.f, 2.f, 2.f); }).expression, "a < b");

    EXPECT_EQ(mixPeriodic(0.5f, 350.f, 10.f, 360.f), 360.f);
    // the first value lifted: 370 + (350 - 370) / 4
    EXPECT_EQ(mixPeriodic(0.25f, 10.f, 350.f, 360.f), 365.f);
    // several periods apart
    EXPECT_EQ(mixPeriodic(0.5f, 10.f, 1070.f, 360.f), 1080.f);
    // within half a period: the plain mix, half a period exactly included
    EXPECT_EQ(mixPeriodic(0.5f, 0.f, 180.f, 360.f), 90.f);
}

TEST(MathQuadratic, rootsLinearCaseAndTolerance) {
    float x1 = 0, x2 = 0;
    ASSERT_TRUE(solveQuadraticEquation(1, -3, 2, x1, x2, 0));
    EXPECT_FLOAT_EQ(x1, 1.f);
    EXPECT_FLOAT_EQ(x2, 2.f);
    ASSERT_TRUE(solveQuadraticEquation(1e-7f, 2, -4, x1, x2, 0));
    EXPECT_EQ(x1, 2.f);
    EXPECT_EQ(x2, 2.f);
    EXPECT_FALSE(solveQuadraticEquation(1e-7f, 1e-7f, 1, x1, x2, 0));
    // D = -0.04: outside a tolerance of 0.01 the vertex and false, inside it one root
    EXPECT_FALSE(solveQuadraticEquation(1, 2, 1.01f, x1, x2, 0.01f));
    EXPECT_FLOAT_EQ(x1, -1.f);
    x1 = x2 = 0;
    EXPECT_TRUE(solveQuadraticEquation(1, 2, 1.01f, x1, x2, 0.1f));
    EXPECT_FLOAT_EQ(x1, -1.f);
    EXPECT_EQ(x1, x2);
}

TEST(Random, minimalStandardSequenceAndRepeats) {
    // The standard library's engine with the same multiplier is an independent reference.
    setRandomSeed(123456789);
    std::minstd_rand reference(123456789);
    int last = 0;
    for (int i = 0; i < 2000; ++i) {
        last = LQ::rand();
        ASSERT_EQ(last, static_cast<int>(reference())) << i;
    }
    EXPECT_EQ(randomSeed, last);

    // one shared state: every draw consumes it, and a seed repeats the mixed sequence
    auto draw = [] {
        std::vector<float> values;
        for (int i = 0; i < 50; ++i) {
            values.push_back(static_cast<float>(LQ::rand()));
            values.push_back(randomUniform());
            values.push_back(randomUniform(-2.f, 3.f));
            values.push_back(static_cast<float>(randomUniformInt(10)));
            values.push_back(randomNormal());
        }
        return values;
    };
    setRandomSeed(42);
    const std::vector<float> first = draw();
    setRandomSeed(42);
    EXPECT_EQ(draw(), first);
    setRandomSeed(43);
    EXPECT_NE(draw(), first);

    setRandomSeed(7);
    LQ::rand();
    const int second = LQ::rand();
    setRandomSeed(7);
    randomUniform();
    EXPECT_EQ(LQ::rand(), second);
    setRandomSeed(7);
    const float a = randomUniform(-2.f, 3.f);
    setRandomSeed(7);
    EXPECT_EQ(randomUniform(RangeF(-2.f, 3.f)), a);

    EXPECT_EQ(randomUniformInt(0), 0);
}

TEST(Random, distributions) {
    setRandomSeed(2024);
    std::set<int> ints;
    const int n = 20000;
    double sum = 0, sum2 = 0;
    for (int i = 0; i < n; ++i) {
        const float v = randomUniform(-2.f, 3.f);
        ASSERT_GE(v, -2.f);
        ASSERT_LT(v, 3.f);
        ints.insert(randomUniformInt(7));
        const double z = randomNormal();
        sum += z;
        sum2 += z * z;
    }
    EXPECT_EQ(ints, std::set<int>({0, 1, 2, 3, 4, 5, 6}));
    EXPECT_NEAR(sum / n, 0.0, 0.03);
    EXPECT_NEAR(std::sqrt(sum2 / n - (sum / n) * (sum / n)), 1.0, 0.03);
}

TEST(Statistics, covarianceAndVariance) {
    Matrix out;
    const std::vector<PointF> square = {{0, 0}, {2, 0}, {0, 2}, {2, 2}};
    covariance(square, PointF(1, 1), out);
    EXPECT_EQ(std::vector<float>(out.data(), out.data() + 4), std::vector<float>({1, 0, 0, 1}));
    // points along (1, 2, -1): t in {-1, 0, 1, 2}, mean 0.5, so var(t) = 1.25
    std::vector<Point3dF> line;
    for (float t : {-1.f, 0.f, 1.f, 2.f}) line.emplace_back(t, 2 * t, -t);
    covariance(line, Point3dF(0.5f, 1.f, -0.5f), out);
    const float direction[] = {1, 2, -1};
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j) EXPECT_FLOAT_EQ(out(i, j), 1.25f * direction[i] * direction[j]);

    // weights 1 and 3 about the origin: (1 * 4 + 3 * 0) / 4 and so on
    covariance({PointF(2, 0), PointF(0, 2)}, {1.f, 3.f}, PointF(), out);
    EXPECT_EQ(std::vector<float>(out.data(), out.data() + 4), std::vector<float>({1, 0, 0, 3}));
    // a total weight of zero leaves the plain weighted sums
    covariance({Point3dF(1, 0, 0), Point3dF(0, 1, 0)}, {1.f, -1.f}, Point3dF(), out);
    EXPECT_EQ(std::vector<float>(out.data(), out.data() + 9),
              std::vector<float>({1, 0, 0, 0, -1, 0, 0, 0, 0}));
    const FailedCheck check = catchCheck([&] { covariance(square, {1.f}, PointF(), out); });
    EXPECT_EQ(check.expression, "(points.size()) == (weights.size())");
    EXPECT_EQ(check.tail, "4 != 1");

    // mean squared distance from the centre (1, 1): each corner is 2 away
    EXPECT_FLOAT_EQ(variance(std::vector<PointI>{{0, 0}, {2, 0}, {0, 2}, {2, 2}}), 2.f);
    const float data[] = {1, 2, 3, 4};
    EXPECT_FLOAT_EQ(variance(data, 4), 5.f / 3.f);
    EXPECT_EQ(variance(data, 1), 0.f);
}

TEST(Statistics, regression) {
    // a slope and an intercept worked out by hand: means 3.5 and 4, Sxx = 17.5, Sxy = 35,
    // Syy = 70.12, so slope 2, intercept -3 and R^2 = 35^2 / (17.5 * 70.12)
    const int n = 6;
    const float x[2 * n] = {1, 2, 3, 4, 5, 6, 1, 1, 1, 1, 1, 1};
    float c[2] = {};
    const float y[n] = {-1.1f, 1.2f, 2.9f, 5.1f, 6.8f, 9.1f};
    const double slope = 2, intercept = -3, r2 = 1225 / 1227.1;
    EXPECT_NEAR(regression(x, y, c, n, 2), r2, 1e-5);
    EXPECT_NEAR(c[0], slope, 1e-4);
    EXPECT_NEAR(c[1], intercept, 1e-4);

    Matrix parameters(Size(1, 2));
    EXPECT_NEAR(linearRegressionMat(Matrix(Size(n, 2), x), Matrix(Size(1, n), y), parameters), r2, 1e-5);
    EXPECT_NEAR(parameters[0], slope, 1e-4);
    EXPECT_NEAR(parameters[1], intercept, 1e-4);

    const float flat[n] = {2, 2, 2, 2, 2, 2};
    EXPECT_EQ(computeR2(x, flat, c, n, 2), 0.f);

    // the second regressor repeats the first: x x^T is singular
    const float twice[2 * 3] = {1, 2, 3, 2, 4, 6};
    const FailedCheck check = catchCheck([&] { regression(twice, y, c, 3, 2); });
    EXPECT_EQ(check.expression, "status");
    EXPECT_EQ(check.tail, "matrix inversion failed: Matrix(Size(2, 2)\n14\t28\t\n28\t56\t\n)\n");
}
