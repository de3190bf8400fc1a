#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <numeric>
#include <random>
#include <vector>

#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"
#include "StrongClassifier.h"
#include "TestImages.h"
#include "WeakClassifier.h"

using LQ::BasePoint;
using LQ::BaseRect;
using LQ::BaseSize;
using LQ::Image;

namespace {

std::vector<LQ::schar> randomTable(unsigned seed) {
    std::mt19937 random(seed);
    std::vector<LQ::schar> table(256);
    for (LQ::schar& v : table) v = static_cast<LQ::schar>(static_cast<int>(random() % 256) - 128);
    return table;
}

// the image turned as rotatePointOnSize turns a point: new(y, W - 1 - x) = old(x, y)
Image turned(const Image& image) {
    Image result(BaseSize<int>(image.height(), image.width()), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x) {
            const BasePoint<int> p = rotatePointOnSize(BasePoint<int>(x, y), image.size());
            result.pixel(p.x, p.y)[0] = image.pixel(x, y)[0];
        }
    return result;
}

Image mirrored(const Image& image) {
    Image result(image.size(), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x) result.pixel(image.width() - 1 - x, y)[0] = image.pixel(x, y)[0];
    return result;
}

Image filled(int width, int height, unsigned char value) {
    Image image(BaseSize<int>(width, height), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) image.pixel(x, y)[0] = value;
    return image;
}

// a Haar test's outer and inner rectangles
struct HaarCase {
    BaseRect<int> first, second;
};

long long boxSum(const Image& image, const BaseRect<int>& r) {
    long long sum = 0;
    for (int y = r.top; y < r.bottom; ++y)
        for (int x = r.left; x < r.right; ++x) sum += image.pixel(x, y)[0];
    return sum;
}

}  // namespace

// The bit permutations are what turning or mirroring the image does to its census codes.
TEST(WeakClassifiers, BitMatricesFollowTheImage) {
    EXPECT_EQ(WeakClassifierRmct::bitRotationMatrix[1], 32);
    EXPECT_EQ(WeakClassifierRmct::bitFlipMatrix[1], 4);
    for (const int* m : {WeakClassifierRmct::bitRotationMatrix, WeakClassifierRmct::bitFlipMatrix}) {
        EXPECT_EQ(m[0], 0);
        EXPECT_EQ(m[255], 255);
    }
    for (int code = 0; code < 256; ++code) {
        int r = code;
        for (int k = 0; k < 4; ++k) r = WeakClassifierRmct::bitRotationMatrix[r];
        EXPECT_EQ(r, code);
        EXPECT_EQ(WeakClassifierRmct::bitFlipMatrix[WeakClassifierRmct::bitFlipMatrix[code]], code);
    }

    const Image image = randomImage(13, 9, LQ::COLOR_MODE_MONO, 5);
    Image rmct, rmctTurned, rmctMirrored;
    LQ::computeRmct(image, rmct);
    LQ::computeRmct(turned(image), rmctTurned);
    LQ::computeRmct(mirrored(image), rmctMirrored);
    for (int y = 1; y < image.height() - 1; ++y)
        for (int x = 1; x < image.width() - 1; ++x) {
            const int code = rmct.pixel(x, y)[0];
            const BasePoint<int> p = rotatePointOnSize(BasePoint<int>(x, y), image.size());
            const BasePoint<int> q = flipPointOnSize(BasePoint<int>(x, y), image.size());
            ASSERT_EQ(rmctTurned.pixel(p.x, p.y)[0], WeakClassifierRmct::bitRotationMatrix[code]) << x << "," << y;
            ASSERT_EQ(rmctMirrored.pixel(q.x, q.y)[0], WeakClassifierRmct::bitFlipMatrix[code]) << x << "," << y;
        }
}

// Whole turns and mirrors of every kind come back in test_cascade; here the point and bin moves.
TEST(WeakClassifiers, TurnsMoveTheirPointsAndBins) {
    const BaseSize<int> window(24, 29);
    const BaseSize<int> turnedWindow(29, 24);
    EXPECT_EQ(rotatePointOnSize(BasePoint<int>(0, 0), window), BasePoint<int>(0, 23));
    EXPECT_EQ(rotatePointOnSize(BasePoint<int>(0, 23), turnedWindow), BasePoint<int>(23, 28));

    // a turn moves an orientation by three bins, a mirror negates it
    WeakClassifierHog sector;
    sector.setSector(4);
    sector.rotate(window);
    EXPECT_EQ(sector.getSector(), 1);
    for (int s : {0, 3}) {
        sector.setSector(s);
        sector.flip(window);
        EXPECT_EQ(sector.getSector(), s);
    }
    sector.setSector(1);
    sector.flip(window);
    EXPECT_EQ(sector.getSector(), 5);

    // the two transforms don't commute
    std::vector<LQ::schar> table = randomTable(1);
    WeakClassifierRmct rmct(BasePoint<int>(3, 7));
    rmct.setData(table.data());
    WeakClassifierRmct a = rmct, b = rmct;
    a.flip(window);
    a.rotate(window);
    b.rotate(window);
    b.flip(turnedWindow);
    EXPECT_FALSE(a == b);
}

// Evaluation against sums taken pixel by pixel, through offsets made for real strides.
TEST(WeakClassifiers, LookUpIndicesMatchDirectSums) {
    Image parent;
    const Image image = randomView(30, 26, LQ::COLOR_MODE_MONO, 9, parent);
    Image integral;
    LQ::computeIntegral(image, integral);
    const unsigned int* sums = reinterpret_cast<const unsigned int*>(integral.data());
    const int stride = static_cast<int>(integral.stripLength() / 4);
    std::vector<LQ::schar> table = randomTable(2);

    const HaarCase cases[] = {{BaseRect<int>(1, 2, 21, 18), BaseRect<int>(5, 6, 11, 10)},
                              {BaseRect<int>(0, 0, 30, 26), BaseRect<int>()},
                              {BaseRect<int>(3, 3, 9, 7), BaseRect<int>(3, 3, 9, 7)}};
    for (const HaarCase& c : cases) {
        WeakClassifierHaar haar;
        haar.set(c.first, c.second, 99);
        haar.setData(table.data());
        haar.setStripLength(stride);
        const long long a1 = c.first.area(), a2 = c.second.area();
        const long long s1 = boxSum(image, c.first), s2 = boxSum(image, c.second);
        long long expected = 0;
        if (c.second.width() == 0)
            expected = 127 + s1 / (2 * a1);
        else if (a1 != a2)
            expected = 127 + (a1 * s2 - a2 * s1) / (2 * a2 * (a1 - a2));
        EXPECT_EQ(haar.index(sums), expected) << c.first;
    }
    Image zeroIntegral;
    LQ::computeIntegral(filled(8, 8, 0), zeroIntegral);
    WeakClassifierHaar single;
    single.set(BaseRect<int>(1, 1, 5, 6), BaseRect<int>());
    single.setStripLength(zeroIntegral.stripLength() / 4);
    EXPECT_EQ(single.index(reinterpret_cast<const unsigned int*>(zeroIntegral.data())), 127);

    // HOG: the bin's share of its block, against per-pixel sums of the integral HOG
    const BaseRect<int> roi(2, 3, 26, 22);
    Image hogImage;
    LQ::computeIntegralHog(image, hogImage, roi, LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
    const unsigned int* h = reinterpret_cast<const unsigned int*>(hogImage.data());
    auto channelSum = [&](const BaseRect<int>& r, int channel) {
        auto at = [&](int x, int y) { return h[(y * hogImage.width() + x) * 7 + channel]; };
        return at(r.right, r.bottom) + at(r.left, r.top) - at(r.right, r.top) - at(r.left, r.bottom);
    };
    for (int sector = 0; sector < 6; ++sector) {
        WeakClassifierHog hog;
        hog.setBlock(BaseRect<int>(4, 5, 20, 19));
        hog.setCell(BaseRect<int>(6, 8, 12, 13));
        hog.setSector(sector);
        hog.setData(table.data());
        hog.moveRoi(roi);
        const BaseRect<int> cell(4, 5, 10, 10), block(2, 2, 18, 16);
        unsigned long long expected = (static_cast<unsigned long long>(channelSum(cell, sector)) << 8) /
                                      (channelSum(block, 6) + 1ull);
        EXPECT_EQ(hog.index(h), static_cast<int>(expected)) << sector;
    }
    const Image flat = filled(12, 12, 77);
    LQ::computeIntegralHog(flat, hogImage, flat.rect(), LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
    WeakClassifierHog quiet;
    quiet.setBlock(BaseRect<int>(1, 1, 10, 10));
    quiet.setCell(BaseRect<int>(2, 2, 5, 5));
    quiet.moveRoi(flat.rect());
    EXPECT_EQ(quiet.index(reinterpret_cast<const unsigned int*>(hogImage.data())), 0);
}

// The Haar quotient found by multiplication is the exact integer quotient: at multiples of
// the divisor and one off, either sign, negative and no divisor, both sides of the trusted
// range. Rectangle sums are set directly at their bottom-right corners.
TEST(WeakClassifiers, HaarQuotientIsExactEverywhere) {
    const int stride = 160;
    const HaarCase cases[] = {{BaseRect<int>(1, 1, 38, 30), BaseRect<int>(5, 4, 20, 17)},
                          {BaseRect<int>(1, 1, 5, 4), BaseRect<int>(2, 2, 4, 3)},
                          {BaseRect<int>(1, 1, 121, 101), BaseRect<int>(10, 10, 50, 41)},
                          {BaseRect<int>(3, 3, 7, 7), BaseRect<int>(1, 1, 10, 10)},
                          {BaseRect<int>(1, 2, 61, 40), BaseRect<int>()},
                          {BaseRect<int>(2, 2, 9, 8), BaseRect<int>(2, 2, 9, 8)}};
    std::mt19937 random(17);
    long long fastChecks = 0, slowChecks = 0;
    for (const HaarCase& c : cases) {
        WeakClassifierHaar haar;
        haar.set(c.first, c.second);
        haar.setStripLength(stride);
        std::vector<unsigned int> integral(stride * 130, 0);
        const size_t firstCorner = c.first.bottom * stride + c.first.right;
        const size_t secondCorner = c.second.bottom * stride + c.second.right;
        const auto check = [&](long long s1, long long s2) {
            if (s1 < INT_MIN || s1 > INT_MAX || s2 < INT_MIN || s2 > INT_MAX) return;
            // an empty second rectangle has all corners at 0, where the first has none
            integral[firstCorner] = static_cast<unsigned int>(s1);
            if (c.second.width()) integral[secondCorner] = static_cast<unsigned int>(s2);
            const long long sum2 = c.second.width() ? s2 : 0;
            const long long numerator = haar.firstFactor * sum2 - haar.secondFactor * s1;
            // quotients far outside any table are left out: 127 + quotient must stay an int
            if (haar.divisor && std::llabs(numerator / haar.divisor) > (1 << 30)) return;
            const long long expected = haar.divisor ? 127 + numerator / haar.divisor : 0;
            ASSERT_EQ(haar.index(integral.data()), expected) << c.first << " " << s1 << " " << s2;
            ASSERT_EQ(haar.dividedIndex(integral.data()), expected);
            (std::llabs(numerator) < WeakClassifierHaar::kExactRange ? fastChecks : slowChecks) += 1;
        };
        const long long a1 = c.first.area(), a2 = c.second.area();
        const long long d = haar.divisor ? std::llabs(haar.divisor) : 1;
        // second sums that make a1 * s2 a multiple of the divisor, times growing factors
        const long long unit = d / std::gcd(a1, d);
        for (long long m = 1; m < (1ll << 40); m = m * 3 + 1)
            for (long long sign : {-1, 1})
                for (long long delta : {-1, 0, 1})
                    for (long long s1 = -2; s1 <= 2; ++s1) {
                        check(s1, sign * m * unit + delta);
                        if (c.second.width() == 0) check(sign * m * d + delta + s1, 0);
                    }
        // numerators just inside and just outside the trusted range
        const long long factor = c.second.width() ? a1 : 1;
        for (long long sign : {-1, 1})
            for (long long delta = -3; delta <= 3; ++delta) {
                const long long s = sign * (WeakClassifierHaar::kExactRange / factor) + delta;
                c.second.width() ? check(0, s) : check(-s, 0);
                c.second.width() ? check(a2 ? 1 : 0, s) : check(-s + 1, 0);
            }
        for (int k = 0; k < 20000; ++k) check(static_cast<int>(random()), static_cast<int>(random()));
    }
    EXPECT_GT(fastChecks, 10000);
    EXPECT_GT(slowChecks, 100);
}

TEST(WeakClassifiers, AbsFeaturePassesTheTablesPassingRange) {
    std::vector<LQ::schar> table(256, -5);
    for (int i = 130; i <= 150; ++i) table[i] = 10;
    table[140] = -1;  // inside the range: passes anyway
    WeakClassifierHaar haar;
    haar.set(BaseRect<int>(0, 0, 1, 1), BaseRect<int>());
    haar.setData(table.data());
    AbsFeature feature(haar, 3);
    feature.setStripLength(2 * 4);
    unsigned int fake[4] = {0, 0, 0, 0};
    // rectangle sums of pixels are never negative
    for (int s = 0; s <= 257; ++s) {
        fake[3] = static_cast<unsigned int>(s);
        const int index = 127 + s / 2;
        EXPECT_EQ(feature.passes(fake), index >= 130 && index <= 150) << s;
    }
    std::vector<LQ::schar> low(256, -5);
    haar.setData(low.data());
    AbsFeature none(haar, 3);
    EXPECT_GT(none.lowerBound, none.upperBound);
}
