#include "LQ_ImageResize.h"

#include <cmath>
#include <cstring>
#include <vector>

#include "LQ_Integral.h"

namespace LQ {

namespace {
BaseRect<int> wholeIfEmpty(const BaseRect<int>& rect, const Image& image) {
    return rect.area() == 0 ? image.rect() : rect;
}

// start of each block and its length, one table for both axes
void blockTables(int count, float zoom, std::vector<int>& shift, std::vector<int>& step) {
    shift.resize(count);
    step.resize(count);
    for (int i = 0; i < count; ++i) shift[i] = static_cast<int>(i * zoom * stableMultiplier<float>());
    for (int i = 0; i + 1 < count; ++i) step[i] = shift[i + 1] - shift[i];
    if (count) step[count - 1] = 1;
}
}  // namespace

// ---- halving -----------------------------------------------------------------------------

void zoomMonoTwiceRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    for (int x = 0; x < width; ++x)
        out[x] = static_cast<unsigned char>((row0[2 * x] + row0[2 * x + 1] + row1[2 * x] + row1[2 * x + 1]) >> 2);
}

#if defined(LQ_HAVE_NEON)
void zoomMonoTwiceRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        // pairwise sums of each row, then the two rows, all in 16 bits
        const uint16x8_t low = vaddq_u16(vpaddlq_u8(vld1q_u8(row0 + 2 * x)), vpaddlq_u8(vld1q_u8(row1 + 2 * x)));
        const uint16x8_t high =
            vaddq_u16(vpaddlq_u8(vld1q_u8(row0 + 2 * x + 16)), vpaddlq_u8(vld1q_u8(row1 + 2 * x + 16)));
        vst1q_u8(out + x, vcombine_u8(vshrn_n_u16(low, 2), vshrn_n_u16(high, 2)));
    }
    zoomMonoTwiceRowScalar(row0 + 2 * x, row1 + 2 * x, out + x, width - x);
}
#endif

#if defined(LQ_HAVE_SSSE3)
__attribute__((target("ssse3"))) void zoomMonoTwiceRowSse(const unsigned char* row0, const unsigned char* row1,
                                                          unsigned char* out, int width) {
    const __m128i ones = _mm_set1_epi8(1);
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const __m128i a0 = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row0 + 2 * x));
        const __m128i a1 = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row0 + 2 * x + 16));
        const __m128i b0 = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row1 + 2 * x));
        const __m128i b1 = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row1 + 2 * x + 16));
        const __m128i low = _mm_add_epi16(_mm_maddubs_epi16(a0, ones), _mm_maddubs_epi16(b0, ones));
        const __m128i high = _mm_add_epi16(_mm_maddubs_epi16(a1, ones), _mm_maddubs_epi16(b1, ones));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x),
                         _mm_packus_epi16(_mm_srli_epi16(low, 2), _mm_srli_epi16(high, 2)));
    }
    zoomMonoTwiceRowScalar(row0 + 2 * x, row1 + 2 * x, out + x, width - x);
}

__attribute__((target("avx2"))) void zoomMonoTwiceRowAvx2(const unsigned char* row0, const unsigned char* row1,
                                                          unsigned char* out, int width) {
    const __m256i ones = _mm256_set1_epi8(1);
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        const __m256i low = _mm256_add_epi16(_mm256_maddubs_epi16(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(row0 + 2 * x)), ones),
                                             _mm256_maddubs_epi16(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(row1 + 2 * x)), ones));
        const __m256i high = _mm256_add_epi16(_mm256_maddubs_epi16(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(row0 + 2 * x + 32)), ones),
                                              _mm256_maddubs_epi16(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(row1 + 2 * x + 32)), ones));
        // packing works per 128-bit lane: put the quarters back in order
        const __m256i packed = _mm256_packus_epi16(_mm256_srli_epi16(low, 2), _mm256_srli_epi16(high, 2));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x), _mm256_permute4x64_epi64(packed, 0xD8));
    }
    zoomMonoTwiceRowSse(row0 + 2 * x, row1 + 2 * x, out + x, width - x);
}

// out[x] = in[2x]: the nearest resize at exactly half the width
__attribute__((target("avx2"))) void evenBytesRowAvx2(const unsigned char* in, unsigned char* out, int width) {
    const __m256i mask = _mm256_set1_epi16(0x00FF);
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        const __m256i a = _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(in + 2 * x)), mask);
        const __m256i b = _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(in + 2 * x + 32)), mask);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x), _mm256_permute4x64_epi64(_mm256_packus_epi16(a, b), 0xD8));
    }
    evenBytesRowSse(in + 2 * x, out + x, width - x);
}

void evenBytesRowSse(const unsigned char* in, unsigned char* out, int width) {
    const __m128i mask = _mm_set1_epi16(0x00FF);
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const __m128i a = _mm_and_si128(_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 2 * x)), mask);
        const __m128i b = _mm_and_si128(_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 2 * x + 16)), mask);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x), _mm_packus_epi16(a, b));
    }
    for (; x < width; ++x) out[x] = in[2 * x];
}

namespace {
bool haveSsse3Cpu() {
    static const bool have = __builtin_cpu_supports("ssse3");
    return have;
}
bool haveAvx2Cpu() {
    static const bool have = __builtin_cpu_supports("avx2");
    return have;
}
}  // namespace
#endif

void zoomMonoTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                   int targetStride) {
    for (int y = 0; y < height; ++y) {
        const unsigned char* row0 = source + static_cast<ptrdiff_t>(2 * y) * sourceStride;
        unsigned char* out = target + static_cast<ptrdiff_t>(y) * targetStride;
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
        zoomMonoTwiceRowNeon(row0, row0 + sourceStride, out, width);
#elif defined(LQ_HAVE_SSSE3)
        if (haveAvx2Cpu())
            zoomMonoTwiceRowAvx2(row0, row0 + sourceStride, out, width);
        else if (haveSsse3Cpu())
            zoomMonoTwiceRowSse(row0, row0 + sourceStride, out, width);
        else
            zoomMonoTwiceRowScalar(row0, row0 + sourceStride, out, width);
#else
        zoomMonoTwiceRowScalar(row0, row0 + sourceStride, out, width);
#endif
    }
}

void zoomImageTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                    int targetStride, int channels) {
    const int rowBytes = width * channels;
    for (int y = 0; y < height; ++y) {
        const unsigned char* row0 = source + static_cast<ptrdiff_t>(2 * y) * sourceStride;
        const unsigned char* row1 = row0 + sourceStride;
        unsigned char* out = target + static_cast<ptrdiff_t>(y) * targetStride;
        for (int i = 0; i < rowBytes; ++i) {
            const int x = i / channels, c = i - x * channels;
            const int at = 2 * x * channels + c;
            out[i] = static_cast<unsigned char>((row0[at] + row0[at + channels] + row1[at] + row1[at + channels]) >> 2);
        }
    }
}

void zoomDepthTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                    int targetStride) {
    for (int y = 0; y < height; ++y) {
        const unsigned short* row0 =
            reinterpret_cast<const unsigned short*>(source + static_cast<ptrdiff_t>(2 * y) * sourceStride);
        const unsigned short* row1 = reinterpret_cast<const unsigned short*>(
            source + static_cast<ptrdiff_t>(2 * y + 1) * sourceStride);
        unsigned short* out = reinterpret_cast<unsigned short*>(target + static_cast<ptrdiff_t>(y) * targetStride);
        for (int x = 0; x < width; ++x) {
            const unsigned short samples[4] = {row0[2 * x], row0[2 * x + 1], row1[2 * x], row1[2 * x + 1]};
            unsigned int sum = 0, count = 0;
            for (unsigned short s : samples)
                if (s >= 1 && s <= 4999) sum += s, ++count;
            out[x] = static_cast<unsigned short>(count >= 2 ? sum / count : 0);
        }
    }
}

void zoomImageTwice(const Image& source, Image& target, BaseRect<int> targetRect) {
    LQ_ASSERT_CREATED(source);
    target.create(BaseSize<int>(source.width() / 2, source.height() / 2), source.colorMode());
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    if (targetRect.area() <= 0) return;
    const unsigned char* in = source.pixel(2 * targetRect.left, 2 * targetRect.top);
    unsigned char* out = target.pixel(targetRect.left, targetRect.top);
    const int sourceStride = static_cast<int>(source.stripLength());
    const int targetStride = static_cast<int>(target.stripLength());
    const ColorMode mode = source.colorMode();
    if (mode == COLOR_MODE_MONO)
        zoomMonoTwice(targetRect.width(), targetRect.height(), in, out, sourceStride, targetStride);
    else if (mode == COLOR_MODE_DEPTH)
        zoomDepthTwice(targetRect.width(), targetRect.height(), in, out, sourceStride, targetStride);
    else if (isColor(mode))
        zoomImageTwice(targetRect.width(), targetRect.height(), in, out, sourceStride, targetStride, source.depth());
    else
        LQ_FAIL("color mode is not supported: " << mode);
}

// ---- averaging ----------------------------------------------------------------------------

void zoomImageAverage(const Image& source, Image& target, float zoom, BaseRect<int> targetRect) {
    LQ_ASSERT_CREATED(source);
    LQ_ASSERT_MSG(source.colorMode() == COLOR_MODE_MONO || isColor(source.colorMode()) ||
                      source.colorMode() == COLOR_MODE_DEPTH,
                  "color mode is not supported: " << source.colorMode());
    LQ_ASSERT_NE(source.colorMode(), COLOR_MODE_DEPTH);
    LQ_ASSERT_GT(zoom, 1.f);
    const int numChannels = source.depth();
    LQ_ASSERT_MSG(numChannels <= 4, "zooming of image with depth > 4 is not supported.");
    const float stable = stableMultiplier<float>();
    target.create(BaseSize<int>(static_cast<int>(source.width() / zoom * stable),
                                static_cast<int>(source.height() / zoom * stable)),
                  source.colorMode());
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    std::vector<int> shift, step;
    blockTables(std::max(target.width(), target.height()), zoom, shift, step);
    for (int y = targetRect.top; y < targetRect.bottom; ++y) {
        unsigned char* out = target.row(y);
        for (int x = targetRect.left; x < targetRect.right; ++x) {
            const int area = step[x] * step[y];
            const unsigned char* corner = source.pixel(shift[x], shift[y]);
            for (int c = 0; c < numChannels; ++c) {
                if (area == 1) {
                    out[x * numChannels + c] = corner[c];
                    continue;
                }
                unsigned int sum = 0;
                for (int j = 0; j < step[y]; ++j) {
                    const unsigned char* row = corner + static_cast<ptrdiff_t>(j) * source.stripLength();
                    for (int i = 0; i < step[x]; ++i) sum += row[i * numChannels + c];
                }
                out[x * numChannels + c] = area > 0 ? static_cast<unsigned char>(sum / area) : 0;
            }
        }
    }
}

void zoomImageIntegral(const Image& integral, Image& target, float zoom, BaseRect<int> targetRect) {
    LQ_ASSERT_COLOR_MODE(integral, COLOR_MODE_INTEGRAL);
    LQ_ASSERT_GT(zoom, 1.f);
    const float stable = stableMultiplier<float>();
    target.create(BaseSize<int>(static_cast<int>((integral.width() - 1) / zoom * stable),
                                static_cast<int>((integral.height() - 1) / zoom * stable)),
                  COLOR_MODE_MONO);
    targetRect = wholeIfEmpty(targetRect, target);
    {
        // the rectangle in the integral's own pixels
        const BaseRect<int> targetRect_ = targetRect / (1.f / zoom);
        const BaseRect<int>& targetRect = targetRect_;
        LQ_ASSERT_CONTAINS(integralRect(integral), targetRect);
    }
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    std::vector<int> shift, step;
    blockTables(std::max(target.width(), target.height()), zoom, shift, step);
    for (int y = targetRect.top; y < targetRect.bottom; ++y) {
        const unsigned int* top = integral.row<unsigned int>(shift[y]);
        const unsigned int* bottom = integral.row<unsigned int>(shift[y] + step[y]);
        unsigned char* out = target.row(y);
        for (int x = targetRect.left; x < targetRect.right; ++x) {
            const int l = shift[x], r = shift[x] + step[x];
            const unsigned int sum = bottom[r] + top[l] - top[r] - bottom[l];
            const unsigned int area = static_cast<unsigned int>(step[x] * step[y]);
            out[x] = static_cast<unsigned char>(area ? sum / area : 0);
        }
    }
}

// ---- bilinear and nearest ------------------------------------------------------------------

#if defined(LQ_HAVE_SSSE3)
namespace {
// Byte images, eight target columns a step. Per step one 16-byte load from the row holds
// both neighbours of all eight columns when they lie close enough together (a scale
// above about 0.6); byte shuffles made once per call pick them out into 16-bit lanes. All
// sums fit 16 bits: (256 - f) a + f b is at most 256 x 255.
struct Lanes {
    alignas(16) unsigned char bytes[16];
};
struct MonoBlocks {
    std::vector<int> base;  // first byte of each step's load
    std::vector<Lanes> left, right, fraction;
    int count = 0;                         // whole steps from the rectangle's left edge
};

__attribute__((target("ssse3"))) MonoBlocks monoBlocks(const std::vector<int>& left, const std::vector<int>& right,
                                                      const std::vector<int>& fraction, int rowBytes) {
    MonoBlocks blocks;
    const int columns = static_cast<int>(left.size());
    for (int k = 0; k + 8 <= columns; k += 8) {
        const int base = left[k];
        if (right[k + 7] - base >= 16 || base + 16 > rowBytes) break;
        Lanes a, b, f;
        for (int j = 0; j < 8; ++j) {
            a.bytes[2 * j] = static_cast<unsigned char>(left[k + j] - base), a.bytes[2 * j + 1] = 0x80;
            b.bytes[2 * j] = static_cast<unsigned char>(right[k + j] - base), b.bytes[2 * j + 1] = 0x80;
            f.bytes[2 * j] = static_cast<unsigned char>(fraction[k + j]), f.bytes[2 * j + 1] = 0;
        }
        blocks.base.push_back(base);
        blocks.left.push_back(a);
        blocks.right.push_back(b);
        blocks.fraction.push_back(f);
        blocks.count += 8;
    }
    return blocks;
}

__attribute__((target("ssse3"))) inline __m128i across(const unsigned char* row, const MonoBlocks& blocks, int k) {
    const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + blocks.base[k]));
    const auto lanes = [](const Lanes& l) { return _mm_load_si128(reinterpret_cast<const __m128i*>(l.bytes)); };
    const __m128i a = _mm_shuffle_epi8(v, lanes(blocks.left[k])), b = _mm_shuffle_epi8(v, lanes(blocks.right[k]));
    const __m128i f = lanes(blocks.fraction[k]);
    const __m128i sum = _mm_add_epi16(_mm_mullo_epi16(_mm_sub_epi16(_mm_set1_epi16(256), f), a), _mm_mullo_epi16(f, b));
    return _mm_srli_epi16(sum, 8);
}

// the whole steps of one target row; returns how many columns were done
__attribute__((target("ssse3"))) int bilinearMonoRowSse(const unsigned char* upper, const unsigned char* lower,
                                                        const MonoBlocks& blocks, int fy, unsigned char* out) {
    const __m128i down = _mm_set1_epi16(static_cast<short>(fy)), up = _mm_set1_epi16(static_cast<short>(256 - fy));
    for (int k = 0; k < blocks.count / 8; k += 2) {
        __m128i result[2] = {_mm_setzero_si128(), _mm_setzero_si128()};
        for (int h = 0; h < 2 && k + h < blocks.count / 8; ++h) {
            const __m128i top = across(upper, blocks, k + h), bottom = across(lower, blocks, k + h);
            result[h] = _mm_srli_epi16(_mm_add_epi16(_mm_mullo_epi16(up, top), _mm_mullo_epi16(down, bottom)), 8);
        }
        const __m128i packed = _mm_packus_epi16(result[0], result[1]);
        if (k + 1 < blocks.count / 8)
            _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 8 * k), packed);
        else
            _mm_storel_epi64(reinterpret_cast<__m128i*>(out + 8 * k), packed);
    }
    return blocks.count;
}

bool haveSsse3ForResize() {
    static const bool have = __builtin_cpu_supports("ssse3");
    return have;
}
}  // namespace
#endif

namespace {
// Rows of the bilinear resize: each row's two source rows are first interpolated across,
// truncated to 8 bits, into two row buffers, then the buffers are blended down.
template <int D>
void bilinearRows(const Image& source, Image& target, const BaseRect<int>& targetRect, int origin, int step,
                  const std::vector<int>& left, const std::vector<int>& right, const std::vector<int>& fraction) {
    const int H = source.height();
    const int columns = targetRect.width();
    std::vector<int> top(columns * D), bottom(columns * D);
#if defined(LQ_HAVE_SSSE3)
    MonoBlocks blocks;
    if (D == 1 && haveSsse3ForResize()) blocks = monoBlocks(left, right, fraction, source.width());
#endif
    for (int y = targetRect.top; y < targetRect.bottom; ++y) {
        const int py = origin + y * step;
        const int iy = std::min(py >> 8, H - 1);
        const int fy = py & 255;
        const unsigned char* upper = source.row(iy);
        const unsigned char* lower = source.row(std::min(iy + 1, H - 1));
        unsigned char* out = target.pixel(targetRect.left, y);
        int start = 0;
#if defined(LQ_HAVE_SSSE3)
        if (D == 1 && blocks.count) start = bilinearMonoRowSse(upper, lower, blocks, fy, out);
#endif
        for (int i = start; i < columns; ++i) {
            const int fx = fraction[i], l = left[i], r = right[i];
            for (int c = 0; c < D; ++c) {
                top[i * D + c] = ((256 - fx) * upper[l + c] + fx * upper[r + c]) >> 8;
                bottom[i * D + c] = ((256 - fx) * lower[l + c] + fx * lower[r + c]) >> 8;
            }
        }
        for (int i = start * D; i < columns * D; ++i)
            out[i] = static_cast<unsigned char>(((256 - fy) * top[i] + fy * bottom[i]) >> 8);
    }
}
}  // namespace

void resizeImageBilinear(const Image& source, Image& target, float scale, BaseRect<int> targetRect) {
    const ColorMode mode = source.colorMode();
    LQ_ASSERT_MSG(mode == COLOR_MODE_MONO || mode == COLOR_MODE_DEPTH || isColor(mode),
                  "color mode is not supported: " << mode);
    const float stable = stableMultiplier<float>();
    const int W = source.width(), H = source.height();
    target.create(BaseSize<int>(static_cast<int>(W * scale * stable), static_cast<int>(H * scale * stable)), mode);
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    if (targetRect.area() <= 0) return;
    const int tw = target.width(), th = target.height();
    int origin, step;
    if (scale >= 1) {
        origin = 0;
        const int stepX = tw > 1 ? (W - 1) * 256 / (tw - 1) : 0;
        const int stepY = th > 1 ? (H - 1) * 256 / (th - 1) : 0;
        step = std::min(stepX, stepY);
    } else {
        origin = static_cast<int>(128 / scale * stable) - 128;
        step = static_cast<int>(256 / scale * stable);
    }
    const int depth = source.depth();
    if (mode == COLOR_MODE_DEPTH) {
        for (int y = targetRect.top; y < targetRect.bottom; ++y) {
            unsigned short* out = target.row<unsigned short>(y);
            const int py = origin + y * step;
            for (int x = targetRect.left; x < targetRect.right; ++x) {
                const int px = origin + x * step;
                out[x] = static_cast<unsigned short>(source.fractionalPixel(px / 256.0f, py / 256.0f));
            }
        }
        return;
    }
    // column table: the left neighbour's byte offset, the right one's and the fraction
    const int columns = targetRect.width();
    std::vector<int> left(columns), right(columns), fraction(columns);
    for (int i = 0; i < columns; ++i) {
        const int px = origin + (targetRect.left + i) * step;
        const int ix = std::min(px >> 8, W - 1);
        left[i] = ix * depth;
        right[i] = std::min(ix + 1, W - 1) * depth;
        fraction[i] = px & 255;
    }
    switch (depth) {
        case 1: bilinearRows<1>(source, target, targetRect, origin, step, left, right, fraction); break;
        case 3: bilinearRows<3>(source, target, targetRect, origin, step, left, right, fraction); break;
        case 4: bilinearRows<4>(source, target, targetRect, origin, step, left, right, fraction); break;
        default: bilinearRows<2>(source, target, targetRect, origin, step, left, right, fraction); break;
    }
}

void gatherRowScalar(const unsigned char* in, const int* columns, unsigned char* out, int width) {
    int x = 0;
    for (; x + 4 <= width; x += 4) {
        const unsigned char a = in[columns[x]], b = in[columns[x + 1]], c = in[columns[x + 2]], d = in[columns[x + 3]];
        out[x] = a, out[x + 1] = b, out[x + 2] = c, out[x + 3] = d;
    }
    for (; x < width; ++x) out[x] = in[columns[x]];
}

namespace {
template <int N>
void gatherPixels(const Image& source, Image& target, const BaseRect<int>& rect, const std::vector<int>& columns,
                  const std::vector<int>& rows) {
    struct Pixel {
        unsigned char bytes[N];
    };
    for (int y = rect.top; y < rect.bottom; ++y) {
        const Pixel* in = reinterpret_cast<const Pixel*>(source.row(rows[y - rect.top]));
        Pixel* out = reinterpret_cast<Pixel*>(target.pixel(rect.left, y));
        for (int i = 0; i < rect.width(); ++i) out[i] = in[columns[i]];
    }
}
}  // namespace

void resizeImageNn(const Image& source, Image& target, float scale, BaseRect<int> targetRect) {
    LQ_ASSERT_CREATED(source);
    const int depth = source.depth();
    LQ_ASSERT_MSG(depth >= 1 && depth <= 4, "color mode is not supported: " << source.colorMode());
    const float stable = stableMultiplier<float>();
    const int W = source.width(), H = source.height();
    target.create(BaseSize<int>(static_cast<int>(W * scale * stable), static_cast<int>(H * scale * stable)),
                  source.colorMode());
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    if (targetRect.area() <= 0) return;
    // tables for the rectangle only; a position never leaves the source
    std::vector<int> columns(targetRect.width()), rows(targetRect.height());
    for (int i = 0; i < targetRect.width(); ++i)
        columns[i] = std::min(static_cast<int>((targetRect.left + i) / scale * stable), W - 1);
    for (int i = 0; i < targetRect.height(); ++i)
        rows[i] = std::min(static_cast<int>((targetRect.top + i) / scale * stable), H - 1);
    switch (depth) {
        case 1: {
            // every second column from the first one: a plain stride, no table
            bool everySecond = true;
            for (int i = 1; i < targetRect.width() && everySecond; ++i) everySecond = columns[i] == columns[0] + 2 * i;
            for (int y = targetRect.top; y < targetRect.bottom; ++y) {
                const unsigned char* in = source.row(rows[y - targetRect.top]);
                unsigned char* out = target.pixel(targetRect.left, y);
#if defined(LQ_HAVE_SSSE3)
                if (everySecond) {
                    if (haveAvx2Cpu())
                        evenBytesRowAvx2(in + columns[0], out, targetRect.width());
                    else
                        evenBytesRowSse(in + columns[0], out, targetRect.width());
                    continue;
                }
#endif
                gatherRowScalar(in, columns.data(), out, targetRect.width());
            }
            break;
        }
        case 2: gatherPixels<2>(source, target, targetRect, columns, rows); break;
        case 3: gatherPixels<3>(source, target, targetRect, columns, rows); break;
        default: gatherPixels<4>(source, target, targetRect, columns, rows); break;
    }
}

void resizeImageAccurate(const Image& source, Image& target, float scale, BaseRect<int> targetRect) {
    if (scale < 0.5f)
        zoomImageAverage(source, target, 1 / scale, targetRect);
    else
        resizeImageBilinear(source, target, scale, targetRect);
}

// ---- the 4-bit bilinear kernel ---------------------------------------------------------------

void EstimateAlphaIndexBase(size_t srcSize, size_t dstSize, int* indices, int* alphas, size_t channels) {
    const float ratio = static_cast<float>(srcSize) / static_cast<float>(dstSize);
    for (size_t i = 0; i < dstSize; ++i) {
        const double position = (i + 0.5) * ratio - 0.5;
        int index = static_cast<int>(std::floor(position));
        int alpha;
        if (index < 0) {
            index = 0;
            alpha = 0;
        } else if (index > static_cast<int>(srcSize) - 2) {
            index = static_cast<int>(srcSize) - 2;
            alpha = 16;
        } else {
            alpha = static_cast<int>((position - index) * 16 + 0.5);
        }
        for (size_t c = 0; c < channels; ++c) {
            indices[i * channels + c] = static_cast<int>(index * channels + c);
            alphas[i * channels + c] = alpha;
        }
    }
}

namespace {
// the kernel's scratch: tables and two rows of horizontally interpolated values
struct BilinearScratch {
    size_t rowLength = 0, dstHeight = 0;
    std::vector<int> columnIndex, columnAlpha, rowIndex, rowAlpha;
    std::vector<int> rows[2];
};
BilinearScratch& scratch() {
    static BilinearScratch block;
    return block;
}

void interpolateRow(const unsigned char* row, const BilinearScratch& s, size_t channels, int* out) {
    const size_t length = s.columnIndex.size();
    for (size_t i = 0; i < length; ++i) {
        const int at = s.columnIndex[i];
        const int here = row[at], next = row[at + channels];
        out[i] = (next - here) * s.columnAlpha[i] + here * 16;
    }
}
}  // namespace

void ResizeBilinearBase(const unsigned char* source, size_t srcWidth, size_t srcHeight, size_t srcStride,
                        unsigned char* target, size_t dstWidth, size_t dstHeight, size_t dstStride,
                        size_t channelCount) {
    LQ_ASSERT_MSG(channelCount >= 1 && channelCount <= 4, "Unsupported channel count " << channelCount);
    BilinearScratch& s = scratch();
    const size_t rowLength = dstWidth * channelCount;
    if (rowLength != s.rowLength || dstHeight != s.dstHeight) {
        s.rowLength = rowLength;
        s.dstHeight = dstHeight;
        s.columnIndex.resize(rowLength);
        s.columnAlpha.resize(rowLength);
        s.rowIndex.resize(dstHeight);
        s.rowAlpha.resize(dstHeight);
        s.rows[0].resize(rowLength);
        s.rows[1].resize(rowLength);
    }
    // every target pixel reads two neighbours in each direction
    LQ_ASSERT_MSG(srcWidth >= 2 && srcHeight >= 2, "source too small: " << srcWidth << "x" << srcHeight);
    EstimateAlphaIndexBase(srcWidth, dstWidth, s.columnIndex.data(), s.columnAlpha.data(), channelCount);
    EstimateAlphaIndexBase(srcHeight, dstHeight, s.rowIndex.data(), s.rowAlpha.data(), 1);
    int* first = s.rows[0].data();
    int* second = s.rows[1].data();
    int previous = -2;
    for (size_t y = 0; y < dstHeight; ++y) {
        const int index = s.rowIndex[y];
        if (index == previous + 1) {
            std::swap(first, second);
            interpolateRow(source + (index + 1) * srcStride, s, channelCount, second);
        } else if (index != previous) {
            interpolateRow(source + index * srcStride, s, channelCount, first);
            interpolateRow(source + (index + 1) * srcStride, s, channelCount, second);
        }
        previous = index;
        const int alpha = s.rowAlpha[y];
        unsigned char* out = target + y * dstStride;
        if (alpha == 0) {
            for (size_t i = 0; i < rowLength; ++i) out[i] = static_cast<unsigned char>((first[i] * 16 + 128) >> 8);
        } else if (alpha == 16) {
            for (size_t i = 0; i < rowLength; ++i) out[i] = static_cast<unsigned char>((second[i] * 16 + 128) >> 8);
        } else {
            for (size_t i = 0; i < rowLength; ++i)
                out[i] = static_cast<unsigned char>(((second[i] - first[i]) * alpha + first[i] * 16 + 128) >> 8);
        }
    }
}

void resizeBilinearBase(const Image& source, Image& target) {
    LQ_ASSERT_CREATED(source);
    LQ_ASSERT_COLOR_MODE(target, source.colorMode());
    ResizeBilinearBase(source.data(), source.width(), source.height(), source.stripLength(), target.data(),
                       target.width(), target.height(), target.stripLength(), source.depth());
}

void resizeBilinear(const Image& source, Image& target) { resizeBilinearBase(source, target); }

}  // namespace LQ
