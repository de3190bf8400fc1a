#include "LQ_ImageResize.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <utility>
#include <vector>

#include "LQ_Integral.h"

namespace LQ {

namespace {

BaseRect<int> wholeIfEmpty(const BaseRect<int>& rect, const Image& image) {
    return rect.area() == 0 ? image.rect() : rect;
}

bool isEmpty(const BaseRect<int>& rect) { return rect.width() <= 0 || rect.height() <= 0; }

#if defined(LQ_HAVE_SSSE3)
bool cpuHasSsse3() {
    static const bool have = __builtin_cpu_supports("ssse3");
    return have;
}

bool cpuHasAvx2() {
    static const bool have = __builtin_cpu_supports("avx2");
    return have;
}
#endif

// The gather tables pay off only where a native vector unit reads them; NEON emulated on
// x86 is slower than the scalar rows.
bool vectorGather() {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    return true;
#elif defined(LQ_HAVE_SSSE3)
    return cpuHasSsse3();
#else
    return false;
#endif
}

// start of each block and its length, one table for both axes
void blockTables(int count, float zoom, std::vector<int>& shift, std::vector<int>& step) {
    const float stable = stableMultiplier<float>();
    shift.resize(count + 1);
    step.resize(count);
    for (int i = 0; i <= count; ++i) shift[i] = static_cast<int>(i * zoom * stable);
    for (int i = 0; i < count; ++i) step[i] = shift[i + 1] - shift[i];
    if (count) step[count - 1] = 1;
}

}  // namespace

// ---- halving -----------------------------------------------------------------------------

namespace {
// (a + b + c + d) >> 2, or with Round (a + b + c + d + 2) >> 2, for pixels of C bytes
template <int C, bool Round>
void halveRow(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    for (int x = 0; x < width; ++x)
        for (int c = 0; c < C; ++c) {
            const int at = 2 * C * x + c;
            out[C * x + c] =
                static_cast<unsigned char>((row0[at] + row0[at + C] + row1[at] + row1[at + C] + (Round ? 2 : 0)) >> 2);
        }
}

template <bool Round>
void halveRowAny(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width, int channels) {
    switch (channels) {
        case 1: return halveRow<1, Round>(row0, row1, out, width);
        case 2: return halveRow<2, Round>(row0, row1, out, width);
        case 3: return halveRow<3, Round>(row0, row1, out, width);
        case 4: return halveRow<4, Round>(row0, row1, out, width);
        default: break;
    }
    for (int x = 0; x < width; ++x)
        for (int c = 0; c < channels; ++c) {
            const int at = 2 * channels * x + c;
            out[channels * x + c] = static_cast<unsigned char>(
                (row0[at] + row0[at + channels] + row1[at] + row1[at + channels] + (Round ? 2 : 0)) >> 2);
        }
}
}  // namespace

void zoomMonoTwiceRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    halveRow<1, false>(row0, row1, out, width);
}

void zoomBgrTwiceRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    halveRow<3, false>(row0, row1, out, width);
}

void halveRoundedRowScalar(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width,
                           int channels) {
    halveRowAny<true>(row0, row1, out, width, channels);
}

#if defined(LQ_HAVE_NEON)
namespace {
template <bool Round>
inline uint8x8_t narrowQuarter(uint16x8_t sum) {
    return Round ? vrshrn_n_u16(sum, 2) : vshrn_n_u16(sum, 2);
}

template <bool Round>
void halveMonoNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        // pairwise sums of each row, then the two rows, all in 16 bits
        const uint16x8_t low = vaddq_u16(vpaddlq_u8(vld1q_u8(row0 + 2 * x)), vpaddlq_u8(vld1q_u8(row1 + 2 * x)));
        const uint16x8_t high =
            vaddq_u16(vpaddlq_u8(vld1q_u8(row0 + 2 * x + 16)), vpaddlq_u8(vld1q_u8(row1 + 2 * x + 16)));
        vst1q_u8(out + x, vcombine_u8(narrowQuarter<Round>(low), narrowQuarter<Round>(high)));
    }
    halveRow<1, Round>(row0 + 2 * x, row1 + 2 * x, out + x, width - x);
}

template <bool Round>
void halveTriplesNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    int x = 0;
    for (; x + 8 <= width; x += 8) {
        // the loads split the channels, so each channel halves like a mono row
        const uint8x16x3_t a = vld3q_u8(row0 + 6 * x), b = vld3q_u8(row1 + 6 * x);
        uint8x8x3_t result;
        for (int c = 0; c < 3; ++c)
            result.val[c] = narrowQuarter<Round>(vaddq_u16(vpaddlq_u8(a.val[c]), vpaddlq_u8(b.val[c])));
        vst3_u8(out + 3 * x, result);
    }
    halveRow<3, Round>(row0 + 6 * x, row1 + 6 * x, out + 3 * x, width - x);
}
}  // namespace

void zoomMonoTwiceRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    halveMonoNeon<false>(row0, row1, out, width);
}

void zoomBgrTwiceRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    halveTriplesNeon<false>(row0, row1, out, width);
}

void halveRoundedRowNeon(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width,
                         int channels) {
    if (channels == 1) return halveMonoNeon<true>(row0, row1, out, width);
    if (channels == 3) return halveTriplesNeon<true>(row0, row1, out, width);
    halveRowAny<true>(row0, row1, out, width, channels);
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// the 16-bit sums of four bytes, divided by 4
template <bool Round>
__attribute__((target("ssse3"))) inline __m128i quarter(__m128i sum) {
    return _mm_srli_epi16(Round ? _mm_add_epi16(sum, _mm_set1_epi16(2)) : sum, 2);
}

template <bool Round>
__attribute__((target("ssse3"))) void halveMonoSse(const unsigned char* row0, const unsigned char* row1,
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
                         _mm_packus_epi16(quarter<Round>(low), quarter<Round>(high)));
    }
    halveRow<1, Round>(row0 + 2 * x, row1 + 2 * x, out + x, width - x);
}

// Two target pixels of three bytes from 12 bytes of each row: the shuffle puts the bytes
// to be added side by side, the multiply-add sums the pairs. Six 16-bit results.
template <bool Round>
__attribute__((target("ssse3"))) inline __m128i halveTwoTriples(const unsigned char* a, const unsigned char* b) {
    const __m128i pairs = _mm_setr_epi8(0, 3, 1, 4, 2, 5, 6, 9, 7, 10, 8, 11, -1, -1, -1, -1);
    const __m128i ones = _mm_set1_epi8(1);
    const __m128i top = _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(a)), pairs);
    const __m128i bottom = _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(b)), pairs);
    return quarter<Round>(_mm_add_epi16(_mm_maddubs_epi16(top, ones), _mm_maddubs_epi16(bottom, ones)));
}

template <bool Round>
__attribute__((target("ssse3"))) void halveTriplesSse(const unsigned char* row0, const unsigned char* row1,
                                                      unsigned char* out, int width) {
    const __m128i compact = _mm_setr_epi8(0, 1, 2, 3, 4, 5, 8, 9, 10, 11, 12, 13, -1, -1, -1, -1);
    int x = 0;
    // four target pixels a step; the second loads reach 28 bytes into the step's 24
    for (; x + 5 <= width; x += 4) {
        const unsigned char* a = row0 + 6 * x;
        const unsigned char* b = row1 + 6 * x;
        const __m128i sums = _mm_packus_epi16(halveTwoTriples<Round>(a, b), halveTwoTriples<Round>(a + 12, b + 12));
        const __m128i bytes = _mm_shuffle_epi8(sums, compact);
        _mm_storel_epi64(reinterpret_cast<__m128i*>(out + 3 * x), bytes);
        const int last = _mm_cvtsi128_si32(_mm_srli_si128(bytes, 8));
        std::memcpy(out + 3 * x + 8, &last, 4);
    }
    halveRow<3, Round>(row0 + 6 * x, row1 + 6 * x, out + 3 * x, width - x);
}
}  // namespace

void zoomMonoTwiceRowSse(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    halveMonoSse<false>(row0, row1, out, width);
}

void zoomBgrTwiceRowSse(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
    halveTriplesSse<false>(row0, row1, out, width);
}

void halveRoundedRowSse(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width,
                        int channels) {
    if (channels == 1) return halveMonoSse<true>(row0, row1, out, width);
    if (channels == 3) return halveTriplesSse<true>(row0, row1, out, width);
    halveRowAny<true>(row0, row1, out, width, channels);
}

// 32 target pixels a step; the packs work within 128-bit lanes, the permute puts the
// two lanes' halves back in order
namespace {
// sums of the 16 byte pairs of 32 bytes
__attribute__((target("avx2"))) inline __m256i pairs(const unsigned char* p) {
    return _mm256_maddubs_epi16(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)), _mm256_set1_epi8(1));
}
}  // namespace

__attribute__((target("avx2"))) void zoomMonoTwiceRowAvx2(const unsigned char* row0, const unsigned char* row1,
                                                          unsigned char* out, int width) {
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        const __m256i low = _mm256_srli_epi16(_mm256_add_epi16(pairs(row0 + 2 * x), pairs(row1 + 2 * x)), 2);
        const __m256i high = _mm256_srli_epi16(_mm256_add_epi16(pairs(row0 + 2 * x + 32), pairs(row1 + 2 * x + 32)), 2);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x),
                            _mm256_permute4x64_epi64(_mm256_packus_epi16(low, high), 0xD8));
    }
    // the SSE code after this would pay for the upper halves left dirty
    _mm256_zeroupper();
    halveMonoSse<false>(row0 + 2 * x, row1 + 2 * x, out + x, width - x);
}
#endif

// ---- every second byte ----------------------------------------------------------------------

void evenBytesRowScalar(const unsigned char* in, unsigned char* out, int width) {
    for (int x = 0; x < width; ++x) out[x] = in[2 * x];
}

#if defined(LQ_HAVE_NEON)
void evenBytesRowNeon(const unsigned char* in, unsigned char* out, int width) {
    int x = 0;
    for (; x + 16 <= width; x += 16) vst1q_u8(out + x, vld2q_u8(in + 2 * x).val[0]);
    evenBytesRowScalar(in + 2 * x, out + x, width - x);
}
#endif

#if defined(LQ_HAVE_SSSE3)
void evenBytesRowSse(const unsigned char* in, unsigned char* out, int width) {
    const __m128i low = _mm_set1_epi16(0x00FF);
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const __m128i a = _mm_and_si128(_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 2 * x)), low);
        const __m128i b = _mm_and_si128(_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 2 * x + 16)), low);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x), _mm_packus_epi16(a, b));
    }
    evenBytesRowScalar(in + 2 * x, out + x, width - x);
}

__attribute__((target("avx2"))) void evenBytesRowAvx2(const unsigned char* in, unsigned char* out, int width) {
    const __m256i low = _mm256_set1_epi16(0x00FF);
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        const __m256i a = _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(in + 2 * x)), low);
        const __m256i b = _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(in + 2 * x + 32)), low);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x), _mm256_permute4x64_epi64(_mm256_packus_epi16(a, b), 0xD8));
    }
    _mm256_zeroupper();
    evenBytesRowSse(in + 2 * x, out + x, width - x);
}
#endif

namespace {
void zoomMonoTwiceRow(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    zoomMonoTwiceRowNeon(row0, row1, out, width);
#else
#if defined(LQ_HAVE_SSSE3)
    if (cpuHasAvx2()) return zoomMonoTwiceRowAvx2(row0, row1, out, width);
    if (cpuHasSsse3()) return zoomMonoTwiceRowSse(row0, row1, out, width);
#endif
    zoomMonoTwiceRowScalar(row0, row1, out, width);
#endif
}

void halveRoundedRow(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width,
                     int channels) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    halveRoundedRowNeon(row0, row1, out, width, channels);
#else
#if defined(LQ_HAVE_SSSE3)
    if (cpuHasSsse3()) return halveRoundedRowSse(row0, row1, out, width, channels);
#endif
    halveRoundedRowScalar(row0, row1, out, width, channels);
#endif
}

void zoomBgrTwiceRow(const unsigned char* row0, const unsigned char* row1, unsigned char* out, int width) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    zoomBgrTwiceRowNeon(row0, row1, out, width);
#else
#if defined(LQ_HAVE_SSSE3)
    if (cpuHasSsse3()) return zoomBgrTwiceRowSse(row0, row1, out, width);
#endif
    zoomBgrTwiceRowScalar(row0, row1, out, width);
#endif
}
}  // namespace

void zoomMonoTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                   int targetStride) {
    for (int y = 0; y < height; ++y) {
        const unsigned char* row0 = source + static_cast<ptrdiff_t>(2 * y) * sourceStride;
        zoomMonoTwiceRow(row0, row0 + sourceStride, target + static_cast<ptrdiff_t>(y) * targetStride, width);
    }
}

void zoomImageTwice(int width, int height, const unsigned char* source, unsigned char* target, int sourceStride,
                    int targetStride, int channels) {
    if (channels == 1) return zoomMonoTwice(width, height, source, target, sourceStride, targetStride);
    for (int y = 0; y < height; ++y) {
        const unsigned char* row0 = source + static_cast<ptrdiff_t>(2 * y) * sourceStride;
        const unsigned char* row1 = row0 + sourceStride;
        unsigned char* out = target + static_cast<ptrdiff_t>(y) * targetStride;
        if (channels == 3)
            zoomBgrTwiceRow(row0, row1, out, width);
        else
            halveRowAny<false>(row0, row1, out, width, channels);
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
    if (&source == &target) {
        const Image copy(source);
        return zoomImageTwice(copy, target, targetRect);
    }
    LQ_ASSERT_CREATED(source);
    const ColorMode mode = source.colorMode();
    LQ_ASSERT_MSG(mode == COLOR_MODE_MONO || mode == COLOR_MODE_DEPTH || isColor(mode),
                  "color mode is not supported: " << mode);
    target.create(BaseSize<int>(source.width() / 2, source.height() / 2), mode);
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    if (isEmpty(targetRect)) return;
    const unsigned char* in = source.pixel(2 * targetRect.left, 2 * targetRect.top);
    unsigned char* out = target.pixel(targetRect.left, targetRect.top);
    const int sourceStride = static_cast<int>(source.stripLength());
    const int targetStride = static_cast<int>(target.stripLength());
    if (mode == COLOR_MODE_DEPTH)
        zoomDepthTwice(targetRect.width(), targetRect.height(), in, out, sourceStride, targetStride);
    else
        zoomImageTwice(targetRect.width(), targetRect.height(), in, out, sourceStride, targetStride, source.depth());
}

// ---- averaging ----------------------------------------------------------------------------

namespace {
template <int C>
void averageBlocks(const Image& source, Image& target, const BaseRect<int>& rect, const std::vector<int>& shift,
                   const std::vector<int>& step) {
    const size_t stride = source.stripLength();
    for (int y = rect.top; y < rect.bottom; ++y) {
        unsigned char* out = target.row(y);
        const int rows = step[y];
        for (int x = rect.left; x < rect.right; ++x) {
            const unsigned char* corner = source.pixel(shift[x], shift[y]);
            const int columns = step[x];
            const int area = columns * rows;
            if (area == 1) {
                for (int c = 0; c < C; ++c) out[x * C + c] = corner[c];
                continue;
            }
            unsigned int sums[C] = {};
            for (int j = 0; j < rows; ++j) {
                const unsigned char* in = corner + j * stride;
                for (int i = 0; i < columns; ++i)
                    for (int c = 0; c < C; ++c) sums[c] += in[i * C + c];
            }
            for (int c = 0; c < C; ++c)
                out[x * C + c] = static_cast<unsigned char>(area > 0 ? sums[c] / static_cast<unsigned>(area) : 0);
        }
    }
}
}  // namespace

void zoomImageAverage(const Image& source, Image& target, float zoom, BaseRect<int> targetRect) {
    if (&source == &target) {
        const Image copy(source);
        return zoomImageAverage(copy, target, zoom, targetRect);
    }
    LQ_ASSERT_CREATED(source);
    const ColorMode mode = source.colorMode();
    // depth passes this one so that it meets its own check
    LQ_ASSERT_MSG(mode == COLOR_MODE_MONO || mode == COLOR_MODE_DEPTH || isColor(mode),
                  "color mode is not supported: " << mode);
    LQ_ASSERT_NE(source.colorMode(), COLOR_MODE_DEPTH);
    LQ_ASSERT_GT(zoom, 1.f);
    const int numChannels = source.depth();
    LQ_ASSERT_MSG(numChannels <= 4, "zooming of image with depth > 4 is not supported.");
    const float stable = stableMultiplier<float>();
    target.create(BaseSize<int>(static_cast<int>(source.width() / zoom * stable),
                                static_cast<int>(source.height() / zoom * stable)),
                  mode);
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    if (isEmpty(targetRect)) return;
    std::vector<int> shift, step;
    blockTables(std::max(target.width(), target.height()), zoom, shift, step);
    switch (numChannels) {
        case 1: averageBlocks<1>(source, target, targetRect, shift, step); break;
        case 3: averageBlocks<3>(source, target, targetRect, shift, step); break;
        default: averageBlocks<4>(source, target, targetRect, shift, step); break;
    }
}

namespace {
// the check in the integral's own pixels, under the rectangle's own name
void checkInIntegral(const Image& integral, const BaseRect<int>& targetRect) {
    LQ_ASSERT_CONTAINS(integralRect(integral), targetRect);
}
}  // namespace

void zoomImageIntegral(const Image& integral, Image& target, float zoom, BaseRect<int> targetRect) {
    LQ_ASSERT_COLOR_MODE(integral, COLOR_MODE_INTEGRAL);
    LQ_ASSERT_GT(zoom, 1.f);
    const float stable = stableMultiplier<float>();
    target.create(BaseSize<int>(static_cast<int>((integral.width() - 1) / zoom * stable),
                                static_cast<int>((integral.height() - 1) / zoom * stable)),
                  COLOR_MODE_MONO);
    targetRect = wholeIfEmpty(targetRect, target);
    checkInIntegral(integral, targetRect / (1.f / zoom));
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    if (isEmpty(targetRect)) return;
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

// ---- gathers ------------------------------------------------------------------------------

void GatherTable::build(const int* offsets, int blocks, int rowBytes) {
    base_.assign(blocks, 0);
    windows_.assign(blocks, 0);
    index_.assign(16 * static_cast<size_t>(blocks), 0);
    for (int b = 0; b < blocks; ++b) {
        const int* o = offsets + 16 * b;
        const int low = *std::min_element(o, o + 16), high = *std::max_element(o, o + 16);
        const int windows = (high - low) / 16 + 1;
        if (windows > 4) continue;
        // moved left at the end of the row; the bytes still lie inside the windows
        const int start = std::min(low, rowBytes - 16 * windows);
        if (start < 0) continue;
        base_[b] = start;
        windows_[b] = static_cast<unsigned char>(windows);
        for (int j = 0; j < 16; ++j) index_[16 * b + j] = static_cast<unsigned char>(o[j] - start);
    }
}

void gatherRowScalar(const unsigned char* row, const int* offsets, unsigned char* out, int count) {
    for (int i = 0; i < count; ++i) out[i] = row[offsets[i]];
}

#if defined(LQ_HAVE_NEON)
namespace {
// the 16 bytes of a block with 1 to 4 windows from p
inline uint8x16_t gather16Neon(const unsigned char* p, int windows, const unsigned char* indices) {
    const uint8x16_t index = vld1q_u8(indices);
    switch (windows) {
        case 1: return vqtbl1q_u8(vld1q_u8(p), index);
        case 2: {
            const uint8x16x2_t w = {{vld1q_u8(p), vld1q_u8(p + 16)}};
            return vqtbl2q_u8(w, index);
        }
        case 3: {
            const uint8x16x3_t w = {{vld1q_u8(p), vld1q_u8(p + 16), vld1q_u8(p + 32)}};
            return vqtbl3q_u8(w, index);
        }
        default: {
            const uint8x16x4_t w = {{vld1q_u8(p), vld1q_u8(p + 16), vld1q_u8(p + 32), vld1q_u8(p + 48)}};
            return vqtbl4q_u8(w, index);
        }
    }
}
}  // namespace

void gatherRowNeon(const unsigned char* row, const GatherTable& table, const int* offsets, unsigned char* out,
                   int count) {
    const int blocks = std::min(table.blocks(), count / 16);
    const int* base = table.bases();
    const unsigned char* windows = table.windowCounts();
    const unsigned char* index = table.indices();
    for (int b = 0; b < blocks; ++b) {
        if (windows[b])
            vst1q_u8(out + 16 * b, gather16Neon(row + base[b], windows[b], index + 16 * b));
        else
            gatherRowScalar(row, offsets + 16 * b, out + 16 * b, 16);
    }
    gatherRowScalar(row, offsets + 16 * blocks, out + 16 * blocks, count - 16 * blocks);
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// the 16 bytes of a block with 1 to 4 windows from p
__attribute__((target("ssse3"))) inline __m128i gather16Sse(const unsigned char* p, int windows,
                                                             const unsigned char* indices) {
    __m128i index = _mm_loadu_si128(reinterpret_cast<const __m128i*>(indices));
    if (windows == 1) return _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p)), index);
    const __m128i fifteen = _mm_set1_epi8(15), sixteen = _mm_set1_epi8(16);
    __m128i result = _mm_setzero_si128();
    for (int w = 0; w < windows; ++w) {
        // bytes of other windows get the top bit, which makes the shuffle write 0
        const __m128i picked = _mm_or_si128(index, _mm_cmpgt_epi8(index, fifteen));
        result = _mm_or_si128(result,
                              _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p + 16 * w)), picked));
        index = _mm_sub_epi8(index, sixteen);
    }
    return result;
}
}  // namespace

__attribute__((target("ssse3"))) void gatherRowSse(const unsigned char* row, const GatherTable& table,
                                                   const int* offsets, unsigned char* out, int count) {
    const int blocks = std::min(table.blocks(), count / 16);
    const int* base = table.bases();
    const unsigned char* windows = table.windowCounts();
    const unsigned char* index = table.indices();
    for (int b = 0; b < blocks; ++b) {
        if (windows[b])
            _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 16 * b),
                             gather16Sse(row + base[b], windows[b], index + 16 * b));
        else
            gatherRowScalar(row, offsets + 16 * b, out + 16 * b, 16);
    }
    gatherRowScalar(row, offsets + 16 * blocks, out + 16 * blocks, count - 16 * blocks);
}
#endif

namespace {
void gatherRow(const unsigned char* row, const GatherTable& table, const std::vector<int>& offsets,
               unsigned char* out) {
    const int count = static_cast<int>(offsets.size());
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    gatherRowNeon(row, table, offsets.data(), out, count);
#else
#if defined(LQ_HAVE_SSSE3)
    if (table.blocks()) return gatherRowSse(row, table, offsets.data(), out, count);
#endif
    gatherRowScalar(row, offsets.data(), out, count);
#endif
}

void evenBytesRow(const unsigned char* in, unsigned char* out, int width) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    evenBytesRowNeon(in, out, width);
#elif defined(LQ_HAVE_SSSE3)
    if (cpuHasAvx2()) return evenBytesRowAvx2(in, out, width);
    evenBytesRowSse(in, out, width);
#else
    evenBytesRowScalar(in, out, width);
#endif
}
}  // namespace

// ---- interpolation across a row and blends of two rows --------------------------------------

void BilinearColumns::resize(int count) {
    first.resize(count);
    second.resize(count);
    w0.resize(count);
    w1.resize(count);
}

void BilinearColumns::buildTable(int rowBytes) {
    const int blocks = count() / 8;
    std::vector<int> offsets(16 * static_cast<size_t>(blocks));
    for (int b = 0; b < blocks; ++b)
        for (int j = 0; j < 8; ++j) {
            offsets[16 * b + j] = first[8 * b + j];
            offsets[16 * b + 8 + j] = second[8 * b + j];
        }
    table.build(offsets.data(), blocks, rowBytes);
}

namespace {
void acrossRange(const unsigned char* row, const BilinearColumns& columns, unsigned short* out, int begin, int end) {
    const int* first = columns.first.data();
    const int* second = columns.second.data();
    const unsigned short* w0 = columns.w0.data();
    const unsigned short* w1 = columns.w1.data();
    for (int i = begin; i < end; ++i) out[i] = static_cast<unsigned short>(row[first[i]] * w0[i] + row[second[i]] * w1[i]);
}
}  // namespace

void bilinearAcrossScalar(const unsigned char* row, const BilinearColumns& columns, unsigned short* out) {
    acrossRange(row, columns, out, 0, columns.count());
}

#if defined(LQ_HAVE_NEON)
void bilinearAcrossNeon(const unsigned char* row, const BilinearColumns& columns, unsigned short* out) {
    const GatherTable& table = columns.table;
    const int blocks = std::min(table.blocks(), columns.count() / 8);
    const int* base = table.bases();
    const unsigned char* windows = table.windowCounts();
    const unsigned char* index = table.indices();
    const unsigned short* weights0 = columns.w0.data();
    const unsigned short* weights1 = columns.w1.data();
    for (int b = 0; b < blocks; ++b) {
        if (!windows[b]) {
            acrossRange(row, columns, out, 8 * b, 8 * b + 8);
            continue;
        }
        const uint8x16_t bytes = gather16Neon(row + base[b], windows[b], index + 16 * b);
        const uint16x8_t w0 = vld1q_u16(weights0 + 8 * b), w1 = vld1q_u16(weights1 + 8 * b);
        const uint16x8_t sum = vmlaq_u16(vmulq_u16(vmovl_u8(vget_low_u8(bytes)), w0), vmovl_u8(vget_high_u8(bytes)), w1);
        vst1q_u16(out + 8 * b, sum);
    }
    acrossRange(row, columns, out, 8 * blocks, columns.count());
}
#endif

#if defined(LQ_HAVE_SSSE3)
__attribute__((target("ssse3"))) void bilinearAcrossSse(const unsigned char* row, const BilinearColumns& columns,
                                                        unsigned short* out) {
    const GatherTable& table = columns.table;
    const int blocks = std::min(table.blocks(), columns.count() / 8);
    const int* base = table.bases();
    const unsigned char* windows = table.windowCounts();
    const unsigned char* index = table.indices();
    const unsigned short* weights0 = columns.w0.data();
    const unsigned short* weights1 = columns.w1.data();
    const __m128i zero = _mm_setzero_si128();
    for (int b = 0; b < blocks; ++b) {
        if (!windows[b]) {
            acrossRange(row, columns, out, 8 * b, 8 * b + 8);
            continue;
        }
        const __m128i bytes = gather16Sse(row + base[b], windows[b], index + 16 * b);
        const __m128i w0 = _mm_loadu_si128(reinterpret_cast<const __m128i*>(weights0 + 8 * b));
        const __m128i w1 = _mm_loadu_si128(reinterpret_cast<const __m128i*>(weights1 + 8 * b));
        const __m128i sum = _mm_add_epi16(_mm_mullo_epi16(_mm_unpacklo_epi8(bytes, zero), w0),
                                          _mm_mullo_epi16(_mm_unpackhi_epi8(bytes, zero), w1));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 8 * b), sum);
    }
    acrossRange(row, columns, out, 8 * blocks, columns.count());
}
#endif

void blendRows4Scalar(const unsigned short* t, const unsigned short* u, int alpha, unsigned char* out, int count) {
    for (int i = 0; i < count; ++i) out[i] = static_cast<unsigned char>(((u[i] - t[i]) * alpha + t[i] * 16 + 128) >> 8);
}

void blendRows8Scalar(const unsigned short* t, const unsigned short* u, int fraction, unsigned char* out, int count) {
    for (int i = 0; i < count; ++i)
        out[i] = static_cast<unsigned char>(((256 - fraction) * (t[i] >> 8) + fraction * (u[i] >> 8)) >> 8);
}

#if defined(LQ_HAVE_NEON)
// Both sums stay below 65536: 16 x 4080 + 128 and 256 x 255.
void blendRows4Neon(const unsigned short* t, const unsigned short* u, int alpha, unsigned char* out, int count) {
    const uint16x8_t wt = vdupq_n_u16(static_cast<uint16_t>(16 - alpha));
    const uint16x8_t wu = vdupq_n_u16(static_cast<uint16_t>(alpha));
    const uint16x8_t half = vdupq_n_u16(128);
    int i = 0;
    for (; i + 8 <= count; i += 8) {
        const uint16x8_t sum = vmlaq_u16(vmlaq_u16(half, vld1q_u16(t + i), wt), vld1q_u16(u + i), wu);
        vst1_u8(out + i, vshrn_n_u16(sum, 8));
    }
    blendRows4Scalar(t + i, u + i, alpha, out + i, count - i);
}

void blendRows8Neon(const unsigned short* t, const unsigned short* u, int fraction, unsigned char* out, int count) {
    const uint16x8_t wt = vdupq_n_u16(static_cast<uint16_t>(256 - fraction));
    const uint16x8_t wu = vdupq_n_u16(static_cast<uint16_t>(fraction));
    int i = 0;
    for (; i + 8 <= count; i += 8) {
        const uint16x8_t top = vshrq_n_u16(vld1q_u16(t + i), 8), bottom = vshrq_n_u16(vld1q_u16(u + i), 8);
        vst1_u8(out + i, vshrn_n_u16(vmlaq_u16(vmulq_u16(top, wt), bottom, wu), 8));
    }
    blendRows8Scalar(t + i, u + i, fraction, out + i, count - i);
}
#endif

#if defined(LQ_HAVE_SSSE3)
// SSE2, which every x86-64 processor has; the same bounds as NEON's
void blendRows4Sse(const unsigned short* t, const unsigned short* u, int alpha, unsigned char* out, int count) {
    const __m128i wt = _mm_set1_epi16(static_cast<short>(16 - alpha)), wu = _mm_set1_epi16(static_cast<short>(alpha));
    const __m128i half = _mm_set1_epi16(128);
    const auto blend = [&](int i) {
        const __m128i top = _mm_loadu_si128(reinterpret_cast<const __m128i*>(t + i));
        const __m128i bottom = _mm_loadu_si128(reinterpret_cast<const __m128i*>(u + i));
        const __m128i sum = _mm_add_epi16(_mm_mullo_epi16(top, wt), _mm_mullo_epi16(bottom, wu));
        return _mm_srli_epi16(_mm_add_epi16(sum, half), 8);
    };
    int i = 0;
    for (; i + 16 <= count; i += 16)
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + i), _mm_packus_epi16(blend(i), blend(i + 8)));
    blendRows4Scalar(t + i, u + i, alpha, out + i, count - i);
}

void blendRows8Sse(const unsigned short* t, const unsigned short* u, int fraction, unsigned char* out, int count) {
    const __m128i wt = _mm_set1_epi16(static_cast<short>(256 - fraction));
    const __m128i wu = _mm_set1_epi16(static_cast<short>(fraction));
    const auto blend = [&](int i) {
        const __m128i top = _mm_srli_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(t + i)), 8);
        const __m128i bottom = _mm_srli_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(u + i)), 8);
        return _mm_srli_epi16(_mm_add_epi16(_mm_mullo_epi16(top, wt), _mm_mullo_epi16(bottom, wu)), 8);
    };
    int i = 0;
    for (; i + 16 <= count; i += 16)
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + i), _mm_packus_epi16(blend(i), blend(i + 8)));
    blendRows8Scalar(t + i, u + i, fraction, out + i, count - i);
}
#endif

namespace {
void bilinearAcross(const unsigned char* row, const BilinearColumns& columns, unsigned short* out) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    bilinearAcrossNeon(row, columns, out);
#else
#if defined(LQ_HAVE_SSSE3)
    if (cpuHasSsse3()) return bilinearAcrossSse(row, columns, out);
#endif
    bilinearAcrossScalar(row, columns, out);
#endif
}

void blendRows4(const unsigned short* t, const unsigned short* u, int alpha, unsigned char* out, int count) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    blendRows4Neon(t, u, alpha, out, count);
#elif defined(LQ_HAVE_SSSE3)
    blendRows4Sse(t, u, alpha, out, count);
#else
    blendRows4Scalar(t, u, alpha, out, count);
#endif
}

void blendRows8(const unsigned short* t, const unsigned short* u, int fraction, unsigned char* out, int count) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    blendRows8Neon(t, u, fraction, out, count);
#elif defined(LQ_HAVE_SSSE3)
    blendRows8Sse(t, u, fraction, out, count);
#else
    blendRows8Scalar(t, u, fraction, out, count);
#endif
}

// Two source rows interpolated across, kept while consecutive target rows need them.
class AcrossRows {
public:
    AcrossRows(const unsigned char* data, size_t stride, const BilinearColumns& columns)
        : data_(data), stride_(stride), columns_(columns) {
        for (auto& buffer : buffers_) buffer.resize(columns.count());
    }
    // row index, keeping the other row wanted at the same time
    const unsigned short* get(int index, int other) {
        for (int s = 0; s < 2; ++s)
            if (rows_[s] == index) return buffers_[s].data();
        const int s = rows_[0] == other ? 1 : 0;
        bilinearAcross(data_ + index * stride_, columns_, buffers_[s].data());
        rows_[s] = index;
        return buffers_[s].data();
    }

private:
    const unsigned char* data_;
    size_t stride_;
    const BilinearColumns& columns_;
    std::vector<unsigned short> buffers_[2];
    int rows_[2] = {-1, -1};
};
}  // namespace

// ---- bilinear and nearest ------------------------------------------------------------------

namespace {
// Depth through the masked mean of the four neighbours. On the last column or row the
// missing neighbours have no weight; a 2 x 2 copy with the edge repeated keeps the reads
// inside the image and gives the same value.
unsigned short depthSample(const Image& source, int px, int py) {
    const int ix = std::min(px >> 8, source.width() - 1), iy = std::min(py >> 8, source.height() - 1);
    if (ix + 1 < source.width() && iy + 1 < source.height())
        return static_cast<unsigned short>(source.fractionalPixel256(px, py));
    const int nx = std::min(ix + 1, source.width() - 1), ny = std::min(iy + 1, source.height() - 1);
    unsigned short block[4] = {source.pixel<unsigned short>(ix, iy)[0], source.pixel<unsigned short>(nx, iy)[0],
                               source.pixel<unsigned short>(ix, ny)[0], source.pixel<unsigned short>(nx, ny)[0]};
    Image local;
    local.createRef(reinterpret_cast<unsigned char*>(block), BaseSize<int>(2, 2), COLOR_MODE_DEPTH);
    return static_cast<unsigned short>(local.fractionalPixel256(px & 255, py & 255));
}
}  // namespace

void resizeImageBilinear(const Image& source, Image& target, float scale, BaseRect<int> targetRect) {
    if (&source == &target) {
        const Image copy(source);
        return resizeImageBilinear(copy, target, scale, targetRect);
    }
    const ColorMode mode = source.colorMode();
    LQ_ASSERT_MSG(mode == COLOR_MODE_MONO || mode == COLOR_MODE_DEPTH || isColor(mode),
                  "color mode is not supported: " << mode);
    const float stable = stableMultiplier<float>();
    const int W = source.width(), H = source.height();
    target.create(BaseSize<int>(static_cast<int>(W * scale * stable), static_cast<int>(H * scale * stable)), mode);
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    if (isEmpty(targetRect)) return;
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
    if (mode == COLOR_MODE_DEPTH) {
        for (int y = targetRect.top; y < targetRect.bottom; ++y) {
            unsigned short* out = target.row<unsigned short>(y);
            for (int x = targetRect.left; x < targetRect.right; ++x)
                out[x] = depthSample(source, origin + x * step, origin + y * step);
        }
        return;
    }
    // Per target byte its two neighbours and weights. Positions never pass the last pixel;
    // where one lands on it its right neighbour has weight 0 and is read as itself.
    const int depth = source.depth();
    const int count = targetRect.width() * depth;
    BilinearColumns columns;
    columns.resize(count);
    for (int i = 0; i < targetRect.width(); ++i) {
        const int px = origin + (targetRect.left + i) * step;
        const int ix = std::min(px >> 8, W - 1), nx = std::min(ix + 1, W - 1);
        const int fx = px & 255;
        for (int c = 0; c < depth; ++c) {
            columns.first[i * depth + c] = ix * depth + c;
            columns.second[i * depth + c] = nx * depth + c;
            columns.w0[i * depth + c] = static_cast<unsigned short>(256 - fx);
            columns.w1[i * depth + c] = static_cast<unsigned short>(fx);
        }
    }
    if (vectorGather()) columns.buildTable(W * depth);
    AcrossRows rows(source.data(), source.stripLength(), columns);
    for (int y = targetRect.top; y < targetRect.bottom; ++y) {
        const int py = origin + y * step;
        const int iy = std::min(py >> 8, H - 1), ny = std::min(iy + 1, H - 1);
        const unsigned short* upper = rows.get(iy, ny);
        const unsigned short* lower = rows.get(ny, iy);
        blendRows8(upper, lower, py & 255, target.pixel(targetRect.left, y), count);
    }
}

void resizeImageNn(const Image& source, Image& target, float scale, BaseRect<int> targetRect) {
    if (&source == &target) {
        const Image copy(source);
        return resizeImageNn(copy, target, scale, targetRect);
    }
    LQ_ASSERT_CREATED(source);
    const int depth = source.depth();
    LQ_ASSERT_MSG(depth >= 1 && depth <= 4, "color mode is not supported: " << source.colorMode());
    const float stable = stableMultiplier<float>();
    const int W = source.width(), H = source.height();
    target.create(BaseSize<int>(static_cast<int>(W * scale * stable), static_cast<int>(H * scale * stable)),
                  source.colorMode());
    LQ_ASSERT_CONTAINS(target.rect(), targetRect);
    targetRect = wholeIfEmpty(targetRect, target);
    if (isEmpty(targetRect)) return;
    // byte offsets of the rectangle's columns; a position never leaves the source
    std::vector<int> offsets(static_cast<size_t>(targetRect.width()) * depth);
    for (int i = 0; i < targetRect.width(); ++i) {
        const int column = std::min(static_cast<int>((targetRect.left + i) / scale * stable), W - 1);
        for (int c = 0; c < depth; ++c) offsets[i * depth + c] = column * depth + c;
    }
    // every second byte, the common halving of mono, has a loop of its own
    bool even = depth == 1;
    for (size_t i = 0; i < offsets.size() && even; ++i) even = offsets[i] == offsets[0] + 2 * static_cast<int>(i);
    GatherTable table;
    if (!even && vectorGather()) table.build(offsets.data(), static_cast<int>(offsets.size() / 16), W * depth);
    for (int y = targetRect.top; y < targetRect.bottom; ++y) {
        const unsigned char* in = source.row(std::min(static_cast<int>(y / scale * stable), H - 1));
        unsigned char* out = target.pixel(targetRect.left, y);
        if (even)
            evenBytesRow(in + offsets[0], out, targetRect.width());
        else
            gatherRow(in, table, offsets, out);
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
    const int last = static_cast<int>(srcSize) - 2;
    for (size_t i = 0; i < dstSize; ++i) {
        const double position = (i + 0.5) * ratio - 0.5;
        int index = static_cast<int>(std::floor(position));
        int alpha;
        if (last < 0 || index < 0) {
            // a single pixel has nothing to interpolate with
            index = 0;
            alpha = 0;
        } else if (index > last) {
            index = last;
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
// The kernel's scratch: tables and the two rows interpolated across. Replaced when a
// call's sizes differ from the last call's.
struct BilinearBlock {
    size_t srcWidth = 0, srcHeight = 0, dstWidth = 0, dstHeight = 0, channels = 0;
    BilinearColumns columns;
    std::vector<int> rowIndex, rowAlpha;
    std::vector<unsigned short> rows[2];

    void prepare(size_t sw, size_t sh, size_t dw, size_t dh, size_t ch) {
        if (sw == srcWidth && sh == srcHeight && dw == dstWidth && dh == dstHeight && ch == channels) return;
        srcWidth = sw, srcHeight = sh, dstWidth = dw, dstHeight = dh, channels = ch;
        const int count = static_cast<int>(dw * ch);
        std::vector<int> alphas(count);
        columns.resize(count);
        EstimateAlphaIndexBase(sw, dw, columns.first.data(), alphas.data(), ch);
        for (int i = 0; i < count; ++i) {
            // a source one pixel wide has no second neighbour: the first stands in, at weight 0
            columns.second[i] = sw > 1 ? columns.first[i] + static_cast<int>(ch) : columns.first[i];
            columns.w0[i] = static_cast<unsigned short>(16 - alphas[i]);
            columns.w1[i] = static_cast<unsigned short>(alphas[i]);
        }
        columns.buildTable(static_cast<int>(sw * ch));
        rowIndex.resize(dh);
        rowAlpha.resize(dh);
        EstimateAlphaIndexBase(sh, dh, rowIndex.data(), rowAlpha.data(), 1);
        rows[0].resize(count);
        rows[1].resize(count);
    }
};

BilinearBlock& bilinearBlock() {
    static BilinearBlock block;
    return block;
}
}  // namespace

void ResizeBilinearBase(const unsigned char* source, size_t srcWidth, size_t srcHeight, size_t srcStride,
                        unsigned char* target, size_t dstWidth, size_t dstHeight, size_t dstStride,
                        size_t channelCount) {
    LQ_ASSERT_MSG(channelCount >= 1 && channelCount <= 4, "Unsupported channel count " << channelCount);
    if (dstWidth == 0 || dstHeight == 0) return;
    LQ_ASSERT_MSG(srcWidth > 0 && srcHeight > 0, "empty source " << srcWidth << "x" << srcHeight);
    if (srcWidth == 2 * dstWidth && srcHeight == 2 * dstHeight) {
        // At exactly half the size every alpha is 8 and no index is clamped: t = 8 (a + b),
        // u = 8 (c + d), and (8 t + 8 u + 128) >> 8 = (a + b + c + d + 2) >> 2.
        const int channels = static_cast<int>(channelCount), width = static_cast<int>(dstWidth);
        for (size_t y = 0; y < dstHeight; ++y)
            halveRoundedRow(source + 2 * y * srcStride, source + (2 * y + 1) * srcStride, target + y * dstStride,
                            width, channels);
        return;
    }
    BilinearBlock& block = bilinearBlock();
    block.prepare(srcWidth, srcHeight, dstWidth, dstHeight, channelCount);
    const int count = static_cast<int>(dstWidth * channelCount);
    const int lastRow = static_cast<int>(srcHeight) - 1;
    unsigned short* t = block.rows[0].data();
    unsigned short* u = block.rows[1].data();
    int previous = -2;  // no row yet
    for (size_t y = 0; y < dstHeight; ++y) {
        const int s = block.rowIndex[y];
        const unsigned char* upper = source + s * srcStride;
        const unsigned char* lower = source + std::min(s + 1, lastRow) * srcStride;
        if (s == previous + 1) {
            // moved down by one row: the old lower row is the new upper one
            std::swap(t, u);
            bilinearAcross(lower, block.columns, u);
        } else if (s != previous) {
            bilinearAcross(upper, block.columns, t);
            bilinearAcross(lower, block.columns, u);
        }
        previous = s;
        blendRows4(t, u, block.rowAlpha[y], target + y * dstStride, count);
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
