#pragma once
// Sums and means over rectangles of an image.

#include "LQ_Image.h"

namespace LQ {

// samples of a MONO, MONO16 or DEPTH image, in a 32-bit accumulator
unsigned int imageSum(const Image& image, const BaseRect<int>& rect);
float imageMean(const Image& image, const BaseRect<int>& rect);
// Integer means into out: one byte for MONO, one 16-bit value for the 16-bit modes, one
// byte per channel for the three-byte colour modes; zeros for an empty rect.
void imageMean(const Image& image, unsigned char* out, const BaseRect<int>& rect);

}  // namespace LQ
