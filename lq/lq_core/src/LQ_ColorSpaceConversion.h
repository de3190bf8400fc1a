#pragma once
// Conversions between colour modes. Each conversion with a rectangle checks that the
// rectangle lies in the source (zero area: the whole image), that the source has the mode
// it wants, creates the target at the source's full size and writes only the rectangle.

#include "LQ_Image.h"
#include "LQ_Neon.h"
#include "LQ_SharedPtr.h"

namespace LQ {

void bgrToYuv(const Image& source, Image& target, const BaseRect<int>& rect);
void rgbToYuv(const Image& source, Image& target, const BaseRect<int>& rect);
void rgbaToYuv(const Image& source, Image& target, const BaseRect<int>& rect);
void monoToYuv(const Image& source, Image& target, const BaseRect<int>& rect);
void bgrToMono(const Image& source, Image& target, const BaseRect<int>& rect);
void rgbToMono(const Image& source, Image& target, const BaseRect<int>& rect);
void rgbaToMono(const Image& source, Image& target, const BaseRect<int>& rect);
void yuvToMono(const Image& source, Image& target, const BaseRect<int>& rect);
void floatToMono(const Image& source, Image& target, float offset, float factor, const BaseRect<int>& rect);
void floatToFloat2(const Image& source, Image& target, const BaseRect<int>& rect);
void floatToBgr(const Image& source, Image& target, float offset, float factor, const BaseRect<int>& rect);
void bgrToRgba(const Image& source, Image& target, const BaseRect<int>& rect);
void rgbToRgba(const Image& source, Image& target, const BaseRect<int>& rect);
void bgrToRgb(const Image& source, Image& target, const BaseRect<int>& rect);
void rgbToBgr(const Image& source, Image& target, const BaseRect<int>& rect);
void rgbaToBgr(const Image& source, Image& target, const BaseRect<int>& rect);
void monoToBgr(const Image& source, Image& target, const BaseRect<int>& rect);
void monoToRgb(const Image& source, Image& target, const BaseRect<int>& rect);
void monoToRgba(const Image& source, Image& target, const BaseRect<int>& rect);
void mono16ToMono(const Image& source, Image& target, float factor, const BaseRect<int>& rect);
void mono16ToBgr(const Image& source, Image& target, float factor, const BaseRect<int>& rect);
void mono16ToRgb(const Image& source, Image& target, float factor, const BaseRect<int>& rect);
void mono16ToRgba(const Image& source, Image& target, float factor, const BaseRect<int>& rect);
void monoToFloat(const Image& source, Image& target, float factor, const BaseRect<int>& rect);
void mono16ToFloat(const Image& source, Image& target, float factor, const BaseRect<int>& rect);
void yuvToBgr(const Image& source, Image& target, const BaseRect<int>& rect);
void yuvToRgb(const Image& source, Image& target, const BaseRect<int>& rect);
void yuvToRgba(const Image& source, Image& target, const BaseRect<int>& rect);

// NV21: luma plane, then V, U pairs for each 2 x 2 block; both sides must be even
void nv21ToYuv(const unsigned char* nv21, const BaseSize<int>& size, Image& target);
void nv21ToYuvFlip(const unsigned char* nv21, const BaseSize<int>& size, Image& target);
void nv21ToYuvZoom2(const unsigned char* nv21, const BaseSize<int>& size, Image& target);
void nv21ToYuvZoom2Flip(const unsigned char* nv21, const BaseSize<int>& size, Image& target);
void nv21ToMono(const unsigned char* nv21, const BaseSize<int>& size, Image& target);
void nv21ToMonoFlip(const unsigned char* nv21, const BaseSize<int>& size, Image& target);
void yuvToNv21(const Image& source, SharedArray<unsigned char>& out);
void yuvToYuy2(const Image& source, SharedArray<unsigned char>& out);

// dispatchers by the source's mode
void toMono(const Image& source, Image& target, const BaseRect<int>& rect);
void toBgr(const Image& source, Image& target, const BaseRect<int>& rect);
void toRgb(const Image& source, Image& target, const BaseRect<int>& rect);
void toRgba(const Image& source, Image& target, const BaseRect<int>& rect);
void toYuv(const Image& source, Image& target, const BaseRect<int>& rect);
void toColorMode(const Image& source, Image& target, ColorMode mode, const BaseRect<int>& rect);

// Luma rows, exposed so the vector paths can be compared with the scalar one: pixels of
// `step` bytes with red, green and blue at the given byte offsets.
void lumaRowScalar(const unsigned char* in, unsigned char* out, int width, int step, int r, int g, int b);
// RGB of `step` (3 or 4) bytes, red at byte r (0 or 2), to YUV and back; four-byte
// targets get alpha 255
void rgbToYuvRowScalar(const unsigned char* in, unsigned char* out, int width, int step, int r);
void yuvToRgbRowScalar(const unsigned char* in, unsigned char* out, int width, int step, int r);
// One target row of NV21: pixel x takes luma[zoom * x] and the V, U pair of that column,
// zoom 1 or 2; mirrored, pixel x is pixel width - 1 - x of the plain row. The luma and pair
// rows hold zoom * width bytes (rounded up to even).
void nv21RowScalar(const unsigned char* luma, const unsigned char* pairs, unsigned char* out, int width, int zoom,
                   bool flip);
// the Y byte of each YUV pixel
void yuvToMonoRowScalar(const unsigned char* in, unsigned char* out, int width);
#if defined(LQ_HAVE_NEON)
// three- and four-byte pixels; r is 0 or 2
void lumaRowNeon(const unsigned char* in, unsigned char* out, int width, int step, int r);
void nv21RowNeon(const unsigned char* luma, const unsigned char* pairs, unsigned char* out, int width, int zoom,
                 bool flip);
void yuvToMonoRowNeon(const unsigned char* in, unsigned char* out, int width);
#endif
#if defined(LQ_HAVE_SSSE3)
// x86 rows, 16 pixels a step with SSSE3 and 32 with AVX2; the caller checks the processor.
// Three-byte pixels with red at byte r (0 or 2) to luma, and four-byte ones
void lumaRowSse(const unsigned char* in, unsigned char* out, int width, int r);
void lumaRowAvx2(const unsigned char* in, unsigned char* out, int width, int r);
void lumaRow4Avx2(const unsigned char* in, unsigned char* out, int width, int r);
// YUV to three-byte RGB (red at byte r) and back
void yuvToRgbRowSse(const unsigned char* in, unsigned char* out, int width, int r);
void yuvToRgbRowAvx2(const unsigned char* in, unsigned char* out, int width, int r);
void rgbToYuvRowSse(const unsigned char* in, unsigned char* out, int width, int r);
void rgbToYuvRowAvx2(const unsigned char* in, unsigned char* out, int width, int r);
// byte c of each three-byte pixel
void channelRowSse(const unsigned char* in, unsigned char* out, int width, int c);
// each byte into a three-byte pixel
void spreadRowSse(const unsigned char* in, unsigned char* out, int width);
void spreadRowAvx2(const unsigned char* in, unsigned char* out, int width);
// bytes 0 and 2 of each three-byte pixel exchanged; in and out must not overlap
void swapRowSse(const unsigned char* in, unsigned char* out, int width);
void swapRowAvx2(const unsigned char* in, unsigned char* out, int width);
// three-byte pixels to four: byte r, byte 1, byte 2 - r, then 255
void toFourRowSse(const unsigned char* in, unsigned char* out, int width, int r);
void nv21RowSse(const unsigned char* luma, const unsigned char* pairs, unsigned char* out, int width, int zoom,
                bool flip);
void nv21RowAvx2(const unsigned char* luma, const unsigned char* pairs, unsigned char* out, int width, int zoom,
                 bool flip);
#endif

}  // namespace LQ
