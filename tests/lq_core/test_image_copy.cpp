#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "LQ_ImageCopy.h"
#include "LogCapture.h"

using LQ::Image;
using LQ::PointI;
using LQ::Rect;
using LQ::Size;

namespace {
// pixel (x, y), channel c holds 50 * c + 10 * y + x
Image ramp(int width, int height, LQ::ColorMode mode) {
    Image image(Size(width, height), mode);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            for (int c = 0; c < image.depth(); ++c) image.pixel(x, y)[c] = static_cast<unsigned char>(50 * c + 10 * y + x);
    return image;
}
}  // namespace

TEST(ImageCopy, CopiesRectanglesInPlaceAndToAnOrigin) {
    const Image source = ramp(5, 4, LQ::COLOR_MODE_BGR);
    Image whole;
    LQ::copyImage(source, whole, Rect());
    ASSERT_EQ(whole.size(), source.size());
    EXPECT_EQ(whole.pixel(4, 3)[2], 134);

    Image part(Size(5, 4), LQ::COLOR_MODE_BGR);
    std::memset(part.data(), 7, 5 * 4 * 3);
    LQ::copyImage(source, part, Rect(1, 2, 3, 4));
    EXPECT_EQ(part.pixel(1, 2)[0], 21);
    EXPECT_EQ(part.pixel(0, 2)[0], 7);  // outside the rectangle: untouched

    // into a view: rows follow the target's stride
    Image big(Size(8, 6), LQ::COLOR_MODE_BGR);
    std::memset(big.data(), 0, 8 * 6 * 3);
    LQ::copyImage(source, big, Rect(3, 1, 5, 3), PointI(6, 4));
    EXPECT_EQ(big.pixel(6, 4)[0], 13);
    EXPECT_EQ(big.pixel(7, 5)[2], 124);
    EXPECT_EQ(big.pixel(5, 4)[0], 0);

    FailedCheck check = catchCheck([&] { LQ::copyImage(source, big, Rect(0, 0, 3, 3), PointI(6, 4)); });
    EXPECT_EQ(check.expression, "(target.rect()).contains(destination)");
    Image mono(Size(5, 4), LQ::COLOR_MODE_MONO);
    check = catchCheck([&] { LQ::copyImage(source, mono, Rect(0, 0, 1, 1), PointI(0, 0)); });
    EXPECT_EQ(check.expression, "(target).colorMode() == (source.colorMode())");
    EXPECT_EQ(check.tail, "have COLOR_MODE_MONO, but need COLOR_MODE_BGR");
}

TEST(ImageCopy, BorderRepeatsTheEdgesAroundTheInnerPart) {
    const Image source = ramp(3, 2, LQ::COLOR_MODE_MONO);  // rows 0 1 2 / 10 11 12
    Image target;
    LQ::copyImageBorder(source, target, Rect(-2, -1, 4, 4));
    ASSERT_EQ(target.size(), Size(6, 5));
    const int expected[5][6] = {{0, 0, 0, 1, 2, 2},
                                {0, 0, 0, 1, 2, 2},
                                {10, 10, 10, 11, 12, 12},
                                {10, 10, 10, 11, 12, 12},
                                {10, 10, 10, 11, 12, 12}};
    for (int y = 0; y < 5; ++y)
        for (int x = 0; x < 6; ++x) EXPECT_EQ(target.pixel(x, y)[0], expected[y][x]) << x << "," << y;

    // a band inside the source is a plain crop
    LQ::copyImageBorder(ramp(6, 6, LQ::COLOR_MODE_RGB), target, Rect(2, 3, 4, 5));
    EXPECT_EQ(target.pixel(1, 1)[1], 50 + 43);

    FailedCheck check = catchCheck([&] { LQ::copyImageBorder(source, target, Rect(3, 0, 6, 2)); });
    EXPECT_EQ(check.expression, "innerRect.area() != 0");
}

TEST(ImageCopy, SplitsAndMergesChannels) {
    const Image source = ramp(4, 3, LQ::COLOR_MODE_RGBA);
    std::vector<Image> channels;
    LQ::splitChannels(source, channels);
    ASSERT_EQ(channels.size(), 4u);
    EXPECT_EQ(channels[3].pixel(2, 1)[0], 162);

    Image merged;
    LQ::mergeChannels(channels, merged, LQ::COLOR_MODE_RGBA);
    ASSERT_EQ(merged.size(), source.size());
    EXPECT_EQ(0, std::memcmp(merged.data(), source.data(), 4 * 3 * 4));

    FailedCheck check = catchCheck([&] { LQ::splitChannels(ramp(2, 2, LQ::COLOR_MODE_MONO), channels); });
    EXPECT_EQ(check.expression, "numChannels > 1");
    EXPECT_EQ(check.tail, "not enougth channels: 1");
    check = catchCheck([&] { LQ::mergeChannels(channels, merged, LQ::COLOR_MODE_BGR); });
    EXPECT_EQ(check.expression, "(numChannels) == (depth(targetColorMode))");
    EXPECT_EQ(check.tail, "Wrong number of channels: 4");
    channels[2] = ramp(3, 3, LQ::COLOR_MODE_MONO);
    check = catchCheck([&] { LQ::mergeChannels(channels, merged, LQ::COLOR_MODE_RGBA); });
    EXPECT_EQ(check.expression, "(images[i].size()) == (size)");
    channels.resize(1);
    check = catchCheck([&] { LQ::mergeChannels(channels, merged, LQ::COLOR_MODE_MONO); });
    EXPECT_EQ(check.expression, "(images.size()) >= (2u)");
}
