#include <gtest/gtest.h>

#include <cstring>

#include "LQ_ImageResize.h"
#include "LQ_ImageRotate.h"
#include "LQ_Integral.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
// pixel (x, y) of channel c holds 10 * y + x + 100 * c
Image ramp(int width, int height, LQ::ColorMode mode = LQ::COLOR_MODE_MONO) {
    Image image(Size(width, height), mode);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            for (int c = 0; c < image.depth(); ++c) image.pixel(x, y)[c] = static_cast<unsigned char>(10 * y + x + 100 * c);
    return image;
}
}  // namespace

TEST(Resize, HalvingAveragesBlocksForEveryMode) {
    Image mono = ramp(5, 4), half;
    mono.pixel(1, 1)[0] = 14;  // block sum 0 + 1 + 10 + 14 = 25: 6 after truncation
    LQ::zoomImageTwice(mono, half, Rect());
    ASSERT_EQ(half.size(), Size(2, 2));
    EXPECT_EQ(half.pixel(0, 0)[0], 6);
    EXPECT_EQ(half.pixel(1, 1)[0], (22 + 23 + 32 + 33) / 4);

    Image bgr = ramp(4, 2, LQ::COLOR_MODE_BGR);
    LQ::zoomImageTwice(bgr, half, Rect(1, 0, 2, 1));  // only the second pixel
    EXPECT_EQ(half.pixel(1, 0)[2], (202 + 203 + 212 + 213) / 4);

    Image depth(Size(2, 4), LQ::COLOR_MODE_DEPTH);
    const unsigned short samples[8] = {1000, 2000, 0, 6000, 0, 0, 0, 4999};
    std::memcpy(depth.data(), samples, sizeof(samples));
    LQ::zoomImageTwice(depth, half, Rect());
    EXPECT_EQ(half.row<unsigned short>(0)[0], 1500);  // two valid samples
    EXPECT_EQ(half.row<unsigned short>(1)[0], 0);     // only one

    FailedCheck check = catchCheck([&] { LQ::zoomImageTwice(mono, half, Rect(0, 0, 3, 1)); });
    EXPECT_EQ(check.expression, "(target.rect()).contains(targetRect)");
}

TEST(Resize, AveragingIntegralAndAccurate) {
    Image image = randomImage(100, 100, LQ::COLOR_MODE_MONO, 5), small;
    LQ::zoomImageAverage(image, small, 2.f, Rect());
    ASSERT_EQ(small.size(), Size(50, 50));  // the stable multiplier keeps 100 / 2 at 50
    EXPECT_EQ(small.pixel(7, 3)[0], (image.pixel(14, 6)[0] + image.pixel(15, 6)[0] + image.pixel(14, 7)[0] +
                                     image.pixel(15, 7)[0]) / 4);
    Image integral, fromIntegral;
    LQ::computeIntegral(image, integral);
    LQ::zoomImageIntegral(integral, fromIntegral, 2.f, Rect());
    EXPECT_TRUE(samePixels(fromIntegral, small));
    LQ::zoomImageAverage(ramp(7, 7, LQ::COLOR_MODE_RGB), small, 3.f, Rect());
    EXPECT_EQ(small.size(), Size(2, 2));
    EXPECT_EQ(small.pixel(1, 1)[1], 100 + 33);  // the last block is one pixel: a copy of (3, 3)
    FailedCheck check = catchCheck([&] { LQ::zoomImageAverage(image, small, 1.f, Rect()); });
    EXPECT_EQ(check.expression, "(zoom) > (1.f)");
    check = catchCheck([&] { LQ::zoomImageAverage(Image(Size(4, 4), LQ::COLOR_MODE_DEPTH), small, 2.f, Rect()); });
    EXPECT_EQ(check.expression, "(source.colorMode()) != (COLOR_MODE_DEPTH)");
    check = catchCheck([&] { LQ::zoomImageAverage(Image(), small, 2.f, Rect()); });
    EXPECT_EQ(check.tail, "image is not created");

    Image accurate;
    LQ::resizeImageAccurate(image, accurate, 0.49f, Rect());  // averaging
    LQ::zoomImageAverage(image, small, 1 / 0.49f, Rect());
    EXPECT_TRUE(samePixels(accurate, small));
    LQ::resizeImageAccurate(image, accurate, 0.5f, Rect());  // bilinear
    LQ::resizeImageBilinear(image, small, 0.5f, Rect());
    EXPECT_TRUE(samePixels(accurate, small));
}

TEST(Resize, BilinearAndNearestSampling) {
    const Image image = randomImage(9, 7, LQ::COLOR_MODE_MONO, 6);
    Image out;
    LQ::resizeImageBilinear(image, out, 1.0f, Rect());
    EXPECT_TRUE(samePixels(out, image));  // step 256, origin 0
    // scale 0.5: origin 128, step 512, so every sample lies midway between four pixels
    LQ::resizeImageBilinear(image, out, 0.5f, Rect());
    ASSERT_EQ(out.size(), Size(4, 3));
    const auto mid = [&](int x, int y) {
        const int top = (128 * image.pixel(x, y)[0] + 128 * image.pixel(x + 1, y)[0]) >> 8;
        const int bottom = (128 * image.pixel(x, y + 1)[0] + 128 * image.pixel(x + 1, y + 1)[0]) >> 8;
        return (128 * top + 128 * bottom) >> 8;
    };
    EXPECT_EQ(out.pixel(1, 2)[0], mid(2, 4));
    EXPECT_EQ(out.pixel(3, 0)[0], mid(6, 0));

    // every pixel against the formula, for shrinking and growing, on a wide image so that
    // whole vector steps are taken
    const Image wide = randomImage(83, 9, LQ::COLOR_MODE_MONO, 12);
    for (float scale : {0.3f, 0.7f, 1.6f, 2.3f}) {
        LQ::resizeImageBilinear(wide, out, scale, Rect());
        const float stable = 1.000001f;
        const int tw = out.width(), th = out.height();
        int origin = 0, step = std::min((82 * 256) / (tw - 1), (8 * 256) / (th - 1));
        if (scale < 1) origin = static_cast<int>(128 / scale * stable) - 128, step = static_cast<int>(256 / scale * stable);
        for (int y = 0; y < th; ++y)
            for (int x = 0; x < tw; ++x) {
                const int px = origin + x * step, py = origin + y * step;
                const int ix = std::min(px >> 8, 82), iy = std::min(py >> 8, 8), fx = px & 255, fy = py & 255;
                const auto at = [&](int i, int j) { return int(wide.pixel(std::min(i, 82), std::min(j, 8))[0]); };
                const int top = ((256 - fx) * at(ix, iy) + fx * at(ix + 1, iy)) >> 8;
                const int bottom = ((256 - fx) * at(ix, iy + 1) + fx * at(ix + 1, iy + 1)) >> 8;
                ASSERT_EQ(out.pixel(x, y)[0], ((256 - fy) * top + fy * bottom) >> 8) << scale << ": " << x << "," << y;
            }
    }

    LQ::resizeImageNn(wide, out, 0.5f, Rect(3, 1, 41, 4));  // half the width: every second byte
    for (int y = 1; y < 4; ++y)
        for (int x = 3; x < 41; ++x) ASSERT_EQ(out.pixel(x, y)[0], wide.pixel(2 * x, 2 * y)[0]) << x << "," << y;

    LQ::resizeImageNn(ramp(9, 7, LQ::COLOR_MODE_BGR), out, 0.5f, Rect());
    EXPECT_EQ(out.size(), Size(4, 3));
    EXPECT_EQ(out.pixel(3, 2)[1], 100 + 46);
    LQ::resizeImageNn(ramp(4, 2), out, 2.5f, Rect(9, 4, 10, 5));  // one pixel at the far corner
    EXPECT_EQ(out.size(), Size(10, 5));
    EXPECT_EQ(out.pixel(9, 4)[0], 13);  // 9 / 2.5 = 3.6, 4 / 2.5 = 1.6

    // the 4-bit kernel reproduces an image of its own size
    Image same(image.size(), LQ::COLOR_MODE_MONO);
    LQ::resizeBilinear(image, same);
    EXPECT_TRUE(samePixels(same, image));
    Image bigger(Size(18, 14), LQ::COLOR_MODE_MONO);
    LQ::resizeBilinearBase(image, bigger);
    // target column 1: p = 1.5 * 0.5 - 0.5 = 0.25, alpha 4; row 0: index 0 alpha 0
    const int t = (image.pixel(1, 0)[0] - image.pixel(0, 0)[0]) * 4 + image.pixel(0, 0)[0] * 16;
    EXPECT_EQ(bigger.pixel(1, 0)[0], (t * 16 + 128) >> 8);
    FailedCheck check = catchCheck([&] {
        Image wrong(Size(4, 4), LQ::COLOR_MODE_BGR);
        LQ::resizeBilinear(image, wrong);
    });
    EXPECT_EQ(check.expression, "(target).colorMode() == (source.colorMode())");
}

TEST(Rotate, QuarterTurnsFlipsAndTranspose) {
    const Image image = ramp(3, 2, LQ::COLOR_MODE_RGB);
    Image one, three, minusOne, back;
    LQ::rotatePi4(image, one, 1);
    ASSERT_EQ(one.size(), Size(2, 3));
    // (x, y) goes to column y, row W - 1 - x
    EXPECT_EQ(one.pixel(1, 2 - 0)[0], image.pixel(0, 1)[0]);
    EXPECT_EQ(one.pixel(0, 0)[2], image.pixel(2, 0)[2]);
    LQ::rotatePi4(image, three, 3);
    LQ::rotatePi4(image, minusOne, -1);
    EXPECT_TRUE(samePixels(three, minusOne));
    EXPECT_EQ(three.pixel(2 - 1 - 0, 2)[1], image.pixel(2, 0)[1] - 0);  // (x, y) -> column H - 1 - y, row x
    Image two;
    LQ::rotatePi4(image, two, 6);
    EXPECT_EQ(two.pixel(0, 0)[0], image.pixel(2, 1)[0]);
    LQ::rotatePi4(one, back, 1);
    LQ::rotatePi4(back, two, 2);
    EXPECT_TRUE(samePixels(two, image));  // four quarter turns

    Image flipped, transposed;
    LQ::flipLeftRight(image, flipped);
    EXPECT_EQ(flipped.pixel(0, 1)[0], image.pixel(2, 1)[0]);
    LQ::flipTopBottom(image, flipped);
    EXPECT_EQ(flipped.pixel(2, 0)[1], image.pixel(2, 1)[1]);
    LQ::transpose(image, transposed);
    EXPECT_EQ(transposed.pixel(1, 2)[2], image.pixel(2, 1)[2]);
    FailedCheck check = catchCheck([&] { LQ::flipLeftRight(Image(), flipped); });
    EXPECT_EQ(check.expression, "(source).isCreated()");

    // byte images take a path of their own: it must agree with the path of wider pixels
    const Image mono = randomImage(21, 13, LQ::COLOR_MODE_MONO, 31);
    Image wide(mono.size(), LQ::COLOR_MODE_RGB);
    for (int y = 0; y < 13; ++y)
        for (int x = 0; x < 21; ++x) wide.pixel(x, y)[0] = wide.pixel(x, y)[1] = wide.pixel(x, y)[2] = mono.pixel(x, y)[0];
    for (int turns = 1; turns <= 3; ++turns) {
        Image turnedMono, turnedWide;
        LQ::rotatePi4(mono, turnedMono, turns);
        LQ::rotatePi4(wide, turnedWide, turns);
        for (int y = 0; y < turnedMono.height(); ++y)
            for (int x = 0; x < turnedMono.width(); ++x)
                ASSERT_EQ(turnedMono.pixel(x, y)[0], turnedWide.pixel(x, y)[1]) << turns << ": " << x << "," << y;
    }

    // views with a wide stride and every small size: a quarter turn and back is the identity
    for (int width = 1; width <= 9; ++width)
        for (int height = 1; height <= 9; ++height) {
            Image parent, turned, again;
            const Image view = randomView(width, height, LQ::COLOR_MODE_BGR, width * 10 + height, parent);
            LQ::rotatePi4(view, turned, 1);
            LQ::rotatePi4(turned, again, 3);
            ASSERT_TRUE(samePixels(again, view)) << width << "x" << height;
        }
}

TEST(Rotate, FreeRotationAndFrameSizes) {
    const Image image = randomImage(20, 16, LQ::COLOR_MODE_MONO, 8);
    Image out(Size(20, 16), LQ::COLOR_MODE_MONO);
    const LQ::PointF centre(9.5f, 7.5f);
    // no turn and no zoom: the image itself but for the last column and row, which are
    // clamped just short of the edge; so the frame's corners are not all inside
    EXPECT_FALSE(LQ::rotateAndZoomImage(image, out, 0.f, 1.f, 1.000001f, centre));
    for (int y = 0; y + 1 < 16; ++y)
        for (int x = 0; x + 1 < 20; ++x) ASSERT_EQ(out.pixel(x, y)[0], image.pixel(x, y)[0]) << x << "," << y;
    EXPECT_NE(out.pixel(19, 0)[0] == image.pixel(19, 0)[0] && out.pixel(19, 5)[0] == image.pixel(19, 5)[0] &&
                  out.pixel(19, 9)[0] == image.pixel(19, 9)[0],
              true);
    Image smaller(Size(10, 8), LQ::COLOR_MODE_MONO);
    EXPECT_TRUE(LQ::rotateAndZoomImage(image, smaller, 0.f, 1.f, 1.f, centre));
    EXPECT_EQ(smaller.pixel(0, 0)[0], image.pixel(5, 4)[0]);
    // a half turn about the centre
    Image turned(Size(20, 16), LQ::COLOR_MODE_MONO);
    LQ::rotateAndZoomImage(image, turned, 3.14159265f, 1.f, 1.f, centre);
    EXPECT_EQ(turned.pixel(3, 4)[0], image.pixel(16, 11)[0]);
    // above zoom 3 the target pixels are block means
    Image tiny(Size(4, 4), LQ::COLOR_MODE_MONO);
    LQ::rotateAndZoomImage(image, tiny, 0.f, 4.f, 4.f, centre);
    FailedCheck check = catchCheck([&] { LQ::rotateAndZoomImage(image, tiny, 0.f, 1.f, 1.1f, centre); });
    EXPECT_EQ(check.expression, "equal(zoomX, zoomY)");
    EXPECT_EQ(check.tail, "different zooms not implemented yet");
    check = catchCheck([&] {
        Image bgr(Size(4, 4), LQ::COLOR_MODE_BGR);
        LQ::rotateAndZoomImage(image, bgr, 0.f, 1.f, 1.f, centre);
    });
    EXPECT_EQ(check.expression, "(source).colorMode() == (target.colorMode())");

    EXPECT_EQ(LQ::getRotatedFrameSize(Size(640, 360), 0.f), Size(640, 360));
    EXPECT_EQ(LQ::getRotatedFrameSize(Size(640, 360), 1.5707964f), Size(360, 640));
    EXPECT_EQ(LQ::getRotatedFrameSize(Size(640, 360), 0.7853982f), Size(500, 500));
}
