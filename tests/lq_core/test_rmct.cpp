#include <gtest/gtest.h>

#include <algorithm>

#include "LQ_Gradients.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
const int kOrder[8][2] = {{-1, -1}, {0, -1}, {1, -1}, {-1, 0}, {1, 0}, {-1, 1}, {0, 1}, {1, 1}};

int codeAt(const Image& image, int x, int y) {
    int sum = 20, code = 0;
    for (const auto& d : kOrder) sum += image.pixel(x + d[0], y + d[1])[0];
    for (const auto& d : kOrder) code = code * 2 + (image.pixel(x + d[0], y + d[1])[0] > sum / 8);
    return code;
}
}  // namespace

TEST(RmctTransform, EveryPixelFollowsTheNeighbourRuleAtEverySize) {
    for (int width = 1; width <= 37; width += (width < 12 ? 1 : 5))
        for (int height = 1; height <= 7; ++height)
            for (bool asView : {false, true}) {
                Image parent;
                const Image image = asView ? randomView(width, height, LQ::COLOR_MODE_MONO, width * 16 + height, parent)
                                           : randomImage(width, height, LQ::COLOR_MODE_MONO, width * 16 + height);
                Image census(Size(width, height), LQ::COLOR_MODE_RMCT);
                for (const Rect& rect : {Rect(-4, -2, width + 9, height + 1), Rect(), Rect(1, 0, width, height - 1),
                                         Rect(0, 1, width - 1, height), Rect(1, 1, width - 1, height - 1)}) {
                    for (int y = 0; y < height; ++y) std::fill(census.row(y), census.row(y) + width, 0xA5);
                    LQ::computeRmct(image, census, rect);
                    // the interior codes, then the border lines that the clipped rect reaches
                    std::vector<int> expected(width * height, 0);
                    const auto at = [&](int x, int y) -> int& { return expected[y * width + x]; };
                    for (int y = 1; y + 1 < height; ++y)
                        for (int x = 1; x + 1 < width; ++x) at(x, y) = codeAt(image, x, y);
                    const Rect r = rect.intersect(image.rect());
                    for (int x = r.left; x < r.right && r.width() >= 3 && r.height() >= 3; ++x) {
                        if (r.top == 0) at(x, 0) = at(x, 1);
                        if (r.bottom == height) at(x, height - 1) = at(x, height - 2);
                    }
                    for (int y = r.top; y < r.bottom && r.width() >= 3 && r.height() >= 3; ++y) {
                        if (r.left == 0) at(0, y) = at(1, y);
                        if (r.right == width) at(width - 1, y) = at(width - 2, y);
                    }
                    for (int y = 0; y < height; ++y)
                        for (int x = 0; x < width; ++x)
                            ASSERT_EQ(census.pixel(x, y)[0], at(x, y)) << width << "x" << height << (asView ? " view" : "")
                                                                      << " rect " << rect << " at " << x << "," << y;
                }
            }

    // the pixel form: offsets in the natural order agree, reversed they mirror the bits
    const Image image = randomImage(9, 4, LQ::COLOR_MODE_MONO, 77);
    const int s = static_cast<int>(image.stripLength());
    int natural[8], reversed[8];
    for (int i = 0; i < 8; ++i) natural[i] = reversed[7 - i] = kOrder[i][1] * s + kOrder[i][0];
    for (int x = 1; x < 8; ++x) {
        const int code = codeAt(image, x, 2);
        int mirrored = 0;
        for (int b = 0; b < 8; ++b) mirrored |= ((code >> b) & 1) << (7 - b);
        EXPECT_EQ(LQ::computeRmctPixel(image.pixel(x, 2), natural), code);
        EXPECT_EQ(LQ::computeRmctPixel(image.pixel(x, 2), reversed), mirrored);
    }
}

TEST(RmctTransform, BitDifferencesAndTheirChecks) {
    const unsigned char* bits = LQ::getNumbits256();
    EXPECT_EQ(bits[0] + bits[255] + bits[0xB7] + bits[0x80], 0 + 8 + 6 + 1);

    Image parentA, parentB;
    const Image a = randomView(11, 7, LQ::COLOR_MODE_RMCT, 1, parentA), b = randomView(11, 7, LQ::COLOR_MODE_RMCT, 2, parentB);
    const auto differ = [&](int ax, int ay, int bx, int by) { return bits[a.pixel(ax, ay)[0] ^ b.pixel(bx, by)[0]]; };
    Image target(a.size(), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < 7; ++y) std::fill(target.row(y), target.row(y) + 11, 99);
    const Rect rect(2, 1, 9, 5);
    LQ::bitDiff(a, b, target, rect);
    unsigned int total = 0, window = 0;
    for (int y = 0; y < 7; ++y)
        for (int x = 0; x < 11; ++x) {
            total += differ(x, y, x, y);
            ASSERT_EQ(target.pixel(x, y)[0], rect.contains(LQ::BasePoint<int>(x, y)) ? differ(x, y, x, y) : 99);
        }
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 4; ++x) window += differ(5 + x, 1 + y, 2 + x, 4 + y);
    EXPECT_EQ(LQ::bitDiffSum(a, b), total);
    EXPECT_EQ(LQ::bitDiffSum(a, b, 5, 1, 2, 4, 4, 3), window);
    EXPECT_EQ(LQ::bitDiffSum(a, b, 5, 1, 2, 4, 4, 0) + LQ::bitDiffSum(a, b, 5, 1, 2, 4, -1, 3), 0u);

    const Image mono = randomImage(11, 7, LQ::COLOR_MODE_MONO, 4), narrow = randomImage(10, 7, LQ::COLOR_MODE_RMCT, 5);
    const std::pair<std::function<void()>, const char*> failures[] = {
        {[&] { LQ::bitDiff(a, b, target, Rect(0, 0, 12, 7)); }, "(source1.rect()).contains(rect)"},
        {[&] { LQ::bitDiff(mono, b, target, rect); }, "(source1).colorMode() == (COLOR_MODE_RMCT)"},
        {[&] { LQ::bitDiff(a, mono, target, rect); }, "(source2).colorMode() == (COLOR_MODE_RMCT)"},
        {[&] { LQ::bitDiff(a, narrow, target, rect); }, "(source1).size() == (source2.size())"},
        {[&] { LQ::bitDiffSum(a, mono); }, "(source1).colorMode() == ((source2).colorMode())"},
        {[&] { LQ::bitDiffSum(a, narrow, 0, 0, 0, 0, 1, 1); }, "(source1).size() == ((source2).size())"},
        {[&] { LQ::computeRmct(a, target); }, "(image).colorMode() == (COLOR_MODE_MONO)"},
    };
    for (const auto& failure : failures) EXPECT_EQ(catchCheck(failure.first).expression, failure.second);
    EXPECT_EQ(catchCheck(failures[3].first).tail, "have Size(11, 7), but need Size(10, 7)");
}

// ---- the vector rows of the census, integral, integral HOG and Sobel kernels -------------

namespace {
// Variant 0 is the scalar row, then NEON (SIMDe on x86), SSE2 and AVX2 where they exist.
#if defined(LQ_HAVE_NEON)
#define NEON_ROW(f) LQ::f##Neon
#else
#define NEON_ROW(f) nullptr
#endif
#if defined(LQ_HAVE_SSSE3)
#define SSE_ROW(f) LQ::f##Sse
#define AVX2_ROW(f) (__builtin_cpu_supports("avx2") ? LQ::f##Avx2 : nullptr)
#else
#define SSE_ROW(f) nullptr
#define AVX2_ROW(f) nullptr
#endif
template <class F>
std::vector<F> variants(std::initializer_list<F> all) {
    std::vector<F> present;
    for (F f : all)
        if (f) present.push_back(f);
    return present;
}

// Random rows of every width in exact-size buffers, so that an access past a row shows under
// the sanitizer: plain, extremes (0 and 255: the largest sums and gradients) and near-flat.
// run(kernel, rows, width) gives a kernel's output; every variant must give the scalar one.
template <class F, class Run>
void compareRows(const std::vector<F>& kernels, int minWidth, Run run) {
    std::mt19937 random(43);
    for (int width = minWidth; width <= 99; ++width)
        for (int kind = 0; kind < 3; ++kind) {
            std::vector<unsigned char> rows[3];
            for (auto& row : rows) {
                row = randomBytes(width, random);
                for (auto& b : row) b = kind == 1 ? (b & 1 ? 255 : 0) : kind == 2 ? 100 + b % 5 : b;
            }
            const auto expected = run(kernels[0], rows, width);
            for (size_t v = 1; v < kernels.size(); ++v)
                ASSERT_EQ(run(kernels[v], rows, width), expected) << "variant " << v << ", width " << width;
        }
}

}  // namespace

TEST(FeatureRows, VectorRowsEqualScalarRows) {
    using Census = decltype(&LQ::rmctRowScalar);
    compareRows(variants<Census>({LQ::rmctRowScalar, NEON_ROW(rmctRow), SSE_ROW(rmctRow), AVX2_ROW(rmctRow)}), 3,
                [](Census f, const std::vector<unsigned char>* rows, int width) {
                    std::vector<unsigned char> out(width, 77);  // the end columns stay untouched
                    f(rows[0].data(), rows[1].data(), rows[2].data(), out.data(), width);
                    return out;
                });
    using Sobel = decltype(&LQ::sobelRowScalar);
    compareRows(variants<Sobel>({LQ::sobelRowScalar, NEON_ROW(sobelRow), SSE_ROW(sobelRow)}), 3,
                [](Sobel f, const std::vector<unsigned char>* rows, int width) {
                    std::vector<signed char> out(2 * width, 55);
                    f(rows[0].data(), rows[1].data(), rows[2].data(), out.data(), width);
                    return out;
                });
    // previous sums near the top of the range: wrapping must wrap alike
    using Integral = decltype(&LQ::integralRowScalar);
    compareRows(variants<Integral>({LQ::integralRowScalar, NEON_ROW(integralRow), SSE_ROW(integralRow), AVX2_ROW(integralRow)}), 1,
                [](Integral f, const std::vector<unsigned char>* rows, int width) {
                    std::vector<unsigned int> above(width + 1, 0xFFFFF000u - width), out(width + 1, 5);
                    f(rows[0].data(), above.data(), out.data(), width);
                    return out;
                });
    using Hog = decltype(&LQ::integralHogRowScalar);
    for (int bins : {6, 12})
        compareRows(variants<Hog>({LQ::integralHogRowScalar, NEON_ROW(integralHogRow), SSE_ROW(integralHogRow), AVX2_ROW(integralHogRow)}), 3,
                    [bins](Hog f, const std::vector<unsigned char>* rows, int width) {
                        const unsigned char* table = bins == 12 ? LQ::getHogSigned12() : LQ::getHogUnsigned6();
                        std::vector<unsigned int> previous((width + 1) * (bins + 1)), out(previous.size(), 7);
                        for (size_t k = 0; k < previous.size(); ++k) previous[k] = 0xFFFF0000u + 977 * k;
                        f(rows[0].data(), rows[1].data(), rows[2].data(), width, table, bins, previous.data(), out.data());
                        return out;
                    });
}
