#pragma once
// Scaling: halving, averaging by blocks, bilinear and nearest-neighbour sampling, and the
// 4-bit fixed-point bilinear kernel of the tracker.

#include <cstddef>

#include "LQ_Image.h"
#include "LQ_Neon.h"

namespace LQ {

// shrink by zoom > 1, each target pixel the mean of its block
void zoomImageAverage(const Image& source, Image& target, float zoom, BaseRect<int> targetRect);
// the same for mono, read from an integral image
void zoomImageIntegral(const Image& integral, Image& target, float zoom, BaseRect<int> targetRect);
// halve: MONO, DEPTH and the colour modes; (a + b + c + d) >> 2 per channel
void zoomImageTwice(const Image& source, Image& target, BaseRect<int> targetRect);
// raw kernels: width and height are the target's
void zoomImageTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                    int targetStride, int channels);
void zoomMonoTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                   int targetStride);
// only valid samples (1 to 4999) count; fewer than two give 0
void zoomDepthTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                    int targetStride);

// target size = source size x scale
void resizeImageBilinear(const Image& source, Image& target, float scale, BaseRect<int> targetRect);
void resizeImageNn(const Image& source, Image& target, float scale, BaseRect<int> targetRect);
// below 0.5 averaging, else bilinear
void resizeImageAccurate(const Image& source, Image& target, float scale, BaseRect<int> targetRect);

// the target is sized by the caller; 4-bit fixed-point bilinear
void resizeBilinearBase(const Image& source, Image& target);
void resizeBilinear(const Image& source, Image& target);
// Keeps its tables and row buffers in one static block: not re-entrant.
void ResizeBilinearBase(const unsigned char* source, size_t srcWidth, size_t srcHeight, size_t srcStride,
                        unsigned char* target, size_t dstWidth, size_t dstHeight, size_t dstStride,
                        size_t channelCount);
void EstimateAlphaIndexBase(size_t srcSize, size_t dstSize, int* indices, int* alphas, size_t channels);

// Row kernels of the halving, exposed so the vector paths can be compared with the scalar
// one: width target pixels from two source rows.
void zoomMonoTwiceRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
#if defined(LQ_HAVE_NEON)
void zoomMonoTwiceRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
#endif
#if defined(LQ_HAVE_SSSE3)
void zoomMonoTwiceRowSse(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
void zoomMonoTwiceRowAvx2(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
void evenBytesRowSse(const unsigned char* in, unsigned char* out, int width);
void evenBytesRowAvx2(const unsigned char* in, unsigned char* out, int width);
#endif

// Gathers of the nearest resize: out[x] = in[columns[x]] for pixels of 1 byte.
void gatherRowScalar(const unsigned char* in, const int* columns, unsigned char* out, int width);

}  // namespace LQ
