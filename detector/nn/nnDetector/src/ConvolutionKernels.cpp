#include "ConvolutionKernels.h"

#include <type_traits>

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

}  // namespace LQ
