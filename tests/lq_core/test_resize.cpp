#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <functional>
#include <random>
#include <vector>

#include "LQ_ImageResize.h"
#include "LQ_Integral.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
// a small MONO image from its rows
Image mono(int width, int height, std::initializer_list<int> values) {
    Image image(Size(width, height), LQ::COLOR_MODE_MONO);
    auto v = values.begin();
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) image.pixel(x, y)[0] = static_cast<unsigned char>(*v++);
    return image;
}

Image filled(Size size, LQ::ColorMode mode, unsigned char value) {
    Image image(size, mode);
    for (int y = 0; y < size.height; ++y) std::memset(image.row(y), value, static_cast<size_t>(size.width) * image.depth());
    return image;
}

// The 4-bit kernel from its formula, each target byte on its own: no row buffers.
Image bilinear4Reference(const Image& source, Size size) {
    const int ch = source.depth();
    std::vector<int> ci(size.width * ch), ca(size.width * ch), ri(size.height), ra(size.height);
    LQ::EstimateAlphaIndexBase(source.width(), size.width, ci.data(), ca.data(), ch);
    LQ::EstimateAlphaIndexBase(source.height(), size.height, ri.data(), ra.data(), 1);
    const auto across = [&](int y, int i) {
        const unsigned char* row = source.row(std::min(y, source.height() - 1));
        const int here = row[ci[i]], next = row[source.width() > 1 ? ci[i] + ch : ci[i]];
        return (next - here) * ca[i] + here * 16;
    };
    Image out(size, source.colorMode());
    for (int y = 0; y < size.height; ++y)
        for (int i = 0; i < size.width * ch; ++i) {
            const int t = across(ri[y], i), u = across(ri[y] + 1, i);
            out.row(y)[i] = static_cast<unsigned char>(((u - t) * ra[y] + t * 16 + 128) >> 8);
        }
    return out;
}

// resizeImageBilinear from its formula, pixel by pixel
Image bilinear8Reference(const Image& source, float scale) {
    const float stable = LQ::stableMultiplier<float>();
    const int W = source.width(), H = source.height(), d = source.depth();
    const int tw = static_cast<int>(W * scale * stable), th = static_cast<int>(H * scale * stable);
    int origin = 0, step;
    if (scale >= 1) {
        step = std::min(tw > 1 ? (W - 1) * 256 / (tw - 1) : 0, th > 1 ? (H - 1) * 256 / (th - 1) : 0);
    } else {
        origin = static_cast<int>(128 / scale * stable) - 128;
        step = static_cast<int>(256 / scale * stable);
    }
    Image out(Size(tw, th), source.colorMode());
    for (int y = 0; y < th; ++y)
        for (int x = 0; x < tw; ++x) {
            const int px = origin + x * step, py = origin + y * step, ix = px >> 8, iy = py >> 8, fx = px & 255,
                      fy = py & 255;
            const int nx = std::min(ix + 1, W - 1), ny = std::min(iy + 1, H - 1);
            for (int c = 0; c < d; ++c) {
                const int top = ((256 - fx) * source.pixel(ix, iy)[c] + fx * source.pixel(nx, iy)[c]) >> 8;
                const int bottom = ((256 - fx) * source.pixel(ix, ny)[c] + fx * source.pixel(nx, ny)[c]) >> 8;
                out.pixel(x, y)[c] = static_cast<unsigned char>(((256 - fy) * top + fy * bottom) >> 8);
            }
        }
    return out;
}
}  // namespace

TEST(ImageScaling, HalvingPerModeAndRectangle) {
    const Image small = mono(5, 3, {1, 2, 9, 9, 7, 3, 3, 0, 255, 7, 8, 8, 8, 8, 8});
    Image half;
    LQ::zoomImageTwice(small, half, Rect());
    ASSERT_EQ(half.size(), Size(2, 1));  // the odd column and row are dropped
    EXPECT_EQ(half.pixel(0, 0)[0], 2);   // 9 >> 2: truncated, not rounded
    EXPECT_EQ(half.pixel(1, 0)[0], (9 + 9 + 0 + 255) >> 2);

    Image bgr(Size(4, 2), LQ::COLOR_MODE_BGR);
    const unsigned char bytes[2][12] = {{10, 20, 30, 11, 21, 31, 0, 0, 0, 200, 200, 200},
                                        {12, 22, 32, 13, 23, 33, 1, 1, 1, 255, 255, 255}};
    for (int y = 0; y < 2; ++y) std::memcpy(bgr.row(y), bytes[y], 12);
    half = filled(Size(2, 1), LQ::COLOR_MODE_BGR, 77);
    LQ::zoomImageTwice(bgr, half, Rect(1, 0, 2, 1));  // only the second pixel
    EXPECT_EQ(half.pixel(0, 0)[0], 77);
    EXPECT_EQ(half.pixel(1, 0)[0], (0 + 200 + 1 + 255) >> 2);
    LQ::zoomImageTwice(bgr, half, Rect());
    EXPECT_EQ(std::vector<int>(half.pixel(0, 0), half.pixel(0, 0) + 3), (std::vector<int>{11, 21, 31}));  // channels apart

    // depth: only 1 to 4999 count, at least two of them
    Image depth(Size(6, 2), LQ::COLOR_MODE_DEPTH);
    const unsigned short samples[12] = {1000, 2000, 0, 4999, 5000, 10, 0, 6000, 0, 0, 20, 30};
    for (int i = 0; i < 12; ++i) depth.pixel<unsigned short>(i % 6, i / 6)[0] = samples[i];
    LQ::zoomImageTwice(depth, half, Rect());
    EXPECT_EQ(half.pixel<unsigned short>(0, 0)[0], 1500);
    EXPECT_EQ(half.pixel<unsigned short>(1, 0)[0], 0);  // one valid sample
    EXPECT_EQ(half.pixel<unsigned short>(2, 0)[0], 20);  // 5000 is no measurement

    FailedCheck check = catchCheck([&] { LQ::zoomImageTwice(small, half, Rect(0, 0, 3, 1)); });
    EXPECT_EQ(check.expression, "(target.rect()).contains(targetRect)");
    check = catchCheck([&] { LQ::zoomImageTwice(Image(), half, Rect()); });
    EXPECT_EQ(check.expression, "(source).isCreated()");
    check = catchCheck([&] { LQ::zoomImageTwice(Image(Size(4, 4), LQ::COLOR_MODE_FLOAT), half, Rect()); });
    EXPECT_EQ(check.tail, "color mode is not supported: COLOR_MODE_FLOAT");
}

TEST(ImageScaling, AveragingBlocksAndIntegral) {
    // zoom 2.5 on 5 x 5: blocks start at 0 and 2, the last one is one pixel wide
    Image ramp(Size(5, 5), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < 5; ++y)
        for (int x = 0; x < 5; ++x) ramp.pixel(x, y)[0] = static_cast<unsigned char>(10 * y + x);
    Image small;
    LQ::zoomImageAverage(ramp, small, 2.5f, Rect());
    ASSERT_EQ(small.size(), Size(2, 2));
    EXPECT_EQ(small.pixel(0, 0)[0], (0 + 1 + 10 + 11) / 4);
    EXPECT_EQ(small.pixel(1, 0)[0], (2 + 12) / 2);
    EXPECT_EQ(small.pixel(1, 1)[0], 22);  // a copy

    const Image random = randomImage(100, 100, LQ::COLOR_MODE_MONO, 5);
    LQ::zoomImageAverage(random, small, 2.f, Rect());
    ASSERT_EQ(small.size(), Size(50, 50));  // the stable multiplier keeps 100 / 2 at 50
    Image rgb(Size(7, 4), LQ::COLOR_MODE_RGB);
    for (int y = 0; y < 4; ++y)
        for (int i = 0; i < 21; ++i) rgb.row(y)[i] = static_cast<unsigned char>(i % 3 * 100 + y);
    LQ::zoomImageAverage(rgb, small, 3.f, Rect());
    EXPECT_EQ(small.size(), Size(2, 1));
    EXPECT_EQ(small.pixel(1, 0)[2], 200 + 1);  // rows 0 to 2: (0 + 1 + 2) / 3 on top of 200

    // the integral route gives the same blocks and means
    Image integral, fromIntegral;
    LQ::computeIntegral(random, integral);
    for (float zoom : {2.f, 2.5f, 3.7f}) {
        LQ::zoomImageAverage(random, small, zoom, Rect());
        LQ::zoomImageIntegral(integral, fromIntegral, zoom, Rect());
        EXPECT_TRUE(samePixels(fromIntegral, small)) << zoom;
    }

    const std::pair<std::function<void()>, const char*> failures[] = {
        {[&] { LQ::zoomImageAverage(random, small, 1.f, Rect()); }, "(zoom) > (1.f)"},
        {[&] { LQ::zoomImageAverage(Image(Size(4, 4), LQ::COLOR_MODE_DEPTH), small, 2.f, Rect()); },
         "(source.colorMode()) != (COLOR_MODE_DEPTH)"},
        {[&] { LQ::zoomImageAverage(random, small, 2.f, Rect(0, 0, 51, 1)); }, "(target.rect()).contains(targetRect)"},
        {[&] { LQ::zoomImageIntegral(integral, small, 2.f, Rect(0, 0, 52, 2)); }, "(integralRect(integral)).contains(targetRect)"},
        {[&] { LQ::zoomImageIntegral(random, small, 2.f, Rect()); }, "(integral).colorMode() == (COLOR_MODE_INTEGRAL)"},
    };
    for (const auto& [call, expression] : failures) EXPECT_EQ(catchCheck(call).expression, expression);
    EXPECT_EQ(catchCheck([&] { LQ::zoomImageAverage(Image(Size(4, 4), LQ::COLOR_MODE_MONO16), small, 2.f, Rect()); }).tail,
              "color mode is not supported: COLOR_MODE_MONO16");
    EXPECT_EQ(catchCheck([&] { LQ::zoomImageAverage(Image(), small, 2.f, Rect()); }).tail, "image is not created");

    // below 0.5 the accurate resize averages, from 0.5 on it is bilinear
    Image accurate;
    LQ::resizeImageAccurate(random, accurate, 0.49f, Rect());
    LQ::zoomImageAverage(random, small, 1 / 0.49f, Rect());
    EXPECT_TRUE(samePixels(accurate, small));
    LQ::resizeImageAccurate(random, accurate, 0.5f, Rect());
    LQ::resizeImageBilinear(random, small, 0.5f, Rect());
    EXPECT_TRUE(samePixels(accurate, small));
}

TEST(ImageScaling, BilinearSteps) {
    const Image image = randomImage(9, 7, LQ::COLOR_MODE_BGR, 6);
    Image out;
    LQ::resizeImageBilinear(image, out, 1.0f, Rect());
    EXPECT_TRUE(samePixels(out, image));  // step 256, origin 0

    // scale 0.5: every sample midway between four pixels; the across pass is truncated
    // first: (1 + 0) >> 1 = 0 above and (2 + 1) >> 1 = 1 below give 0, not 1
    LQ::resizeImageBilinear(mono(2, 2, {1, 0, 2, 1}), out, 0.5f, Rect());
    ASSERT_EQ(out.size(), Size(1, 1));
    EXPECT_EQ(out.pixel(0, 0)[0], 0);

    // scale 2 on 3 x 5: steps 2 x 256 / 5 = 102 across and 4 x 256 / 9 = 113 down; the
    // smaller serves both, so row 9 reads at 918 / 256 = 3 + 150 / 256
    const Image tall = mono(3, 5, {0, 100, 200, 10, 110, 210, 20, 120, 220, 30, 130, 230, 40, 140, 240});
    LQ::resizeImageBilinear(tall, out, 2.f, Rect());
    ASSERT_EQ(out.size(), Size(6, 10));
    const int top = (2 * 130 + 254 * 230) >> 8, bottom = (2 * 140 + 254 * 240) >> 8;
    EXPECT_EQ(out.pixel(5, 9)[0], (106 * top + 150 * bottom) >> 8);
    // a target one row high makes one term 0, and so the step: every pixel reads (0, 0)
    LQ::resizeImageBilinear(mono(4, 1, {9, 50, 90, 130}), out, 1.5f, Rect());
    ASSERT_EQ(out.size(), Size(6, 1));
    for (int x = 0; x < 6; ++x) EXPECT_EQ(out.pixel(x, 0)[0], 9);

    // depth through the masked mean; at scale 1 every sample is its own pixel, also on the
    // last column and row, and invalid samples come out as 0
    Image depth(Size(3, 2), LQ::COLOR_MODE_DEPTH);
    const unsigned short samples[6] = {1000, 0, 4999, 7000, 12, 3000};
    for (int i = 0; i < 6; ++i) depth.pixel<unsigned short>(i % 3, i / 3)[0] = samples[i];
    LQ::resizeImageBilinear(depth, out, 1.f, Rect());
    const unsigned short expected[6] = {1000, 0, 4999, 0, 12, 3000};
    for (int i = 0; i < 6; ++i) EXPECT_EQ(out.pixel<unsigned short>(i % 3, i / 3)[0], expected[i]) << i;
    Image wide(Size(20, 10), LQ::COLOR_MODE_DEPTH);
    for (int i = 0; i < 200; ++i) wide.pixel<unsigned short>(i % 20, i / 20)[0] = static_cast<unsigned short>(i * 37 % 6000);
    LQ::resizeImageBilinear(wide, out, 0.3f, Rect());  // origin 298, step 853
    EXPECT_EQ(out.pixel<unsigned short>(2, 1)[0], wide.fractionalPixel((298 + 2 * 853) / 256.0f, (298 + 853) / 256.0f));

    FailedCheck check = catchCheck([&] { LQ::resizeImageBilinear(Image(Size(3, 3), LQ::COLOR_MODE_MONO16), out, 2.f, Rect()); });
    EXPECT_EQ(check.tail, "color mode is not supported: COLOR_MODE_MONO16");
    check = catchCheck([&] { LQ::resizeImageBilinear(image, out, 0.5f, Rect(0, 0, 5, 1)); });
    EXPECT_EQ(check.expression, "(target.rect()).contains(targetRect)");
}

TEST(ImageScaling, NearestNeighbour) {
    Image ramp(Size(9, 7), LQ::COLOR_MODE_BGR);
    for (int y = 0; y < 7; ++y)
        for (int x = 0; x < 9; ++x)
            for (int c = 0; c < 3; ++c) ramp.pixel(x, y)[c] = static_cast<unsigned char>(10 * y + x + 100 * c);
    Image out;
    LQ::resizeImageNn(ramp, out, 0.5f, Rect());
    ASSERT_EQ(out.size(), Size(4, 3));
    EXPECT_EQ(out.pixel(3, 2)[1], 100 + 46);
    // 2.5 up: target (9, 4) reads (9 / 2.5, 4 / 2.5) = (3, 1); only that pixel is written
    out = filled(Size(22, 17), LQ::COLOR_MODE_BGR, 7);
    LQ::resizeImageNn(ramp, out, 2.5f, Rect(9, 4, 10, 5));
    EXPECT_EQ(out.pixel(9, 4)[2], 200 + 13);
    EXPECT_EQ(out.pixel(8, 4)[2], 7);
    // pixels of 2 and 4 bytes move whole
    const Image wide = randomImage(11, 5, LQ::COLOR_MODE_FLOAT, 3);
    LQ::resizeImageNn(wide, out, 0.7f, Rect());
    EXPECT_EQ(out.colorMode(), LQ::COLOR_MODE_FLOAT);
    EXPECT_EQ(std::memcmp(out.pixel(5, 2), wide.pixel(7, 2), 4), 0);  // 5 / 0.7 = 7.1, 2 / 0.7 = 2.9

    FailedCheck check = catchCheck([&] { LQ::resizeImageNn(Image(Size(2, 2), LQ::COLOR_MODE_FLOAT2), out, 2.f, Rect()); });
    EXPECT_EQ(check.tail, "color mode is not supported: COLOR_MODE_FLOAT2");
    check = catchCheck([&] { LQ::resizeImageNn(Image(), out, 2.f, Rect()); });
    EXPECT_EQ(check.expression, "(source).isCreated()");
}

TEST(ImageScaling, FourBitKernel) {
    // 4 to 8: p = i / 2 - 1 / 4
    int indices[24], alphas[24];
    LQ::EstimateAlphaIndexBase(4, 8, indices, alphas, 3);
    const int s[8] = {0, 0, 0, 1, 1, 2, 2, 2}, a[8] = {0, 4, 12, 4, 12, 4, 12, 16};
    for (int i = 0; i < 8; ++i) {
        EXPECT_EQ(indices[3 * i + 2], 3 * s[i] + 2) << i;
        EXPECT_EQ(alphas[3 * i + 2], a[i]) << i;
    }

    // 2 x 2 to 4 x 4: (1, 1) lies at (0.25, 0.25), the exact bilinear value 60
    Image out(Size(4, 4), LQ::COLOR_MODE_MONO);
    LQ::resizeBilinear(mono(2, 2, {0, 160, 80, 240}), out);
    EXPECT_EQ(out.pixel(1, 1)[0], 60);
    EXPECT_EQ(out.pixel(0, 2)[0], 60);   // (0, 0.75): (1280 x 12 + 128) >> 8
    EXPECT_EQ(out.pixel(3, 3)[0], 240);  // clamped to the last pair, alpha 16
    // the 128 rounds: alpha 12 gives 1 x 12 + 3 x 16 = 60 across, 60 x 16 / 256 = 3.75 gives 4
    LQ::resizeBilinear(mono(2, 2, {3, 4, 3, 4}), out);
    EXPECT_EQ(out.pixel(2, 0)[0], 4);

    // the same size reproduces the image (other sizes: the sweep below)
    Image parent, same(Size(9, 7), LQ::COLOR_MODE_BGR);
    const Image view = randomView(9, 7, LQ::COLOR_MODE_BGR, 9, parent);
    LQ::resizeBilinearBase(view, same);
    EXPECT_TRUE(samePixels(same, view));
    // a source one pixel wide or high repeats it
    Image column(Size(5, 3), LQ::COLOR_MODE_MONO);
    LQ::resizeBilinear(mono(1, 3, {10, 20, 30}), column);
    EXPECT_EQ(column.pixel(4, 1)[0], column.pixel(0, 1)[0]);
    EXPECT_EQ(column.pixel(2, 2)[0], 30);

    FailedCheck check = catchCheck([&] { LQ::resizeBilinear(Image(), out); });
    EXPECT_EQ(check.expression, "(source).isCreated()");
    EXPECT_EQ(check.tail, "image is not created");
    check = catchCheck([&] { LQ::resizeBilinear(Image(Size(3, 3), LQ::COLOR_MODE_BGR), out); });
    EXPECT_EQ(check.expression, "(target).colorMode() == (source.colorMode())");
    EXPECT_EQ(check.tail, "have COLOR_MODE_MONO, but need COLOR_MODE_BGR");
    check = catchCheck([&] { LQ::ResizeBilinearBase(out.data(), 4, 4, 20, out.data(), 2, 2, 10, 5); });
    EXPECT_EQ(check.expression, "channelCount >= 1 && channelCount <= 4");
    EXPECT_EQ(check.tail, "Unsupported channel count 5");
}

// Every size from 1 x 1, compact and as views, against the formulas; the sanitizer
// watches the edges.
TEST(ImageScaling, SizeSweep) {
    const std::vector<int> widths = {1, 2, 3, 4, 5, 6, 7, 8, 9, 11, 13, 17, 31, 67, 130};
    for (int width : widths)
        for (int height : {1, 2, 3, 5, 8, 9, 20})
            for (LQ::ColorMode mode : {LQ::COLOR_MODE_MONO, LQ::COLOR_MODE_BGR, LQ::COLOR_MODE_RGBA}) {
                SCOPED_TRACE(::testing::Message() << width << "x" << height << " mode " << mode);
                Image parent, out;
                const Image view = randomView(width, height, mode, width * 31 + height, parent);
                const int d = view.depth();
                LQ::zoomImageTwice(view, out, Rect());
                ASSERT_EQ(out.size(), Size(width / 2, height / 2));  // the odd row and column dropped
                for (int y = 0; y < height / 2; ++y)
                    for (int i = 0; i < width / 2 * d; ++i) {
                        const unsigned char* a = view.row(2 * y) + (i / d) * 2 * d + i % d;
                        const unsigned char* b = a + view.stripLength();
                        ASSERT_EQ(out.row(y)[i], (a[0] + a[d] + b[0] + b[d]) >> 2) << i << "," << y;
                    }
                for (float scale : {0.2f, 0.3f, 0.5f, 0.7f, 1.f, 1.7f, 2.3f}) {
                    LQ::resizeImageBilinear(view, out, scale, Rect());
                    ASSERT_TRUE(samePixels(out, bilinear8Reference(view, scale))) << scale;
                    LQ::resizeImageNn(view, out, scale, Rect());
                    for (int y = 0; y < out.height(); ++y)
                        for (int x = 0; x < out.width(); ++x)
                            ASSERT_EQ(std::memcmp(out.pixel(x, y),
                                                  view.pixel(static_cast<int>(x / scale * 1.000001f),
                                                             static_cast<int>(y / scale * 1.000001f)),
                                                  d),
                                      0);
                }
                // the third size halves even sizes exactly, a path of its own
                for (const Size& size : {Size(width * 2 + 1, height + 3), Size((width + 1) / 2, (height + 2) / 3),
                                         Size(std::max(width / 2, 1), std::max(height / 2, 1)),
                                         Size(width / 4 + 1, height)}) {
                    Image sized(size, mode);
                    LQ::resizeBilinear(view, sized);
                    ASSERT_TRUE(samePixels(sized, bilinear4Reference(view, size))) << size;
                }
                LQ::zoomImageAverage(view, out, 1.3f, Rect());
            }
}

// ---- vector rows against their scalar references ---------------------------------------------

namespace {
// Random rows in exact-size buffers, so that an access past a row shows under the sanitizer:
// plain, 0 and 255 only (the largest sums) and near-flat.
std::vector<unsigned char> testRow(size_t count, std::mt19937& random, int kind) {
    std::vector<unsigned char> row = randomBytes(count, random);
    for (auto& b : row) b = static_cast<unsigned char>(kind == 1 ? (b & 1 ? 255 : 0) : kind == 2 ? 100 + b % 4 : b);
    return row;
}

// Two rows of 2 x width pixels of `channels` bytes to one row of width pixels.
using HalveRow = std::function<void(const unsigned char*, const unsigned char*, unsigned char*, int)>;
void compareHalving(const HalveRow& scalarRow, const HalveRow& vectorRow, int channels) {
    std::mt19937 random(11);
    for (int width = 1; width <= 99; ++width)
        for (int kind = 0; kind < 3; ++kind) {
            const std::vector<unsigned char> row0 = testRow(2 * width * channels, random, kind),
                                             row1 = testRow(2 * width * channels, random, kind);
            std::vector<unsigned char> expected(width * channels), actual(width * channels);
            scalarRow(row0.data(), row1.data(), expected.data(), width);
            vectorRow(row0.data(), row1.data(), actual.data(), width);
            ASSERT_EQ(actual, expected) << "width " << width << " channels " << channels << " kind " << kind;
        }
}
// the even bytes of one row take the same form, the second row unused
HalveRow evenBytes(void (*row)(const unsigned char*, unsigned char*, int)) {
    return [row](const unsigned char* in, const unsigned char*, unsigned char* out, int width) { row(in, out, width); };
}
HalveRow rounded(void (*row)(const unsigned char*, const unsigned char*, unsigned char*, int, int), int channels) {
    return [=](const unsigned char* a, const unsigned char* b, unsigned char* out, int width) { row(a, b, out, width, channels); };
}

// Rising offsets whose neighbours lie 0 to 2 x spread - 1 bytes apart, in a row that ends
// at most one byte after the last; so every window count occurs, and blocks too far apart.
std::vector<int> risingOffsets(int count, int spread, std::mt19937& random) {
    std::vector<int> offsets(count);
    int at = random() % 3;
    for (auto& o : offsets) o = at, at += random() % (2 * spread);
    return offsets;
}

template <class Blend4, class Blend8>
void compareBlends(Blend4 blend4, Blend8 blend8) {
    std::mt19937 random(41);
    for (int count = 1; count <= 67; ++count) {
        std::vector<unsigned short> t(count), u(count);
        for (int i = 0; i < count; ++i) t[i] = random() % 4081, u[i] = random() % 4081;
        std::vector<unsigned char> expected(count), actual(count);
        for (int alpha = 0; alpha <= 16; ++alpha) {
            LQ::blendRows4Scalar(t.data(), u.data(), alpha, expected.data(), count);
            blend4(t.data(), u.data(), alpha, actual.data(), count);
            ASSERT_EQ(actual, expected) << count << " alpha " << alpha;
        }
        for (int i = 0; i < count; ++i) t[i] = random() % 65281, u[i] = random() % 65281;
        for (int fraction : {0, 1, 77, 128, 255}) {
            LQ::blendRows8Scalar(t.data(), u.data(), fraction, expected.data(), count);
            blend8(t.data(), u.data(), fraction, actual.data(), count);
            ASSERT_EQ(actual, expected) << count << " fraction " << fraction;
        }
    }
}

template <class Gather>
void compareGathers(Gather gather) {
    std::mt19937 random(21);
    for (int count = 1; count <= 67; ++count)
        for (int spread : {1, 2, 3, 5, 9}) {
            const std::vector<int> offsets = risingOffsets(count, spread, random);
            const std::vector<unsigned char> row = randomBytes(offsets.back() + 1 + random() % 2, random);
            LQ::GatherTable table;
            table.build(offsets.data(), count / 16, static_cast<int>(row.size()));
            std::vector<unsigned char> expected(count), actual(count);
            LQ::gatherRowScalar(row.data(), offsets.data(), expected.data(), count);
            gather(row.data(), table, offsets.data(), actual.data(), count);
            ASSERT_EQ(actual, expected) << "count " << count << " spread " << spread;
        }
}

template <class Across>
void compareAcross(Across across) {
    std::mt19937 random(31);
    for (int channels : {1, 3, 4})
        for (int pixels = 1; pixels * channels <= 67; ++pixels)
            for (int spread : {1, 2, 4, 7}) {
                const std::vector<int> starts = risingOffsets(pixels, spread, random);
                const int sourcePixels = starts.back() + 1 + random() % 2;
                LQ::BilinearColumns columns;
                columns.resize(pixels * channels);
                for (int i = 0; i < pixels; ++i)
                    for (int c = 0; c < channels; ++c) {
                        const int f = random() % 257, j = i * channels + c;
                        columns.first[j] = starts[i] * channels + c;
                        columns.second[j] = std::min(starts[i] + 1, sourcePixels - 1) * channels + c;
                        columns.w0[j] = static_cast<unsigned short>(256 - f);
                        columns.w1[j] = static_cast<unsigned short>(f);
                    }
                columns.buildTable(sourcePixels * channels);
                const std::vector<unsigned char> row = randomBytes(sourcePixels * channels, random);
                std::vector<unsigned short> expected(columns.count()), actual(columns.count());
                LQ::bilinearAcrossScalar(row.data(), columns, expected.data());
                across(row.data(), columns, actual.data());
                ASSERT_EQ(actual, expected) << pixels << " pixels of " << channels << ", spread " << spread;
            }
}
}  // namespace

#if defined(LQ_HAVE_NEON)
TEST(ImageScalingVector, NeonRowsEqualScalarRows) {
    compareHalving(LQ::zoomMonoTwiceRowScalar, LQ::zoomMonoTwiceRowNeon, 1);
    compareHalving(LQ::zoomBgrTwiceRowScalar, LQ::zoomBgrTwiceRowNeon, 3);
    compareHalving(evenBytes(LQ::evenBytesRowScalar), evenBytes(LQ::evenBytesRowNeon), 1);
    for (int c = 1; c <= 4; ++c) compareHalving(rounded(LQ::halveRoundedRowScalar, c), rounded(LQ::halveRoundedRowNeon, c), c);
    compareGathers(LQ::gatherRowNeon);
    compareAcross(LQ::bilinearAcrossNeon);
    compareBlends(LQ::blendRows4Neon, LQ::blendRows8Neon);
}
#endif

#if defined(LQ_HAVE_SSSE3)
TEST(ImageScalingVector, X86RowsEqualScalarRows) {
    if (!__builtin_cpu_supports("ssse3")) GTEST_SKIP() << "no SSSE3 on this processor";
    compareHalving(LQ::zoomMonoTwiceRowScalar, LQ::zoomMonoTwiceRowSse, 1);
    compareHalving(LQ::zoomBgrTwiceRowScalar, LQ::zoomBgrTwiceRowSse, 3);
    compareHalving(evenBytes(LQ::evenBytesRowScalar), evenBytes(LQ::evenBytesRowSse), 1);
    for (int c = 1; c <= 4; ++c) compareHalving(rounded(LQ::halveRoundedRowScalar, c), rounded(LQ::halveRoundedRowSse, c), c);
    compareGathers(LQ::gatherRowSse);
    compareAcross(LQ::bilinearAcrossSse);
    compareBlends(LQ::blendRows4Sse, LQ::blendRows8Sse);
    if (!__builtin_cpu_supports("avx2")) GTEST_SKIP() << "no AVX2 on this processor";
    compareHalving(LQ::zoomMonoTwiceRowScalar, LQ::zoomMonoTwiceRowAvx2, 1);
    compareHalving(evenBytes(LQ::evenBytesRowScalar), evenBytes(LQ::evenBytesRowAvx2), 1);
}
#endif
