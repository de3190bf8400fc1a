#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include "LQ_ImageCopy.h"
#include "LQ_ImageMath.h"
#include "LQ_ImageRotate.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::Image;
using LQ::PointF;
using LQ::Rect;
using LQ::Size;

namespace {
// the bytes of a MONO image, row by row
std::vector<int> bytes(const Image& image) {
    std::vector<int> values;
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x) values.push_back(image.pixel(x, y)[0]);
    return values;
}

// pixel (x, y) holds 10 y + x in every channel
Image ramp(int width, int height, LQ::ColorMode mode = LQ::COLOR_MODE_MONO) {
    Image image(Size(width, height), mode);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width * image.depth(); ++x) image.row(y)[x] = static_cast<unsigned char>(10 * y + x / image.depth());
    return image;
}
}  // namespace

TEST(ImageTurning, QuarterTurnsAndMirrorsByHand) {
    Image image(Size(3, 2), LQ::COLOR_MODE_MONO);
    for (int i = 0; i < 6; ++i) image.pixel(i % 3, i / 3)[0] = static_cast<unsigned char>(i + 1);
    // 1 2 3
    // 4 5 6
    Image out;
    LQ::rotatePi4(image, out, 1);
    EXPECT_EQ(out.size(), Size(2, 3));
    EXPECT_EQ(bytes(out), (std::vector<int>{3, 6, 2, 5, 1, 4}));
    LQ::rotatePi4(image, out, -1);
    EXPECT_EQ(bytes(out), (std::vector<int>{4, 1, 5, 2, 6, 3}));
    LQ::rotatePi4(image, out, 6);
    EXPECT_EQ(out.size(), Size(3, 2));
    EXPECT_EQ(bytes(out), (std::vector<int>{6, 5, 4, 3, 2, 1}));
    LQ::transpose(image, out);
    EXPECT_EQ(bytes(out), (std::vector<int>{1, 4, 2, 5, 3, 6}));
    LQ::flipLeftRight(image, out);
    EXPECT_EQ(bytes(out), (std::vector<int>{3, 2, 1, 6, 5, 4}));
    LQ::flipTopBottom(image, out);
    EXPECT_EQ(bytes(out), (std::vector<int>{4, 5, 6, 1, 2, 3}));
    LQ::flipLeftRight(out, out);  // in place
    EXPECT_EQ(bytes(out), (std::vector<int>{6, 5, 4, 3, 2, 1}));

    // pixels move whole: channels keep their order
    const Image bgr = randomImage(5, 3, LQ::COLOR_MODE_BGR, 2);
    LQ::rotatePi4(bgr, out, 1);
    EXPECT_EQ(std::memcmp(out.pixel(2, 5 - 1 - 1), bgr.pixel(1, 2), 3), 0);  // (1, 2) -> column 2, row 3
    LQ::rotatePi4(bgr, out, 3);
    EXPECT_EQ(std::memcmp(out.pixel(3 - 1 - 2, 1), bgr.pixel(1, 2), 3), 0);  // -> column 0, row 1

    FailedCheck check = catchCheck([&] { LQ::flipLeftRight(Image(), out); });
    EXPECT_EQ(check.expression, "(source).isCreated()");
    EXPECT_EQ(check.tail, "image is not created");
}

// Turns back and forth give the image again, for every pixel size and on views.
TEST(ImageTurning, RoundTripsForEveryPixelSize) {
    for (LQ::ColorMode mode : {LQ::COLOR_MODE_MONO, LQ::COLOR_MODE_DEPTH, LQ::COLOR_MODE_BGR, LQ::COLOR_MODE_RGBA,
                               LQ::COLOR_MODE_FLOAT2, LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6})
        for (int width : {1, 2, 7, 8, 9, 17})
            for (int height : {1, 3, 8, 16, 19}) {
                SCOPED_TRACE(::testing::Message() << width << "x" << height << " mode " << mode);
                Image parent, once, back, flipped, twice;
                const Image view = randomView(width, height, mode, width * 7 + height, parent);
                for (int k = 1; k <= 3; ++k) {
                    LQ::rotatePi4(view, once, k);
                    LQ::rotatePi4(once, back, 4 - k);
                    ASSERT_TRUE(samePixels(back, view)) << k;
                }
                LQ::transpose(view, once);
                LQ::transpose(once, back);
                ASSERT_TRUE(samePixels(back, view));
                LQ::flipLeftRight(view, flipped);
                LQ::flipTopBottom(flipped, back);
                LQ::rotatePi4(view, twice, 2);
                ASSERT_TRUE(samePixels(twice, back));
                // a quarter turn is a transpose read upwards
                LQ::rotatePi4(view, once, 1);
                LQ::transpose(view, back);
                LQ::flipTopBottom(back, flipped);
                ASSERT_TRUE(samePixels(once, flipped));
            }
}

TEST(ImageTurning, VectorPathsEqualScalar) {
    std::vector<void (*)(const Image&, Image&, LQ::Turn)> paths;
#if defined(LQ_HAVE_NEON)
    paths.push_back(LQ::turnNeon);
#endif
#if defined(LQ_HAVE_SSSE3)
    if (__builtin_cpu_supports("ssse3")) paths.push_back(LQ::turnSse);
#endif
    if (paths.empty()) GTEST_SKIP() << "no vector path on this machine";
    for (LQ::ColorMode mode : {LQ::COLOR_MODE_MONO, LQ::COLOR_MODE_BGR})
        for (int width = 1; width <= 67; ++width)
            for (int height : {1, 2, 4, 7, 8, 9, 15, 16, 17, 33}) {
                Image parent, targetParent(Size(height + 3, width + 2), mode), expected(Size(height, width), mode);
                const Image view = randomView(width, height, mode, width * 100 + height, parent);
                Image actual;  // a view too: rows are reached through the stride
                actual.createRef(targetParent, Rect(2, 1, height + 2, width + 1));
                for (LQ::Turn turn : {LQ::Turn::Transpose, LQ::Turn::Once, LQ::Turn::Thrice})
                    for (auto path : paths) {
                        LQ::turnScalar(view, expected, turn);
                        path(view, actual, turn);
                        ASSERT_TRUE(samePixels(actual, expected))
                            << width << "x" << height << " mode " << mode << " turn " << static_cast<int>(turn);
                    }
            }
    std::mt19937 random(3);
    for (int depth = 1; depth <= 4; ++depth)
        for (int width = 1; width <= 67; ++width) {
            const std::vector<unsigned char> in = randomBytes(width * depth, random);
            std::vector<unsigned char> expected(width * depth), actual(width * depth);
            LQ::flipRowScalar(in.data(), expected.data(), width, depth);
#if defined(LQ_HAVE_NEON)
            LQ::flipRowNeon(in.data(), actual.data(), width, depth);
            ASSERT_EQ(actual, expected) << "NEON width " << width << " depth " << depth;
#endif
#if defined(LQ_HAVE_SSSE3)
            if (__builtin_cpu_supports("ssse3")) {
                LQ::flipRowSse(in.data(), actual.data(), width, depth);
                ASSERT_EQ(actual, expected) << "SSSE3 width " << width << " depth " << depth;
            }
#endif
        }
}

TEST(FreeRotation, SamplesAndSquares) {
    const Image image = ramp(8, 8);
    // no turn, zoom 2: target pixel x reads 2 (x - 1) + 3.5, midway between four pixels
    Image out(Size(3, 3), LQ::COLOR_MODE_MONO);
    EXPECT_TRUE(LQ::rotateAndZoomImage(image, out, 0.f, 2.f, PointF(3.5f, 3.5f), PointF(1.f, 1.f)));
    EXPECT_EQ(out.pixel(0, 0)[0], (11 + 12 + 21 + 22) / 4);
    EXPECT_EQ(out.pixel(2, 2)[0], (55 + 56 + 65 + 66) / 4);

    // zoom 4 averages squares of 4 x 4 around (1, 1) and (5, 5); the first is pushed inside
    Image small(Size(2, 2), LQ::COLOR_MODE_MONO);
    EXPECT_TRUE(LQ::rotateAndZoomImage(image, small, 0.f, 4.f, PointF(3.5f, 3.5f), PointF(0.5f, 0.5f)));
    EXPECT_EQ(bytes(small), (std::vector<int>{16, 19, 46, 49}));  // rows 0-3 / 3-6, columns 0-3 / 3-6
    // a square larger than the source takes all of it
    EXPECT_FALSE(LQ::rotateAndZoomImage(ramp(3, 3), small, 0.3f, 5.f, PointF(1.f, 1.f), PointF(0.5f, 0.5f)));
    EXPECT_EQ(bytes(small), (std::vector<int>{11, 11, 11, 11}));

    // the same sampling for three channels and for depth; the last column and row are
    // clamped just short of the edge, so there the frame is not inside
    const Image bgr = randomImage(6, 5, LQ::COLOR_MODE_BGR, 4);
    Image turned(bgr.size(), LQ::COLOR_MODE_BGR);
    EXPECT_FALSE(LQ::rotateAndZoomImage(bgr, turned, 0.f, 1.f, PointF(2.5f, 2.f), PointF(2.5f, 2.f)));
    for (int y = 0; y + 1 < 5; ++y)
        for (int x = 0; x + 1 < 6; ++x) ASSERT_EQ(std::memcmp(turned.pixel(x, y), bgr.pixel(x, y), 3), 0);
    Image depth(Size(4, 3), LQ::COLOR_MODE_DEPTH), depthOut(Size(4, 3), LQ::COLOR_MODE_DEPTH);
    for (int i = 0; i < 12; ++i) depth.pixel<unsigned short>(i % 4, i / 4)[0] = static_cast<unsigned short>(100 * i + 1);
    LQ::rotateAndZoomImage(depth, depthOut, 0.f, 1.f, PointF(1.5f, 1.f), PointF(1.5f, 1.f));
    EXPECT_EQ(depthOut.pixel<unsigned short>(2, 1)[0], 601);

    // without a target centre the target's own centre serves
    const Image random = randomImage(20, 16, LQ::COLOR_MODE_MONO, 8);
    Image a(Size(7, 6), LQ::COLOR_MODE_MONO), b(Size(7, 6), LQ::COLOR_MODE_MONO);
    LQ::rotateAndZoomImage(random, a, 0.7f, 1.3f, 1.3f, PointF(9.f, 8.f));
    LQ::rotateAndZoomImage(random, b, 0.7f, 1.3f, PointF(9.f, 8.f), PointF(3.f, 2.5f));
    EXPECT_TRUE(samePixels(a, b));

    EXPECT_NO_THROW(LQ::rotateAndZoomImage(random, a, 0.f, 1.f, 1.000001f, PointF(9.f, 8.f)));
    FailedCheck check = catchCheck([&] { LQ::rotateAndZoomImage(random, a, 0.f, 1.f, 1.1f, PointF(9.f, 8.f)); });
    EXPECT_EQ(check.expression, "equal(zoomX, zoomY)");
    EXPECT_EQ(check.tail, "different zooms not implemented yet");
    check = catchCheck([&] { LQ::rotateAndZoomImage(random, turned, 0.f, 1.f, 1.f, PointF(9.f, 8.f)); });
    EXPECT_EQ(check.expression, "(source).colorMode() == (target.colorMode())");
}

TEST(FreeRotation, FramesAndCorners) {
    const float identity[4] = {1.f, 0.f, 0.f, 1.f};
    const Size source(10, 10), target(3, 3);
    EXPECT_TRUE(LQ::allInside(source, target, identity, PointF(1.f, 1.f), PointF(1.f, 1.f)));
    EXPECT_TRUE(LQ::allInside(source, target, identity, PointF(7.5f, 1.f), PointF(1.f, 1.f)));
    EXPECT_FALSE(LQ::allInside(source, target, identity, PointF(8.f, 1.f), PointF(1.f, 1.f)));  // reaches column 9
    EXPECT_FALSE(LQ::allInside(source, target, identity, PointF(0.9f, 1.f), PointF(1.f, 1.f)));
    // a quarter turn: the corners (0, 0) and (0, 2) of a 1 x 3 frame land at x 3 and 1, y 1
    const float turn[4] = {0.f, -1.f, 1.f, 0.f};
    EXPECT_TRUE(LQ::allInside(Size(10, 4), Size(1, 3), turn, PointF(2.f, 1.f), PointF(0.f, 1.f)));
    EXPECT_FALSE(LQ::allInside(Size(4, 10), Size(1, 3), turn, PointF(2.f, 1.f), PointF(0.f, 1.f)));

    EXPECT_EQ(LQ::getRotatedFrameSize(Size(640, 360), 0.f), Size(640, 360));
    EXPECT_EQ(LQ::getRotatedFrameSize(Size(640, 360), 1.5707964f), Size(360, 640));
    EXPECT_EQ(LQ::getRotatedFrameSize(Size(640, 360), 0.7853982f), Size(500, 500));
}

TEST(ImageMeasures, SumsAndMeans) {
    Image image(Size(3, 2), LQ::COLOR_MODE_MONO);
    const unsigned char values[6] = {1, 2, 3, 4, 5, 9};
    for (int i = 0; i < 6; ++i) image.pixel(i % 3, i / 3)[0] = values[i];
    EXPECT_EQ(LQ::imageSum(image, Rect()), 24u);  // zero area: the whole image
    EXPECT_EQ(LQ::imageSum(image, Rect(1, 0, 3, 2)), 19u);
    EXPECT_FLOAT_EQ(LQ::imageMean(image, Rect(1, 0, 3, 2)), 4.75f);
    unsigned char out[3] = {77, 77, 77};
    LQ::imageMean(image, out, Rect(1, 0, 3, 2));
    EXPECT_EQ(out[0], 4);  // truncated
    EXPECT_EQ(out[1], 77);
    LQ::imageMean(image, out, Rect(2, 1, 2, 2));
    EXPECT_EQ(out[0], 0);  // zero area here means no pixels

    Image depth(Size(2, 1), LQ::COLOR_MODE_DEPTH);
    depth.pixel<unsigned short>(0, 0)[0] = 1000, depth.pixel<unsigned short>(1, 0)[0] = 60001;
    EXPECT_EQ(LQ::imageSum(depth, Rect()), 61001u);
    unsigned short mean = 0;
    LQ::imageMean(depth, reinterpret_cast<unsigned char*>(&mean), Rect(0, 0, 2, 1));
    EXPECT_EQ(mean, 30500);

    Image parent;
    const Image bgr = randomView(4, 3, LQ::COLOR_MODE_BGR, 9, parent);
    LQ::imageMean(bgr, out, Rect(1, 1, 3, 3));
    for (int c = 0; c < 3; ++c)
        EXPECT_EQ(out[c], (bgr.pixel(1, 1)[c] + bgr.pixel(2, 1)[c] + bgr.pixel(1, 2)[c] + bgr.pixel(2, 2)[c]) / 4) << c;

    FailedCheck check = catchCheck([&] { LQ::imageMean(Image(Size(2, 2), LQ::COLOR_MODE_RGBA), out, Rect(0, 0, 1, 1)); });
    EXPECT_EQ(check.tail, "color mode not handled:COLOR_MODE_RGBA");
    check = catchCheck([&] { LQ::imageSum(bgr, Rect()); });
    EXPECT_EQ(check.tail, "color mode not handled:COLOR_MODE_BGR");
    check = catchCheck([&] { LQ::imageMean(image, out, Rect(2, 0, 3, 3)); });
    EXPECT_EQ(check.expression, "(image.rect()).contains(rect)");
}
