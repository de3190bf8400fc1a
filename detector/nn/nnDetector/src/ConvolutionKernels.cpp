#include "ConvolutionKernels.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <type_traits>
#include <utility>

namespace LQ {

float dotProduct(const float* a, const float* b, int n, float init) {
    // one running sum: the order is part of the result, so this loop stays scalar
    float acc = init;
    for (int i = 0; i < n; ++i) {
        const float product = a[i] * b[i];
        acc = acc + product;
    }
    return acc;
}

void dotProducts(const float* a, int rows, int step, const float* b, int n, const float* init, float* out) {
    // each sum alone is a chain of dependent additions; four side by side fill the gaps
    int r = 0;
    for (; r + 4 <= rows; r += 4) {
        const float* a0 = a + static_cast<size_t>(r) * step;
        const float *a1 = a0 + step, *a2 = a1 + step, *a3 = a2 + step;
        float s0 = init[r], s1 = init[r + 1], s2 = init[r + 2], s3 = init[r + 3];
        for (int i = 0; i < n; ++i) {
            const float x = b[i];
            s0 = s0 + a0[i] * x;
            s1 = s1 + a1[i] * x;
            s2 = s2 + a2[i] * x;
            s3 = s3 + a3[i] * x;
        }
        out[r] = s0, out[r + 1] = s1, out[r + 2] = s2, out[r + 3] = s3;
    }
    for (; r < rows; ++r) out[r] = dotProduct(a + static_cast<size_t>(r) * step, b, n, init[r]);
}

template <class T>
void maxVector(T* p, int n, T value) {
    int i = 0;
#if defined(LQ_HAVE_NEON)
    if constexpr (std::is_same<T, float>::value) {
        // compare and select rather than vmaxq: the same answer as the scalar rule for -0 and NaN
        const float32x4_t v = vdupq_n_f32(value);
        for (; i + 16 <= n; i += 16) {
            float* q = p + i;
            const float32x4_t a = vld1q_f32(q), b = vld1q_f32(q + 4), c = vld1q_f32(q + 8),
                              d = vld1q_f32(q + 12);
            vst1q_f32(q, vbslq_f32(vcltq_f32(a, v), v, a));
            vst1q_f32(q + 4, vbslq_f32(vcltq_f32(b, v), v, b));
            vst1q_f32(q + 8, vbslq_f32(vcltq_f32(c, v), v, c));
            vst1q_f32(q + 12, vbslq_f32(vcltq_f32(d, v), v, d));
        }
    }
#endif
    for (; i < n; ++i) p[i] = p[i] < value ? value : p[i];
}

template void maxVector<float>(float* p, int n, float value);

namespace {
// dst row of count outputs += the source row read at step times k
template <class T>
inline void addTapRow(T* __restrict dst, const T* __restrict src, int count, int step, T k) {
    if (step == 1) {
        for (int x = 0; x < count; ++x) dst[x] = dst[x] + src[x] * k;
    } else {
        for (int x = 0; x < count; ++x) dst[x] = dst[x] + src[x * step] * k;
    }
}

// Taps outermost within a row so that the inner loop runs along the outputs and vectorises,
// while each output still gets bias first and the taps in row-major order.
template <class T>
void filterRows(const T* src, int srcStride, T* dst, int dstStride, int outWidth, int outHeight,
                const T* kernel, int kernelWidth, int kernelHeight, T bias, int stride) {
    for (int y = 0; y < outHeight; ++y) {
        T* out = dst + static_cast<size_t>(y) * dstStride;
        for (int x = 0; x < outWidth; ++x) out[x] = bias;
        for (int ky = 0; ky < kernelHeight; ++ky) {
            const T* row = src + static_cast<size_t>(y * stride + ky) * srcStride;
            for (int kx = 0; kx < kernelWidth; ++kx)
                addTapRow(out, row + kx, outWidth, stride, kernel[ky * kernelWidth + kx]);
        }
    }
}
}  // namespace

template <class T>
void applyFilter(const T* src, T* dst, int srcWidth, int srcHeight, const T* kernel, int kernelWidth,
                 int kernelHeight, T bias, int stride) {
    const int outWidth = (srcWidth - kernelWidth) / stride + 1;
    const int outHeight = (srcHeight - kernelHeight) / stride + 1;
    filterRows(src, srcWidth, dst, outWidth, outWidth, outHeight, kernel, kernelWidth, kernelHeight, bias,
               stride);
}

template <class T>
void applyFilter(const T* src, T* dst, int width, int height, const T* kernel, int kernelWidth,
                 int kernelHeight, T bias, int srcStride, int dstStride) {
    filterRows(src, srcStride, dst, dstStride, width - kernelWidth + 1, height - kernelHeight + 1, kernel,
               kernelWidth, kernelHeight, bias, 1);
}

template void applyFilter<float>(const float*, float*, int, int, const float*, int, int, float, int);
template void applyFilter<float>(const float*, float*, int, int, const float*, int, int, float, int, int);

void packPanels(const float* weights, int rows, int depth, std::vector<float>& packed) {
    const int panels = (rows + PANEL_ROWS - 1) / PANEL_ROWS;
    // assign keeps the capacity: after the first call this doesn't allocate
    packed.assign(static_cast<size_t>(panels) * PANEL_ROWS * depth, 0.f);
    float* p = packed.data();
    for (int r0 = 0; r0 < rows; r0 += PANEL_ROWS) {
        const int live = rows - r0 < PANEL_ROWS ? rows - r0 : PANEL_ROWS;
        for (int r = 0; r < live; ++r) {
            const float* row = weights + static_cast<size_t>(r0 + r) * depth;
            for (int k = 0; k < depth; ++k) p[k * PANEL_ROWS + r] = row[k];
        }
        p += static_cast<size_t>(depth) * PANEL_ROWS;
    }
}

namespace {
// Rows here are a few tens of floats: a call to memcpy per row would cost more than the copy.
inline void copyRow(const float* in, float* out, int count) {
#if defined(LQ_HAVE_NEON)
    if (count >= 4) {
        int x = 0;
        for (; x + 4 <= count; x += 4) vst1q_f32(out + x, vld1q_f32(in + x));
        if (x < count) vst1q_f32(out + count - 4, vld1q_f32(in + count - 4));
        return;
    }
#endif
    for (int x = 0; x < count; ++x) out[x] = in[x];
}
}  // namespace

void unfoldPatches(const float* input, int channels, int width, int height, int kernelWidth, int kernelHeight,
                   int stride, int outWidth, int outHeight, float* columns) {
    const size_t count = static_cast<size_t>(outWidth) * outHeight;
    float* column = columns;
    for (int c = 0; c < channels; ++c) {
        const float* plane = input + static_cast<size_t>(c) * width * height;
        for (int ky = 0; ky < kernelHeight; ++ky) {
            for (int kx = 0; kx < kernelWidth; ++kx, column += count) {
                for (int y = 0; y < outHeight; ++y) {
                    const float* in = plane + static_cast<size_t>(y * stride + ky) * width + kx;
                    float* out = column + static_cast<size_t>(y) * outWidth;
                    if (stride == 1) {
                        copyRow(in, out, outWidth);
                    } else {
                        for (int x = 0; x < outWidth; ++x) out[x] = in[x * stride];
                    }
                }
            }
        }
    }
}

void multiplyPanelsScalar(const float* packed, const float* bias, int rows, int depth, const float* columns,
                          int columnStride, int count, float* out, int outStride) {
    for (int r = 0; r < rows; ++r) {
        float* __restrict o = out + static_cast<size_t>(r) * outStride;
        const float* w = packed + static_cast<size_t>(r / PANEL_ROWS) * depth * PANEL_ROWS + r % PANEL_ROWS;
        for (int j = 0; j < count; ++j) o[j] = bias[r];
        for (int k = 0; k < depth; ++k) {
            const float wk = w[static_cast<size_t>(k) * PANEL_ROWS];
            const float* __restrict column = columns + static_cast<size_t>(k) * columnStride;
            for (int j = 0; j < count; ++j) o[j] = o[j] + column[j] * wk;
        }
    }
}

#if defined(LQ_HAVE_NEON)
namespace {
// One panel of four rows against eight columns from j: eight accumulators, two loads of the
// matrix and four weights per step of k. vmlaq is a multiply then an add, as in the scalar
// form, so each lane gives the scalar bits. Rows past the last come from zero weights and
// aren't stored.
inline void panelBlock8(const float* panel, const float* b, int depth, const float* columns, int columnStride,
                        float* const* o, int live, int j) {
    float32x4_t a0 = vdupq_n_f32(b[0]), a1 = vdupq_n_f32(b[1]), a2 = vdupq_n_f32(b[2]),
                a3 = vdupq_n_f32(b[3]);
    float32x4_t c0 = a0, c1 = a1, c2 = a2, c3 = a3;
    const float* column = columns + j;
    const float* w = panel;
    for (int k = 0; k < depth; ++k, column += columnStride, w += PANEL_ROWS) {
        const float32x4_t x0 = vld1q_f32(column), x1 = vld1q_f32(column + 4);
        a0 = vmlaq_n_f32(a0, x0, w[0]);
        c0 = vmlaq_n_f32(c0, x1, w[0]);
        a1 = vmlaq_n_f32(a1, x0, w[1]);
        c1 = vmlaq_n_f32(c1, x1, w[1]);
        a2 = vmlaq_n_f32(a2, x0, w[2]);
        c2 = vmlaq_n_f32(c2, x1, w[2]);
        a3 = vmlaq_n_f32(a3, x0, w[3]);
        c3 = vmlaq_n_f32(c3, x1, w[3]);
    }
    switch (live) {
        case 4:
            vst1q_f32(o[3] + j, a3), vst1q_f32(o[3] + j + 4, c3);
            [[fallthrough]];
        case 3:
            vst1q_f32(o[2] + j, a2), vst1q_f32(o[2] + j + 4, c2);
            [[fallthrough]];
        case 2:
            vst1q_f32(o[1] + j, a1), vst1q_f32(o[1] + j + 4, c1);
            [[fallthrough]];
        default:
            vst1q_f32(o[0] + j, a0), vst1q_f32(o[0] + j + 4, c0);
    }
}

// the same for four columns
inline void panelBlock4(const float* panel, const float* b, int depth, const float* columns, int columnStride,
                        float* const* o, int live, int j) {
    float32x4_t a0 = vdupq_n_f32(b[0]), a1 = vdupq_n_f32(b[1]), a2 = vdupq_n_f32(b[2]),
                a3 = vdupq_n_f32(b[3]);
    const float* column = columns + j;
    const float* w = panel;
    for (int k = 0; k < depth; ++k, column += columnStride, w += PANEL_ROWS) {
        const float32x4_t x0 = vld1q_f32(column);
        a0 = vmlaq_n_f32(a0, x0, w[0]);
        a1 = vmlaq_n_f32(a1, x0, w[1]);
        a2 = vmlaq_n_f32(a2, x0, w[2]);
        a3 = vmlaq_n_f32(a3, x0, w[3]);
    }
    switch (live) {
        case 4:
            vst1q_f32(o[3] + j, a3);
            [[fallthrough]];
        case 3:
            vst1q_f32(o[2] + j, a2);
            [[fallthrough]];
        case 2:
            vst1q_f32(o[1] + j, a1);
            [[fallthrough]];
        default:
            vst1q_f32(o[0] + j, a0);
    }
}
}  // namespace

void multiplyPanelsNeon(const float* packed, const float* bias, int rows, int depth, const float* columns,
                        int columnStride, int count, float* out, int outStride) {
    // Every panel against one block of columns before the next block: the block's slice of
    // the matrix stays in the first-level cache while all the panels pass over it.
    const auto block = [&](int j, int width) {
        for (int r0 = 0; r0 < rows; r0 += PANEL_ROWS) {
            const float* panel = packed + static_cast<size_t>(r0 / PANEL_ROWS) * depth * PANEL_ROWS;
            const int live = rows - r0 < PANEL_ROWS ? rows - r0 : PANEL_ROWS;
            float b[PANEL_ROWS] = {};
            float* o[PANEL_ROWS];
            for (int r = 0; r < PANEL_ROWS; ++r) {
                b[r] = r < live ? bias[r0 + r] : 0.f;
                o[r] = out + static_cast<size_t>(r0 + (r < live ? r : 0)) * outStride;
            }
            if (width == 8) {
                panelBlock8(panel, b, depth, columns, columnStride, o, live, j);
            } else if (width == 4) {
                panelBlock4(panel, b, depth, columns, columnStride, o, live, j);
            } else {
                float a[PANEL_ROWS] = {b[0], b[1], b[2], b[3]};
                const float* column = columns + j;
                const float* w = panel;
                for (int k = 0; k < depth; ++k, column += columnStride, w += PANEL_ROWS)
                    for (int r = 0; r < PANEL_ROWS; ++r) a[r] = a[r] + *column * w[r];
                for (int r = 0; r < live; ++r) o[r][j] = a[r];
            }
        }
    };
    // A remainder is one more block ending at the last column: the columns it computes
    // twice come out the same, and the planes of these layers are often narrower than a
    // few blocks.
    if (count >= 8) {
        for (int j = 0; j + 8 <= count; j += 8) block(j, 8);
        if (count % 8) block(count - 8, 8);
    } else if (count >= 4) {
        block(0, 4);
        if (count > 4) block(count - 4, 4);
    } else {
        for (int j = 0; j < count; ++j) block(j, 1);
    }
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// Four rows against sixteen columns from j in eight-lane registers. A multiply and then an
// add, not a fused one, so that each lane gives the scalar bits.
__attribute__((target("avx2"))) inline void panelBlock16Avx2(const float* panel, const float* b, int depth,
                                                             const float* columns, int columnStride,
                                                             float* const* o, int live, int j) {
    __m256 a[PANEL_ROWS], c[PANEL_ROWS];
    for (int r = 0; r < PANEL_ROWS; ++r) a[r] = c[r] = _mm256_set1_ps(b[r]);
    const float* column = columns + j;
    const float* w = panel;
    for (int k = 0; k < depth; ++k, column += columnStride, w += PANEL_ROWS) {
        const __m256 x0 = _mm256_loadu_ps(column), x1 = _mm256_loadu_ps(column + 8);
        for (int r = 0; r < PANEL_ROWS; ++r) {
            const __m256 wr = _mm256_set1_ps(w[r]);
            a[r] = _mm256_add_ps(a[r], _mm256_mul_ps(x0, wr));
            c[r] = _mm256_add_ps(c[r], _mm256_mul_ps(x1, wr));
        }
    }
    for (int r = live - 1; r >= 0; --r) {
        _mm256_storeu_ps(o[r] + j, a[r]);
        _mm256_storeu_ps(o[r] + j + 8, c[r]);
    }
}

__attribute__((target("avx2"))) inline void panelBlock8Avx2(const float* panel, const float* b, int depth,
                                                            const float* columns, int columnStride, float* const* o,
                                                            int live, int j) {
    __m256 a[PANEL_ROWS];
    for (int r = 0; r < PANEL_ROWS; ++r) a[r] = _mm256_set1_ps(b[r]);
    const float* column = columns + j;
    const float* w = panel;
    for (int k = 0; k < depth; ++k, column += columnStride, w += PANEL_ROWS) {
        const __m256 x0 = _mm256_loadu_ps(column);
        for (int r = 0; r < PANEL_ROWS; ++r) a[r] = _mm256_add_ps(a[r], _mm256_mul_ps(x0, _mm256_set1_ps(w[r])));
    }
    for (int r = live - 1; r >= 0; --r) _mm256_storeu_ps(o[r] + j, a[r]);
}
}  // namespace

__attribute__((target("avx2"))) void multiplyPanelsAvx2(const float* packed, const float* bias, int rows, int depth,
                                                        const float* columns, int columnStride, int count, float* out,
                                                        int outStride) {
    if (count < 8) {
        multiplyPanelsScalar(packed, bias, rows, depth, columns, columnStride, count, out, outStride);
        return;
    }
    // the same block order as the NEON form; a remainder is one more block ending at the
    // last column
    const auto block = [&](int j, int width) __attribute__((target("avx2"))) {
        for (int r0 = 0; r0 < rows; r0 += PANEL_ROWS) {
            const float* panel = packed + static_cast<size_t>(r0 / PANEL_ROWS) * depth * PANEL_ROWS;
            const int live = rows - r0 < PANEL_ROWS ? rows - r0 : PANEL_ROWS;
            float b[PANEL_ROWS] = {};
            float* o[PANEL_ROWS];
            for (int r = 0; r < PANEL_ROWS; ++r) {
                b[r] = r < live ? bias[r0 + r] : 0.f;
                o[r] = out + static_cast<size_t>(r0 + (r < live ? r : 0)) * outStride;
            }
            if (width == 16)
                panelBlock16Avx2(panel, b, depth, columns, columnStride, o, live, j);
            else
                panelBlock8Avx2(panel, b, depth, columns, columnStride, o, live, j);
        }
    };
    int j = 0;
    for (; j + 16 <= count; j += 16) block(j, 16);
    for (; j + 8 <= count; j += 8) block(j, 8);
    if (j < count) block(count - 8, 8);
}
#endif

void multiplyPanels(const float* packed, const float* bias, int rows, int depth, const float* columns,
                    int columnStride, int count, float* out, int outStride) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    multiplyPanelsNeon(packed, bias, rows, depth, columns, columnStride, count, out, outStride);
#elif defined(LQ_HAVE_SSSE3)
    // emulated NEON is no faster than plain loops on x86: its own vectors where it has them
    static const auto product = __builtin_cpu_supports("avx2") ? multiplyPanelsAvx2 :
#if defined(LQ_HAVE_NEON)
                                                               multiplyPanelsNeon;
#else
                                                               multiplyPanelsScalar;
#endif
    product(packed, bias, rows, depth, columns, columnStride, count, out, outStride);
#elif defined(LQ_HAVE_NEON)
    multiplyPanelsNeon(packed, bias, rows, depth, columns, columnStride, count, out, outStride);
#else
    multiplyPanelsScalar(packed, bias, rows, depth, columns, columnStride, count, out, outStride);
#endif
}

namespace {
// the indices j from 0 to size - 1 for which j * stride + phase - pad falls in 0 .. extent - 1
inline void insideRange(int extent, int pad, int stride, int phase, int size, int& first, int& last) {
    first = std::min(size, pad > phase ? (pad - phase + stride - 1) / stride : 0);
    last = std::max(first, std::min(size, (extent + pad - phase + stride - 1) / stride));
}
}  // namespace

void splitPhases(const float* input, int channels, int width, int height, int pad, int stride,
                 float* planes) {
    const int phaseWidth = phaseSize(width, pad, stride), phaseHeight = phaseSize(height, pad, stride);
    const size_t plane = static_cast<size_t>(phaseWidth) * phaseHeight;
    // zeros first, then the input over them: one fill costs less than a fill on each side
    // of every short row
    std::fill_n(planes, plane * channels * stride * stride, 0.f);
    float* p = planes;
    for (int c = 0; c < channels; ++c) {
        const float* channel = input + static_cast<size_t>(c) * width * height;
        for (int py = 0; py < stride; ++py) {
            int top, bottom;
            insideRange(height, pad, stride, py, phaseHeight, top, bottom);
            for (int px = 0; px < stride; ++px, p += plane) {
                int first, last;
                insideRange(width, pad, stride, px, phaseWidth, first, last);
                for (int i = top; i < bottom; ++i) {
                    const float* in = channel + static_cast<size_t>(i * stride + py - pad) * width + px - pad;
                    float* out = p + static_cast<size_t>(i) * phaseWidth;
                    // a constant step lets the compiler gather with shuffles
                    if (stride == 1) {
                        for (int j = first; j < last; ++j) out[j] = in[j];
                    } else if (stride == 2) {
                        for (int j = first; j < last; ++j) out[j] = in[j * 2];
                    } else {
                        for (int j = first; j < last; ++j) out[j] = in[j * stride];
                    }
                }
            }
        }
    }
}

void tapOffsets(int channels, int kernelWidth, int kernelHeight, int stride, int phaseWidth, int phaseHeight,
                int* offsets) {
    const int plane = phaseWidth * phaseHeight;
    for (int c = 0; c < channels; ++c)
        for (int ky = 0; ky < kernelHeight; ++ky)
            for (int kx = 0; kx < kernelWidth; ++kx)
                *offsets++ = ((c * stride + ky % stride) * stride + kx % stride) * plane +
                             ky / stride * phaseWidth + kx / stride;
}

void compactRows(const float* wide, int rows, int wideStride, int phaseWidth, int outWidth, int outHeight,
                 float* out) {
    // Rows are a few tens of floats: whole blocks of eight, the last one ending at the row's
    // end and overlapping the one before, cost less than a loop with a remainder.
    constexpr size_t BLOCK = 8 * sizeof(float);
    for (int r = 0; r < rows; ++r) {
        const float* in = wide + static_cast<size_t>(r) * wideStride;
        for (int y = 0; y < outHeight; ++y, in += phaseWidth, out += outWidth) {
            if (outWidth >= 8) {
                for (int x = 0; x + 8 < outWidth; x += 8) std::memcpy(out + x, in + x, BLOCK);
                std::memcpy(out + outWidth - 8, in + outWidth - 8, BLOCK);
            } else {
                for (int x = 0; x < outWidth; ++x) out[x] = in[x];
            }
        }
    }
}

namespace {
// A group of rows runs as one register block: the rows are split into groups of at most
// TAP_GROUP_ROWS, as even as possible, so that ten filters make two groups of five rather
// than six and four.
template <class Group>
void forGroups(int rows, Group group) {
    const int groups = (rows + TAP_GROUP_ROWS - 1) / TAP_GROUP_ROWS;
    for (int g = 0, r0 = 0; g < groups; ++g) {
        const int size = rows / groups + (g < rows % groups ? 1 : 0);
        group(r0, size);
        r0 += size;
    }
}

// a group kernel for each size up to TAP_GROUP_ROWS, indexed by the size
template <class Kernel, template <int> class Of, int... Sizes>
constexpr std::array<Kernel, sizeof...(Sizes) + 1> groupTable(std::integer_sequence<int, Sizes...>) {
    return {nullptr, &Of<Sizes + 1>::run...};
}
}  // namespace

void packTapGroups(const float* weights, int rows, int depth, std::vector<float>& packed) {
    packed.resize(static_cast<size_t>(rows) * depth);
    forGroups(rows, [&](int r0, int size) {
        float* group = packed.data() + static_cast<size_t>(r0) * depth;
        for (int i = 0; i < size; ++i) {
            const float* row = weights + static_cast<size_t>(r0 + i) * depth;
            for (int k = 0; k < depth; ++k) group[k * size + i] = row[k];
        }
    });
}

void convolveTapsScalar(const float* packed, const float* bias, int rows, int depth, const float* planes,
                        const int* offsets, int count, float* out, int outStride) {
    forGroups(rows, [&](int r0, int size) {
        for (int i = 0; i < size; ++i) {
            float* __restrict o = out + static_cast<size_t>(r0 + i) * outStride;
            const float* w = packed + static_cast<size_t>(r0) * depth + i;
            for (int j = 0; j < count; ++j) o[j] = bias[r0 + i];
            for (int k = 0; k < depth; ++k) {
                const float wk = w[k * size];
                const float* __restrict column = planes + offsets[k];
                for (int j = 0; j < count; ++j) o[j] = o[j] + column[j] * wk;
            }
        }
    });
}

// The loops over the rows of a register block are unrolled before the compiler decides
// where the accumulators live: unrolled later, they stay in a memory copy that is stored to
// on every step.

namespace {
using TapGroup = void (*)(const float*, int, const float*, const float*, const int*, int, float*, int);
}  // namespace

#if defined(LQ_HAVE_NEON)
namespace {
// R rows against 4 * V columns from o and planes on; the R weights of a tap are next to
// each other. vmlaq is a multiply then an add, as in the scalar form, so each lane gives
// the scalar bits.
template <int R, int V>
inline void tapBlockNeon(const float* w, int depth, const float* b, const float* planes, const int* offsets,
                         float* o, int outStride) {
    float32x4_t a[R * V];
#pragma GCC unroll 16
    for (int i = 0; i < R * V; ++i) a[i] = vdupq_n_f32(b[i / V]);
    for (int k = 0; k < depth; ++k, w += R) {
        const float* column = planes + offsets[k];
        float32x4_t x[V];
#pragma GCC unroll 16
        for (int v = 0; v < V; ++v) x[v] = vld1q_f32(column + 4 * v);
#pragma GCC unroll 16
        for (int i = 0; i < R * V; ++i) a[i] = vmlaq_n_f32(a[i], x[i % V], w[i / V]);
    }
#pragma GCC unroll 16
    for (int i = 0; i < R * V; ++i) vst1q_f32(o + static_cast<size_t>(i / V) * outStride + 4 * (i % V), a[i]);
}

// All count columns of R rows in blocks of eight, or four below eight; a remainder is one
// more block ending at the last column, whose overlap comes out the same. count is at least 4.
template <int R>
struct TapGroupNeon {
    static void run(const float* w, int depth, const float* b, const float* planes, const int* offsets,
                    int count, float* o, int outStride) {
        int j = 0;
        for (; j + 8 <= count; j += 8) tapBlockNeon<R, 2>(w, depth, b, planes + j, offsets, o + j, outStride);
        if (j == count) return;
        if (count >= 8 && count - j > 4) {
            tapBlockNeon<R, 2>(w, depth, b, planes + count - 8, offsets, o + count - 8, outStride);
            return;
        }
        if (count - j > 4) tapBlockNeon<R, 1>(w, depth, b, planes + j, offsets, o + j, outStride);
        tapBlockNeon<R, 1>(w, depth, b, planes + count - 4, offsets, o + count - 4, outStride);
    }
};
}  // namespace

void convolveTapsNeon(const float* packed, const float* bias, int rows, int depth, const float* planes,
                      const int* offsets, int count, float* out, int outStride) {
    if (count < 4) {
        convolveTapsScalar(packed, bias, rows, depth, planes, offsets, count, out, outStride);
        return;
    }
    static constexpr auto groups =
        groupTable<TapGroup, TapGroupNeon>(std::make_integer_sequence<int, TAP_GROUP_ROWS>());
    forGroups(rows, [&](int r0, int size) {
        groups[size](packed + static_cast<size_t>(r0) * depth, depth, bias + r0, planes, offsets, count,
                     out + static_cast<size_t>(r0) * outStride, outStride);
    });
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// R rows against 8 * V columns in eight-lane registers: with six rows and two vectors,
// twelve accumulators, two vectors of input and a weight fill fifteen of the sixteen
// registers. A multiply and then an add, not a fused one, so that each lane gives the
// scalar bits.
template <int R, int V>
__attribute__((target("avx2"))) inline void tapBlockAvx2(const float* w, int depth, const float* b,
                                                         const float* planes, const int* offsets, float* o,
                                                         int outStride) {
    static_assert(V == 1 || V == 2, "one or two vectors per row");
    __m256 a[R], c[R];
#pragma GCC unroll 16
    for (int i = 0; i < R; ++i) a[i] = c[i] = _mm256_set1_ps(b[i]);
    for (int k = 0; k < depth; ++k, w += R) {
        const float* column = planes + offsets[k];
        const __m256 x0 = _mm256_loadu_ps(column);
        const __m256 x1 = V == 2 ? _mm256_loadu_ps(column + 8) : x0;
#pragma GCC unroll 16
        for (int i = 0; i < R; ++i) {
            const __m256 wi = _mm256_broadcast_ss(w + i);
            a[i] = _mm256_add_ps(a[i], _mm256_mul_ps(x0, wi));
            if (V == 2) c[i] = _mm256_add_ps(c[i], _mm256_mul_ps(x1, wi));
        }
    }
#pragma GCC unroll 16
    for (int i = 0; i < R; ++i) {
        float* row = o + static_cast<size_t>(i) * outStride;
        _mm256_storeu_ps(row, a[i]);
        if (V == 2) _mm256_storeu_ps(row + 8, c[i]);
    }
}

// all count columns of R rows in blocks of sixteen; a remainder is one more block of
// sixteen or eight ending at the last column. count is at least 8.
template <int R>
struct TapGroupAvx2 {
    __attribute__((target("avx2"))) static void run(const float* w, int depth, const float* b,
                                                    const float* planes, const int* offsets, int count,
                                                    float* o, int outStride) {
        int j = 0;
        for (; j + 16 <= count; j += 16)
            tapBlockAvx2<R, 2>(w, depth, b, planes + j, offsets, o + j, outStride);
        if (j == count) return;
        if (count >= 16 && count - j > 8) {
            tapBlockAvx2<R, 2>(w, depth, b, planes + count - 16, offsets, o + count - 16, outStride);
            return;
        }
        if (count - j > 8) tapBlockAvx2<R, 1>(w, depth, b, planes + j, offsets, o + j, outStride);
        tapBlockAvx2<R, 1>(w, depth, b, planes + count - 8, offsets, o + count - 8, outStride);
    }
};
}  // namespace

void convolveTapsAvx2(const float* packed, const float* bias, int rows, int depth, const float* planes,
                      const int* offsets, int count, float* out, int outStride) {
    if (count < 8) {
        convolveTapsScalar(packed, bias, rows, depth, planes, offsets, count, out, outStride);
        return;
    }
    static constexpr auto groups =
        groupTable<TapGroup, TapGroupAvx2>(std::make_integer_sequence<int, TAP_GROUP_ROWS>());
    forGroups(rows, [&](int r0, int size) {
        groups[size](packed + static_cast<size_t>(r0) * depth, depth, bias + r0, planes, offsets, count,
                     out + static_cast<size_t>(r0) * outStride, outStride);
    });
}
#endif

void convolveTaps(const float* packed, const float* bias, int rows, int depth, const float* planes,
                  const int* offsets, int count, float* out, int outStride) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    convolveTapsNeon(packed, bias, rows, depth, planes, offsets, count, out, outStride);
#elif defined(LQ_HAVE_SSSE3)
    static const auto convolve = __builtin_cpu_supports("avx2") ? convolveTapsAvx2 :
#if defined(LQ_HAVE_NEON)
                                                                convolveTapsNeon;
#else
                                                                convolveTapsScalar;
#endif
    convolve(packed, bias, rows, depth, planes, offsets, count, out, outStride);
#elif defined(LQ_HAVE_NEON)
    convolveTapsNeon(packed, bias, rows, depth, planes, offsets, count, out, outStride);
#else
    convolveTapsScalar(packed, bias, rows, depth, planes, offsets, count, out, outStride);
#endif
}

}  // namespace LQ
