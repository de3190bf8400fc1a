#include <gtest/gtest.h>

#include "LQ_ColorSpaceConversion.h"
#include "LQ_Gradients.h"
#include "LQ_ImageCopy.h"
#include "LQ_ImageResize.h"
#include "LQ_ImageRotate.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

// Every kernel on every small size, on compact images and on views with a wider stride.
// The values are checked elsewhere; here the sanitizer watches for reads and writes
// outside the images, and a few invariants must hold at every size.
TEST(KernelSizes, EveryKernelStaysInsideItsImages) {
    for (int width = 1; width <= 12; ++width) {
        for (int height = 1; height <= 9; ++height) {
            for (bool asView : {false, true}) {
                SCOPED_TRACE(::testing::Message() << width << "x" << height << (asView ? " view" : ""));
                const unsigned seed = width * 100 + height;
                Image parents[3];
                const auto make = [&](LQ::ColorMode mode, int i) {
                    return asView ? randomView(width, height, mode, seed + i, parents[i]) : randomImage(width, height, mode, seed + i);
                };
                const Image mono = make(LQ::COLOR_MODE_MONO, 0), bgr = make(LQ::COLOR_MODE_BGR, 1),
                            rgba = make(LQ::COLOR_MODE_RGBA, 2);
                Image out, other;
                const Rect corner(width - 1, height - 1, width, height);
                for (LQ::ColorMode mode : {LQ::COLOR_MODE_MONO, LQ::COLOR_MODE_BGR, LQ::COLOR_MODE_RGB, LQ::COLOR_MODE_YUV,
                                           LQ::COLOR_MODE_RGBA}) {
                    LQ::toColorMode(bgr, out, mode, Rect());
                    LQ::toColorMode(bgr, out, mode, corner);
                    if (mode != LQ::COLOR_MODE_RGB) LQ::toColorMode(rgba, other, mode, Rect());  // no such route
                    LQ::toColorMode(mono, other, mode, corner);
                }
                LQ::toColorMode(mono, out, LQ::COLOR_MODE_RMCT, Rect());
                LQ::toColorMode(mono, out, LQ::COLOR_MODE_GRADIENT, Rect());
                LQ::toColorMode(mono, out, LQ::COLOR_MODE_INTEGRAL, corner);
                ASSERT_EQ(out.row<unsigned int>(height)[width], mono.pixel(width - 1, height - 1)[0]);

                LQ::computeRmct(mono, out, Rect(0, 0, width, height));
                LQ::computeIntegralHog(mono, out, mono.rect(), LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12);
                LQ::computeGradients(mono, out);
                LQ::thinGradients(out);
                LQ::canny(mono, out, 5, 40);
                LQ::robertCross(mono, out);
                LQ::SobelAbsolute(mono, out);

                for (const Image* image : {&mono, &bgr, &rgba}) {
                    LQ::zoomImageTwice(*image, out, Rect());
                    ASSERT_EQ(out.size(), Size(width / 2, height / 2));
                    for (float scale : {0.3f, 0.5f, 1.0f, 1.7f}) {
                        LQ::resizeImageNn(*image, out, scale, Rect());
                        LQ::resizeImageBilinear(*image, out, scale, Rect());
                    }
                    LQ::zoomImageAverage(*image, out, 1.5f, Rect());
                    for (int turns = 0; turns < 4; ++turns) LQ::rotatePi4(*image, out, turns);
                    LQ::flipLeftRight(*image, out);
                    LQ::flipTopBottom(*image, out);
                    LQ::transpose(*image, out);
                    LQ::copyImageBorder(*image, out, Rect(-2, -3, width + 2, height + 1));
                    ASSERT_EQ(out.pixel(0, 0)[0], image->pixel(0, 0)[0]);
                    if (width >= 2 && height >= 2) {
                        Image turned(Size(7, 5), image->colorMode());
                        if (image != &rgba) {  // the sampler knows one- and three-byte pixels
                            LQ::rotateAndZoomImage(*image, turned, 0.7f, 1.3f, 1.3f, LQ::PointF(width / 2.f, height / 2.f));
                            LQ::rotateAndZoomImage(*image, turned, -0.4f, 3.5f, 3.5f, LQ::PointF(width / 2.f, height / 2.f));
                        }
                        Image sized(Size(2 * width + 1, height + 3), image->colorMode());
                        LQ::resizeBilinear(*image, sized);
                        Image shrunk(Size((width + 1) / 2, (height + 1) / 2), image->colorMode());
                        LQ::resizeBilinear(*image, shrunk);
                    }
                }
                Image integral;
                LQ::computeIntegral(mono, integral);
                if (width >= 2 && height >= 2) LQ::zoomImageIntegral(integral, out, 1.7f, Rect());
            }
        }
    }
}
