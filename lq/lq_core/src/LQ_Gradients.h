#pragma once
// Gradient operators over mono images: Sobel, Roberts cross, direction sectors, Canny.

#include "LQ_Image.h"
#include "LQ_Neon.h"

namespace LQ {

// COLOR_MODE_GRADIENT with Gx / 8 and Gy / 8 as signed bytes; borders 0
void SobelGradient(const Image& source, Image& target);
void SobelGradientInRect(const Image& source, Image& target, const BaseRect<int>& rect);
void computeSobelGradient(const Image& source, Image& target);
// undivided sums as 16-bit two's complement, one COLOR_MODE_MONO16 image per direction
void computeSobelGradient(const Image& source, Image& first, Image& second);
void SobelAbsolute(const Image& source, Image& target);
void robertCross(const Image& source, Image& target);
// byte 0 the direction sector 0 to 3, byte 1 the magnitude
void computeGradients(const Image& source, Image& target);
void thinGradients(Image& image);
void updateGradients(unsigned char* pixel, int low, int stripLength);
// minThreshold must not be negative: the edge walk stops at the zero border only then
void canny(const Image& source, Image& target, int minThreshold, int maxThreshold);

// Row kernels, exposed so the vector paths can be compared with the scalar one: Gx / 8 and
// Gy / 8 of columns 1 .. width - 2 of the row between above and below, at target[2x] and
// target[2x + 1]; width >= 3.
void sobelRowScalar(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                    signed char* target, int width);
#if defined(LQ_HAVE_NEON)
void sobelRowNeon(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                  signed char* target, int width);
#endif
#if defined(LQ_HAVE_SSSE3)
// SSE2, which every x86-64 processor has
void sobelRowSse(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                 signed char* target, int width);
#endif

}  // namespace LQ
