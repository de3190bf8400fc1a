#pragma once
// Scaling: halving, averaging by blocks, bilinear and nearest-neighbour sampling, and the
// 4-bit fixed-point bilinear kernel of the tracker.

#include <cstddef>
#include <vector>

#include "LQ_Image.h"
#include "LQ_Neon.h"

namespace LQ {

// Shrinks by zoom > 1; each target pixel is the truncated mean of its block. MONO and the
// colour modes. An all-zero targetRect means the whole target.
void zoomImageAverage(const Image& source, Image& target, float zoom, BaseRect<int> targetRect);
// The same for mono, read from an integral image ((W + 1) x (H + 1) sums).
void zoomImageIntegral(const Image& integral, Image& target, float zoom, BaseRect<int> targetRect);
// Halves: (a + b + c + d) >> 2 per channel; MONO, DEPTH (valid samples only) and colour modes.
void zoomImageTwice(const Image& source, Image& target, BaseRect<int> targetRect);
// Raw kernels of the halving; width and height are the target's.
void zoomImageTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                    int targetStride, int channels);
void zoomMonoTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                   int targetStride);
// 16-bit depth: only samples from 1 to 4999 count; fewer than two in a block give 0.
void zoomDepthTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                    int targetStride);

// Target size = source size x scale; positions in 1/256 pixel, the horizontal pass
// truncated to 8 bits before the vertical one.
void resizeImageBilinear(const Image& source, Image& target, float scale, BaseRect<int> targetRect);
void resizeImageNn(const Image& source, Image& target, float scale, BaseRect<int> targetRect);
// below 0.5 averaging, else bilinear
void resizeImageAccurate(const Image& source, Image& target, float scale, BaseRect<int> targetRect);

// The target is sized by the caller; bilinear with 4 fraction bits. One function, two names.
void resizeBilinearBase(const Image& source, Image& target);
void resizeBilinear(const Image& source, Image& target);
// Keeps its tables and row buffers in one static block: not re-entrant.
void ResizeBilinearBase(const unsigned char* source, size_t srcWidth, size_t srcHeight, size_t srcStride,
                        unsigned char* target, size_t dstWidth, size_t dstHeight, size_t dstStride,
                        size_t channelCount);
// The kernel's column table: per target position and channel the first neighbour's index
// (s x channels + c) and the weight 0 to 16 of the second.
void EstimateAlphaIndexBase(size_t srcSize, size_t dstSize, int* indices, int* alphas, size_t channels);

// ---- row kernels --------------------------------------------------------------------------
// Exposed so that tests hold every vector path against its scalar reference.

// Halving: width target pixels from two source rows, (a + b + c + d) >> 2.
void zoomMonoTwiceRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
// the same for pixels of three bytes
void zoomBgrTwiceRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
// (a + b + c + d + 2) >> 2 for pixels of any size: the 4-bit kernel at exactly half the size
void halveRoundedRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width,
                           int channels);
#if defined(LQ_HAVE_NEON)
void zoomMonoTwiceRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
void zoomBgrTwiceRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
// vector code for 1 and 3 channels
void halveRoundedRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width,
                         int channels);
#endif
#if defined(LQ_HAVE_SSSE3)
// need SSSE3
void zoomMonoTwiceRowSse(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
void zoomBgrTwiceRowSse(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
void halveRoundedRowSse(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width,
                        int channels);
// needs AVX2
void zoomMonoTwiceRowAvx2(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width);
#endif

// out[x] = in[2 x]: the nearest resize of mono at exactly half the width
void evenBytesRowScalar(const unsigned char* in, unsigned char* out, int width);
#if defined(LQ_HAVE_NEON)
void evenBytesRowNeon(const unsigned char* in, unsigned char* out, int width);
#endif
#if defined(LQ_HAVE_SSSE3)
// SSE2 only
void evenBytesRowSse(const unsigned char* in, unsigned char* out, int width);
// needs AVX2
void evenBytesRowAvx2(const unsigned char* in, unsigned char* out, int width);
#endif

// Byte gathers, the same table for every row. The vector paths fetch 16 bytes a block: one
// to four 16-byte windows of the row from base, picked apart by table look-ups. A block
// whose bytes lie further apart, or a row too short for a window, has windows 0 and is
// gathered byte by byte.
class GatherTable {
public:
    // offsets: 16 per block; no window reaches beyond rowBytes
    void build(const int* offsets, int blocks, int rowBytes);
    int blocks() const { return static_cast<int>(base_.size()); }
    // per block: the first byte of its windows, their number, and 16 indices from that byte
    const int* bases() const { return base_.data(); }
    const unsigned char* windowCounts() const { return windows_.data(); }
    const unsigned char* indices() const { return index_.data(); }

private:
    std::vector<int> base_;
    std::vector<unsigned char> windows_, index_;
};

// out[i] = row[offsets[i]] for i below count
void gatherRowScalar(const unsigned char* row, const int* offsets, unsigned char* out, int count);
#if defined(LQ_HAVE_NEON)
// table: built from the same offsets, count / 16 blocks
void gatherRowNeon(const unsigned char* row, const GatherTable& table, const int* offsets, unsigned char* out,
                   int count);
#endif
#if defined(LQ_HAVE_SSSE3)
void gatherRowSse(const unsigned char* row, const GatherTable& table, const int* offsets, unsigned char* out,
                  int count);
#endif

// Interpolation across one row: out[i] = row[first[i]] * w0[i] + row[second[i]] * w1[i],
// in 16 bits. With the weights 16 - alpha and alpha this is (next - this) alpha + 16 this,
// with 256 - f and f it is (256 - f) a + f b; neither leaves 16 bits.
struct BilinearColumns {
    std::vector<int> first, second;
    std::vector<unsigned short> w0, w1;
    GatherTable table;  // blocks of 8 outputs: their 8 first bytes, then their 8 second bytes

    void resize(int count);
    int count() const { return static_cast<int>(first.size()); }
    // after the columns are filled; rowBytes: how much of a source row may be read
    void buildTable(int rowBytes);
};

void bilinearAcrossScalar(const unsigned char* row, const BilinearColumns& columns, unsigned short* out);
#if defined(LQ_HAVE_NEON)
void bilinearAcrossNeon(const unsigned char* row, const BilinearColumns& columns, unsigned short* out);
#endif
#if defined(LQ_HAVE_SSSE3)
void bilinearAcrossSse(const unsigned char* row, const BilinearColumns& columns, unsigned short* out);
#endif

// Blends of two interpolated rows t (upper) and u (lower) into bytes.
// 4 fraction bits, alpha 0 to 16: ((u - t) alpha + 16 t + 128) >> 8.
void blendRows4Scalar(const unsigned short* t, const unsigned short* u, int alpha, unsigned char* out, int count);
// 8 bits, each row first truncated to 8 bits: ((256 - f) (t >> 8) + f (u >> 8)) >> 8.
void blendRows8Scalar(const unsigned short* t, const unsigned short* u, int fraction, unsigned char* out, int count);
#if defined(LQ_HAVE_SSSE3)
// SSE2 only
void blendRows4Sse(const unsigned short* t, const unsigned short* u, int alpha, unsigned char* out, int count);
void blendRows8Sse(const unsigned short* t, const unsigned short* u, int fraction, unsigned char* out, int count);
#endif
#if defined(LQ_HAVE_NEON)
void blendRows4Neon(const unsigned short* t, const unsigned short* u, int alpha, unsigned char* out, int count);
void blendRows8Neon(const unsigned short* t, const unsigned short* u, int fraction, unsigned char* out, int count);
#endif

}  // namespace LQ
