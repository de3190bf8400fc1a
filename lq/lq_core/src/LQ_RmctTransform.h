#pragma once
// The census image of the cascades: per pixel, which of the eight neighbours stand above
// their own mean plus a margin.

#include "LQ_Image.h"
#include "LQ_Neon.h"

namespace LQ {

// The interior is always computed whole; rect decides which border lines are filled.
void computeRmct(const Image& image, Image& rmct, const BaseRect<int>& rect);
void computeRmct(const Image& image, Image& rmct);
// one code; offsets[0] gives bit 7, offsets[7] bit 0
unsigned char computeRmctPixel(const unsigned char* source, const int* offsets);
// entry v: the number of set bits of v
const unsigned char* getNumbits256();

void bitDiff(const Image& source1, const Image& source2, Image& target, const BaseRect<int>& rect);
unsigned int bitDiffSum(const Image& source1, const Image& source2);
unsigned int bitDiffSum(const Image& source1, const Image& source2, int ax, int ay, int bx, int by, int width,
                        int height);

// Row kernels, exposed so the vector path can be compared with the scalar one: codes of
// columns 1 .. width - 2 of the row between above and below; width >= 3.
void rmctRowScalar(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                   unsigned char* target, int width);
#if defined(LQ_HAVE_NEON)
void rmctRowNeon(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                 unsigned char* target, int width);
#endif
#if defined(LQ_HAVE_SSSE3)
// SSE2, which every x86-64 processor has
void rmctRowSse(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                unsigned char* target, int width);
// only where the processor has AVX2
void rmctRowAvx2(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                 unsigned char* target, int width);
#endif

}  // namespace LQ
