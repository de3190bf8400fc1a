#include "LQ_Yuv420toBgr.h"

#include <utility>

#include "LQ_Neon.h"

namespace LQ {

BaseSize<int> getOutputSize(const BaseSize<int>& size, bool zoomTwice) {
    const int d = zoomTwice ? 2 : 1;
    return BaseSize<int>(size.width / d, (2 * (size.height / 3)) / d);
}

void yuvRowZoomScalar(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                      bool swapRedBlue) {
    for (int x = 0; x < width; ++x) computeBgr(luma[2 * x], chroma[2 * x + 1], chroma[2 * x], bgr, swapRedBlue);
}

void yuvRowFullScalar(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                      bool swapRedBlue) {
    // an odd last column has no pair of its own: it shares its neighbour's
    const int pairs = width / 2;
    for (int x = 0; x < width; ++x) {
        const int pair = x / 2 < pairs ? x / 2 : pairs - 1;
        computeBgr(luma[x], chroma[2 * pair + 1], chroma[2 * pair], bgr, swapRedBlue);
    }
}

#if defined(LQ_HAVE_NEON)
namespace {

// v >> 10 clamped to 0..255 equals the scalar "0 if not above 0, else min(v, 0x3FFFF) >> 10".
inline uint8x8_t narrowChannel(int32x4_t low, int32x4_t high) {
    return vqmovun_s16(vcombine_s16(vshrn_n_s32(low, 10), vshrn_n_s32(high, 10)));
}

inline void convert8(uint8x8_t y8, uint8x8_t u8, uint8x8_t v8, uint8x8_t& b, uint8x8_t& g, uint8x8_t& r) {
    const int16x8_t bias = vdupq_n_s16(128);
    const int16x8_t y = vreinterpretq_s16_u16(vmovl_u8(y8));
    const int16x8_t u = vsubq_s16(vreinterpretq_s16_u16(vmovl_u8(u8)), bias);
    const int16x8_t v = vsubq_s16(vreinterpretq_s16_u16(vmovl_u8(v8)), bias);
    const int32x4_t yLow = vmull_n_s16(vget_low_s16(y), 1192);
    const int32x4_t yHigh = vmull_n_s16(vget_high_s16(y), 1192);
    b = narrowChannel(vmlal_n_s16(yLow, vget_low_s16(u), 2066), vmlal_n_s16(yHigh, vget_high_s16(u), 2066));
    g = narrowChannel(vmlsl_n_s16(vmlsl_n_s16(yLow, vget_low_s16(v), 833), vget_low_s16(u), 400),
                      vmlsl_n_s16(vmlsl_n_s16(yHigh, vget_high_s16(v), 833), vget_high_s16(u), 400));
    r = narrowChannel(vmlal_n_s16(yLow, vget_low_s16(v), 1634), vmlal_n_s16(yHigh, vget_high_s16(v), 1634));
}

inline void convert16(uint8x16_t y, uint8x16_t u, uint8x16_t v, unsigned char* bgr, bool swapRedBlue) {
    uint8x8_t b0, g0, r0, b1, g1, r1;
    convert8(vget_low_u8(y), vget_low_u8(u), vget_low_u8(v), b0, g0, r0);
    convert8(vget_high_u8(y), vget_high_u8(u), vget_high_u8(v), b1, g1, r1);
    uint8x16x3_t out;
    out.val[swapRedBlue ? 2 : 0] = vcombine_u8(b0, b1);
    out.val[1] = vcombine_u8(g0, g1);
    out.val[swapRedBlue ? 0 : 2] = vcombine_u8(r0, r1);
    vst3q_u8(bgr, out);
}

}  // namespace

void yuvRowZoomNeon(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                    bool swapRedBlue) {
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const uint8x16x2_t yy = vld2q_u8(luma + 2 * x);
        const uint8x16x2_t vu = vld2q_u8(chroma + 2 * x);
        convert16(yy.val[0], vu.val[1], vu.val[0], bgr + 3 * x, swapRedBlue);
    }
    yuvRowZoomScalar(luma + 2 * x, chroma + 2 * x, bgr + 3 * x, width - x, swapRedBlue);
}

void yuvRowFullNeon(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                    bool swapRedBlue) {
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const uint8x8x2_t vu = vld2_u8(chroma + x);
        const uint8x8x2_t u = vzip_u8(vu.val[1], vu.val[1]);
        const uint8x8x2_t v = vzip_u8(vu.val[0], vu.val[0]);
        convert16(vld1q_u8(luma + x), vcombine_u8(u.val[0], u.val[1]), vcombine_u8(v.val[0], v.val[1]), bgr + 3 * x,
                  swapRedBlue);
    }
    // x is even here, so the tail's pairs line up with the row's
    yuvRowFullScalar(luma + x, chroma + x, bgr + 3 * x, width - x, swapRedBlue);
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {

// Shuffle masks that interleave 16 bytes each of B, G and R into 48 bytes of pixels:
// masks[k][c] picks the bytes of channel c that land in output block k.
struct InterleaveMasks {
    alignas(16) unsigned char bytes[3][3][16];
    InterleaveMasks() {
        for (int k = 0; k < 3; ++k)
            for (int c = 0; c < 3; ++c)
                for (int j = 0; j < 16; ++j) {
                    const int at = 16 * k + j;
                    bytes[k][c][j] = at % 3 == c ? static_cast<unsigned char>(at / 3) : 0x80;
                }
    }
};

// Sums of weighted (luma, chroma) pairs, shifted; v >> 10 clamped to 0..255 equals the
// scalar rule, and the two packs do the clamping.
__attribute__((target("ssse3"))) inline __m128i narrow8(__m128i low, __m128i high) {
    return _mm_packs_epi32(_mm_srai_epi32(low, 10), _mm_srai_epi32(high, 10));
}

// 8 pixels from 8 luma words (the low byte is the even pixel) and 8 chroma words (V, U).
__attribute__((target("ssse3"))) inline void convert8Sse(__m128i lumaWords, __m128i chromaWords, __m128i& b,
                                                         __m128i& g, __m128i& r) {
    const __m128i lowBytes = _mm_set1_epi16(0x00FF);
    const __m128i bias = _mm_set1_epi16(128);
    const __m128i y = _mm_and_si128(lumaWords, lowBytes);
    const __m128i v = _mm_sub_epi16(_mm_and_si128(chromaWords, lowBytes), bias);
    const __m128i u = _mm_sub_epi16(_mm_srli_epi16(chromaWords, 8), bias);
    const __m128i weightsB = _mm_set1_epi32((2066 << 16) | 1192);
    const __m128i weightsR = _mm_set1_epi32((1634 << 16) | 1192);
    // green is blue's sum plus (-2466 u - 833 v): the same integer as 1192 y - 833 v - 400 u
    const __m128i weightsG = _mm_set1_epi32(static_cast<int>((0xFFFFu & static_cast<unsigned>(-833)) << 16 |
                                                             (0xFFFFu & static_cast<unsigned>(-2466))));
    const __m128i bLow = _mm_madd_epi16(_mm_unpacklo_epi16(y, u), weightsB);
    const __m128i bHigh = _mm_madd_epi16(_mm_unpackhi_epi16(y, u), weightsB);
    b = narrow8(bLow, bHigh);
    g = narrow8(_mm_add_epi32(bLow, _mm_madd_epi16(_mm_unpacklo_epi16(u, v), weightsG)),
                _mm_add_epi32(bHigh, _mm_madd_epi16(_mm_unpackhi_epi16(u, v), weightsG)));
    r = narrow8(_mm_madd_epi16(_mm_unpacklo_epi16(y, v), weightsR), _mm_madd_epi16(_mm_unpackhi_epi16(y, v), weightsR));
}

}  // namespace

__attribute__((target("ssse3"))) void yuvRowZoomSse(const unsigned char* luma, const unsigned char* chroma,
                                                    unsigned char* bgr, int width, bool swapRedBlue) {
    static const InterleaveMasks masks;
    const __m128i* m = reinterpret_cast<const __m128i*>(masks.bytes);
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        __m128i b0, g0, r0, b1, g1, r1;
        convert8Sse(_mm_loadu_si128(reinterpret_cast<const __m128i*>(luma + 2 * x)),
                    _mm_loadu_si128(reinterpret_cast<const __m128i*>(chroma + 2 * x)), b0, g0, r0);
        convert8Sse(_mm_loadu_si128(reinterpret_cast<const __m128i*>(luma + 2 * x + 16)),
                    _mm_loadu_si128(reinterpret_cast<const __m128i*>(chroma + 2 * x + 16)), b1, g1, r1);
        __m128i channels[3] = {_mm_packus_epi16(b0, b1), _mm_packus_epi16(g0, g1), _mm_packus_epi16(r0, r1)};
        if (swapRedBlue) std::swap(channels[0], channels[2]);
        for (int k = 0; k < 3; ++k) {
            const __m128i out = _mm_or_si128(_mm_or_si128(_mm_shuffle_epi8(channels[0], m[3 * k]),
                                                          _mm_shuffle_epi8(channels[1], m[3 * k + 1])),
                                             _mm_shuffle_epi8(channels[2], m[3 * k + 2]));
            _mm_storeu_si128(reinterpret_cast<__m128i*>(bgr + 3 * x + 16 * k), out);
        }
    }
    yuvRowZoomScalar(luma + 2 * x, chroma + 2 * x, bgr + 3 * x, width - x, swapRedBlue);
}

namespace {
// The same sums on 16 pixels; unpacks, madds and packs stay within 128-bit lanes,
// so the pixels come out in order.
__attribute__((target("avx2"))) inline __m256i narrow16(__m256i low, __m256i high) {
    return _mm256_packs_epi32(_mm256_srai_epi32(low, 10), _mm256_srai_epi32(high, 10));
}

__attribute__((target("avx2"))) inline void convert16Avx(const unsigned char* luma, const unsigned char* chroma,
                                                         __m256i& b, __m256i& g, __m256i& r) {
    const __m256i lowBytes = _mm256_set1_epi16(0x00FF);
    const __m256i bias = _mm256_set1_epi16(128);
    const __m256i lumaWords = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(luma));
    const __m256i chromaWords = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(chroma));
    const __m256i y = _mm256_and_si256(lumaWords, lowBytes);
    const __m256i v = _mm256_sub_epi16(_mm256_and_si256(chromaWords, lowBytes), bias);
    const __m256i u = _mm256_sub_epi16(_mm256_srli_epi16(chromaWords, 8), bias);
    const __m256i weightsB = _mm256_set1_epi32((2066 << 16) | 1192);
    const __m256i weightsR = _mm256_set1_epi32((1634 << 16) | 1192);
    const __m256i weightsG = _mm256_set1_epi32(static_cast<int>((0xFFFFu & static_cast<unsigned>(-833)) << 16 |
                                                                (0xFFFFu & static_cast<unsigned>(-2466))));
    const __m256i bLow = _mm256_madd_epi16(_mm256_unpacklo_epi16(y, u), weightsB);
    const __m256i bHigh = _mm256_madd_epi16(_mm256_unpackhi_epi16(y, u), weightsB);
    b = narrow16(bLow, bHigh);
    g = narrow16(_mm256_add_epi32(bLow, _mm256_madd_epi16(_mm256_unpacklo_epi16(u, v), weightsG)),
                 _mm256_add_epi32(bHigh, _mm256_madd_epi16(_mm256_unpackhi_epi16(u, v), weightsG)));
    r = narrow16(_mm256_madd_epi16(_mm256_unpacklo_epi16(y, v), weightsR),
                 _mm256_madd_epi16(_mm256_unpackhi_epi16(y, v), weightsR));
}

// 16-bit values of pixels 0-15 and 16-31 to 32 bytes in pixel order.
__attribute__((target("avx2"))) inline __m256i packPixels(__m256i first, __m256i second) {
    return _mm256_permute4x64_epi64(_mm256_packus_epi16(first, second), 0xD8);
}
}  // namespace

__attribute__((target("avx2"))) void yuvRowZoomAvx2(const unsigned char* luma, const unsigned char* chroma,
                                                    unsigned char* bgr, int width, bool swapRedBlue) {
    static const InterleaveMasks masks;
    __m256i m[9];
    for (int i = 0; i < 9; ++i)
        m[i] = _mm256_broadcastsi128_si256(_mm_load_si128(reinterpret_cast<const __m128i*>(masks.bytes) + i));
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        __m256i b0, g0, r0, b1, g1, r1;
        convert16Avx(luma + 2 * x, chroma + 2 * x, b0, g0, r0);
        convert16Avx(luma + 2 * x + 32, chroma + 2 * x + 32, b1, g1, r1);
        __m256i channels[3] = {packPixels(b0, b1), packPixels(g0, g1), packPixels(r0, r1)};
        if (swapRedBlue) std::swap(channels[0], channels[2]);
        // each lane interleaves its own 16 pixels: lane 0 pixels 0-15, lane 1 pixels 16-31
        __m256i out[3];
        for (int k = 0; k < 3; ++k)
            out[k] = _mm256_or_si256(_mm256_or_si256(_mm256_shuffle_epi8(channels[0], m[3 * k]),
                                                     _mm256_shuffle_epi8(channels[1], m[3 * k + 1])),
                                     _mm256_shuffle_epi8(channels[2], m[3 * k + 2]));
        __m256i* target = reinterpret_cast<__m256i*>(bgr + 3 * x);
        _mm256_storeu_si256(target, _mm256_permute2x128_si256(out[0], out[1], 0x20));
        _mm256_storeu_si256(target + 1, _mm256_permute2x128_si256(out[2], out[0], 0x30));
        _mm256_storeu_si256(target + 2, _mm256_permute2x128_si256(out[1], out[2], 0x31));
    }
    yuvRowZoomSse(luma + 2 * x, chroma + 2 * x, bgr + 3 * x, width - x, swapRedBlue);
}

bool haveAvx2() {
    static const bool have = __builtin_cpu_supports("avx2");
    return have;
}

bool haveSsse3() {
    static const bool have = __builtin_cpu_supports("ssse3");
    return have;
}
#endif

// The fastest row kernel of this machine for the zoomed conversion.
static void yuvRowZoom(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                       bool swapRedBlue) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    yuvRowZoomNeon(luma, chroma, bgr, width, swapRedBlue);
#else
#if defined(LQ_HAVE_SSSE3)
    // emulated NEON is slower than the scalar rows on x86: use the host's own vectors or none
    if (haveAvx2()) return yuvRowZoomAvx2(luma, chroma, bgr, width, swapRedBlue);
    if (haveSsse3()) return yuvRowZoomSse(luma, chroma, bgr, width, swapRedBlue);
#endif
    yuvRowZoomScalar(luma, chroma, bgr, width, swapRedBlue);
#endif
}

static void yuvRowFull(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                       bool swapRedBlue) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    yuvRowFullNeon(luma, chroma, bgr, width, swapRedBlue);
#else
    yuvRowFullScalar(luma, chroma, bgr, width, swapRedBlue);
#endif
}

void yuv420toBgr(const Image& source, Image& destination, bool zoomTwice, bool swapRedBlue) {
    LQ_ASSERT_NOT_NULL(source.data());
    LQ_ASSERT_MSG(source.width() >= 0 && source.height() >= 0, "wrong frame size " << source.size());
    const int d = zoomTwice ? 2 : 1;
    const BaseSize<int> size = getOutputSize(source.size(), zoomTwice);
    destination.create(size, COLOR_MODE_BGR);
    if (!zoomTwice && (size.width < 2 || size.height < 2)) return;

    const size_t sourceStride = static_cast<size_t>(size.width) * d;
    const unsigned char* luma = source.data();
    const unsigned char* chroma = luma + static_cast<size_t>(size.height) * d * sourceStride;
    for (int y = 0; y < size.height; ++y) {
        unsigned char* out = destination.row(y);
        if (zoomTwice) {
            const unsigned char* lumaRow = luma + 2 * static_cast<size_t>(y) * sourceStride;
            const unsigned char* chromaRow = chroma + static_cast<size_t>(y) * sourceStride;
            yuvRowZoom(lumaRow, chromaRow, out, size.width, swapRedBlue);
        } else {
            const unsigned char* lumaRow = luma + static_cast<size_t>(y) * sourceStride;
            const unsigned char* chromaRow = chroma + static_cast<size_t>(y / 2) * sourceStride;
            yuvRowFull(lumaRow, chromaRow, out, size.width, swapRedBlue);
        }
    }
}

}  // namespace LQ
