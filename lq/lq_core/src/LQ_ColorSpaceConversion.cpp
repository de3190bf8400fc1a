#include "LQ_ColorSpaceConversion.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "LQ_Depth.h"
#include "LQ_Gradients.h"
#include "LQ_ImageCopy.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"

namespace LQ {

// The checks every conversion with a rectangle makes, in this order; `area` is what to write.
#define LQ_CONVERSION_START(wantedMode, targetMode)                                           \
    LQ_ASSERT_CONTAINS(source.rect(), rect);                                                  \
    const BaseRect<int> area = rect.area() == 0 ? source.rect() : rect;                      \
    LQ_ASSERT_COLOR_MODE(source, wantedMode);                                                 \
    target.create(source.size(), targetMode)

namespace {
inline unsigned char luma(int r, int g, int b) { return static_cast<unsigned char>(((129 * g + 66 * r + 25 * b) >> 8) + 16); }
inline unsigned char chromaU(int r, int g, int b) { return static_cast<unsigned char>(((-38 * r - 74 * g + 112 * b) >> 8) + 128); }
inline unsigned char chromaV(int r, int g, int b) { return static_cast<unsigned char>(((112 * r - 94 * g - 18 * b) >> 8) + 128); }

// below 0 gives 0, above 255 gives 255, the rest is truncated toward zero
inline unsigned char clampByte(float value) {
    if (value < 0) return 0;
    if (value > 255) return 255;
    return static_cast<unsigned char>(value);
}

#if defined(LQ_HAVE_SSSE3)
bool haveSsse3Cpu() {
    static const bool have = __builtin_cpu_supports("ssse3");
    return have;
}
bool haveAvx2Cpu() {
    static const bool have = __builtin_cpu_supports("avx2");
    return have;
}
#endif

// Calls f(in, out) for each pixel of area; in and out point at the pixel's elements. The
// pixel sizes are constants so that the loop unrolls and vectorises.
template <class In, class Out, int InElements, int OutElements, class F>
void forEachPixel(const Image& source, Image& target, const BaseRect<int>& area, F f) {
    const int width = area.width();
    for (int y = area.top; y < area.bottom; ++y) {
        const In* __restrict in = reinterpret_cast<const In*>(source.pixel(area.left, y));
        Out* __restrict out = reinterpret_cast<Out*>(target.pixel(area.left, y));
        for (int x = 0; x < width; ++x) f(in + x * InElements, out + x * OutElements);
    }
}

template <int Step, int r>
void rgbToYuvPixels(const unsigned char* __restrict in, unsigned char* __restrict out, int width) {
    constexpr int g = 1, b = 2 - r;
    for (int x = 0; x < width; ++x) {
        const unsigned char* p = in + Step * x;
        out[3 * x] = luma(p[r], p[g], p[b]);
        out[3 * x + 1] = chromaU(p[r], p[g], p[b]);
        out[3 * x + 2] = chromaV(p[r], p[g], p[b]);
    }
}

template <int Step, int r>
void yuvToRgbPixels(const unsigned char* __restrict in, unsigned char* __restrict out, int width) {
    constexpr int g = 1, b = 2 - r;
    for (int x = 0; x < width; ++x) {
        const float y = in[3 * x], u = in[3 * x + 1] - 128.f, v = in[3 * x + 2] - 128.f;
        unsigned char* q = out + Step * x;
        q[r] = clampByte(y + v * 1.370705f);
        q[g] = clampByte(y + v * -0.698001f + u * -0.337633f);
        q[b] = clampByte(y + u * 1.732446f);
        if (Step == 4) q[3] = 255;
    }
}

void rgbToYuvAt(const Image& source, Image& target, const BaseRect<int>& area, int r) {
    for (int y = area.top; y < area.bottom; ++y) {
        const unsigned char* in = source.pixel(area.left, y);
        unsigned char* out = target.pixel(area.left, y);
#if defined(LQ_HAVE_SSSE3)
        if (source.depth() == 3 && haveAvx2Cpu()) {
            rgbToYuvRowAvx2(in, out, area.width(), r);
            continue;
        }
        if (source.depth() == 3 && haveSsse3Cpu()) {
            rgbToYuvRowSse(in, out, area.width(), r);
            continue;
        }
#endif
        rgbToYuvRowScalar(in, out, area.width(), source.depth(), r);
    }
}

void yuvToRgbAt(const Image& source, Image& target, const BaseRect<int>& area, int r) {
    for (int y = area.top; y < area.bottom; ++y) {
        const unsigned char* in = source.pixel(area.left, y);
        unsigned char* out = target.pixel(area.left, y);
#if defined(LQ_HAVE_SSSE3)
        if (target.depth() == 3 && haveAvx2Cpu()) {
            yuvToRgbRowAvx2(in, out, area.width(), r);
            continue;
        }
        if (target.depth() == 3 && haveSsse3Cpu()) {
            yuvToRgbRowSse(in, out, area.width(), r);
            continue;
        }
#endif
        yuvToRgbRowScalar(in, out, area.width(), target.depth(), r);
    }
}

// Luma of a rectangle; the vector rows where the pixel layout allows them.
void lumaOf(const Image& source, Image& target, const BaseRect<int>& area, int r, int g, int b) {
    const int step = source.depth();
    for (int y = area.top; y < area.bottom; ++y) {
        const unsigned char* in = source.pixel(area.left, y);
        unsigned char* out = target.pixel(area.left, y);
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
        if (g == 1 && (r == 0 || r == 2)) {
            lumaRowNeon(in, out, area.width(), step, r);
            continue;
        }
#elif defined(LQ_HAVE_SSSE3)
        if (g == 1 && (r == 0 || r == 2) && haveAvx2Cpu()) {
            step == 3 ? lumaRowAvx2(in, out, area.width(), r) : lumaRow4Avx2(in, out, area.width(), r);
            continue;
        }
        if (step == 3 && g == 1 && (r == 0 || r == 2) && haveSsse3Cpu()) {
            lumaRowSse(in, out, area.width(), r);
            continue;
        }
#endif
        lumaRowScalar(in, out, area.width(), step, r, g, b);
    }
}
}  // namespace

void lumaRowScalar(const unsigned char* in, unsigned char* out, int width, int step, int r, int g, int b) {
    for (int x = 0; x < width; ++x, in += step) out[x] = luma(in[r], in[g], in[b]);
}

void rgbToYuvRowScalar(const unsigned char* in, unsigned char* out, int width, int step, int r) {
    if (step == 4)
        r == 0 ? rgbToYuvPixels<4, 0>(in, out, width) : rgbToYuvPixels<4, 2>(in, out, width);
    else
        r == 0 ? rgbToYuvPixels<3, 0>(in, out, width) : rgbToYuvPixels<3, 2>(in, out, width);
}

void yuvToRgbRowScalar(const unsigned char* in, unsigned char* out, int width, int step, int r) {
    if (step == 4)
        r == 0 ? yuvToRgbPixels<4, 0>(in, out, width) : yuvToRgbPixels<4, 2>(in, out, width);
    else
        r == 0 ? yuvToRgbPixels<3, 0>(in, out, width) : yuvToRgbPixels<3, 2>(in, out, width);
}

#if defined(LQ_HAVE_NEON)
namespace {
inline uint8x8_t luma8(uint8x8_t r, uint8x8_t g, uint8x8_t b) {
    // the weighted sum stays below 65536, so 16 bits hold it exactly
    uint16x8_t sum = vmull_u8(g, vdup_n_u8(129));
    sum = vmlal_u8(sum, r, vdup_n_u8(66));
    sum = vmlal_u8(sum, b, vdup_n_u8(25));
    return vadd_u8(vshrn_n_u16(sum, 8), vdup_n_u8(16));
}
}  // namespace

void lumaRowNeon(const unsigned char* in, unsigned char* out, int width, int step, int r) {
    int x = 0;
    if (step == 3) {
        for (; x + 8 <= width; x += 8) {
            const uint8x8x3_t p = vld3_u8(in + 3 * x);
            vst1_u8(out + x, luma8(p.val[r], p.val[1], p.val[2 - r]));
        }
    } else if (step == 4) {
        for (; x + 8 <= width; x += 8) {
            const uint8x8x4_t p = vld4_u8(in + 4 * x);
            vst1_u8(out + x, luma8(p.val[r], p.val[1], p.val[2 - r]));
        }
    }
    lumaRowScalar(in + step * x, out + x, width - x, step, r, 1, 2 - r);
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// pshufb masks that gather channel c of 16 three-byte pixels from the three loads
struct Deinterleave3 {
    alignas(16) signed char masks[3][3][16];
    Deinterleave3() {
        for (int c = 0; c < 3; ++c)
            for (int part = 0; part < 3; ++part)
                for (int i = 0; i < 16; ++i) {
                    const int at = 3 * i + c - 16 * part;
                    masks[c][part][i] = static_cast<signed char>(at >= 0 && at < 16 ? at : -128);
                }
    }
};
const Deinterleave3 kDeinterleave3;

__attribute__((target("ssse3"))) inline __m128i channel(const __m128i* parts, int c) {
    const __m128i* m = reinterpret_cast<const __m128i*>(kDeinterleave3.masks[c]);
    return _mm_or_si128(_mm_or_si128(_mm_shuffle_epi8(parts[0], _mm_load_si128(m)),
                                     _mm_shuffle_epi8(parts[1], _mm_load_si128(m + 1))),
                        _mm_shuffle_epi8(parts[2], _mm_load_si128(m + 2)));
}

__attribute__((target("ssse3"))) inline __m128i luma8Sse(__m128i r, __m128i g, __m128i b) {
    // products and their sum stay below 65536: the low 16 bits are exact
    const __m128i sum = _mm_add_epi16(_mm_add_epi16(_mm_mullo_epi16(g, _mm_set1_epi16(129)),
                                                    _mm_mullo_epi16(r, _mm_set1_epi16(66))),
                                      _mm_mullo_epi16(b, _mm_set1_epi16(25)));
    return _mm_add_epi16(_mm_srli_epi16(sum, 8), _mm_set1_epi16(16));
}
// masks that spread 16 bytes into 48, each byte three times
struct Spread3 {
    alignas(16) signed char masks[3][16];
    Spread3() {
        for (int part = 0; part < 3; ++part)
            for (int i = 0; i < 16; ++i) masks[part][i] = static_cast<signed char>((16 * part + i) / 3);
    }
};
const Spread3 kSpread3;

// swaps bytes 0 and 2 of each of the five pixels in the first 15 bytes; byte 15 stays
alignas(16) const signed char kSwap3[16] = {2, 1, 0, 5, 4, 3, 8, 7, 6, 11, 10, 9, 14, 13, 12, 15};
}  // namespace

namespace {
__attribute__((target("avx2"))) inline __m256i luma16Avx(__m256i r, __m256i g, __m256i b) {
    const __m256i sum = _mm256_add_epi16(_mm256_add_epi16(_mm256_mullo_epi16(g, _mm256_set1_epi16(129)),
                                                          _mm256_mullo_epi16(r, _mm256_set1_epi16(66))),
                                         _mm256_mullo_epi16(b, _mm256_set1_epi16(25)));
    return _mm256_add_epi16(_mm256_srli_epi16(sum, 8), _mm256_set1_epi16(16));
}
}  // namespace

namespace {
// pshufb masks that place channel c's bytes into the three 16-byte parts of 16 pixels
struct Interleave3 {
    alignas(16) signed char masks[3][3][16];
    Interleave3() {
        for (int c = 0; c < 3; ++c)
            for (int part = 0; part < 3; ++part)
                for (int i = 0; i < 16; ++i) {
                    const int at = 16 * part + i;
                    masks[c][part][i] = static_cast<signed char>(at % 3 == c ? at / 3 : -128);
                }
    }
};
const Interleave3 kInterleave3;

__attribute__((target("ssse3"))) inline void storePixels(unsigned char* out, const __m128i* channels) {
    for (int part = 0; part < 3; ++part) {
        __m128i bytes = _mm_setzero_si128();
        for (int c = 0; c < 3; ++c)
            bytes = _mm_or_si128(bytes, _mm_shuffle_epi8(channels[c], _mm_load_si128(reinterpret_cast<const __m128i*>(
                                                                           kInterleave3.masks[c][part]))));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 16 * part), bytes);
    }
}

__attribute__((target("ssse3"))) inline void loadPixels(const unsigned char* in, __m128i* channels) {
    const __m128i parts[3] = {_mm_loadu_si128(reinterpret_cast<const __m128i*>(in)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 16)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 32))};
    for (int c = 0; c < 3; ++c) channels[c] = channel(parts, c);
}

// Truncated toward zero; the saturating packs that follow give clampByte's 0 and 255,
// since the values stay within -500 .. 500.
__attribute__((target("ssse3"))) inline __m128i clampTruncate(__m128 value) { return _mm_cvttps_epi32(value); }

// ((a x + b y + c z) >> 8) + add on 16-bit lanes; the sums stay within 16 bits signed
__attribute__((target("ssse3"))) inline __m128i weighted(__m128i x, __m128i y, __m128i z, short a, short b, short c,
                                                         short add) {
    const __m128i sum = _mm_add_epi16(_mm_add_epi16(_mm_mullo_epi16(x, _mm_set1_epi16(a)), _mm_mullo_epi16(y, _mm_set1_epi16(b))),
                                      _mm_mullo_epi16(z, _mm_set1_epi16(c)));
    return _mm_add_epi16(_mm_srai_epi16(sum, 8), _mm_set1_epi16(add));
}
}  // namespace

__attribute__((target("ssse3"))) void yuvToRgbRowSse(const unsigned char* in, unsigned char* out, int width, int r) {
    const __m128i zero = _mm_setzero_si128();
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        __m128i yuv[3];
        loadPixels(in + 3 * x, yuv);
        __m128i words[3][2];
        for (int c = 0; c < 3; ++c) words[c][0] = _mm_unpacklo_epi8(yuv[c], zero), words[c][1] = _mm_unpackhi_epi8(yuv[c], zero);
        __m128i rgb[3][4];
        for (int q = 0; q < 4; ++q) {
            const auto lanes = [&](int c) {
                const __m128i w = words[c][q / 2];
                return _mm_cvtepi32_ps(q % 2 ? _mm_unpackhi_epi16(w, zero) : _mm_unpacklo_epi16(w, zero));
            };
            const __m128 y = lanes(0), u = _mm_sub_ps(lanes(1), _mm_set1_ps(128.f)), v = _mm_sub_ps(lanes(2), _mm_set1_ps(128.f));
            rgb[0][q] = clampTruncate(_mm_add_ps(y, _mm_mul_ps(v, _mm_set1_ps(1.370705f))));
            rgb[1][q] = clampTruncate(_mm_add_ps(_mm_add_ps(y, _mm_mul_ps(v, _mm_set1_ps(-0.698001f))),
                                                 _mm_mul_ps(u, _mm_set1_ps(-0.337633f))));
            rgb[2][q] = clampTruncate(_mm_add_ps(y, _mm_mul_ps(u, _mm_set1_ps(1.732446f))));
        }
        __m128i channels[3];
        for (int c = 0; c < 3; ++c)
            channels[c] = _mm_packus_epi16(_mm_packs_epi32(rgb[c][0], rgb[c][1]), _mm_packs_epi32(rgb[c][2], rgb[c][3]));
        // red goes to byte r, blue to byte 2 - r
        const __m128i ordered[3] = {channels[r == 0 ? 0 : 2], channels[1], channels[r == 0 ? 2 : 0]};
        storePixels(out + 3 * x, ordered);
    }
    yuvToRgbRowScalar(in + 3 * x, out + 3 * x, width - x, 3, r);
}

__attribute__((target("ssse3"))) void rgbToYuvRowSse(const unsigned char* in, unsigned char* out, int width, int r) {
    const __m128i zero = _mm_setzero_si128();
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        __m128i pixels[3];
        loadPixels(in + 3 * x, pixels);
        const __m128i red = pixels[r], green = pixels[1], blue = pixels[2 - r];
        __m128i yuv[3][2];
        for (int h = 0; h < 2; ++h) {
            const __m128i R = h ? _mm_unpackhi_epi8(red, zero) : _mm_unpacklo_epi8(red, zero);
            const __m128i G = h ? _mm_unpackhi_epi8(green, zero) : _mm_unpacklo_epi8(green, zero);
            const __m128i B = h ? _mm_unpackhi_epi8(blue, zero) : _mm_unpacklo_epi8(blue, zero);
            yuv[0][h] = luma8Sse(R, G, B);
            yuv[1][h] = weighted(R, G, B, -38, -74, 112, 128);
            yuv[2][h] = weighted(R, G, B, 112, -94, -18, 128);
        }
        __m128i channels[3];
        for (int c = 0; c < 3; ++c) channels[c] = _mm_packus_epi16(yuv[c][0], yuv[c][1]);
        storePixels(out + 3 * x, channels);
    }
    rgbToYuvRowScalar(in + 3 * x, out + 3 * x, width - x, 3, r);
}

__attribute__((target("ssse3"))) void channelRowSse(const unsigned char* in, unsigned char* out, int width, int c) {
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const __m128i parts[3] = {_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x)),
                                  _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x + 16)),
                                  _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x + 32))};
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x), channel(parts, c));
    }
    for (; x < width; ++x) out[x] = in[3 * x + c];
}

__attribute__((target("ssse3"))) void spreadRowSse(const unsigned char* in, unsigned char* out, int width) {
    const __m128i* m = reinterpret_cast<const __m128i*>(kSpread3.masks);
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + x));
        for (int part = 0; part < 3; ++part)
            _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 3 * x + 16 * part), _mm_shuffle_epi8(v, _mm_load_si128(m + part)));
    }
    for (; x < width; ++x) out[3 * x] = out[3 * x + 1] = out[3 * x + 2] = in[x];
}

__attribute__((target("ssse3"))) void swapRowSse(const unsigned char* in, unsigned char* out, int width) {
    const __m128i mask = _mm_load_si128(reinterpret_cast<const __m128i*>(kSwap3));
    int x = 0;
    // five pixels a step; the sixteenth byte written is the next step's first
    for (; x + 6 <= width; x += 5)
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 3 * x),
                         _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x)), mask));
    for (; x < width; ++x) {
        const unsigned char a = in[3 * x], b = in[3 * x + 1], c = in[3 * x + 2];
        out[3 * x] = c, out[3 * x + 1] = b, out[3 * x + 2] = a;
    }
}

__attribute__((target("ssse3"))) void lumaRowSse(const unsigned char* in, unsigned char* out, int width, int r) {
    const __m128i zero = _mm_setzero_si128();
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const __m128i parts[3] = {_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x)),
                                  _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x + 16)),
                                  _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x + 32))};
        const __m128i red = channel(parts, r), green = channel(parts, 1), blue = channel(parts, 2 - r);
        const __m128i low = luma8Sse(_mm_unpacklo_epi8(red, zero), _mm_unpacklo_epi8(green, zero),
                                     _mm_unpacklo_epi8(blue, zero));
        const __m128i high = luma8Sse(_mm_unpackhi_epi8(red, zero), _mm_unpackhi_epi8(green, zero),
                                      _mm_unpackhi_epi8(blue, zero));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x), _mm_packus_epi16(low, high));
    }
    lumaRowScalar(in + 3 * x, out + x, width - x, 3, r, 1, 2 - r);
}

// AVX2 rows take 32 pixels a step, 16 in each 128-bit lane, so that the SSSE3 shuffles
// work lane by lane; three-byte pixels are loaded and stored with the lanes 48 bytes apart.
namespace {
struct Avx2Masks {
    __m256i in[3][3], out[3][3], spread[3];
};

__attribute__((target("avx2"))) inline Avx2Masks avx2Masks() {
    Avx2Masks m;
    for (int c = 0; c < 3; ++c)
        for (int k = 0; k < 3; ++k) {
            m.in[c][k] = _mm256_broadcastsi128_si256(_mm_load_si128(reinterpret_cast<const __m128i*>(kDeinterleave3.masks[c][k])));
            m.out[c][k] = _mm256_broadcastsi128_si256(_mm_load_si128(reinterpret_cast<const __m128i*>(kInterleave3.masks[c][k])));
        }
    for (int k = 0; k < 3; ++k)
        m.spread[k] = _mm256_broadcastsi128_si256(_mm_load_si128(reinterpret_cast<const __m128i*>(kSpread3.masks[k])));
    return m;
}

__attribute__((target("avx2"))) inline void load32x3(const unsigned char* in, const Avx2Masks& m, __m256i* channels) {
    __m256i parts[3];
    for (int k = 0; k < 3; ++k)
        parts[k] = _mm256_inserti128_si256(_mm256_castsi128_si256(_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 16 * k))),
                                           _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 48 + 16 * k)), 1);
    for (int c = 0; c < 3; ++c)
        channels[c] = _mm256_or_si256(_mm256_or_si256(_mm256_shuffle_epi8(parts[0], m.in[c][0]), _mm256_shuffle_epi8(parts[1], m.in[c][1])),
                                      _mm256_shuffle_epi8(parts[2], m.in[c][2]));
}

// parts[k] holds bytes 16k.. in lane 0 and 48 + 16k.. in lane 1
__attribute__((target("avx2"))) inline void storeParts3(unsigned char* out, const __m256i* parts) {
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(out), _mm256_permute2x128_si256(parts[0], parts[1], 0x20));
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + 32), _mm256_permute2x128_si256(parts[2], parts[0], 0x30));
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + 64), _mm256_permute2x128_si256(parts[1], parts[2], 0x31));
}

__attribute__((target("avx2"))) inline void store32x3(unsigned char* out, const Avx2Masks& m, const __m256i* channels) {
    __m256i parts[3];
    for (int k = 0; k < 3; ++k)
        parts[k] = _mm256_or_si256(_mm256_or_si256(_mm256_shuffle_epi8(channels[0], m.out[0][k]), _mm256_shuffle_epi8(channels[1], m.out[1][k])),
                                   _mm256_shuffle_epi8(channels[2], m.out[2][k]));
    storeParts3(out, parts);
}

// In-lane packs of four vectors of eight 32-bit values (pixels 0-7, 8-15, 16-23, 24-31)
// leave the 4-byte groups in the order 0 2 4 6 1 3 5 7; this puts them back.
__attribute__((target("avx2"))) inline __m256i packedInOrder(__m256i packed) {
    return _mm256_permutevar8x32_epi32(packed, _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7));
}

__attribute__((target("avx2"))) inline __m256i weighted16(__m256i x, __m256i y, __m256i z, short a, short b, short c, short add) {
    const __m256i sum = _mm256_add_epi16(_mm256_add_epi16(_mm256_mullo_epi16(x, _mm256_set1_epi16(a)), _mm256_mullo_epi16(y, _mm256_set1_epi16(b))),
                                         _mm256_mullo_epi16(z, _mm256_set1_epi16(c)));
    return _mm256_add_epi16(_mm256_srai_epi16(sum, 8), _mm256_set1_epi16(add));
}
__attribute__((target("avx2"))) inline __m256i load256(const unsigned char* p) {
    return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p));
}

// bytes 8 group .. 8 group + 7 of the 32
__attribute__((target("avx2"))) inline __m128i eightBytes(__m256i v, int group) {
    const __m128i lane = group < 2 ? _mm256_castsi256_si128(v) : _mm256_extracti128_si256(v, 1);
    return group % 2 ? _mm_srli_si128(lane, 8) : lane;
}

// byte c of the 32-bit words of two vectors, as 16-bit lanes
__attribute__((target("avx2"))) inline __m256i byteOfWords(const __m256i* words, int c) {
    const __m128i count = _mm_cvtsi32_si128(8 * c);
    const __m256i low = _mm256_set1_epi32(0xFF);
    return _mm256_packs_epi32(_mm256_and_si256(_mm256_srl_epi32(words[0], count), low),
                              _mm256_and_si256(_mm256_srl_epi32(words[1], count), low));
}
}  // namespace

__attribute__((target("avx2"))) void yuvToRgbRowAvx2(const unsigned char* in, unsigned char* out, int width, int r) {
    const Avx2Masks m = avx2Masks();
    const __m256i flipSign = _mm256_set1_epi8(-128);
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        __m256i yuv[3];
        load32x3(in + 3 * x, m, yuv);
        // a byte minus 128 is the byte with its top bit flipped, read as signed
        const __m256i u = _mm256_xor_si256(yuv[1], flipSign), v = _mm256_xor_si256(yuv[2], flipSign);
        __m256i rgb[3][4];
        for (int group = 0; group < 4; ++group) {
            const __m256 Y = _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(eightBytes(yuv[0], group)));
            const __m256 U = _mm256_cvtepi32_ps(_mm256_cvtepi8_epi32(eightBytes(u, group)));
            const __m256 V = _mm256_cvtepi32_ps(_mm256_cvtepi8_epi32(eightBytes(v, group)));
            rgb[0][group] = _mm256_cvttps_epi32(_mm256_add_ps(Y, _mm256_mul_ps(V, _mm256_set1_ps(1.370705f))));
            rgb[1][group] = _mm256_cvttps_epi32(_mm256_add_ps(_mm256_add_ps(Y, _mm256_mul_ps(V, _mm256_set1_ps(-0.698001f))),
                                                              _mm256_mul_ps(U, _mm256_set1_ps(-0.337633f))));
            rgb[2][group] = _mm256_cvttps_epi32(_mm256_add_ps(Y, _mm256_mul_ps(U, _mm256_set1_ps(1.732446f))));
        }
        __m256i channels[3];
        for (int c = 0; c < 3; ++c)
            channels[c] = packedInOrder(_mm256_packus_epi16(_mm256_packs_epi32(rgb[c][0], rgb[c][1]),
                                                            _mm256_packs_epi32(rgb[c][2], rgb[c][3])));
        const __m256i ordered[3] = {channels[r == 0 ? 0 : 2], channels[1], channels[r == 0 ? 2 : 0]};
        store32x3(out + 3 * x, m, ordered);
    }
    yuvToRgbRowSse(in + 3 * x, out + 3 * x, width - x, r);
}

__attribute__((target("avx2"))) void rgbToYuvRowAvx2(const unsigned char* in, unsigned char* out, int width, int r) {
    const Avx2Masks m = avx2Masks();
    const __m256i zero = _mm256_setzero_si256();
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        __m256i pixels[3];
        load32x3(in + 3 * x, m, pixels);
        const __m256i red = pixels[r], green = pixels[1], blue = pixels[2 - r];
        __m256i yuv[3][2];
        for (int h = 0; h < 2; ++h) {
            const __m256i R = h ? _mm256_unpackhi_epi8(red, zero) : _mm256_unpacklo_epi8(red, zero);
            const __m256i G = h ? _mm256_unpackhi_epi8(green, zero) : _mm256_unpacklo_epi8(green, zero);
            const __m256i B = h ? _mm256_unpackhi_epi8(blue, zero) : _mm256_unpacklo_epi8(blue, zero);
            yuv[0][h] = luma16Avx(R, G, B);
            yuv[1][h] = weighted16(R, G, B, -38, -74, 112, 128);
            yuv[2][h] = weighted16(R, G, B, 112, -94, -18, 128);
        }
        __m256i channels[3];
        for (int c = 0; c < 3; ++c) channels[c] = _mm256_packus_epi16(yuv[c][0], yuv[c][1]);
        store32x3(out + 3 * x, m, channels);
    }
    rgbToYuvRowSse(in + 3 * x, out + 3 * x, width - x, r);
}

__attribute__((target("avx2"))) void lumaRowAvx2(const unsigned char* in, unsigned char* out, int width, int r) {
    const Avx2Masks m = avx2Masks();
    const __m256i zero = _mm256_setzero_si256();
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        __m256i pixels[3];
        load32x3(in + 3 * x, m, pixels);
        const __m256i red = pixels[r], green = pixels[1], blue = pixels[2 - r];
        const __m256i low = luma16Avx(_mm256_unpacklo_epi8(red, zero), _mm256_unpacklo_epi8(green, zero),
                                      _mm256_unpacklo_epi8(blue, zero));
        const __m256i high = luma16Avx(_mm256_unpackhi_epi8(red, zero), _mm256_unpackhi_epi8(green, zero),
                                       _mm256_unpackhi_epi8(blue, zero));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x), _mm256_packus_epi16(low, high));
    }
    lumaRowSse(in + 3 * x, out + x, width - x, r);
}

__attribute__((target("avx2"))) void lumaRow4Avx2(const unsigned char* in, unsigned char* out, int width, int r) {
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        __m256i words[4];
        for (int k = 0; k < 4; ++k) words[k] = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(in + 4 * x + 32 * k));
        const __m256i first = luma16Avx(byteOfWords(words, r), byteOfWords(words, 1), byteOfWords(words, 2 - r));
        const __m256i second = luma16Avx(byteOfWords(words + 2, r), byteOfWords(words + 2, 1), byteOfWords(words + 2, 2 - r));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x), packedInOrder(_mm256_packus_epi16(first, second)));
    }
    lumaRowScalar(in + 4 * x, out + x, width - x, 4, r, 1, 2 - r);
}

__attribute__((target("avx2"))) void spreadRowAvx2(const unsigned char* in, unsigned char* out, int width) {
    const Avx2Masks m = avx2Masks();
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        const __m256i v = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(in + x));
        const __m256i parts[3] = {_mm256_shuffle_epi8(v, m.spread[0]), _mm256_shuffle_epi8(v, m.spread[1]),
                                  _mm256_shuffle_epi8(v, m.spread[2])};
        storeParts3(out + 3 * x, parts);
    }
    spreadRowSse(in + x, out + 3 * x, width - x);
}

__attribute__((target("ssse3"))) void toFourRowSse(const unsigned char* in, unsigned char* out, int width, int r) {
    // four pixels of 12 bytes into 16, red to byte 0, the fourth bytes cleared for alpha
    const __m128i mask = r == 0 ? _mm_setr_epi8(0, 1, 2, -128, 3, 4, 5, -128, 6, 7, 8, -128, 9, 10, 11, -128)
                                : _mm_setr_epi8(2, 1, 0, -128, 5, 4, 3, -128, 8, 7, 6, -128, 11, 10, 9, -128);
    const __m128i alpha = _mm_set1_epi32(static_cast<int>(0xFF000000u));
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        const __m128i a = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x));
        const __m128i b = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x + 16));
        const __m128i c = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * x + 32));
        const __m128i groups[4] = {a, _mm_alignr_epi8(b, a, 12), _mm_alignr_epi8(c, b, 8), _mm_srli_si128(c, 4)};
        for (int k = 0; k < 4; ++k)
            _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 4 * x + 16 * k),
                             _mm_or_si128(_mm_shuffle_epi8(groups[k], mask), alpha));
    }
    for (; x < width; ++x) {
        out[4 * x] = in[3 * x + r];
        out[4 * x + 1] = in[3 * x + 1];
        out[4 * x + 2] = in[3 * x + 2 - r];
        out[4 * x + 3] = 255;
    }
}

namespace {
// Exchanging bytes 0 and 2 moves each byte by at most two: an output block is the input
// block where the byte stays, the block two bytes on or two bytes back where it moves.
// Which byte is which repeats every 96 bytes, three blocks of 32.
struct SwapMasks {
    alignas(32) unsigned char keep[3][32], next[3][32], back[3][32];
    SwapMasks() {
        for (int j = 0; j < 3; ++j)
            for (int i = 0; i < 32; ++i) {
                const int channel = (32 * j + i) % 3;
                keep[j][i] = channel == 1 ? 0xFF : 0;
                next[j][i] = channel == 0 ? 0xFF : 0;
                back[j][i] = channel == 2 ? 0xFF : 0;
            }
    }
};
const SwapMasks kSwapMasks;
}  // namespace

__attribute__((target("avx2"))) void swapRowAvx2(const unsigned char* in, unsigned char* out, int width) {
    __m256i keep[3], next[3], back[3];
    for (int j = 0; j < 3; ++j) {
        keep[j] = _mm256_load_si256(reinterpret_cast<const __m256i*>(kSwapMasks.keep[j]));
        next[j] = _mm256_load_si256(reinterpret_cast<const __m256i*>(kSwapMasks.next[j]));
        back[j] = _mm256_load_si256(reinterpret_cast<const __m256i*>(kSwapMasks.back[j]));
    }
    // A head of 1 to 32 pixels, until the stores are aligned to 32 bytes (3 x 11 = 1 mod 32):
    // unaligned stores cost more than the loads here. The head also keeps the loads two
    // bytes back inside the row, and the loop keeps one pixel after its 32 for those on.
    int x = static_cast<int>((-11 * static_cast<long>(reinterpret_cast<uintptr_t>(out) % 32)) & 31);
    if (x == 0) x = 32;
    x = std::min(x, width);
    swapRowSse(in, out, x);
    for (; x + 33 <= width; x += 32) {
        const unsigned char* p = in + 3 * x;
        for (int j = 0; j < 3; ++j) {
            const __m256i same = load256(p + 32 * j), after = load256(p + 32 * j + 2), before = load256(p + 32 * j - 2);
            _mm256_store_si256(reinterpret_cast<__m256i*>(out + 3 * x + 32 * j),
                                _mm256_or_si256(_mm256_or_si256(_mm256_and_si256(same, keep[j]), _mm256_and_si256(after, next[j])),
                                                _mm256_and_si256(before, back[j])));
        }
    }
    swapRowSse(in + 3 * x, out + 3 * x, width - x);
}

namespace {
// pshufb masks that build the 48 bytes of 16 full-size pixels from 16 luma bytes and the
// 16 bytes of their eight V, U pairs: part k = shuffle(luma, luma[k]) | shuffle(pairs, pairs[k])
struct Nv21FullMasks {
    alignas(16) signed char luma[3][16], pairs[3][16];
    Nv21FullMasks() {
        for (int k = 0; k < 3; ++k)
            for (int i = 0; i < 16; ++i) {
                const int at = 16 * k + i, pixel = at / 3, channel = at % 3;
                luma[k][i] = static_cast<signed char>(channel == 0 ? pixel : -128);
                pairs[k][i] = static_cast<signed char>(channel == 0 ? -128 : (pixel & ~1) + (channel == 1 ? 1 : 0));
            }
    }
};
const Nv21FullMasks kNv21Full;

__attribute__((target("avx2"))) inline __m256i broadcastMask(const signed char* mask) {
    return _mm256_broadcastsi128_si256(_mm_load_si128(reinterpret_cast<const __m128i*>(mask)));
}

// Full size: two shuffles per 16 output bytes, straight from the loaded rows.
__attribute__((target("avx2"))) int nv21FullRowAvx2(const unsigned char* luma, const unsigned char* pairs,
                                                     unsigned char* out, int width, bool flip) {
    __m256i lumaMask[3], pairMask[3];
    for (int k = 0; k < 3; ++k) lumaMask[k] = broadcastMask(kNv21Full.luma[k]), pairMask[k] = broadcastMask(kNv21Full.pairs[k]);
    const __m256i reverse = _mm256_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0, 15, 14, 13, 12, 11, 10, 9, 8,
                                             7, 6, 5, 4, 3, 2, 1, 0);
    const __m256i reversePairs = _mm256_setr_epi8(14, 15, 12, 13, 10, 11, 8, 9, 6, 7, 4, 5, 2, 3, 0, 1, 14, 15, 12, 13, 10, 11,
                                                  8, 9, 6, 7, 4, 5, 2, 3, 0, 1);
    int x = 0;
    for (; x + 32 <= width; x += 32) {
        const int s = flip ? width - x - 32 : x;
        __m256i y = load256(luma + s), c = load256(pairs + s);
        if (flip) {
            y = _mm256_permute4x64_epi64(_mm256_shuffle_epi8(y, reverse), 0x4E);
            c = _mm256_permute4x64_epi64(_mm256_shuffle_epi8(c, reversePairs), 0x4E);
        }
        __m256i parts[3];
        for (int k = 0; k < 3; ++k)
            parts[k] = _mm256_or_si256(_mm256_shuffle_epi8(y, lumaMask[k]), _mm256_shuffle_epi8(c, pairMask[k]));
        storeParts3(out + 3 * x, parts);
    }
    return x;
}
}  // namespace

__attribute__((target("avx2"))) void nv21RowAvx2(const unsigned char* luma, const unsigned char* pairs,
                                                  unsigned char* out, int width, int zoom, bool flip) {
    const __m256i low = _mm256_set1_epi16(0xFF);
    const __m256i reverse = _mm256_broadcastsi128_si256(_mm_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0));
    if (zoom == 1 && flip && width % 2) return nv21RowSse(luma, pairs, out, width, zoom, flip);
    int x = 0;
    if (zoom == 1) {
        x = nv21FullRowAvx2(luma, pairs, out, width, flip);
    } else {
        const Avx2Masks m = avx2Masks();
        for (; x + 32 <= width; x += 32) {
            const int s = 2 * (flip ? width - x - 32 : x);
            // in-lane packs interleave the two loads' halves: 64-bit order 0 2 1 3
            const __m256i l0 = load256(luma + s), l1 = load256(luma + s + 32);
            const __m256i c0 = load256(pairs + s), c1 = load256(pairs + s + 32);
            __m256i p[3];
            p[0] = _mm256_permute4x64_epi64(_mm256_packus_epi16(_mm256_and_si256(l0, low), _mm256_and_si256(l1, low)), 0xD8);
            p[1] = _mm256_permute4x64_epi64(_mm256_packus_epi16(_mm256_srli_epi16(c0, 8), _mm256_srli_epi16(c1, 8)), 0xD8);
            p[2] = _mm256_permute4x64_epi64(_mm256_packus_epi16(_mm256_and_si256(c0, low), _mm256_and_si256(c1, low)), 0xD8);
            if (flip)
                for (int c = 0; c < 3; ++c) p[c] = _mm256_permute4x64_epi64(_mm256_shuffle_epi8(p[c], reverse), 0x4E);
            store32x3(out + 3 * x, m, p);
        }
    }
    if (flip)
        nv21RowSse(luma, pairs, out + 3 * x, width - x, zoom, true);
    else
        nv21RowSse(luma + zoom * x, pairs + zoom * x, out + 3 * x, width - x, zoom, false);
}
#endif

// ---- to YUV and mono ---------------------------------------------------------------------

void bgrToYuv(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_BGR, COLOR_MODE_YUV);
    rgbToYuvAt(source, target, area, 2);
}

void rgbToYuv(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_RGB, COLOR_MODE_YUV);
    rgbToYuvAt(source, target, area, 0);
}

void rgbaToYuv(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_RGBA, COLOR_MODE_YUV);
    rgbToYuvAt(source, target, area, 0);
}

void monoToYuv(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO, COLOR_MODE_YUV);
    forEachPixel<unsigned char, unsigned char, 1, 3>(source, target, area, [](const unsigned char* p, unsigned char* q) {
        q[0] = static_cast<unsigned char>(((220 * p[0]) >> 8) + 16);
        q[1] = q[2] = 128;
    });
}

void bgrToMono(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_BGR, COLOR_MODE_MONO);
    lumaOf(source, target, area, 2, 1, 0);
}

void rgbToMono(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_RGB, COLOR_MODE_MONO);
    lumaOf(source, target, area, 0, 1, 2);
}

void rgbaToMono(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_RGBA, COLOR_MODE_MONO);
    lumaOf(source, target, area, 0, 1, 2);
}

void yuvToMono(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_YUV, COLOR_MODE_MONO);
    for (int y = area.top; y < area.bottom; ++y) {
        const unsigned char* in = source.pixel(area.left, y);
        unsigned char* out = target.pixel(area.left, y);
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
        yuvToMonoRowNeon(in, out, area.width());
        continue;
#elif defined(LQ_HAVE_SSSE3)
        if (haveSsse3Cpu()) {
            channelRowSse(in, out, area.width(), 0);
            continue;
        }
#endif
        yuvToMonoRowScalar(in, out, area.width());
    }
}

void floatToMono(const Image& source, Image& target, float offset, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_FLOAT, COLOR_MODE_MONO);
    forEachPixel<float, unsigned char, 1, 1>(source, target, area, [=](const float* p, unsigned char* q) {
        q[0] = clampByte(p[0] * factor + offset);
    });
}

void floatToFloat2(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_FLOAT, COLOR_MODE_FLOAT2);
    forEachPixel<float, float, 1, 2>(source, target, area, [](const float* p, float* q) {
        q[0] = p[0];
        q[1] = 0;
    });
}

void floatToBgr(const Image& source, Image& target, float offset, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_FLOAT, COLOR_MODE_BGR);
    forEachPixel<float, unsigned char, 1, 3>(source, target, area, [=](const float* p, unsigned char* q) {
        q[0] = q[1] = q[2] = clampByte(p[0] * factor + offset);
    });
}

// ---- channel orders ----------------------------------------------------------------------

namespace {
// out[k] = in[order[k]] for the first three bytes; a fourth byte of 255 when asked
template <int InStep, int OutStep, int c0, int c2, bool alpha>
void reorder(const Image& source, Image& target, const BaseRect<int>& area) {
#if defined(LQ_HAVE_SSSE3)
    if constexpr (InStep == 3 && OutStep == 3 && c0 == 2 && c2 == 0 && !alpha) {
        if (haveSsse3Cpu()) {
            for (int y = area.top; y < area.bottom; ++y) {
                if (haveAvx2Cpu())
                    swapRowAvx2(source.pixel(area.left, y), target.pixel(area.left, y), area.width());
                else
                    swapRowSse(source.pixel(area.left, y), target.pixel(area.left, y), area.width());
            }
            return;
        }
    }
    if constexpr (InStep == 3 && OutStep == 4 && alpha) {
        if (haveSsse3Cpu()) {
            for (int y = area.top; y < area.bottom; ++y)
                toFourRowSse(source.pixel(area.left, y), target.pixel(area.left, y), area.width(), c0);
            return;
        }
    }
#endif
    constexpr int c1 = 1;
    forEachPixel<unsigned char, unsigned char, InStep, OutStep>(source, target, area, [=](const unsigned char* p, unsigned char* q) {
        const unsigned char a = p[c0], b = p[c1], c = p[c2];
        q[0] = a, q[1] = b, q[2] = c;
        if (alpha) q[OutStep - 1] = 255;
    });
}
template <int OutStep, bool alpha>
void spread(const Image& source, Image& target, const BaseRect<int>& area) {
#if defined(LQ_HAVE_SSSE3)
    if constexpr (OutStep == 3) {
        if (haveSsse3Cpu()) {
            for (int y = area.top; y < area.bottom; ++y) {
                if (haveAvx2Cpu())
                    spreadRowAvx2(source.pixel(area.left, y), target.pixel(area.left, y), area.width());
                else
                    spreadRowSse(source.pixel(area.left, y), target.pixel(area.left, y), area.width());
            }
            return;
        }
    }
#endif
    forEachPixel<unsigned char, unsigned char, 1, OutStep>(source, target, area, [=](const unsigned char* p, unsigned char* q) {
        q[0] = q[1] = q[2] = p[0];
        if (alpha) q[OutStep - 1] = 255;
    });
}
template <int OutStep, bool alpha>
void spread16(const Image& source, Image& target, const BaseRect<int>& area, float factor) {
    forEachPixel<unsigned short, unsigned char, 1, OutStep>(source, target, area, [=](const unsigned short* p, unsigned char* q) {
        q[0] = q[1] = q[2] = clampByte(p[0] * factor);
        if (alpha) q[OutStep - 1] = 255;
    });
}
}  // namespace

void bgrToRgba(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_BGR, COLOR_MODE_RGBA);
    reorder<3, 4, 2, 0, true>(source, target, area);
}

void rgbToRgba(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_RGB, COLOR_MODE_RGBA);
    reorder<3, 4, 0, 2, true>(source, target, area);
}

void bgrToRgb(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_BGR, COLOR_MODE_RGB);
    reorder<3, 3, 2, 0, false>(source, target, area);
}

void rgbToBgr(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_RGB, COLOR_MODE_BGR);
    reorder<3, 3, 2, 0, false>(source, target, area);
}

void rgbaToBgr(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_RGBA, COLOR_MODE_BGR);
    reorder<4, 3, 2, 0, false>(source, target, area);
}

void monoToBgr(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO, COLOR_MODE_BGR);
    spread<3, false>(source, target, area);
}

void monoToRgb(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO, COLOR_MODE_RGB);
    spread<3, false>(source, target, area);
}

void monoToRgba(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO, COLOR_MODE_RGBA);
    spread<4, true>(source, target, area);
}

void mono16ToMono(const Image& source, Image& target, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO16, COLOR_MODE_MONO);
    forEachPixel<unsigned short, unsigned char, 1, 1>(source, target, area, [=](const unsigned short* p, unsigned char* q) {
        q[0] = clampByte(p[0] * factor);
    });
}

void mono16ToBgr(const Image& source, Image& target, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO16, COLOR_MODE_BGR);
    spread16<3, false>(source, target, area, factor);
}

void mono16ToRgb(const Image& source, Image& target, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO16, COLOR_MODE_RGB);
    spread16<3, false>(source, target, area, factor);
}

void mono16ToRgba(const Image& source, Image& target, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO16, COLOR_MODE_RGBA);
    spread16<4, true>(source, target, area, factor);
}

void monoToFloat(const Image& source, Image& target, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO, COLOR_MODE_FLOAT);
    forEachPixel<unsigned char, float, 1, 1>(source, target, area, [=](const unsigned char* p, float* q) { q[0] = p[0] * factor; });
}

void mono16ToFloat(const Image& source, Image& target, float factor, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_MONO16, COLOR_MODE_FLOAT);
    forEachPixel<unsigned short, float, 1, 1>(source, target, area, [=](const unsigned short* p, float* q) { q[0] = p[0] * factor; });
}

void yuvToBgr(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_YUV, COLOR_MODE_BGR);
    yuvToRgbAt(source, target, area, 2);
}

void yuvToRgb(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_YUV, COLOR_MODE_RGB);
    yuvToRgbAt(source, target, area, 0);
}

void yuvToRgba(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_CONVERSION_START(COLOR_MODE_YUV, COLOR_MODE_RGBA);
    yuvToRgbAt(source, target, area, 0);
}

// ---- camera formats ------------------------------------------------------------------------

namespace {
template <int zoom, bool flip>
void nv21RowAt(const unsigned char* __restrict luma, const unsigned char* __restrict pairs, unsigned char* __restrict out,
               int width) {
    for (int x = 0; x < width; ++x) {
        const int column = zoom * (flip ? width - 1 - x : x);
        const int pair = column & ~1;
        out[3 * x] = luma[column];
        out[3 * x + 1] = pairs[pair + 1];
        out[3 * x + 2] = pairs[pair];
    }
}
}  // namespace

void nv21RowScalar(const unsigned char* luma, const unsigned char* pairs, unsigned char* out, int width, int zoom,
                   bool flip) {
    if (zoom == 2)
        flip ? nv21RowAt<2, true>(luma, pairs, out, width) : nv21RowAt<2, false>(luma, pairs, out, width);
    else
        flip ? nv21RowAt<1, true>(luma, pairs, out, width) : nv21RowAt<1, false>(luma, pairs, out, width);
}

void yuvToMonoRowScalar(const unsigned char* in, unsigned char* out, int width) {
    for (int x = 0; x < width; ++x) out[x] = in[3 * x];
}

// The vector rows take 16 target pixels a step. A mirrored step reads the source block
// that ends where the previous one began and reverses each channel; what is left over at
// the end of a row is the scalar row of the remaining width, mirrored or not, which reads
// the same columns. A full-size mirrored row of odd width would put the blocks across the
// chroma pairs, so it stays scalar (camera frames have even widths).
#if defined(LQ_HAVE_NEON)
namespace {
inline uint8x16_t reverse16(uint8x16_t v) {
    const uint8x16_t halves = vrev64q_u8(v);
    return vextq_u8(halves, halves, 8);
}
}  // namespace

void nv21RowNeon(const unsigned char* luma, const unsigned char* pairs, unsigned char* out, int width, int zoom,
                 bool flip) {
    int x = 0;
    if (!(flip && zoom == 1 && width % 2)) {
        for (; x + 16 <= width; x += 16) {
            const int s = zoom * (flip ? width - x - 16 : x);
            uint8x16x3_t p;
            if (zoom == 2) {
                const uint8x16x2_t l = vld2q_u8(luma + s);
                const uint8x16x2_t vu = vld2q_u8(pairs + s);
                p.val[0] = l.val[0], p.val[1] = vu.val[1], p.val[2] = vu.val[0];
            } else {
                const uint8x8x2_t vu = vld2_u8(pairs + s);
                const uint8x8x2_t u = vzip_u8(vu.val[1], vu.val[1]);
                const uint8x8x2_t v = vzip_u8(vu.val[0], vu.val[0]);
                p.val[0] = vld1q_u8(luma + s);
                p.val[1] = vcombine_u8(u.val[0], u.val[1]);
                p.val[2] = vcombine_u8(v.val[0], v.val[1]);
            }
            if (flip)
                for (int c = 0; c < 3; ++c) p.val[c] = reverse16(p.val[c]);
            vst3q_u8(out + 3 * x, p);
        }
    }
    if (flip)
        nv21RowScalar(luma, pairs, out + 3 * x, width - x, zoom, true);
    else
        nv21RowScalar(luma + zoom * x, pairs + zoom * x, out + 3 * x, width - x, zoom, false);
}

void yuvToMonoRowNeon(const unsigned char* in, unsigned char* out, int width) {
    int x = 0;
    for (; x + 16 <= width; x += 16) vst1q_u8(out + x, vld3q_u8(in + 3 * x).val[0]);
    yuvToMonoRowScalar(in + 3 * x, out + x, width - x);
}
#endif

#if defined(LQ_HAVE_SSSE3)
__attribute__((target("ssse3"))) void nv21RowSse(const unsigned char* luma, const unsigned char* pairs,
                                                  unsigned char* out, int width, int zoom, bool flip) {
    const __m128i low = _mm_set1_epi16(0xFF);
    const __m128i reverse = _mm_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0);
    const auto load = [](const unsigned char* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); };
    int x = 0;
    if (!(flip && zoom == 1 && width % 2)) {
        for (; x + 16 <= width; x += 16) {
            const int s = zoom * (flip ? width - x - 16 : x);
            __m128i p[3];
            if (zoom == 2) {
                const __m128i l0 = load(luma + s), l1 = load(luma + s + 16);
                const __m128i c0 = load(pairs + s), c1 = load(pairs + s + 16);
                p[0] = _mm_packus_epi16(_mm_and_si128(l0, low), _mm_and_si128(l1, low));
                p[1] = _mm_packus_epi16(_mm_srli_epi16(c0, 8), _mm_srli_epi16(c1, 8));
                p[2] = _mm_packus_epi16(_mm_and_si128(c0, low), _mm_and_si128(c1, low));
            } else {
                const __m128i c = load(pairs + s);
                const __m128i u = _mm_srli_epi16(c, 8), v = _mm_and_si128(c, low);
                p[0] = load(luma + s);
                p[1] = _mm_or_si128(u, _mm_slli_epi16(u, 8));
                p[2] = _mm_or_si128(v, _mm_slli_epi16(v, 8));
            }
            if (flip)
                for (int c = 0; c < 3; ++c) p[c] = _mm_shuffle_epi8(p[c], reverse);
            storePixels(out + 3 * x, p);
        }
    }
    if (flip)
        nv21RowScalar(luma, pairs, out + 3 * x, width - x, zoom, true);
    else
        nv21RowScalar(luma + zoom * x, pairs + zoom * x, out + 3 * x, width - x, zoom, false);
}
#endif

namespace {
// zoom 1 or 2; a flip reads the columns from the right
void nv21ToYuvRows(const unsigned char* nv21, int width, int height, Image& target, int zoom, bool flip) {
    const unsigned char* chroma = nv21 + static_cast<size_t>(width) * height;
    for (int y = 0; y < target.height(); ++y) {
        const unsigned char* luma = nv21 + static_cast<size_t>(y * zoom) * width;
        const unsigned char* pairs = chroma + static_cast<size_t>(y * zoom / 2) * width;
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
        nv21RowNeon(luma, pairs, target.row(y), target.width(), zoom, flip);
#elif defined(LQ_HAVE_SSSE3)
        if (haveAvx2Cpu())
            nv21RowAvx2(luma, pairs, target.row(y), target.width(), zoom, flip);
        else if (haveSsse3Cpu())
            nv21RowSse(luma, pairs, target.row(y), target.width(), zoom, flip);
        else
            nv21RowScalar(luma, pairs, target.row(y), target.width(), zoom, flip);
#else
        nv21RowScalar(luma, pairs, target.row(y), target.width(), zoom, flip);
#endif
    }
}
}  // namespace

void nv21ToYuv(const unsigned char* nv21, const BaseSize<int>& size, Image& target) {
    const int width = size.width, height = size.height;
    LQ_ASSERT_MSG(height % 2 == 0, "height must be even: " << height);
    LQ_ASSERT_MSG(width % 2 == 0, "width must be even: " << width);
    target.create(size, COLOR_MODE_YUV);
    nv21ToYuvRows(nv21, width, height, target, 1, false);
}

void nv21ToYuvFlip(const unsigned char* nv21, const BaseSize<int>& size, Image& target) {
    const int width = size.width, height = size.height;
    LQ_ASSERT_MSG(height % 2 == 0, "height must be even: " << height);
    LQ_ASSERT_MSG(width % 2 == 0, "width must be even: " << width);
    target.create(size, COLOR_MODE_YUV);
    nv21ToYuvRows(nv21, width, height, target, 1, true);
}

void nv21ToYuvZoom2(const unsigned char* nv21, const BaseSize<int>& size, Image& target) {
    LQ_ASSERT_MSG(size.height % 2 == 0, "height must be even: " << size.height);
    LQ_ASSERT_MSG(size.width % 2 == 0, "width must be even: " << size.width);
    target.create(BaseSize<int>(size.width / 2, size.height / 2), COLOR_MODE_YUV);
    nv21ToYuvRows(nv21, size.width, size.height, target, 2, false);
}

void nv21ToYuvZoom2Flip(const unsigned char* nv21, const BaseSize<int>& size, Image& target) {
    LQ_ASSERT_MSG(size.height % 2 == 0, "height must be even: " << size.height);
    LQ_ASSERT_MSG(size.width % 2 == 0, "width must be even: " << size.width);
    target.create(BaseSize<int>(size.width / 2, size.height / 2), COLOR_MODE_YUV);
    nv21ToYuvRows(nv21, size.width, size.height, target, 2, true);
}

void nv21ToMono(const unsigned char* nv21, const BaseSize<int>& size, Image& target) {
    LQ_ASSERT_MSG(size.height % 2 == 0, "height must be even: " << size.height);
    LQ_ASSERT_MSG(size.width % 2 == 0, "width must be even: " << size.width);
    target.create(size, COLOR_MODE_MONO);
    if (target.stripLength() == static_cast<unsigned>(size.width)) {
        std::memcpy(target.data(), nv21, static_cast<size_t>(size.width) * size.height);
        return;
    }
    for (int y = 0; y < size.height; ++y) std::memcpy(target.row(y), nv21 + static_cast<size_t>(y) * size.width, size.width);
}

void nv21ToMonoFlip(const unsigned char* nv21, const BaseSize<int>& size, Image& target) {
    LQ_ASSERT_MSG(size.height % 2 == 0, "height must be even: " << size.height);
    LQ_ASSERT_MSG(size.width % 2 == 0, "width must be even: " << size.width);
    target.create(size, COLOR_MODE_MONO);
    for (int y = 0; y < size.height; ++y) {
        const unsigned char* in = nv21 + static_cast<size_t>(y) * size.width;
        unsigned char* out = target.row(y);
        for (int x = 0; x < size.width; ++x) out[x] = in[size.width - 1 - x];
    }
}

void yuvToNv21(const Image& source, SharedArray<unsigned char>& out) {
    LQ_ASSERT_COLOR_MODE(source, COLOR_MODE_YUV);
    const int width = source.width() & ~1, height = source.height() & ~1;
    out = SharedArray<unsigned char>(new unsigned char[static_cast<size_t>(width * height * 1.5)]);
    unsigned char* luma = out.get();
    unsigned char* pairs = luma + static_cast<size_t>(width) * height;
    for (int y = 0; y < height; ++y) {
        const unsigned char* in = source.row(y);
        for (int x = 0; x < width; ++x) {
            *luma++ = in[3 * x];
            if (x % 2 == 0 && y % 2 == 0) {
                *pairs++ = in[3 * x + 2];
                *pairs++ = in[3 * x + 1];
            }
        }
    }
}

void yuvToYuy2(const Image& source, SharedArray<unsigned char>& out) {
    LQ_ASSERT_COLOR_MODE(source, COLOR_MODE_YUV);
    out = SharedArray<unsigned char>(new unsigned char[static_cast<size_t>(source.width()) * source.height() * 2]);
    if (source.width() % 2) return;
    unsigned char* q = out.get();
    for (int y = 0; y < source.height(); ++y) {
        const unsigned char* p = source.row(y);
        for (int x = 0; x < source.width(); x += 2, p += 6, q += 4) {
            q[0] = p[0];
            q[1] = static_cast<unsigned char>((p[1] + p[4]) >> 1);
            q[2] = p[3];
            q[3] = static_cast<unsigned char>((p[2] + p[5]) >> 1);
        }
    }
}

// ---- dispatchers -------------------------------------------------------------------------

void toMono(const Image& source, Image& target, const BaseRect<int>& rect) {
    switch (source.colorMode()) {
        case COLOR_MODE_MONO: return copyImage(source, target, rect);
        case COLOR_MODE_DEPTH: return depthToMono(source, target, 500, 5000, rect);
        case COLOR_MODE_BGR: return bgrToMono(source, target, rect);
        case COLOR_MODE_RGB: return rgbToMono(source, target, rect);
        case COLOR_MODE_YUV: return yuvToMono(source, target, rect);
        case COLOR_MODE_RGBA: return rgbaToMono(source, target, rect);
        case COLOR_MODE_FLOAT: return floatToMono(source, target, 0, 1.0f, rect);
        default: LQ_FAIL("color mode not handled: " << source.colorMode());
    }
}

void toBgr(const Image& source, Image& target, const BaseRect<int>& rect) {
    switch (source.colorMode()) {
        case COLOR_MODE_MONO: return monoToBgr(source, target, rect);
        case COLOR_MODE_MONO16: return mono16ToBgr(source, target, 1.0f, rect);
        case COLOR_MODE_DEPTH: return depthToBgr(source, target, 500, 5000, rect);
        case COLOR_MODE_BGR: return copyImage(source, target, rect);
        case COLOR_MODE_RGB: return rgbToBgr(source, target, rect);
        case COLOR_MODE_YUV: return yuvToBgr(source, target, rect);
        case COLOR_MODE_RGBA: return rgbaToBgr(source, target, rect);
        case COLOR_MODE_FLOAT: return floatToBgr(source, target, 0, 100.0f, rect);
        default: LQ_FAIL("color mode not handled: " << source.colorMode());
    }
}

void toRgb(const Image& source, Image& target, const BaseRect<int>& rect) {
    switch (source.colorMode()) {
        case COLOR_MODE_MONO: return monoToRgb(source, target, rect);
        case COLOR_MODE_MONO16: return mono16ToRgb(source, target, 1.0f, rect);
        case COLOR_MODE_DEPTH: return depthToRgb(source, target, 500, 5000, rect);
        case COLOR_MODE_BGR: return bgrToRgb(source, target, rect);
        case COLOR_MODE_RGB: return copyImage(source, target, rect);
        case COLOR_MODE_YUV: return yuvToRgb(source, target, rect);
        default: LQ_FAIL("color mode not handled: " << source.colorMode());
    }
}

void toRgba(const Image& source, Image& target, const BaseRect<int>& rect) {
    switch (source.colorMode()) {
        case COLOR_MODE_MONO: return monoToRgba(source, target, rect);
        case COLOR_MODE_MONO16: return mono16ToRgba(source, target, 100.0f, rect);
        case COLOR_MODE_BGR: return bgrToRgba(source, target, rect);
        case COLOR_MODE_RGB: return rgbToRgba(source, target, rect);
        case COLOR_MODE_YUV: return yuvToRgba(source, target, rect);
        case COLOR_MODE_RGBA: return copyImage(source, target, rect);
        default: LQ_FAIL("color mode not handled: " << source.colorMode());
    }
}

void toYuv(const Image& source, Image& target, const BaseRect<int>& rect) {
    switch (source.colorMode()) {
        case COLOR_MODE_MONO: return monoToYuv(source, target, rect);
        case COLOR_MODE_BGR: return bgrToYuv(source, target, rect);
        case COLOR_MODE_RGB: return rgbToYuv(source, target, rect);
        case COLOR_MODE_YUV: return copyImage(source, target, rect);
        case COLOR_MODE_RGBA: return rgbaToYuv(source, target, rect);
        default: LQ_FAIL("color mode not handled: " << source.colorMode());
    }
}

void toColorMode(const Image& source, Image& target, ColorMode mode, const BaseRect<int>& rect) {
    switch (mode) {
        case COLOR_MODE_MONO: return toMono(source, target, rect);
        case COLOR_MODE_DEPTH: return copyImage(source, target, rect);
        case COLOR_MODE_GRADIENT: return SobelGradient(source, target);
        case COLOR_MODE_RMCT: return computeRmct(source, target, rect);
        case COLOR_MODE_BGR: return toBgr(source, target, rect);
        case COLOR_MODE_RGB: return toRgb(source, target, rect);
        case COLOR_MODE_YUV: return toYuv(source, target, rect);
        case COLOR_MODE_RGBA: return toRgba(source, target, rect);
        case COLOR_MODE_INTEGRAL: return computeIntegral(source, target, rect);
        default: LQ_FAIL("color mode not handled: " << mode);
    }
}

}  // namespace LQ
