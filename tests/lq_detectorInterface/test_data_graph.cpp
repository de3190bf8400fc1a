#include <gtest/gtest.h>

#include <cstring>
#include <sstream>
#include <utility>

#include "LQ_ColorModeData.h"
#include "LQ_ImagePyramidData.h"
#include "LQ_ImageResize.h"
#include "LQ_ImageRotatePi4Data.h"
#include "LQ_ImageZoomData.h"
#include "LQ_Integral.h"
#include "LQ_Yuv420Converter.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::ColorMode;
using LQ::Image;
using LQ::ImageData;
using LQ::Rect;
using LQ::SharedPtr;
using LQ::Size;

namespace {
Image pattern(int width, int height, ColorMode mode = LQ::COLOR_MODE_MONO, unsigned seed = 0) {
    return randomImage(width, height, mode, seed);
}

// A node that records what it was asked to compute.
class CountingData : public ImageData {
public:
    explicit CountingData(const SharedPtr<ImageData>& parent) : ImageData(parent->size(), parent->colorMode()) {
        addParent(parent);
    }
    void compute(const Rect& rect) override {
        ++computes;
        last = rect;
    }
    std::string name() const override { return derivedName("CountingData"); }
    int computes = 0;
    Rect last;
};

SharedPtr<ImageData> root(const Image& image) {
    SharedPtr<ImageData> node(new ImageData(image.size(), image.colorMode()));
    node->set(image);
    return node;
}
}  // namespace

TEST(ImageData, ComputesOnlyWhatIsAskedForOncePerFrame) {
    const Image frame = pattern(40, 30);
    SharedPtr<ImageData> base = root(frame);
    SharedPtr<CountingData> node(new CountingData(base));
    EXPECT_EQ(base->computedRect(), Rect(0, 0, 40, 30));

    node->get(Rect(5, 5, 10, 10));
    node->get(Rect(6, 6, 9, 9));  // inside what is valid: nothing to do
    EXPECT_EQ(node->computes, 1);
    node->get(Rect(-5, 5, 10, 12));  // larger, and clipped to the image
    EXPECT_EQ(node->computes, 2);
    EXPECT_EQ(node->last, Rect(0, 5, 10, 12));
    node->get(Rect(20, 20, 25, 25));  // disjoint: replaces, does not join
    EXPECT_EQ(node->computedRect(), Rect(20, 20, 25, 25));
    node->get(Rect(0, 5, 10, 12));
    EXPECT_EQ(node->computes, 4);
    node->get(Rect(50, 50, 60, 60));  // nothing of it in the image
    EXPECT_EQ(node->computes, 4);
    node->get();
    node->get();
    EXPECT_EQ(node->computes, 5);

    base->resetRecursive();  // a new frame: everything stale
    EXPECT_EQ(node->computedRect(), Rect());
    node->get();
    EXPECT_EQ(node->computes, 6);

    // a plain node that is asked to compute has nothing to compute from
    ImageData empty(Size(2, 2), LQ::COLOR_MODE_MONO);
    FailedCheck check = catchCheck([&] { empty.get(); });
    EXPECT_NE(check.tail.find(". ImageData is not set, or void compute(const LQ::Rect&) is not overloaded"),
              std::string::npos);
}

TEST(ImageData, CopiesWithBordersAndZerosOutside) {
    SharedPtr<ImageData> base = root(pattern(8, 6));
    Image out;
    base->get(Rect(6, 4, 10, 8), out);
    ASSERT_EQ(out.size(), Size(4, 4));
    EXPECT_EQ(out.pixel(3, 3)[0], base->getRaw().pixel(7, 5)[0]);
    EXPECT_EQ(out.pixel(0, 0)[0], base->getRaw().pixel(6, 4)[0]);
    LogCapture log;
    base->get(Rect(20, 20, 23, 22), out);
    EXPECT_EQ(out.size(), Size(3, 2));
    for (int y = 0; y < 2; ++y)
        for (int x = 0; x < 3; ++x) EXPECT_EQ(out.pixel(x, y)[0], 0);
    EXPECT_NE(log.text().find("Rect fully outside of image Rect(20, 20, 23, 22)"), std::string::npos);
}

TEST(ImageData, DerivedNodesComputeTheirKernelsOverRectangles) {
    const Image frame = pattern(64, 48, LQ::COLOR_MODE_BGR, 3);
    SharedPtr<ImageData> base = root(frame);
    SharedPtr<ImageData> mono(new LQ::ColorModeData(base, LQ::COLOR_MODE_MONO));
    SharedPtr<ImageData> integral(new LQ::ColorModeData(mono, LQ::COLOR_MODE_INTEGRAL));
    EXPECT_EQ(integral->size(), Size(64, 48));
    EXPECT_EQ(integral->getRaw().size(), Size(65, 49));

    // the integral of a rectangle sums that rectangle alone
    const Rect part(10, 8, 30, 20);
    const Image& sums = integral->get(part);
    unsigned int expected = 0;
    const Image& gray = mono->get();
    for (int y = part.top; y < part.bottom; ++y)
        for (int x = part.left; x < part.right; ++x) expected += gray.pixel(x, y)[0];
    EXPECT_EQ(sums.row<unsigned int>(part.bottom)[part.right], expected);

    // halving and resizing match their kernels on the whole image
    SharedPtr<ImageData> half(new LQ::ImageZoomData(mono, 32));
    Image reference;
    LQ::zoomImageTwice(gray, reference, Rect());
    EXPECT_TRUE(samePixels(half->get(), reference));

    // bilinear last: it is the default the other tests expect
    for (bool nearest : {true, false}) {
        LQ::ImageZoomData::setResizeAlgorithm(nearest ? LQ::ResizeAlgorithm::NEAREST_NEIGHBOUR
                                                      : LQ::ResizeAlgorithm::BILINEAR);
        SharedPtr<LQ::ImageZoomData> odd(new LQ::ImageZoomData(mono, 20));
        EXPECT_EQ(odd->get().size(), Size(20, 15));
        (nearest ? LQ::resizeImageNn : LQ::resizeImageBilinear)(gray, reference, odd->zoom(), Rect());
        EXPECT_TRUE(samePixels(odd->get(), reference)) << nearest;
    }

    // the same width is a reference, no copy
    SharedPtr<ImageData> same(new LQ::ImageZoomData(mono, 64));
    EXPECT_EQ(same->get().data(), gray.data());

    std::ostringstream text;
    text << *half;
    EXPECT_NE(text.str().find(": ImageZoomData of (ColorModeData of (ImageData at "), std::string::npos);
}

TEST(ImageData, RotationFollowsTheAngleAndYuvNodesConvert) {
    const Image frame = pattern(6, 4);
    SharedPtr<ImageData> base = root(frame);
    int angle = 90;
    SharedPtr<LQ::ImageRotatePi4Data> turned(new LQ::ImageRotatePi4Data(base, &angle));
    EXPECT_EQ(turned->size(), Size(4, 6));
    // one quarter turn: pixel (x, y) goes to column y, row W - 1 - x
    EXPECT_EQ(turned->get(Rect(0, 0, 1, 1)).pixel(1, 5 - 2)[0], frame.pixel(2, 1)[0]);
    angle = -540;  // normalised in place: 180
    EXPECT_EQ(turned->quarterTurns(), 2);
    EXPECT_EQ(angle, -180);
    const std::pair<int, int> cases[] = {{44, 0}, {315, 0}, {225, 3}};
    for (const auto& [a, turns] : cases) {
        angle = a;
        EXPECT_EQ(turned->quarterTurns(), turns) << a;
    }

    // 4 x 2 luma rows and one row of V, U pairs
    Image yuv(Size(4, 3), LQ::COLOR_MODE_MONO);
    const unsigned char bytes[] = {10, 20, 30, 40, 50, 60, 70, 80, 128, 128, 128, 128};
    std::memcpy(yuv.data(), bytes, sizeof(bytes));
    SharedPtr<ImageData> camera = root(yuv);
    SharedPtr<ImageData> luma(new LQ::Yuv420Converter(camera, LQ::COLOR_MODE_MONO, false, false));
    EXPECT_EQ(luma->get().size(), Size(4, 2));
    EXPECT_EQ(luma->get().data(), yuv.data());
    SharedPtr<ImageData> bgr(new LQ::Yuv420Converter(camera, LQ::COLOR_MODE_BGR, true, false));
    EXPECT_EQ(bgr->get().size(), Size(2, 1));
    EXPECT_EQ(bgr->name(), "Yuv420Converter  zoomTwice_ = 1 swapRedBlue_ 0 of (" + camera->name() + ")");
    SharedPtr<ImageData> bad(new LQ::Yuv420Converter(camera, LQ::COLOR_MODE_MONO, true, false));
    FailedCheck check = catchCheck([&] { bad->get(); });
    EXPECT_EQ(check.expression, "(zoomTwice_) == (false)");
    EXPECT_EQ(check.tail, "for mono only zoom 1 is supported");
}

TEST(ImagePyramid, LayerWidthsAndZoomChains) {
    SharedPtr<ImageData> base = root(pattern(640, 360));
    LQ::ImagePyramidData pyramid(base, 1);
    EXPECT_EQ(pyramid.layerWidths(), (std::vector<int>{640, 320, 160, 80, 40, 20, 10, 5, 2}));
    LQ::ImagePyramidData two(base, 2);
    EXPECT_EQ(two.layerWidths().size(), 18u);
    EXPECT_EQ(two.layerWidths()[1], 452);  // 640 / sqrt(2)
    EXPECT_EQ(two.getNearestLayer(2.0f), 2);
    EXPECT_EQ(two.getNearestLayer(0.5f), 0);
    EXPECT_FLOAT_EQ(two.getNearestZoom(1.5f), 640.f / 452);
    EXPECT_EQ(two.getBaseHalfLayer(100), 4);  // octave 160 .. 81 starts at layer 2 * 2

    SharedPtr<ImageData>& first = pyramid.getByWidth(LQ::COLOR_MODE_MONO, 320);
    const ImageData* at320 = first.get();
    EXPECT_EQ(at320->parents()[0].get(), base.get());
    pyramid.getByWidth(LQ::COLOR_MODE_MONO, 100);
    ASSERT_NE(pyramid.find(LQ::COLOR_MODE_MONO, 160), nullptr);
    const ImageData* at160 = pyramid.find(LQ::COLOR_MODE_MONO, 160)->get();
    EXPECT_EQ(at160->parents()[0].get(), at320);
    EXPECT_EQ(pyramid.find(LQ::COLOR_MODE_MONO, 100)->get()->parents()[0].get(), at160);
    EXPECT_EQ(pyramid.getByWidth(LQ::COLOR_MODE_MONO, 320).get(), at320);

    // feature images come from mono at their own width, never scaled themselves
    SharedPtr<ImageData> rmct = pyramid.getByWidth(LQ::COLOR_MODE_RMCT, 50);
    EXPECT_EQ(rmct->size(), Size(50, 28));
    EXPECT_EQ(rmct->parents()[0].get(), pyramid.find(LQ::COLOR_MODE_MONO, 50)->get());
    EXPECT_EQ(pyramid.find(LQ::COLOR_MODE_RMCT, 100), nullptr);

    // another mode starts from a converted full-size image
    LQ::ImagePyramidData colour(root(pattern(64, 32, LQ::COLOR_MODE_BGR)), 1);
    EXPECT_EQ(colour.getByZoom(LQ::COLOR_MODE_MONO, 4.f)->size(), Size(16, 8));
    EXPECT_NE(colour.find(LQ::COLOR_MODE_MONO, 64), nullptr);

    FailedCheck check = catchCheck([&] { pyramid.getByWidth(LQ::COLOR_MODE_MONO, 0); });
    EXPECT_EQ(check.expression, "(width) > (0)");
    check = catchCheck([&] { LQ::ImagePyramidData bad(base, 0); });
    EXPECT_EQ(check.expression, "(numLayersHalfZoom) >= (1)");
}

TEST(ImagePyramid, ForgetsLeavesAfterAHundredFramesAndFollowsNewSizes) {
    const Image frame = pattern(128, 64);
    SharedPtr<ImageData> base = root(frame);
    SharedPtr<LQ::ImagePyramidData> pyramid(new LQ::ImagePyramidData(base, 1));
    pyramid->getByWidth(LQ::COLOR_MODE_MONO, 40);  // 64, then 40 below it
    for (int frameNum = 1; frameNum < 100; ++frameNum) {
        base->resetRecursive();
        base->set(frame);
        base->updateRecursive();
    }
    EXPECT_NE(pyramid->find(LQ::COLOR_MODE_MONO, 40), nullptr);
    base->resetRecursive();  // the hundredth turn of the ring: the leaf goes, its parent waits
    EXPECT_EQ(pyramid->find(LQ::COLOR_MODE_MONO, 40), nullptr);
    EXPECT_NE(pyramid->find(LQ::COLOR_MODE_MONO, 64), nullptr);
    for (int frameNum = 0; frameNum < 100; ++frameNum) base->resetRecursive();
    EXPECT_EQ(pyramid->find(LQ::COLOR_MODE_MONO, 64), nullptr);
    base->set(frame);
    EXPECT_EQ(base->children().size(), 1u);  // only the pyramid is left below the base
    // made again when asked for
    EXPECT_EQ(pyramid->getByWidth(LQ::COLOR_MODE_MONO, 40)->get().size(), Size(40, 20));

    // a frame of another size: an INFO line, and the nodes follow at the update
    SharedPtr<ImageData> node = pyramid->getByWidth(LQ::COLOR_MODE_MONO, 64);
    LQ::getLogLevel() = LQ::LOG_LEVEL_INFO;
    LogCapture log;
    base->resetRecursive();
    base->set(pattern(256, 100));
    base->updateRecursive();
    LQ::getLogLevel() = LQ::LOG_LEVEL_WARNING;
    EXPECT_NE(log.text().find("Setting image with different size Size(256, 100) prev size Size(128, 64) or colorMode "
                              "COLOR_MODE_MONO was COLOR_MODE_MONO"),
              std::string::npos);
    EXPECT_EQ(pyramid->size(), Size(256, 100));
    EXPECT_EQ(pyramid->getByWidth(LQ::COLOR_MODE_MONO, 128)->get().size(), Size(128, 50));
    EXPECT_EQ(node->get().size(), Size(128, 50));  // the old node now halves the new frame
}
