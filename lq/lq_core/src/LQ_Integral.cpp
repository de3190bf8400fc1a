#include "LQ_Integral.h"

#include <cmath>
#include <cstring>
#include <vector>

namespace LQ {

// ---- integral image ------------------------------------------------------------------------

void integralRowScalar(const unsigned char* in, const unsigned int* above, unsigned int* out, int width) {
    unsigned int run = 0;
    for (int x = 0; x < width; ++x) {
        run += in[x];
        out[x + 1] = run + above[x + 1];
    }
}

#if defined(LQ_HAVE_NEON)
void integralRowNeon(const unsigned char* in, const unsigned int* above, unsigned int* out, int width) {
    const uint16x8_t zero = vdupq_n_u16(0);
    uint32x4_t carry = vdupq_n_u32(0);
    int x = 0;
    for (; x + 8 <= width; x += 8) {
        // prefix sums of eight bytes in 16 bits (at most 2040), then widened and carried
        uint16x8_t s = vmovl_u8(vld1_u8(in + x));
        s = vaddq_u16(s, vextq_u16(zero, s, 7));
        s = vaddq_u16(s, vextq_u16(zero, s, 6));
        s = vaddq_u16(s, vextq_u16(zero, s, 4));
        const uint32x4_t low = vaddq_u32(vmovl_u16(vget_low_u16(s)), carry);
        const uint32x4_t high = vaddq_u32(vmovl_u16(vget_high_u16(s)), carry);
        vst1q_u32(out + x + 1, vaddq_u32(low, vld1q_u32(above + x + 1)));
        vst1q_u32(out + x + 5, vaddq_u32(high, vld1q_u32(above + x + 5)));
        carry = vdupq_n_u32(vgetq_lane_u32(high, 3));
    }
    unsigned int run = x ? vgetq_lane_u32(carry, 0) : 0;
    for (; x < width; ++x) {
        run += in[x];
        out[x + 1] = run + above[x + 1];
    }
}
#endif

#if defined(LQ_HAVE_SSSE3)
void integralRowSse(const unsigned char* in, const unsigned int* above, unsigned int* out, int width) {
    const __m128i zero = _mm_setzero_si128();
    __m128i carry = zero;
    int x = 0;
    for (; x + 8 <= width; x += 8) {
        __m128i s = _mm_unpacklo_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(in + x)), zero);
        s = _mm_add_epi16(s, _mm_slli_si128(s, 2));
        s = _mm_add_epi16(s, _mm_slli_si128(s, 4));
        s = _mm_add_epi16(s, _mm_slli_si128(s, 8));
        const __m128i low = _mm_add_epi32(_mm_unpacklo_epi16(s, zero), carry);
        const __m128i high = _mm_add_epi32(_mm_unpackhi_epi16(s, zero), carry);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x + 1),
                         _mm_add_epi32(low, _mm_loadu_si128(reinterpret_cast<const __m128i*>(above + x + 1))));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x + 5),
                         _mm_add_epi32(high, _mm_loadu_si128(reinterpret_cast<const __m128i*>(above + x + 5))));
        carry = _mm_shuffle_epi32(high, 0xFF);
    }
    unsigned int run = static_cast<unsigned int>(_mm_cvtsi128_si32(carry));
    for (; x < width; ++x) {
        run += in[x];
        out[x + 1] = run + above[x + 1];
    }
}
#endif

#if defined(LQ_HAVE_SSSE3)
__attribute__((target("avx2"))) void integralRowAvx2(const unsigned char* in, const unsigned int* above,
                                                     unsigned int* out, int width) {
    __m256i carry = _mm256_setzero_si256();
    int x = 0;
    for (; x + 16 <= width; x += 16) {
        // prefix sums of two groups of eight bytes in 16 bits, within the two 128-bit halves
        __m256i s = _mm256_cvtepu8_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(in + x)));
        s = _mm256_add_epi16(s, _mm256_slli_si256(s, 2));
        s = _mm256_add_epi16(s, _mm256_slli_si256(s, 4));
        s = _mm256_add_epi16(s, _mm256_slli_si256(s, 8));
        // the first group's total, spread over the second half only (at most 4080: 16 bits)
        __m256i first = _mm256_shufflehi_epi16(s, 0xFF);
        first = _mm256_permute2x128_si256(_mm256_unpackhi_epi64(first, first), first, 0x08);
        s = _mm256_add_epi16(s, first);
        const __m256i low = _mm256_add_epi32(_mm256_cvtepu16_epi32(_mm256_castsi256_si128(s)), carry);
        const __m256i high = _mm256_add_epi32(_mm256_cvtepu16_epi32(_mm256_extracti128_si256(s, 1)), carry);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x + 1),
                            _mm256_add_epi32(low, _mm256_loadu_si256(reinterpret_cast<const __m256i*>(above + x + 1))));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + x + 9),
                            _mm256_add_epi32(high, _mm256_loadu_si256(reinterpret_cast<const __m256i*>(above + x + 9))));
        carry = _mm256_permutevar8x32_epi32(high, _mm256_set1_epi32(7));
    }
    unsigned int run = static_cast<unsigned int>(_mm256_extract_epi32(carry, 0));
    for (; x < width; ++x) {
        run += in[x];
        out[x + 1] = run + above[x + 1];
    }
}
#endif

namespace {
void integralRow(const unsigned char* in, const unsigned int* above, unsigned int* out, int width) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    integralRowNeon(in, above, out, width);
#elif defined(LQ_HAVE_SSSE3)
    static const auto row = __builtin_cpu_supports("avx2") ? integralRowAvx2 : integralRowSse;
    row(in, above, out, width);
#else
    integralRowScalar(in, above, out, width);
#endif
}
}  // namespace

void computeIntegral(const Image& image, Image& integral, const BaseRect<int>& rect) {
    LQ_ASSERT_COLOR_MODE(image, COLOR_MODE_MONO);
    LQ_ASSERT_MSG(image.rect().contains(rect),
                  "Rect must be inside image: rect = " << rect << ", image.rect() = " << image.rect());
    const BaseRect<int> area = rect.area() == 0 ? image.rect() : rect;
    const int width = image.width() + 1, height = image.height() + 1;
    integral.create(BaseSize<int>(width, height), COLOR_MODE_INTEGRAL);
    // Zero what the sums do not write: rows down to the rectangle's top, the columns left
    // of it and right of it, and the rows below it. Everything else is overwritten.
    for (int y = 0; y < height; ++y) {
        unsigned int* row = integral.row<unsigned int>(y);
        if (y <= area.top || y > area.bottom) {
            std::memset(row, 0, sizeof(unsigned int) * width);
        } else {
            std::memset(row, 0, sizeof(unsigned int) * (area.left + 1));
            std::memset(row + area.right + 1, 0, sizeof(unsigned int) * (width - area.right - 1));
        }
    }
    for (int y = area.top; y < area.bottom; ++y) {
        integralRow(image.row(y) + area.left, integral.row<unsigned int>(y) + area.left,
                    integral.row<unsigned int>(y + 1) + area.left, area.width());
    }
}

void computeIntegral(const Image& image, Image& integral) { computeIntegral(image, integral, image.rect()); }

void computeIntegralOptimized(const Image& image, Image& integral) {
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wsign-compare"
    LQ_ASSERT_MSG(image.size().width == image.stripLength(), "incorrect stripLength");
#pragma GCC diagnostic pop
    computeIntegral(image, integral, image.rect());
}

void integral_image(const unsigned char* source, unsigned int* target, unsigned int width, unsigned int height) {
    for (unsigned int y = 0; y < height; ++y) {
        unsigned int run = 0;
        for (unsigned int x = 0; x < width; ++x) {
            run += source[y * width + x];
            target[y * width + x] = run + (y ? target[(y - 1) * width + x] : 0);
        }
    }
}

// ---- tables ------------------------------------------------------------------------------------

namespace {
constexpr int kSide = 512;
inline int at(int a, int b) { return (a + 256) * kSide + (b + 256); }

struct Tables {
    std::vector<unsigned char> magnitudes, unsigned6, signed12;
    Tables() : magnitudes(kSide * kSide), unsigned6(kSide * kSide), signed12(kSide * kSide) {
        const double P = 3.1415927410125732, Q = 6.2831854820251465;
        for (int a = -255; a <= 255; ++a) {
            for (int b = -255; b <= 255; ++b) {
                magnitudes[at(a, b)] = static_cast<unsigned char>(std::fmin(std::sqrt(double(a * a + b * b)), 255.0));
                int u, s;
                if (a <= 0 && b <= 0) {
                    const double angle = std::atan2(a == 0 ? +0.0 : double(a), double(b));
                    u = static_cast<int>(angle * 6 / P + 6 + 0.5) % 6;
                    s = static_cast<int>(angle * 12 / Q + 12 + 0.5) % 12;
                } else if (a == 0) {  // b >= 1
                    u = unsigned6[at(0, -b)];
                    s = signed12[at(0, -b)] - 6;
                } else if (a < 0) {  // b >= 1
                    u = (6 - unsigned6[at(a, -b)]) % 6;
                    s = (18 - signed12[at(a, -b)]) % 12;
                } else if (b < 0) {  // a >= 1
                    u = (6 - unsigned6[at(-a, b)]) % 6;
                    s = (12 - signed12[at(-a, b)]) % 12;
                } else {  // a >= 1, b >= 0
                    u = unsigned6[at(-a, -b)];
                    s = signed12[at(-a, -b)] - 6;
                }
                unsigned6[at(a, b)] = static_cast<unsigned char>(u);
                signed12[at(a, b)] = static_cast<unsigned char>(s);
            }
        }
    }
};

// built at first use and kept for the life of the process
const Tables& tables() {
    static const Tables* built = new Tables;
    return *built;
}
}  // namespace

const unsigned char* getMagnitudes() { return tables().magnitudes.data(); }
const unsigned char* getHogUnsigned6() { return tables().unsigned6.data(); }
const unsigned char* getHogSigned12() { return tables().signed12.data(); }

// ---- integral HOG -------------------------------------------------------------------------------

namespace {
inline int hogEntry(const unsigned char* up, const unsigned char* mid, const unsigned char* down, int i) {
    const int gx = down[i + 1] + up[i + 1] + 2 * (mid[i + 1] - mid[i - 1]) - down[i - 1] - up[i - 1];
    const int gy = down[i + 1] + down[i - 1] + 2 * (down[i] - up[i]) - up[i + 1] - up[i - 1];
    return at(gx / 4, gy / 4);
}

// The bin count is a constant so that the channel loops unroll.
template <int Bins>
void hogRowScalar(const unsigned char* up, const unsigned char* mid, const unsigned char* down, int width,
                  const unsigned char* hog, const unsigned int* previous, unsigned int* current) {
    constexpr int channels = Bins + 1;
    const unsigned char* magnitudes = getMagnitudes();
    unsigned int accumulator[channels] = {};
    const unsigned int* above = previous + 2 * channels;
    unsigned int* out = current + 2 * channels;
    for (int i = 1; i <= width - 2; ++i, above += channels, out += channels) {
        const int entry = hogEntry(up, mid, down, i);
        const unsigned int m = magnitudes[entry];
        accumulator[hog[entry]] += m;
        accumulator[Bins] += m;
        for (int k = 0; k < channels; ++k) out[k] = above[k] + accumulator[k];
    }
    // column W repeats the last sums: the border pixel adds nothing
    for (int k = 0; k < channels; ++k) out[k] = above[k] + accumulator[k];
}
}  // namespace

// The accumulators live in vector registers: a pixel adds its magnitude to the lanes of its
// bin and of the total through a lane mask. A scalar accumulator would be stored and at once
// reloaded by the vector adds, and that store-to-load stall costs more than the masks.
// The whole-vector stores run up to three lanes into the next position, which is written
// after; the last position takes the exact channel count.
#if defined(LQ_HAVE_NEON)
namespace {
// g / 4 truncated toward zero
inline int16x8_t divide4Neon(int16x8_t g) {
    const int16x8_t bias = vreinterpretq_s16_u16(vshrq_n_u16(vreinterpretq_u16_s16(vshrq_n_s16(g, 15)), 14));
    return vshrq_n_s16(vaddq_s16(g, bias), 2);
}

// the table entries of columns i .. i + 7, which need i + 8 inside the rows
inline void hogEntries8Neon(const unsigned char* up, const unsigned char* mid, const unsigned char* down, int i,
                            int* entries) {
    const auto load = [](const unsigned char* p) { return vreinterpretq_s16_u16(vmovl_u8(vld1_u8(p))); };
    const int16x8_t u0 = load(up + i - 1), u1 = load(up + i), u2 = load(up + i + 1);
    const int16x8_t m0 = load(mid + i - 1), m2 = load(mid + i + 1);
    const int16x8_t d0 = load(down + i - 1), d1 = load(down + i), d2 = load(down + i + 1);
    const int16x8_t dm = vsubq_s16(m2, m0);  // doubled by an add: a left shift of a negative lane is undefined
    const int16x8_t gx = vaddq_s16(vaddq_s16(vsubq_s16(u2, u0), vsubq_s16(d2, d0)), vaddq_s16(dm, dm));
    const int16x8_t gy = vsubq_s16(vaddq_s16(vaddq_s16(d0, d2), vshlq_n_s16(d1, 1)),
                                   vaddq_s16(vaddq_s16(u0, u2), vshlq_n_s16(u1, 1)));
    const int16x8_t a = divide4Neon(gx), b = divide4Neon(gy);
    // (a + 256) * 512 + (b + 256), by a multiply-add (a shift of a negative a is undefined)
    const int32x4_t offset = vdupq_n_s32(256 * kSide + 256);
    vst1q_s32(entries, vmlal_n_s16(vaddq_s32(vmovl_s16(vget_low_s16(b)), offset), vget_low_s16(a), kSide));
    vst1q_s32(entries + 4, vmlal_n_s16(vaddq_s32(vmovl_s16(vget_high_s16(b)), offset), vget_high_s16(a), kSide));
}

template <int Bins>
void hogRowNeon(const unsigned char* up, const unsigned char* mid, const unsigned char* down, int width,
                const unsigned char* hog, const unsigned int* previous, unsigned int* current) {
    constexpr int channels = Bins + 1, vectors = (channels + 3) / 4;
    const unsigned char* magnitudes = getMagnitudes();
    uint32x4_t accumulator[vectors], lane[vectors], total[vectors];
    for (int v = 0; v < vectors; ++v) {
        accumulator[v] = vdupq_n_u32(0);
        const uint32_t lanes[4] = {uint32_t(4 * v), uint32_t(4 * v + 1), uint32_t(4 * v + 2), uint32_t(4 * v + 3)};
        lane[v] = vld1q_u32(lanes);
        total[v] = vceqq_u32(lane[v], vdupq_n_u32(Bins));
    }
    const unsigned int* above = previous + 2 * channels;
    unsigned int* out = current + 2 * channels;
    const auto add = [&](int entry) {
        const uint32x4_t bin = vdupq_n_u32(hog[entry]), m = vdupq_n_u32(magnitudes[entry]);
        for (int v = 0; v < vectors; ++v) {
            const uint32x4_t hit = vorrq_u32(vceqq_u32(lane[v], bin), total[v]);
            accumulator[v] = vaddq_u32(accumulator[v], vandq_u32(hit, m));
            vst1q_u32(out + 4 * v, vaddq_u32(vld1q_u32(above + 4 * v), accumulator[v]));
        }
        above += channels;
        out += channels;
    };
    int i = 1;
    int entries[8];
    for (; i + 9 <= width; i += 8) {
        hogEntries8Neon(up, mid, down, i, entries);
        for (int e = 0; e < 8; ++e) add(entries[e]);
    }
    for (; i <= width - 2; ++i) add(hogEntry(up, mid, down, i));
    unsigned int last[4 * vectors];
    for (int v = 0; v < vectors; ++v) vst1q_u32(last + 4 * v, accumulator[v]);
    for (int k = 0; k < channels; ++k) out[k] = above[k] + last[k];
}
}  // namespace
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
inline __m128i divide4Sse(__m128i g) {
    return _mm_srai_epi16(_mm_add_epi16(g, _mm_srli_epi16(_mm_srai_epi16(g, 15), 14)), 2);
}

inline void hogEntries8Sse(const unsigned char* up, const unsigned char* mid, const unsigned char* down, int i,
                           int* entries) {
    const __m128i zero = _mm_setzero_si128();
    const auto load = [zero](const unsigned char* p) {
        return _mm_unpacklo_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)), zero);
    };
    const __m128i u0 = load(up + i - 1), u1 = load(up + i), u2 = load(up + i + 1);
    const __m128i m0 = load(mid + i - 1), m2 = load(mid + i + 1);
    const __m128i d0 = load(down + i - 1), d1 = load(down + i), d2 = load(down + i + 1);
    const __m128i dm = _mm_sub_epi16(m2, m0);
    const __m128i gx = _mm_add_epi16(_mm_add_epi16(_mm_sub_epi16(u2, u0), _mm_sub_epi16(d2, d0)), _mm_add_epi16(dm, dm));
    const __m128i gy = _mm_sub_epi16(_mm_add_epi16(_mm_add_epi16(d0, d2), _mm_add_epi16(d1, d1)),
                                     _mm_add_epi16(_mm_add_epi16(u0, u2), _mm_add_epi16(u1, u1)));
    const __m128i a = _mm_add_epi16(divide4Sse(gx), _mm_set1_epi16(256));
    const __m128i b = _mm_add_epi16(divide4Sse(gy), _mm_set1_epi16(256));
    // (a + 256) * 512 + (b + 256) from the interleaved pairs in one multiply-add
    const __m128i weights = _mm_set1_epi32(1 << 16 | kSide);
    _mm_storeu_si128(reinterpret_cast<__m128i*>(entries), _mm_madd_epi16(_mm_unpacklo_epi16(a, b), weights));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(entries + 4), _mm_madd_epi16(_mm_unpackhi_epi16(a, b), weights));
}

template <int Bins>
void hogRowSse(const unsigned char* up, const unsigned char* mid, const unsigned char* down, int width,
               const unsigned char* hog, const unsigned int* previous, unsigned int* current) {
    constexpr int channels = Bins + 1, vectors = (channels + 3) / 4;
    const unsigned char* magnitudes = getMagnitudes();
    __m128i accumulator[vectors], lane[vectors], total[vectors];
    for (int v = 0; v < vectors; ++v) {
        accumulator[v] = _mm_setzero_si128();
        lane[v] = _mm_setr_epi32(4 * v, 4 * v + 1, 4 * v + 2, 4 * v + 3);
        total[v] = _mm_cmpeq_epi32(lane[v], _mm_set1_epi32(Bins));
    }
    const unsigned int* above = previous + 2 * channels;
    unsigned int* out = current + 2 * channels;
    const auto add = [&](int entry) {
        const __m128i bin = _mm_set1_epi32(hog[entry]), m = _mm_set1_epi32(magnitudes[entry]);
        for (int v = 0; v < vectors; ++v) {
            const __m128i hit = _mm_or_si128(_mm_cmpeq_epi32(lane[v], bin), total[v]);
            accumulator[v] = _mm_add_epi32(accumulator[v], _mm_and_si128(hit, m));
            const __m128i sum =
                _mm_add_epi32(_mm_loadu_si128(reinterpret_cast<const __m128i*>(above + 4 * v)), accumulator[v]);
            _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 4 * v), sum);
        }
        above += channels;
        out += channels;
    };
    int i = 1;
    int entries[8];
    for (; i + 9 <= width; i += 8) {
        hogEntries8Sse(up, mid, down, i, entries);
        for (int e = 0; e < 8; ++e) add(entries[e]);
    }
    for (; i <= width - 2; ++i) add(hogEntry(up, mid, down, i));
    unsigned int last[4 * vectors];
    for (int v = 0; v < vectors; ++v) _mm_storeu_si128(reinterpret_cast<__m128i*>(last + 4 * v), accumulator[v]);
    for (int k = 0; k < channels; ++k) out[k] = above[k] + last[k];
}
}  // namespace
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// A pixel's contribution to all channels at once: the lane mask of its bin, which holds the
// total's lane too, and-ed with its magnitude. With eight lanes the six-bin sums and their
// total take one register, and the running sums never leave it.
template <int Bins>
__attribute__((target("avx2"))) void hogRowAvx2(const unsigned char* up, const unsigned char* mid,
                                                const unsigned char* down, int width, const unsigned char* hog,
                                                const unsigned int* previous, unsigned int* current) {
    constexpr int channels = Bins + 1, vectors = (channels + 7) / 8;
    const unsigned char* magnitudes = getMagnitudes();
    alignas(32) unsigned int masks[Bins][8 * vectors] = {};
    for (int b = 0; b < Bins; ++b) {
        masks[b][b] = ~0u;
        masks[b][Bins] = ~0u;
    }
    __m256i accumulator[vectors];
    for (int v = 0; v < vectors; ++v) accumulator[v] = _mm256_setzero_si256();
    const unsigned int* above = previous + 2 * channels;
    unsigned int* out = current + 2 * channels;
    const auto add = [&](int entry) __attribute__((target("avx2"))) {
        const __m256i m = _mm256_set1_epi32(magnitudes[entry]);
        const unsigned int* mask = masks[hog[entry]];
        for (int v = 0; v < vectors; ++v) {
            const __m256i lanes = _mm256_load_si256(reinterpret_cast<const __m256i*>(mask + 8 * v));
            accumulator[v] = _mm256_add_epi32(accumulator[v], _mm256_and_si256(lanes, m));
            const __m256i sum =
                _mm256_add_epi32(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(above + 8 * v)), accumulator[v]);
            _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + 8 * v), sum);
        }
        above += channels;
        out += channels;
    };
    int i = 1;
    int entries[8];
    for (; i + 9 <= width; i += 8) {
        hogEntries8Sse(up, mid, down, i, entries);
        for (int e = 0; e < 8; ++e) add(entries[e]);
    }
    for (; i <= width - 2; ++i) add(hogEntry(up, mid, down, i));
    alignas(32) unsigned int last[8 * vectors];
    for (int v = 0; v < vectors; ++v) _mm256_store_si256(reinterpret_cast<__m256i*>(last + 8 * v), accumulator[v]);
    for (int k = 0; k < channels; ++k) out[k] = above[k] + last[k];
}
}  // namespace
#endif

void integralHogRowScalar(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                          const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current) {
    if (bins == 12)
        hogRowScalar<12>(above, centre, below, width, hog, previous, current);
    else
        hogRowScalar<6>(above, centre, below, width, hog, previous, current);
}

#if defined(LQ_HAVE_NEON)
void integralHogRowNeon(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                        const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current) {
    if (bins == 12)
        hogRowNeon<12>(above, centre, below, width, hog, previous, current);
    else
        hogRowNeon<6>(above, centre, below, width, hog, previous, current);
}
#endif

#if defined(LQ_HAVE_SSSE3)
void integralHogRowSse(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                       const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current) {
    if (bins == 12)
        hogRowSse<12>(above, centre, below, width, hog, previous, current);
    else
        hogRowSse<6>(above, centre, below, width, hog, previous, current);
}
#endif

#if defined(LQ_HAVE_SSSE3)
__attribute__((target("avx2"))) void integralHogRowAvx2(const unsigned char* above, const unsigned char* centre,
                                                        const unsigned char* below, int width,
                                                        const unsigned char* hog, int bins,
                                                        const unsigned int* previous, unsigned int* current) {
    if (bins == 12)
        hogRowAvx2<12>(above, centre, below, width, hog, previous, current);
    else
        hogRowAvx2<6>(above, centre, below, width, hog, previous, current);
}
#endif

namespace {
void integralHogRow(const unsigned char* above, const unsigned char* centre, const unsigned char* below, int width,
                    const unsigned char* hog, int bins, const unsigned int* previous, unsigned int* current) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    integralHogRowNeon(above, centre, below, width, hog, bins, previous, current);
#elif defined(LQ_HAVE_SSSE3)
    static const auto row = __builtin_cpu_supports("avx2") ? integralHogRowAvx2 : integralHogRowSse;
    row(above, centre, below, width, hog, bins, previous, current);
#else
    integralHogRowScalar(above, centre, below, width, hog, bins, previous, current);
#endif
}
}  // namespace

void computeIntegralHog(const unsigned char* data, int stripLength, Image& target, const BaseRect<int>& rect,
                        ColorMode mode) {
    int bins = 0;
    if (mode == COLOR_MODE_INTEGRAL_HOG_SIGNED12) {
        bins = 12;
    } else if (mode == COLOR_MODE_INTEGRAL_HOG_UNSIGNED6) {
        bins = 6;
    } else {
        LQ_FAIL("incorrect color mode: " << mode);
    }
    const int W = rect.width(), H = rect.height();
    target.create(BaseSize<int>(W + 1, H + 1), mode);
    const size_t rowBytes = sizeof(unsigned int) * (bins + 1) * (W + 1);
    if (W < 3 || H < 3) {
        for (int y = 0; y <= H; ++y) std::memset(target.row(y), 0, rowBytes);
        return;
    }
    // Rows 2 .. H - 1 get every position written but columns 0 and 1; row H is a copy.
    std::memset(target.row(0), 0, rowBytes);
    std::memset(target.row(1), 0, rowBytes);
    for (int y = 2; y < H; ++y) std::memset(target.row(y), 0, sizeof(unsigned int) * (bins + 1) * 2);

    const unsigned char* hog = bins == 12 ? getHogSigned12() : getHogUnsigned6();
    const unsigned char* up = data + static_cast<ptrdiff_t>(rect.top) * stripLength + rect.left;
    for (int j = 1; j <= H - 2; ++j, up += stripLength)
        integralHogRow(up, up + stripLength, up + 2 * stripLength, W, hog, bins, target.row<unsigned int>(j),
                       target.row<unsigned int>(j + 1));
    std::memcpy(target.row(H), target.row(H - 1), rowBytes);
}

void computeIntegralHog(const Image& image, Image& target, const BaseRect<int>& rect, ColorMode mode) {
    LQ_ASSERT_COLOR_MODE(image, COLOR_MODE_MONO);
    LQ_ASSERT_CONTAINS(image.rect(), rect);
    computeIntegralHog(image.data(), static_cast<int>(image.stripLength()), target, rect, mode);
}

}  // namespace LQ
