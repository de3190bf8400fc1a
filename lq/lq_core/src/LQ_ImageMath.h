#pragma once
// Sums and means over rectangles of an image.

#include "LQ_Image.h"

namespace LQ {

// Samples of a MONO, MONO16 or DEPTH image in a 32-bit accumulator; a rect of zero area
// means the whole image.
unsigned int imageSum(const Image& image, const BaseRect<int>& rect);
// imageSum divided by the area
float imageMean(const Image& image, const BaseRect<int>& rect);
// Integer means into out: one byte for MONO, one 16-bit value for MONO16 and DEPTH, one
// byte per channel for the three-byte colour modes; zeros for a rect of zero area.
void imageMean(const Image& image, unsigned char* out, const BaseRect<int>& rect);

}  // namespace LQ
