#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <random>
#include <tuple>

#include "LQ_ColorSpaceConversion.h"
#include "LQ_Depth.h"
#include "LQ_RmctTransform.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
Image pixels(int width, int height, LQ::ColorMode mode, std::initializer_list<int> bytes) {
    Image image(Size(width, height), mode);
    int i = 0;
    for (int b : bytes) image.data()[i++] = static_cast<unsigned char>(b);
    return image;
}
std::vector<int> bytesOf(const Image& image, int x, int y) {
    std::vector<int> bytes;
    for (int c = 0; c < image.depth(); ++c) bytes.push_back(image.pixel(x, y)[c]);
    return bytes;
}
}  // namespace

TEST(ColorConversion, FixedPointLumaChromaAndFloatBack) {
    // white, black, pure red, green, blue in BGR order
    const Image bgr = pixels(5, 1, LQ::COLOR_MODE_BGR, {255, 255, 255, 0, 0, 0, 0, 0, 255, 0, 255, 0, 255, 0, 0});
    Image yuv;
    LQ::bgrToYuv(bgr, yuv, Rect());
    EXPECT_EQ(bytesOf(yuv, 0, 0), (std::vector<int>{235, 128, 128}));
    EXPECT_EQ(bytesOf(yuv, 1, 0), (std::vector<int>{16, 128, 128}));
    // red: Y = (66 * 255 >> 8) + 16, U = (-38 * 255 >> 8) + 128 with an arithmetic shift
    EXPECT_EQ(bytesOf(yuv, 2, 0), (std::vector<int>{81, 90, 239}));
    EXPECT_EQ(bytesOf(yuv, 3, 0), (std::vector<int>{144, 54, 34}));
    EXPECT_EQ(bytesOf(yuv, 4, 0), (std::vector<int>{40, 239, 110}));
    Image mono, again;
    LQ::bgrToMono(bgr, mono, Rect());
    LQ::toMono(yuv, again, Rect());
    EXPECT_TRUE(samePixels(mono, again));
    LQ::rgbToMono(pixels(1, 1, LQ::COLOR_MODE_RGB, {255, 0, 0}), mono, Rect());
    EXPECT_EQ(mono.pixel(0, 0)[0], 81);
    LQ::rgbaToMono(pixels(1, 1, LQ::COLOR_MODE_RGBA, {0, 0, 255, 9}), mono, Rect());
    EXPECT_EQ(mono.pixel(0, 0)[0], 40);

    LQ::monoToYuv(pixels(2, 1, LQ::COLOR_MODE_MONO, {255, 0}), yuv, Rect());
    EXPECT_EQ(bytesOf(yuv, 0, 0), (std::vector<int>{235, 128, 128}));

    // no offset of 16 on the way back; clamping at both ends
    Image back;
    LQ::yuvToBgr(pixels(3, 1, LQ::COLOR_MODE_YUV, {128, 128, 128, 250, 128, 255, 10, 0, 128}), back, Rect());
    EXPECT_EQ(bytesOf(back, 0, 0), (std::vector<int>{128, 128, 128}));
    EXPECT_EQ(bytesOf(back, 1, 0), (std::vector<int>{250, 161, 255}));  // G = 250 - 127 * 0.698001
    EXPECT_EQ(bytesOf(back, 2, 0), (std::vector<int>{0, 53, 10}));      // B = 10 - 128 * 1.732446 < 0
    LQ::yuvToRgba(pixels(1, 1, LQ::COLOR_MODE_YUV, {250, 128, 255}), back, Rect());
    EXPECT_EQ(bytesOf(back, 0, 0), (std::vector<int>{255, 161, 250, 255}));
}

TEST(ColorConversion, ChannelOrdersSpreadsAndScaledModes) {
    const Image bgr = pixels(1, 1, LQ::COLOR_MODE_BGR, {1, 2, 3});
    Image out;
    LQ::bgrToRgb(bgr, out, Rect());
    EXPECT_EQ(bytesOf(out, 0, 0), (std::vector<int>{3, 2, 1}));
    LQ::bgrToRgba(bgr, out, Rect());
    EXPECT_EQ(bytesOf(out, 0, 0), (std::vector<int>{3, 2, 1, 255}));
    LQ::rgbaToBgr(pixels(1, 1, LQ::COLOR_MODE_RGBA, {1, 2, 3, 4}), out, Rect());
    EXPECT_EQ(bytesOf(out, 0, 0), (std::vector<int>{3, 2, 1}));
    LQ::toRgba(pixels(1, 1, LQ::COLOR_MODE_MONO, {9}), out, Rect());
    EXPECT_EQ(bytesOf(out, 0, 0), (std::vector<int>{9, 9, 9, 255}));

    Image wide(Size(3, 1), LQ::COLOR_MODE_MONO16);
    const unsigned short samples[3] = {100, 300, 2};
    std::memcpy(wide.data(), samples, sizeof(samples));
    LQ::mono16ToMono(wide, out, 1.0f, Rect());
    EXPECT_EQ(bytesOf(out, 1, 0), std::vector<int>{255});
    LQ::toRgba(wide, out, Rect());  // factor 100
    EXPECT_EQ(bytesOf(out, 2, 0), (std::vector<int>{200, 200, 200, 255}));
    LQ::monoToFloat(pixels(1, 1, LQ::COLOR_MODE_MONO, {3}), out, 0.5f, Rect());
    EXPECT_EQ(out.row<float>(0)[0], 1.5f);
    Image floats(Size(3, 1), LQ::COLOR_MODE_FLOAT);
    const float values[3] = {-0.5f, 2.559f, 7.f};
    std::memcpy(floats.data(), values, sizeof(values));
    LQ::toBgr(floats, out, Rect());  // factor 100: 0, 255.9 truncated, 700 clamped
    EXPECT_EQ(bytesOf(out, 0, 0), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(bytesOf(out, 1, 0), (std::vector<int>{255, 255, 255}));
    LQ::floatToMono(floats, out, 10.f, 1.f, Rect());
    EXPECT_EQ(bytesOf(out, 1, 0), std::vector<int>{12});
    LQ::floatToFloat2(floats, out, Rect());
    EXPECT_EQ(out.row<float>(0)[4], 7.f);
    EXPECT_EQ(out.row<float>(0)[5], 0.f);
}

TEST(ColorConversion, RectanglesAndChecks) {
    const Image bgr = randomImage(6, 5, LQ::COLOR_MODE_BGR, 3);
    Image full, part(Size(6, 5), LQ::COLOR_MODE_MONO);
    LQ::bgrToMono(bgr, full, Rect());
    std::memset(part.data(), 7, 30);
    unsigned char* buffer = part.data();
    LQ::bgrToMono(bgr, part, Rect(5, 4, 6, 5));  // one pixel at the corner
    EXPECT_EQ(part.data(), buffer);              // the right size and mode: no new buffer
    EXPECT_EQ(part.pixel(5, 4)[0], full.pixel(5, 4)[0]);
    EXPECT_EQ(part.pixel(4, 4)[0], 7);

    FailedCheck check = catchCheck([&] { LQ::bgrToMono(bgr, part, Rect(0, 0, 7, 5)); });
    EXPECT_EQ(check.expression, "(source.rect()).contains(rect)");
    EXPECT_EQ(check.tail, "Rect(0, 0, 7, 5) is out of Rect(0, 0, 6, 5)");
    check = catchCheck([&] { LQ::rgbToYuv(bgr, part, Rect()); });
    EXPECT_EQ(check.expression, "(source).colorMode() == (COLOR_MODE_RGB)");
    EXPECT_EQ(check.tail, "have COLOR_MODE_BGR, but need COLOR_MODE_RGB");
    check = catchCheck([&] { LQ::toMono(Image(Size(2, 2), LQ::COLOR_MODE_MONO16), part, Rect()); });
    EXPECT_EQ(check.expression, "0");
    EXPECT_EQ(check.tail, "color mode not handled: COLOR_MODE_MONO16");
    check = catchCheck([&] { LQ::toColorMode(bgr, part, LQ::COLOR_MODE_FLOAT, Rect()); });
    EXPECT_EQ(check.tail, "color mode not handled: COLOR_MODE_FLOAT");

    // the feature modes go through the dispatcher too
    Image mono, census, reference;
    LQ::bgrToMono(bgr, mono, Rect());
    LQ::toColorMode(mono, census, LQ::COLOR_MODE_RMCT, Rect());
    LQ::computeRmct(mono, reference, Rect());
    EXPECT_TRUE(samePixels(census, reference));
    LQ::toColorMode(mono, census, LQ::COLOR_MODE_INTEGRAL, Rect());
    EXPECT_EQ(census.size(), Size(7, 6));
}

TEST(ColorConversion, CameraFormats) {
    // 4 x 4 luma 0..15, chroma rows (V, U) pairs: (200, 100) (210, 110) / (220, 120) (230, 130)
    std::vector<unsigned char> nv21(24);
    for (int i = 0; i < 16; ++i) nv21[i] = static_cast<unsigned char>(i);
    const unsigned char chroma[8] = {200, 100, 210, 110, 220, 120, 230, 130};
    std::memcpy(nv21.data() + 16, chroma, 8);
    Image yuv;
    LQ::nv21ToYuv(nv21.data(), Size(4, 4), yuv);
    EXPECT_EQ(bytesOf(yuv, 3, 1), (std::vector<int>{7, 110, 210}));
    EXPECT_EQ(bytesOf(yuv, 0, 2), (std::vector<int>{8, 120, 220}));
    LQ::nv21ToYuvZoom2(nv21.data(), Size(4, 4), yuv);
    ASSERT_EQ(yuv.size(), Size(2, 2));
    EXPECT_EQ(bytesOf(yuv, 0, 0), (std::vector<int>{0, 100, 200}));
    EXPECT_EQ(bytesOf(yuv, 1, 1), (std::vector<int>{10, 130, 230}));

    FailedCheck check = catchCheck([&] { LQ::nv21ToYuv(nv21.data(), Size(4, 3), yuv); });
    EXPECT_EQ(check.expression, "height % 2 == 0");
    EXPECT_EQ(check.tail, "height must be even: 3");
    check = catchCheck([&] { LQ::nv21ToMono(nv21.data(), Size(3, 4), yuv); });
    EXPECT_EQ(check.expression, "size.width % 2 == 0");

    // back to NV21: the odd last row and column are dropped
    LQ::SharedArray<unsigned char> block;
    LQ::nv21ToYuv(nv21.data(), Size(4, 4), yuv);
    LQ::yuvToNv21(yuv, block);
    EXPECT_EQ(0, std::memcmp(block.get(), nv21.data(), 24));
    Image odd = randomImage(5, 5, LQ::COLOR_MODE_YUV, 4);
    LQ::yuvToNv21(odd, block);
    EXPECT_EQ(block[15], odd.pixel(3, 3)[0]);
    EXPECT_EQ(block[16 + 6], odd.pixel(2, 2)[2]);  // the last pair: V, U of (2, 2)
    EXPECT_EQ(block[16 + 7], odd.pixel(2, 2)[1]);
    LQ::yuvToYuy2(pixels(2, 1, LQ::COLOR_MODE_YUV, {10, 100, 201, 20, 103, 50}), block);
    EXPECT_EQ((std::vector<int>{block[0], block[1], block[2], block[3]}), (std::vector<int>{10, 101, 20, 125}));
}

TEST(ColorConversion, DepthRamp) {
    // t = (depth - 500) * 765 / 4500 in three segments; the middle and last wrap their bytes
    const int ramp[][4] = {{500, 0, 0, 0},
                           {5000, 0, 0, 0},
                           {600, 255, 17, 0},
                           {2500, static_cast<unsigned char>(254 - 340), 255, static_cast<unsigned char>(342)},
                           {4000, static_cast<unsigned char>(598), static_cast<unsigned char>(252 - 595), 255}};
    unsigned char r, g, b;
    for (const auto& d : ramp) {
        LQ::pixelToRGB(d[0], r, g, b, 500, 5000);
        EXPECT_EQ((std::vector<int>{r, g, b}), (std::vector<int>{d[1], d[2], d[3]})) << d[0];
    }
    FailedCheck check = catchCheck([&] { LQ::pixelToRGB(1, r, g, b, 7, 7); });
    EXPECT_EQ(check.expression, "(maxDepth) > (minDepth)");
    EXPECT_EQ(check.tail, "7 <= 7");

    Image depth(Size(2, 1), LQ::COLOR_MODE_DEPTH);
    const unsigned short samples[2] = {600, 400};
    std::memcpy(depth.data(), samples, sizeof(samples));
    Image out;
    LQ::toBgr(depth, out, Rect());
    EXPECT_EQ(bytesOf(out, 0, 0), (std::vector<int>{0, 17, 255}));
    LQ::toMono(depth, out, Rect());
    EXPECT_EQ(out.pixel(0, 0)[0], 5);                                   // 255 / 4500 * 100
    EXPECT_EQ(out.pixel(1, 0)[0], static_cast<unsigned char>(-5));      // below the range: wraps
}

namespace {
using Bytes = std::vector<unsigned char>;

// Random rows in exact-size buffers, so that an access past a row shows under the sanitizer:
// plain (kind 0), 0 and 255 only (kind 1: the saturating sums) or near-flat (kind 2).
Bytes testRow(size_t count, std::mt19937& random, int kind) {
    Bytes row = randomBytes(count, random);
    for (auto& b : row) b = static_cast<unsigned char>(kind == 1 ? (b & 1 ? 255 : 0) : kind == 2 ? 100 + b % 4 : b);
    return row;
}

// the NV21 rows of one target row: zoom * width bytes of luma and as many of V, U pairs
template <class Row>
void compareNv21(Row vectorRow, int width, std::mt19937& random) {
    for (int zoom : {1, 2}) {
        const Bytes luma = randomBytes(zoom * width, random), pairs = randomBytes((zoom * width + 1) & ~1, random);
        for (bool flip : {false, true}) {
            Bytes scalar(3 * width, 1), vector(3 * width, 2);
            LQ::nv21RowScalar(luma.data(), pairs.data(), scalar.data(), width, zoom, flip);
            vectorRow(luma.data(), pairs.data(), vector.data(), width, zoom, flip);
            EXPECT_EQ(scalar, vector) << "NV21, width " << width << " zoom " << zoom << " flip " << flip;
        }
    }
}
}  // namespace

#if defined(LQ_HAVE_NEON)
TEST(ColorConversion, NeonRowsEqualScalarRows) {
    std::mt19937 random(21);
    for (int width = 1; width <= 99; ++width) {
        for (int kind = 0; kind < 3; ++kind)
            for (int step : {3, 4})
                for (int r : {0, 2}) {
                    const Bytes in = testRow(step * width, random, kind);
                    Bytes scalar(width, 1), vector(width, 2);
                    LQ::lumaRowScalar(in.data(), scalar.data(), width, step, r, 1, 2 - r);
                    LQ::lumaRowNeon(in.data(), vector.data(), width, step, r);
                    EXPECT_EQ(scalar, vector) << "luma, width " << width << " step " << step << " red at " << r;
                }
        const Bytes yuv = randomBytes(3 * width, random);
        Bytes scalar(width, 1), vector(width, 2);
        LQ::yuvToMonoRowScalar(yuv.data(), scalar.data(), width);
        LQ::yuvToMonoRowNeon(yuv.data(), vector.data(), width);
        EXPECT_EQ(scalar, vector) << "YUV to mono, width " << width;
        compareNv21(LQ::nv21RowNeon, width, random);
    }
}
#endif

#if defined(LQ_HAVE_SSSE3)
TEST(ColorConversion, HostVectorRowsEqualScalarRows) {
    if (!__builtin_cpu_supports("ssse3")) GTEST_SKIP() << "this processor has no SSSE3";
    const bool avx2 = __builtin_cpu_supports("avx2");
    using Row = void (*)(const unsigned char*, unsigned char*, int, int);
    using Move = void (*)(const unsigned char*, unsigned char*, int);
    std::mt19937 random(22);
    for (int width = 1; width <= 99; ++width)
        for (int kind = 0; kind < 3; ++kind) {
            const Bytes in = testRow(3 * width, random, kind), rgba = testRow(4 * width, random, kind);
            for (int r : {0, 2}) {
                Bytes luma(width), luma4(width), yuv(3 * width), rgb(3 * width), four;
                LQ::lumaRowScalar(in.data(), luma.data(), width, 3, r, 1, 2 - r);
                LQ::lumaRowScalar(rgba.data(), luma4.data(), width, 4, r, 1, 2 - r);
                LQ::rgbToYuvRowScalar(in.data(), yuv.data(), width, 3, r);
                LQ::yuvToRgbRowScalar(in.data(), rgb.data(), width, 3, r);
                for (int x = 0; x < width; ++x) four.insert(four.end(), {in[3 * x + r], in[3 * x + 1], in[3 * x + 2 - r], 255});
                const std::tuple<const char*, const Bytes&, const Bytes&, std::vector<Row>> cases[] = {
                    {"luma", in, luma, {LQ::lumaRowSse, avx2 ? LQ::lumaRowAvx2 : nullptr}},
                    {"four-byte luma", rgba, luma4, {avx2 ? LQ::lumaRow4Avx2 : nullptr}},
                    {"to YUV", in, yuv, {LQ::rgbToYuvRowSse, avx2 ? LQ::rgbToYuvRowAvx2 : nullptr}},
                    {"from YUV", in, rgb, {LQ::yuvToRgbRowSse, avx2 ? LQ::yuvToRgbRowAvx2 : nullptr}},
                    {"to four bytes", in, four, {LQ::toFourRowSse}},
                };
                for (const auto& [what, source, expected, rows] : cases)
                    for (Row row : rows) {
                        if (!row) continue;
                        Bytes actual(expected.size(), 2);
                        row(source.data(), actual.data(), width, r);
                        ASSERT_EQ(actual, expected) << what << ", width " << width << " red at " << r << " kind " << kind;
                    }
            }
            // the byte moves: byte 0 of each pixel, spread to three, and bytes 0 and 2 exchanged
            Bytes first(width), spread(3 * width), swapped(in);
            for (int x = 0; x < width; ++x) {
                first[x] = in[3 * x];
                spread[3 * x] = spread[3 * x + 1] = spread[3 * x + 2] = in[3 * x];
                std::swap(swapped[3 * x], swapped[3 * x + 2]);
            }
            Bytes actual(width);
            LQ::channelRowSse(in.data(), actual.data(), width, 0);
            ASSERT_EQ(actual, first) << width;
            const std::tuple<const Bytes&, const Bytes&, std::vector<Move>> moves[] = {
                {first, spread, {LQ::spreadRowSse, avx2 ? LQ::spreadRowAvx2 : nullptr}},
                {in, swapped, {LQ::swapRowSse, avx2 ? LQ::swapRowAvx2 : nullptr}},
            };
            for (const auto& [source, expected, rows] : moves)
                for (Move row : rows)
                    // the AVX2 rows store aligned after a lead-in: try other starts of the target
                    for (int at : {0, 1, 7, 16, 29}) {
                        if (!row) continue;
                        Bytes shifted(expected.size() + 32, 3);
                        row(source.data(), shifted.data() + at, width);
                        ASSERT_EQ(expected, Bytes(shifted.begin() + at, shifted.begin() + at + expected.size())) << width << " at " << at;
                    }
            compareNv21(LQ::nv21RowSse, width, random);
            if (avx2) compareNv21(LQ::nv21RowAvx2, width, random);
        }
}
#endif

TEST(ColorConversion, EverySizeStrideAndRectangle) {
    using Convert = std::function<void(const Image&, Image&, const Rect&)>;
    const std::vector<std::pair<LQ::ColorMode, Convert>> conversions = {
        {LQ::COLOR_MODE_BGR, LQ::bgrToYuv},   {LQ::COLOR_MODE_RGB, LQ::rgbToYuv},
        {LQ::COLOR_MODE_RGBA, LQ::rgbaToYuv}, {LQ::COLOR_MODE_MONO, LQ::monoToYuv},
        {LQ::COLOR_MODE_BGR, LQ::bgrToMono},  {LQ::COLOR_MODE_RGBA, LQ::rgbaToMono},
        {LQ::COLOR_MODE_YUV, LQ::yuvToMono},  {LQ::COLOR_MODE_BGR, LQ::bgrToRgb},
        {LQ::COLOR_MODE_RGB, LQ::rgbToRgba},  {LQ::COLOR_MODE_RGBA, LQ::rgbaToBgr},
        {LQ::COLOR_MODE_MONO, LQ::monoToBgr}, {LQ::COLOR_MODE_MONO, LQ::monoToRgba},
        {LQ::COLOR_MODE_YUV, LQ::yuvToBgr},   {LQ::COLOR_MODE_YUV, LQ::yuvToRgba},
        {LQ::COLOR_MODE_RGB, LQ::rgbToMono},  {LQ::COLOR_MODE_BGR, LQ::bgrToRgba},
        {LQ::COLOR_MODE_RGB, LQ::rgbToBgr},   {LQ::COLOR_MODE_MONO, LQ::monoToRgb},
        {LQ::COLOR_MODE_YUV, LQ::yuvToRgb},
        {LQ::COLOR_MODE_MONO16, [](const Image& s, Image& t, const Rect& r) { LQ::mono16ToRgb(s, t, 0.5f, r); }},
        {LQ::COLOR_MODE_DEPTH, [](const Image& s, Image& t, const Rect& r) { LQ::depthToRgb(s, t, 10, 60000, r); }},
    };
    // small sizes for every edge, and widths that reach the 16- and 32-pixel steps
    std::vector<Size> sizes;
    for (int h = 1; h <= 9; ++h)
        for (int w = 1; w <= 9; ++w) sizes.emplace_back(w, h);
    for (int w : {16, 17, 33, 40}) sizes.emplace_back(w, 3);
    unsigned seed = 0;
    for (const Size& size : sizes) {
        for (const auto& [mode, convert] : conversions) {
            Image parent, full, fromView;
            const Image view = randomView(size.width, size.height, mode, ++seed, parent);
            convert(Image(view), full, Rect());
            convert(view, fromView, Rect());
            ASSERT_TRUE(samePixels(full, fromView)) << size << " from " << mode;

            // the inner rectangle (or the last pixel) only, the rest left as it was
            const Rect inner = size.width > 2 && size.height > 2 ? Rect(1, 1, size.width - 1, size.height - 1)
                                                                 : Rect(size.width - 1, size.height - 1, size.width, size.height);
            Image part(size, full.colorMode());
            for (int y = 0; y < size.height; ++y) std::memset(part.row(y), 0xA5, size.width * part.depth());
            convert(view, part, inner);
            for (int y = 0; y < size.height; ++y)
                for (int x = 0; x < size.width; ++x) {
                    const bool inside = inner.contains(LQ::PointI(x, y));
                    for (int c = 0; c < part.depth(); ++c)
                        ASSERT_EQ(part.pixel(x, y)[c], inside ? full.pixel(x, y)[c] : 0xA5)
                            << size << " from " << mode << " at " << x << "," << y;
                }
        }
        if (size.width % 2 || size.height % 2) continue;
        // frames: the mirrored picture is the plain one read from the right
        std::mt19937 random(seed);
        const Bytes nv21 = randomBytes(size.width * size.height * 3 / 2, random);
        for (auto [plain, mirrored] : {std::pair{LQ::nv21ToYuv, LQ::nv21ToYuvFlip},
                                       std::pair{LQ::nv21ToYuvZoom2, LQ::nv21ToYuvZoom2Flip},
                                       std::pair{LQ::nv21ToMono, LQ::nv21ToMonoFlip}}) {
            Image a, b;
            plain(nv21.data(), size, a);
            mirrored(nv21.data(), size, b);
            ASSERT_EQ(a.size(), b.size());
            for (int y = 0; y < a.height(); ++y)
                for (int x = 0; x < a.width(); ++x)
                    ASSERT_EQ(0, std::memcmp(a.pixel(x, y), b.pixel(a.width() - 1 - x, y), a.depth())) << size;
        }
    }
}
