#pragma once
// Rotations by quarter turns, transposition, mirrors, and free rotation with scale.

#include "LQ_Image.h"
#include "LQ_Neon.h"

namespace LQ {

// k quarter turns, taken modulo 4; 1: pixel (x, y) goes to column y, row W - 1 - x;
// 3: to column H - 1 - y, row x.
void rotatePi4(const Image& source, Image& target, int quarterTurns);
// pixel (x, y) goes to (y, x); any pixel size
void transpose(const Image& source, Image& target);
void flipLeftRight(const Image& source, Image& target);
void flipTopBottom(const Image& source, Image& target);

// Samples the source at M (target - targetCentre) + sourceCentre, M the rotation by angle
// times zoom; returns whether the target's frame maps entirely into the source. The
// target keeps its size; its mode must equal the source's.
bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoom,
                        const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);
// the two zooms must be equal
bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoomX, float zoomY,
                        const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);
// about the target's centre ((width - 1) / 2, (height - 1) / 2)
bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoomX, float zoomY,
                        const BasePoint<float>& sourceCentre);
// bilinear samples in 1/256 pixel, clamped into the source; MONO, DEPTH and 3-byte colour
bool rotateAndZoomImageNn(const Image& source, Image& target, float angle, float zoom,
                          const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);
// means of squares with the side of the integer zoom; MONO, the 16-bit modes and 3-byte colour
bool rotateAndZoomImageAverage(const Image& source, Image& target, float angle, float zoom,
                               const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);

// the frame's size after a rotation, between the upright and the turned frame
BaseSize<int> getRotatedFrameSize(const BaseSize<int>& size, float angle);
// m: the 2 x 2 matrix from target offsets to source offsets, row-major
bool allInside(const BaseSize<int>& sourceSize, const BaseSize<int>& targetSize, const float* m,
               const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);

// ---- kernels ------------------------------------------------------------------------------
// Exposed so that tests hold every vector path against its scalar reference.

// Where pixel (x, y) of a W x H source lands: transposed at (y, x), turned once at
// (y, W - 1 - x), three times at (H - 1 - y, x).
enum class Turn { Transpose, Once, Thrice };
// The target is created already, with the swapped size and the source's mode.
void turnScalar(const Image& source, Image& target, Turn turn);
#if defined(LQ_HAVE_NEON)
// 1- and 3-byte pixels in blocks of 8 x 8; other sizes as the scalar path
void turnNeon(const Image& source, Image& target, Turn turn);
#endif
#if defined(LQ_HAVE_SSSE3)
// 1-byte pixels in blocks of 8 x 8 (SSE2), 3-byte pixels in blocks of 4 x 4 (needs SSSE3)
void turnSse(const Image& source, Image& target, Turn turn);
#endif

// Mirror of one row of width pixels of depth bytes.
void flipRowScalar(const unsigned char* in, unsigned char* out, int width, int depth);
#if defined(LQ_HAVE_NEON)
void flipRowNeon(const unsigned char* in, unsigned char* out, int width, int depth);
#endif
#if defined(LQ_HAVE_SSSE3)
// needs SSSE3
void flipRowSse(const unsigned char* in, unsigned char* out, int width, int depth);
#endif

}  // namespace LQ
