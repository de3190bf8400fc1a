#pragma once
// Integral images: sums of any rectangle by four look-ups, of pixels or of gradient
// magnitudes per orientation bin.

#include "LQ_Image.h"
#include "LQ_Neon.h"

namespace LQ {

// (W + 1) x (H + 1) sums of the whole image's size; inside rect the sums of rect alone, 0
// elsewhere. A rect of zero area means the whole image.
void computeIntegral(const Image& image, Image& integral, const BaseRect<int>& rect);
void computeIntegral(const Image& image, Image& integral);
// whole image, compact rows only
void computeIntegralOptimized(const Image& image, Image& integral);
// inclusive sums without the zero border, compact rows
void integral_image(const unsigned char* source, unsigned int* target, unsigned int width, unsigned int height);
// the rectangle of the image an integral image was made of
inline BaseRect<int> integralRect(const Image& integral) {
    return BaseRect<int>(0, 0, integral.width() - 1, integral.height() - 1);
}

// Integral HOG of rect, in rect's own coordinates; mode picks 6 unsigned or 12 signed bins.
void computeIntegralHog(const Image& image, Image& target, const BaseRect<int>& rect, ColorMode mode);
void computeIntegralHog(const unsigned char* data, int stripLength, Image& target, const BaseRect<int>& rect,
                        ColorMode mode);

// One row of sums: out[x + 1] = in[0] + ... + in[x] + above[x + 1], for x below width.
void integralRowScalar(const unsigned char* in, const unsigned int* above, unsigned int* out, int width);
#if defined(LQ_HAVE_NEON)
void integralRowNeon(const unsigned char* in, const unsigned int* above, unsigned int* out, int width);
#endif
#if defined(LQ_HAVE_SSSE3)
// SSE2, which every x86-64 processor has
void integralRowSse(const unsigned char* in, const unsigned int* above, unsigned int* out, int width);
// only where the processor has AVX2
void integralRowAvx2(const unsigned char* in, const unsigned int* above, unsigned int* out, int width);
#endif

// One row of an integral HOG of a region width pixels wide (at least 3), between the source
// rows above and below: positions 2 .. width of current from previous and the gradients of
// centre. hog is one of the two bin tables, bins its bin count.
void integralHogRowScalar(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                          const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current);
#if defined(LQ_HAVE_NEON)
void integralHogRowNeon(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                        const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current);
#endif
#if defined(LQ_HAVE_SSSE3)
void integralHogRowSse(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                       const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current);
// only where the processor has AVX2
void integralHogRowAvx2(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                        const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current);
#endif

// 512 x 512 tables addressed [a + 256][b + 256], built at first use
const unsigned char* getMagnitudes();
const unsigned char* getHogUnsigned6();
const unsigned char* getHogSigned12();

}  // namespace LQ
