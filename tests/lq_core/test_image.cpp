#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <sstream>

#include "LQ_Check.h"
#include "LQ_Image.h"
#include "LogCapture.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

namespace {
Image monoRamp(int width, int height) {
    Image image(Size(width, height), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) image.pixel(x, y)[0] = static_cast<unsigned char>(10 * y + x);
    return image;
}
}  // namespace

TEST(Image, CreateKeepsMatchingRowsAndReferencesWriteThrough) {
    Image parent = monoRamp(6, 4);
    unsigned char* rows = parent.data();
    parent.create(Size(6, 4), LQ::COLOR_MODE_MONO);
    EXPECT_EQ(parent.data(), rows);  // no new allocation for per-frame images
    EXPECT_EQ(parent.pixel(5, 3)[0], 35);

    Image view;
    view.createRef(parent, Rect(2, 1, 5, 3));
    EXPECT_EQ(view.stripLength(), 6u);
    EXPECT_EQ(view.data(), parent.pixel(2, 1));
    view.create(Size(3, 2), LQ::COLOR_MODE_MONO);  // still the reference
    EXPECT_EQ(view.data(), parent.pixel(2, 1));

    // assigning a same-sized image writes into the parent's rows
    Image ones(Size(3, 2), LQ::COLOR_MODE_MONO);
    std::memset(ones.data(), 1, 6);
    view = ones;
    EXPECT_EQ(parent.pixel(2, 1)[0], 1);
    EXPECT_EQ(parent.pixel(1, 1)[0], 11);

    // a copy of the view is compact and equal, padding never compared
    const Image copy(view);
    EXPECT_TRUE(copy.isCompact());
    EXPECT_TRUE(copy == view);

    // a not-created image resets the target and leaves the parent alone
    view = Image();
    EXPECT_FALSE(view.isCreated());
    EXPECT_EQ(parent.pixel(2, 1)[0], 1);

    // a view keeps the buffer alive after its source is gone
    Image survivor;
    {
        Image source = monoRamp(4, 4);
        survivor.createRef(source, Rect(1, 1, 3, 3));
    }
    EXPECT_EQ(survivor.pixel(1, 1)[0], 22);
    EXPECT_TRUE(survivor.hasOwner());
}

TEST(Image, ForeignMemoryIsNeverOwned) {
    unsigned char bytes[12] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11};
    Image foreign;
    foreign.createRef(bytes, Size(2, 2), LQ::COLOR_MODE_BGR, 6);
    EXPECT_FALSE(foreign.hasOwner());
    Image part;
    part.createRef(foreign, Rect(1, 1, 2, 2));
    EXPECT_FALSE(part.hasOwner());
    EXPECT_EQ(part.data(), bytes + 9);
    part.reset();
    foreign.reset();
    EXPECT_EQ(bytes[9], 9);  // dropping the headers freed nothing
}

TEST(Image, CreateRefChecksInOrder) {
    const Image image = monoRamp(4, 3), notCreated;
    struct Case {
        const Image* source;
        Rect rect;
        const char *expression, *tail;
    };
    const Case cases[] = {
        {&notCreated, Rect(0, 0, 1, 1), "image.isCreated()", "createRef: source image not created"},
        {&image, Rect(3, 0, 5, 2), "(image.rect()).contains(rect)", "Rect(3, 0, 5, 2) is out of Size(4, 3)"},
        {&image, Rect(2, 1, 2, 3), "rect.area()", "empty rect: Rect(2, 1, 2, 3)"},
    };
    for (const Case& c : cases) {
        const FailedCheck check = catchCheck([&] { Image().createRef(*c.source, c.rect); });
        EXPECT_EQ(check.expression, c.expression);
        EXPECT_EQ(check.tail, c.tail);
    }
    EXPECT_TRUE(catchCheck([] { Image(Size(-2, 3), LQ::COLOR_MODE_MONO); }).thrown);
}

TEST(Image, EqualityByModeSizeAndTolerance) {
    Image a(Size(2, 1), LQ::COLOR_MODE_FLOAT), b(Size(2, 1), LQ::COLOR_MODE_FLOAT);
    a.row<float>(0)[0] = 1.0f, a.row<float>(0)[1] = -3.0f;
    b.row<float>(0)[0] = 1.0000001f, b.row<float>(0)[1] = -3.0f;
    EXPECT_TRUE(a == b);  // one part in ten million
    b.row<float>(0)[0] = 1.00001f;
    EXPECT_FALSE(a == b);
    b.row<float>(0)[0] = a.row<float>(0)[0] = std::numeric_limits<float>::quiet_NaN();
    EXPECT_FALSE(a == a);  // NaN is unequal, even to itself

    Image rgb(Size(2, 2), LQ::COLOR_MODE_RGB);
    std::memset(rgb.data(), 50, 12);
    Image other(rgb);
    EXPECT_TRUE(rgb == other);
    other.pixel(1, 1)[2] = 51;
    EXPECT_FALSE(rgb == other);

    Image bgr(Size(2, 2), LQ::COLOR_MODE_BGR);
    std::memset(bgr.data(), 50, 12);
    EXPECT_FALSE(rgb == bgr);  // same bytes, other mode
    EXPECT_TRUE(Image() == Image());
}

TEST(Image, FractionalReading) {
    // the reads stay one pixel inside the right and bottom edges
    Image mono(Size(3, 3), LQ::COLOR_MODE_MONO);
    std::memset(mono.data(), 9, 9);
    mono.pixel(0, 0)[0] = 0, mono.pixel(1, 0)[0] = 100, mono.pixel(0, 1)[0] = 200, mono.pixel(1, 1)[0] = 40;
    // a quarter right, half down: ((192*0 + 64*100)*128 + (192*200 + 64*40)*128)
    EXPECT_EQ(mono.fractionalValueMono(64, 128), (6400u * 128) + (40960u * 128));
    EXPECT_EQ(mono.fractionalPixel(1.0f, 1.0f), 40u);
    EXPECT_FLOAT_EQ(mono.fractionalPixelFloat(0.5f, 0.0f), 50.0f);

    Image depth(Size(2, 2), LQ::COLOR_MODE_DEPTH);
    unsigned short* d = depth.row<unsigned short>(0);
    d[0] = 0, d[1] = 1000;
    depth.row<unsigned short>(1)[0] = 1000, depth.row<unsigned short>(1)[1] = 1000;
    // one missing sample of four: weight 49152, the mean of the other three
    EXPECT_NEAR(static_cast<double>(depth.fractionalValueDepth(128, 128)), 1000.0 * 65536, 1000.0 * 65536 * 1e-6);
    depth.row<unsigned short>(1)[0] = 5000, depth.row<unsigned short>(1)[1] = 0;
    EXPECT_EQ(depth.fractionalValueDepth(128, 128), 0u);  // weight 16384 is too little

    Image bgr(Size(2, 2), LQ::COLOR_MODE_BGR);
    std::memset(bgr.data(), 0, 12);
    bgr.pixel(1, 0)[0] = 200, bgr.pixel(1, 0)[2] = 100;
    unsigned char out[3];
    bgr.fractionalPixel256(128, 0, out);
    EXPECT_EQ(out[0], 100);
    EXPECT_EQ(out[2], 50);

    Image rgba(Size(2, 2), LQ::COLOR_MODE_RGBA);
    FailedCheck check = catchCheck([&] { rgba.fractionalValue256(0, 0); });
    EXPECT_EQ(check.tail, "only COLOR_MODE_MONO, COLOR_MODE_DEPTH are implemented.Got COLOR_MODE_RGBA");
    check = catchCheck([&] { rgba.fractionalPixel256(0, 0, out); });
    EXPECT_EQ(check.tail,
              "only COLOR_MODE_MONO, COLOR_MODE_BGR, COLOR_MODE_RGB, COLOR_MODE_YUV, COLOR_MODE_DEPTH are "
              "implemented.Got COLOR_MODE_RGBA");
}

TEST(ColorMode, DepthsNamesAndColours) {
    EXPECT_EQ(LQ::depth(LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12), 52);
    EXPECT_EQ(LQ::depth(LQ::COLOR_MODE_FLOAT2), 8);
    EXPECT_EQ(catchCheck([] { LQ::depth(LQ::COLOR_MODE_END); }).tail, "Invalid color mode: COLOR_MODE_END");
    EXPECT_TRUE(LQ::isColor(LQ::COLOR_MODE_BGR) && LQ::isColor(LQ::COLOR_MODE_RGBA));
    EXPECT_FALSE(LQ::isColor(LQ::COLOR_MODE_MONO) || LQ::isColor(LQ::COLOR_MODE_INTEGRAL));

    const LQ::Color orange = LQ::Color::ORANGE;  // R 255, G 165, B 0
    EXPECT_EQ(orange.prepareColor(LQ::COLOR_MODE_BGR), 0xFFFFA500u);
    EXPECT_EQ(orange.prepareColor(LQ::COLOR_MODE_RGB), 0xFF00A5FFu);
    EXPECT_EQ(orange.prepareColor(LQ::COLOR_MODE_MONO), 0xFFAAAAAAu);  // (16*165 + 11*255) >> 5 = 170
    // Y = ((66*255 + 129*165) >> 8) + 16 = 164, U = ((-38*255 - 74*165) >> 8) + 128 = 42 (shift floors),
    // V = ((112*255 - 94*165) >> 8) + 128 = 178
    EXPECT_EQ(LQ::Color(255, 165, 0).prepareColor(LQ::COLOR_MODE_YUV), 0xFFB22AA4u);
    EXPECT_EQ(catchCheck([] { LQ::Color::RED.prepareColor(LQ::COLOR_MODE_FLOAT); }).tail,
              "wrong color mode: COLOR_MODE_FLOAT");
}

TEST(Image, PrintFormsAndChecks) {
    std::ostringstream empty;
    empty << Image();
    EXPECT_EQ(empty.str(), "Image(Size(0, 0), COLOR_MODE_UNDEFINED)");
    std::ostringstream small;
    small << monoRamp(2, 2);
    EXPECT_EQ(small.str(), "Image(Size(2, 2), COLOR_MODE_MONO, \ndata =\n  0,   1, \n 10,  11, \n)");
    std::istringstream in("anything");
    Image target;
    EXPECT_EQ(catchCheck([&] { in >> target; }).tail, "loading images from stream is not implemented");

    const Image mono = monoRamp(3, 2);
    const Image bgr(Size(4, 2), LQ::COLOR_MODE_BGR);
    FailedCheck check = catchCheck([&] { LQ::checkImages(mono, bgr); });
    EXPECT_EQ(check.expression, "image.colorMode() == colorMode");
    EXPECT_EQ(check.tail, "have COLOR_MODE_MONO, but need COLOR_MODE_BGR");
    check = catchCheck([&] { LQ::checkImage(mono, Size(3, 3), LQ::COLOR_MODE_MONO); });
    EXPECT_EQ(check.expression, "image.size() == size");
    EXPECT_EQ(check.tail, "have Size(3, 2), but need Size(3, 3)");
    check = catchCheck([] { LQ::checkForCreation(Image()); });
    EXPECT_EQ(check.expression, "image.isCreated()");
    EXPECT_EQ(check.tail, "image is not created");
    EXPECT_FALSE(catchCheck([&] { LQ::checkImage(mono, Size(3, 2), LQ::COLOR_MODE_MONO); }).thrown);
}
