#include "LQ_RmctTransform.h"

#include <cstring>

namespace LQ {

namespace {
// the margin: a neighbour must stand about three levels over the mean to set its bit
constexpr int kMargin = 20;
}  // namespace

unsigned char computeRmctPixel(const unsigned char* source, const int* offsets) {
    int sum = kMargin;
    for (int i = 0; i < 8; ++i) sum += source[offsets[i]];
    const int threshold = sum >> 3;
    unsigned char code = 0;
    for (int i = 0; i < 8; ++i) code = static_cast<unsigned char>((code << 1) | (source[offsets[i]] > threshold));
    return code;
}

void rmctRowScalar(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                   unsigned char* target, int width) {
    for (int x = 1; x + 1 < width; ++x) {
        const int n7 = above[x - 1], n6 = above[x], n5 = above[x + 1], n4 = centre[x - 1], n3 = centre[x + 1],
                  n2 = below[x - 1], n1 = below[x], n0 = below[x + 1];
        const int t = (n7 + n6 + n5 + n4 + n3 + n2 + n1 + n0 + kMargin) >> 3;
        target[x] = static_cast<unsigned char>((n7 > t) << 7 | (n6 > t) << 6 | (n5 > t) << 5 | (n4 > t) << 4 |
                                               (n3 > t) << 3 | (n2 > t) << 2 | (n1 > t) << 1 | (n0 > t));
    }
}

#if defined(LQ_HAVE_NEON)
void rmctRowNeon(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                 unsigned char* target, int width) {
    int x = 1;
    for (; x + 16 + 1 <= width; x += 16) {
        const uint8x16_t n[8] = {vld1q_u8(above + x - 1), vld1q_u8(above + x),      vld1q_u8(above + x + 1),
                                 vld1q_u8(centre + x - 1), vld1q_u8(centre + x + 1), vld1q_u8(below + x - 1),
                                 vld1q_u8(below + x),      vld1q_u8(below + x + 1)};
        // eight bytes plus the margin fit 16 bits; a threshold above 255 saturates to 255,
        // which sets no bit either
        uint16x8_t low = vdupq_n_u16(kMargin), high = vdupq_n_u16(kMargin);
        for (int i = 0; i < 8; ++i) {
            low = vaddw_u8(low, vget_low_u8(n[i]));
            high = vaddw_u8(high, vget_high_u8(n[i]));
        }
        const uint8x16_t t = vcombine_u8(vqshrn_n_u16(low, 3), vqshrn_n_u16(high, 3));
        uint8x16_t code = vdupq_n_u8(0);
        for (int i = 0; i < 8; ++i) code = vorrq_u8(code, vandq_u8(vcgtq_u8(n[i], t), vdupq_n_u8(0x80 >> i)));
        vst1q_u8(target + x, code);
    }
    rmctRowScalar(above + x - 1, centre + x - 1, below + x - 1, target + x - 1, width - x + 1);
}
#endif

#if defined(LQ_HAVE_SSSE3)
void rmctRowSse(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                unsigned char* target, int width) {
    const __m128i zero = _mm_setzero_si128();
    int x = 1;
    for (; x + 16 + 1 <= width; x += 16) {
        const __m128i n[8] = {_mm_loadu_si128(reinterpret_cast<const __m128i*>(above + x - 1)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(above + x)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(above + x + 1)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(centre + x - 1)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(centre + x + 1)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(below + x - 1)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(below + x)),
                              _mm_loadu_si128(reinterpret_cast<const __m128i*>(below + x + 1))};
        __m128i low = _mm_set1_epi16(kMargin), high = low;
        for (int i = 0; i < 8; ++i) {
            low = _mm_add_epi16(low, _mm_unpacklo_epi8(n[i], zero));
            high = _mm_add_epi16(high, _mm_unpackhi_epi8(n[i], zero));
        }
        const __m128i t = _mm_packus_epi16(_mm_srli_epi16(low, 3), _mm_srli_epi16(high, 3));
        __m128i code = zero;
        for (int i = 0; i < 8; ++i) {
            // n <= t exactly when the saturating difference is zero; the bit goes where it is not
            const __m128i notAbove = _mm_cmpeq_epi8(_mm_subs_epu8(n[i], t), zero);
            code = _mm_or_si128(code, _mm_andnot_si128(notAbove, _mm_set1_epi8(static_cast<char>(0x80 >> i))));
        }
        _mm_storeu_si128(reinterpret_cast<__m128i*>(target + x), code);
    }
    rmctRowScalar(above + x - 1, centre + x - 1, below + x - 1, target + x - 1, width - x + 1);
}

namespace {
__attribute__((target("avx2"))) inline __m256i load(const unsigned char* p) {
    return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p));
}
}  // namespace

__attribute__((target("avx2"))) void rmctRowAvx2(const unsigned char* above, const unsigned char* centre,
                                                 const unsigned char* below, unsigned char* target, int width) {
    const __m256i zero = _mm256_setzero_si256();
    int x = 1;
    for (; x + 32 + 1 <= width; x += 32) {
        const __m256i n[8] = {load(above + x - 1),  load(above + x),      load(above + x + 1), load(centre + x - 1),
                              load(centre + x + 1), load(below + x - 1), load(below + x),     load(below + x + 1)};
        __m256i low = _mm256_set1_epi16(kMargin), high = low;
        for (int i = 0; i < 8; ++i) {
            low = _mm256_add_epi16(low, _mm256_unpacklo_epi8(n[i], zero));
            high = _mm256_add_epi16(high, _mm256_unpackhi_epi8(n[i], zero));
        }
        // unpack and pack both work within 128-bit halves, so the byte order comes back
        const __m256i t = _mm256_packus_epi16(_mm256_srli_epi16(low, 3), _mm256_srli_epi16(high, 3));
        __m256i code = zero;
        for (int i = 0; i < 8; ++i) {
            const __m256i notAbove = _mm256_cmpeq_epi8(_mm256_subs_epu8(n[i], t), zero);
            code = _mm256_or_si256(code, _mm256_andnot_si256(notAbove, _mm256_set1_epi8(static_cast<char>(0x80 >> i))));
        }
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(target + x), code);
    }
    rmctRowSse(above + x - 1, centre + x - 1, below + x - 1, target + x - 1, width - x + 1);
}
#endif

namespace {
void rmctRow(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
             unsigned char* target, int width) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    rmctRowNeon(above, centre, below, target, width);
#elif defined(LQ_HAVE_SSSE3)
    static const auto row = __builtin_cpu_supports("avx2") ? rmctRowAvx2 : rmctRowSse;
    row(above, centre, below, target, width);
#else
    rmctRowScalar(above, centre, below, target, width);
#endif
}
}  // namespace

void computeRmct(const Image& image, Image& rmct, const BaseRect<int>& rect) {
    LQ_ASSERT_COLOR_MODE(image, COLOR_MODE_MONO);
    const int width = image.width(), height = image.height();
    rmct.create(image.size(), COLOR_MODE_RMCT);
    if (width < 3 || height < 3) {
        // no interior: the target stays all zero
        for (int y = 0; y < height; ++y) std::memset(rmct.row(y), 0, width);
        return;
    }
    // the rows write every interior code, so only the border lines need clearing
    std::memset(rmct.row(0), 0, width);
    std::memset(rmct.row(height - 1), 0, width);
    for (int y = 1; y + 1 < height; ++y) rmct.row(y)[0] = rmct.row(y)[width - 1] = 0;
    BaseRect<int> clipped = rect.intersect(image.rect());
    if (clipped.area() <= 0) clipped = BaseRect<int>();

    // the interior is always whole, so that one census image serves every scan of a frame
    for (int y = 1; y + 1 < height; ++y) rmctRow(image.row(y - 1), image.row(y), image.row(y + 1), rmct.row(y), width);

    const int l = clipped.left, t = clipped.top, r = clipped.right, b = clipped.bottom;
    if (r - l < 3 || b - t < 3) return;
    if (t == 0) std::memcpy(rmct.row(0) + l, rmct.row(1) + l, r - l);
    if (b == height) std::memcpy(rmct.row(height - 1) + l, rmct.row(height - 2) + l, r - l);
    if (l == 0)
        for (int y = t; y < b; ++y) rmct.row(y)[0] = rmct.row(y)[1];
    if (r == width)
        for (int y = t; y < b; ++y) rmct.row(y)[width - 1] = rmct.row(y)[width - 2];
}

void computeRmct(const Image& image, Image& rmct) { computeRmct(image, rmct, image.rect()); }

const unsigned char* getNumbits256() {
    static const struct Table {
        unsigned char bits[256];
        Table() {
            for (int v = 0; v < 256; ++v) bits[v] = static_cast<unsigned char>(__builtin_popcount(v));
        }
    } table;
    return table.bits;
}

void bitDiff(const Image& source1, const Image& source2, Image& target, const BaseRect<int>& rect) {
    LQ_ASSERT_CONTAINS(source1.rect(), rect);
    LQ_ASSERT_COLOR_MODE(source1, COLOR_MODE_RMCT);
    LQ_ASSERT_COLOR_MODE(source2, COLOR_MODE_RMCT);
    LQ_ASSERT_SIZE(source1, source2.size());
    const BaseRect<int> area = rect.area() == 0 ? source1.rect() : rect;
    target.create(source1.size(), COLOR_MODE_MONO);
    const unsigned char* bits = getNumbits256();
    for (int y = area.top; y < area.bottom; ++y) {
        const unsigned char* a = source1.row(y);
        const unsigned char* b = source2.row(y);
        unsigned char* out = target.row(y);
        for (int x = area.left; x < area.right; ++x) out[x] = bits[a[x] ^ b[x]];
    }
}

unsigned int bitDiffSum(const Image& source1, const Image& source2) {
    return bitDiffSum(source1, source2, 0, 0, 0, 0, source1.width(), source1.height());
}

unsigned int bitDiffSum(const Image& source1, const Image& source2, int ax, int ay, int bx, int by, int width,
                        int height) {
    LQ_ASSERT_COLOR_MODE(source1, (source2).colorMode());
    LQ_ASSERT_SIZE(source1, (source2).size());
    if (width < 1 || height < 1) return 0;
    const unsigned char* bits = getNumbits256();
    const int bytes = width * source1.depth();
    unsigned int sum = 0;
    for (int y = 0; y < height; ++y) {
        const unsigned char* a = source1.pixel(ax, ay + y);
        const unsigned char* b = source2.pixel(bx, by + y);
        for (int i = 0; i < bytes; ++i) sum += bits[a[i] ^ b[i]];
    }
    return sum;
}

}  // namespace LQ
