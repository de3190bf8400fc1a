#include <gtest/gtest.h>

#include "LQ_Gradients.h"
#include "LQ_ImageCopy.h"
#include "LQ_ImageResize.h"
#include "LQ_ImageRotate.h"
#include "LQ_Integral.h"
#include "TestImages.h"

using LQ::Image;
using LQ::Rect;
using LQ::Size;

// The kernels whose value tests use one or two sizes only, on every small size, compact and
// as views with a wider stride: the sanitizer watches for accesses outside the images. (The
// colour, resize, turn, census, integral and gradient kernels sweep the sizes in their own tests.)
TEST(KernelSizes, EveryKernelStaysInsideItsImages) {
    for (int width = 1; width <= 12; ++width)
        for (int height = 1; height <= 9; ++height)
            for (bool asView : {false, true}) {
                SCOPED_TRACE(::testing::Message() << width << "x" << height << (asView ? " view" : ""));
                const unsigned seed = width * 100 + height;
                Image parents[3];
                const auto make = [&](LQ::ColorMode mode, int i) {
                    return asView ? randomView(width, height, mode, seed + i, parents[i]) : randomImage(width, height, mode, seed + i);
                };
                const Image mono = make(LQ::COLOR_MODE_MONO, 0), bgr = make(LQ::COLOR_MODE_BGR, 1),
                            rgba = make(LQ::COLOR_MODE_RGBA, 2);
                Image out, integral;
                LQ::computeIntegralHog(mono, out, mono.rect(), LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12);
                LQ::computeGradients(mono, out);
                LQ::thinGradients(out);
                LQ::canny(mono, out, 5, 40);
                LQ::computeIntegral(mono, integral);
                if (width >= 2 && height >= 2) LQ::zoomImageIntegral(integral, out, 1.7f, Rect());

                for (const Image* image : {&mono, &bgr, &rgba}) {
                    LQ::copyImageBorder(*image, out, Rect(-2, -3, width + 2, height + 1));
                    ASSERT_EQ(out.pixel(0, 0)[0], image->pixel(0, 0)[0]);
                    if (width >= 2 && height >= 2 && image != &rgba) {  // the sampler knows one- and three-byte pixels
                        Image turned(Size(7, 5), image->colorMode());
                        LQ::rotateAndZoomImage(*image, turned, 0.7f, 1.3f, 1.3f, LQ::PointF(width / 2.f, height / 2.f));
                        LQ::rotateAndZoomImage(*image, turned, -0.4f, 3.5f, 3.5f, LQ::PointF(width / 2.f, height / 2.f));
                    }
                }
            }
}
