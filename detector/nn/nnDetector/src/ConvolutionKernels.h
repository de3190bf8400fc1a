#pragma once
// Float kernels under the weight-carrying layers: sums of products, the clamp, one plane
// through one kernel, and the matrix product that runs the convolution layers.

#include <cstddef>
#include <vector>

#include "LQ_Neon.h"

namespace LQ {

// acc = init, then acc = acc + a[i] * b[i] for i upward, multiply and add kept apart
float dotProduct(const float* a, const float* b, int n, float init);

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

}  // namespace LQ
