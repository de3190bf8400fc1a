#pragma once
// Float kernels under the weight-carrying layers: sums of products, the clamp, one plane
// through one kernel, the matrix product over unfolded patches, and the same sums read in
// place, which run the convolution layers.

#include <cstddef>
#include <vector>

#include "LQ_Neon.h"

namespace LQ {

// acc = init, then acc = acc + a[i] * b[i] for i upward, multiply and add kept apart
float dotProduct(const float* a, const float* b, int n, float init);
// out[r] = dotProduct(a + r * step, b, n, init[r]) for r below rows: the same bits, several
// rows at a time so that their running sums overlap in the pipeline
void dotProducts(const float* a, int rows, int step, const float* b, int n, const float* init, float* out);

// p[i] = max(p[i], value) in place; p[i] stays unless it is below value, so NaN and -0 stay
template <class T>
void maxVector(T* p, int n, T value);

// One plane through one kernel at a stride; the last window that doesn't fit is dropped:
// outW = (srcWidth - kernelWidth) / stride + 1, outH likewise, and dst has compact rows of
// outW. Each output is bias, then the taps added in row-major order.
template <class T>
void applyFilter(const T* src, T* dst, int srcWidth, int srcHeight, const T* kernel, int kernelWidth,
                 int kernelHeight, T bias, int stride);
// The same at stride 1 over a width x height region with explicit row steps, in elements.
template <class T>
void applyFilter(const T* src, T* dst, int width, int height, const T* kernel, int kernelWidth,
                 int kernelHeight, T bias, int srcStride, int dstStride);

// ---- the convolution as a matrix product ------------------------------------------------
// The patches of a plane stack are unfolded into columns, so that every output plane is one
// row of weights times that matrix: out(r, j) = bias[r] + sum over k upward of
// weight(r, k) * column(k, j), multiply and add kept apart. The weights are packed in panels
// of PANEL_ROWS rows, interleaved along k, so the product reads them with one stream.

constexpr int PANEL_ROWS = 4;

// rows x depth row-major weights into panels; rows past the last are zeros
void packPanels(const float* weights, int rows, int depth, std::vector<float>& packed);
// the packed value of (row, k)
inline float& packedAt(std::vector<float>& packed, int depth, int row, int k) {
    return packed[(static_cast<size_t>(row / PANEL_ROWS) * depth + k) * PANEL_ROWS + row % PANEL_ROWS];
}

// Row (c, ky, kx) of the unfolded matrix, c major, holds input(c, y * stride + ky,
// x * stride + kx) at column y * outWidth + x. columns has channels * kH * kW rows of
// outWidth * outHeight values.
void unfoldPatches(const float* input, int channels, int width, int height, int kernelWidth, int kernelHeight,
                   int stride, int outWidth, int outHeight, float* columns);

// out[r * outStride + j] for r below rows and j below count; row k of the unfolded matrix
// starts at columns + k * columnStride. The scalar form is the reference; the vector form gives the
// same bits, each lane accumulating in the same order.
void multiplyPanelsScalar(const float* packed, const float* bias, int rows, int depth, const float* columns,
                          int columnStride, int count, float* out, int outStride);
#if defined(LQ_HAVE_NEON)
void multiplyPanelsNeon(const float* packed, const float* bias, int rows, int depth, const float* columns,
                        int columnStride, int count, float* out, int outStride);
#endif
// the best of the two for this build
#if defined(__x86_64__) || defined(__i386__)
void multiplyPanelsAvx2(const float* packed, const float* bias, int rows, int depth, const float* columns,
                        int columnStride, int count, float* out, int outStride);
#endif
void multiplyPanels(const float* packed, const float* bias, int rows, int depth, const float* columns,
                    int columnStride, int count, float* out, int outStride);

// ---- the convolution read in place ------------------------------------------------------
// The sums of the matrix product without the unfolded copy: column k is the input read from
// planes + offsets[k] on, so out(r, j) = bias[r] + sum over k upward of weight(r, k) *
// planes[offsets[k] + j], multiply and add kept apart. Each output gets the bits of the
// matrix product.
//
// To make every tap one such run, the bordered input is split by phase of the stride: plane
// (c, py, px) holds bordered(c, y * stride + py, x * stride + px). Then tap (c, ky, kx) of output
// (y, x) sits at j = y * phaseWidth + x of plane (c, ky % stride, kx % stride), shifted by
// (ky / stride) * phaseWidth + kx / stride. Sums from outWidth to phaseWidth - 1 of each row
// fall between output rows and are dropped by compactRows; count is
// (outHeight - 1) * phaseWidth + outWidth, and no read leaves the planes.

// the side of a phase plane: the bordered side divided by the stride, rounded up
inline int phaseSize(int size, int pad, int stride) {
    return (size + 2 * pad + stride - 1) / stride;
}
// channels x stride x stride planes of phaseSize(height) x phaseSize(width), zero in the
// border and past the input
void splitPhases(const float* input, int channels, int width, int height, int pad, int stride, float* planes);
// where each tap starts, in the filter's order (c, ky, kx)
void tapOffsets(int channels, int kernelWidth, int kernelHeight, int stride, int phaseWidth, int phaseHeight,
                int* offsets);
// rows of sums at wideStride into outHeight x outWidth planes, dropping the spare sums
void compactRows(const float* wide, int rows, int wideStride, int phaseWidth, int outWidth, int outHeight,
                 float* out);

// The rows are computed in groups of up to this many, as evenly split as possible; the
// weights are packed group by group, a group of g rows from row r0 holding weight(r0 + i, k)
// at r0 * depth + k * g + i, so that a tap's weights for the group are one short run.
constexpr int TAP_GROUP_ROWS = 6;
void packTapGroups(const float* weights, int rows, int depth, std::vector<float>& packed);

// The weights come from packTapGroups. The scalar form is the reference; the vector forms
// give its bits, lane by lane.
void convolveTapsScalar(const float* packed, const float* bias, int rows, int depth, const float* planes,
                        const int* offsets, int count, float* out, int outStride);
#if defined(LQ_HAVE_NEON)
void convolveTapsNeon(const float* packed, const float* bias, int rows, int depth, const float* planes,
                      const int* offsets, int count, float* out, int outStride);
#endif
#if defined(__x86_64__) || defined(__i386__)
void convolveTapsAvx2(const float* packed, const float* bias, int rows, int depth, const float* planes,
                      const int* offsets, int count, float* out, int outStride);
#endif
// the best form for this build and machine
void convolveTaps(const float* packed, const float* bias, int rows, int depth, const float* planes,
                  const int* offsets, int count, float* out, int outStride);

}  // namespace LQ
