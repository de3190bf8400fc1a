#include "LQ_Gradients.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <vector>

namespace LQ {

namespace {
inline void sobelAt(const unsigned char* up, const unsigned char* mid, const unsigned char* down, int x, int& gx,
                    int& gy) {
    gx = down[x + 1] + up[x + 1] + 2 * (mid[x + 1] - mid[x - 1]) - down[x - 1] - up[x - 1];
    gy = down[x + 1] + down[x - 1] + 2 * (down[x] - up[x]) - up[x + 1] - up[x - 1];
}

void clear(Image& image) {
    for (int y = 0; y < image.height(); ++y) std::memset(image.row(y), 0, static_cast<size_t>(image.width()) * image.depth());
}
}  // namespace

void sobelRowScalar(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                    signed char* target, int width) {
    for (int x = 1; x + 1 < width; ++x) {
        int gx, gy;
        sobelAt(above, centre, below, x, gx, gy);
        target[2 * x] = static_cast<signed char>(gx / 8);
        target[2 * x + 1] = static_cast<signed char>(gy / 8);
    }
}

#if defined(LQ_HAVE_NEON)
namespace {
// g / 8 truncated toward zero: negative values are lifted by 7 before the shift
inline int16x8_t divide8Neon(int16x8_t g) {
    const int16x8_t bias = vreinterpretq_s16_u16(vshrq_n_u16(vreinterpretq_u16_s16(vshrq_n_s16(g, 15)), 13));
    return vshrq_n_s16(vaddq_s16(g, bias), 3);
}
}  // namespace

void sobelRowNeon(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                  signed char* target, int width) {
    int x = 1;
    for (; x + 16 + 1 <= width; x += 16) {
        const uint8x16_t a0 = vld1q_u8(above + x - 1), a1 = vld1q_u8(above + x), a2 = vld1q_u8(above + x + 1);
        const uint8x16_t c0 = vld1q_u8(centre + x - 1), c2 = vld1q_u8(centre + x + 1);
        const uint8x16_t b0 = vld1q_u8(below + x - 1), b1 = vld1q_u8(below + x), b2 = vld1q_u8(below + x + 1);
        int8x8_t gx[2], gy[2];
        for (int h = 0; h < 2; ++h) {
            const auto half = [h](uint8x16_t v) { return h ? vget_high_u8(v) : vget_low_u8(v); };
            // |Gx| and |Gy| stay below 1021, so 16 bits hold every partial sum
            const int16x8_t dc = vreinterpretq_s16_u16(vsubl_u8(half(c2), half(c0)));
            int16x8_t x16 = vreinterpretq_s16_u16(vsubl_u8(half(a2), half(a0)));
            x16 = vaddq_s16(x16, vreinterpretq_s16_u16(vsubl_u8(half(b2), half(b0))));
            x16 = vaddq_s16(x16, vaddq_s16(dc, dc));  // not a shift: dc may be negative
            const uint16x8_t sumBelow = vaddq_u16(vaddl_u8(half(b0), half(b2)), vshll_n_u8(half(b1), 1));
            const uint16x8_t sumAbove = vaddq_u16(vaddl_u8(half(a0), half(a2)), vshll_n_u8(half(a1), 1));
            const int16x8_t y16 = vreinterpretq_s16_u16(vsubq_u16(sumBelow, sumAbove));
            gx[h] = vmovn_s16(divide8Neon(x16));
            gy[h] = vmovn_s16(divide8Neon(y16));
        }
        int8x16x2_t pairs;
        pairs.val[0] = vcombine_s8(gx[0], gx[1]);
        pairs.val[1] = vcombine_s8(gy[0], gy[1]);
        vst2q_s8(target + 2 * x, pairs);
    }
    sobelRowScalar(above + x - 1, centre + x - 1, below + x - 1, target + 2 * (x - 1), width - x + 1);
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
inline __m128i divide8Sse(__m128i g) {
    const __m128i bias = _mm_srli_epi16(_mm_srai_epi16(g, 15), 13);
    return _mm_srai_epi16(_mm_add_epi16(g, bias), 3);
}
inline __m128i load16(const unsigned char* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
}  // namespace

void sobelRowSse(const unsigned char* above, const unsigned char* centre, const unsigned char* below,
                 signed char* target, int width) {
    const __m128i zero = _mm_setzero_si128();
    int x = 1;
    for (; x + 16 + 1 <= width; x += 16) {
        const __m128i a0 = load16(above + x - 1), a1 = load16(above + x), a2 = load16(above + x + 1);
        const __m128i c0 = load16(centre + x - 1), c2 = load16(centre + x + 1);
        const __m128i b0 = load16(below + x - 1), b1 = load16(below + x), b2 = load16(below + x + 1);
        __m128i gx[2], gy[2];
        for (int h = 0; h < 2; ++h) {
            const auto widen = [h, zero](__m128i v) { return h ? _mm_unpackhi_epi8(v, zero) : _mm_unpacklo_epi8(v, zero); };
            const __m128i dc = _mm_sub_epi16(widen(c2), widen(c0));
            __m128i x16 = _mm_add_epi16(_mm_sub_epi16(widen(a2), widen(a0)), _mm_sub_epi16(widen(b2), widen(b0)));
            x16 = _mm_add_epi16(x16, _mm_add_epi16(dc, dc));
            const __m128i w1 = widen(b1), v1 = widen(a1);
            const __m128i sumBelow = _mm_add_epi16(_mm_add_epi16(widen(b0), widen(b2)), _mm_add_epi16(w1, w1));
            const __m128i sumAbove = _mm_add_epi16(_mm_add_epi16(widen(a0), widen(a2)), _mm_add_epi16(v1, v1));
            gx[h] = divide8Sse(x16);
            gy[h] = divide8Sse(_mm_sub_epi16(sumBelow, sumAbove));
        }
        // the quotients lie within -127 .. 127, so the saturating pack is exact
        const __m128i x8 = _mm_packs_epi16(gx[0], gx[1]), y8 = _mm_packs_epi16(gy[0], gy[1]);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(target + 2 * x), _mm_unpacklo_epi8(x8, y8));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(target + 2 * x + 16), _mm_unpackhi_epi8(x8, y8));
    }
    sobelRowScalar(above + x - 1, centre + x - 1, below + x - 1, target + 2 * (x - 1), width - x + 1);
}
#endif

namespace {
void sobelRow(const unsigned char* above, const unsigned char* centre, const unsigned char* below, signed char* target,
              int width) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    sobelRowNeon(above, centre, below, target, width);
#elif defined(LQ_HAVE_SSSE3)
    sobelRowSse(above, centre, below, target, width);
#else
    sobelRowScalar(above, centre, below, target, width);
#endif
}

// Gx / 8 and Gy / 8 over the interior part of rect
void sobelInto(const Image& source, Image& target, const BaseRect<int>& rect) {
    const int left = std::max(rect.left, 1), right = std::min(rect.right, source.width() - 1);
    const int top = std::max(rect.top, 1), bottom = std::min(rect.bottom, source.height() - 1);
    if (right <= left) return;
    // the row kernel covers the columns between its first and last, so it starts one early
    for (int y = top; y < bottom; ++y)
        sobelRow(source.row(y - 1) + left - 1, source.row(y) + left - 1, source.row(y + 1) + left - 1,
                 reinterpret_cast<signed char*>(target.row(y)) + 2 * (left - 1), right - left + 2);
}
}  // namespace

void SobelGradient(const Image& source, Image& target) {
    target.create(source.size(), COLOR_MODE_GRADIENT);
    clear(target);
    sobelInto(source, target, source.rect());
}

void SobelGradientInRect(const Image& source, Image& target, const BaseRect<int>& rect) {
    LQ_ASSERT_COLOR_MODE(target, COLOR_MODE_GRADIENT);
    LQ_ASSERT_SIZE(target, source.size());
    typedef BaseRect<int> Rect;
    LQ_ASSERT_MSG(Rect(source.rect()).resize(-1, -1).contains(rect), "input rect should lie inside input image");
    clear(target);
    sobelInto(source, target, rect);
}

void computeSobelGradient(const Image& src, Image& target) {
    LQ_ASSERT_GE(src.width(), 3);
    LQ_ASSERT_GE(src.height(), 3);
    SobelGradient(src, target);
}

void computeSobelGradient(const Image& src, Image& first, Image& second) {
    LQ_ASSERT_GE(src.width(), 3);
    LQ_ASSERT_GE(src.height(), 3);
    first.create(src.size(), COLOR_MODE_MONO16);
    second.create(src.size(), COLOR_MODE_MONO16);
    clear(first);
    clear(second);
    for (int y = 1; y + 1 < src.height(); ++y) {
        const unsigned char* up = src.row(y - 1);
        const unsigned char* mid = src.row(y);
        const unsigned char* down = src.row(y + 1);
        short* gxRow = first.row<short>(y);
        short* gyRow = second.row<short>(y);
        for (int x = 1; x + 1 < src.width(); ++x) {
            int gx, gy;
            sobelAt(up, mid, down, x, gx, gy);
            gxRow[x] = static_cast<short>(gx);
            gyRow[x] = static_cast<short>(gy);
        }
    }
}

void SobelAbsolute(const Image& source, Image& target) {
    target.create(source.size(), COLOR_MODE_MONO);
    clear(target);
    for (int y = 1; y + 1 < source.height(); ++y) {
        const unsigned char* up = source.row(y - 1);
        const unsigned char* mid = source.row(y);
        const unsigned char* down = source.row(y + 1);
        unsigned char* out = target.row(y);
        for (int x = 1; x + 1 < source.width(); ++x) {
            int gx, gy;
            sobelAt(up, mid, down, x, gx, gy);
            out[x] = static_cast<unsigned char>((std::abs(gx) + std::abs(gy)) / 8);
        }
    }
}

void robertCross(const Image& source, Image& target) {
    target.create(source.size(), COLOR_MODE_MONO);
    clear(target);
    for (int y = 0; y + 1 < source.height(); ++y) {
        const unsigned char* p = source.row(y);
        const unsigned char* q = source.row(y + 1);
        unsigned char* out = target.row(y);
        for (int x = 0; x + 1 < source.width(); ++x)
            out[x] = static_cast<unsigned char>((std::abs(p[x + 1] - q[x]) + std::abs(p[x] - q[x + 1])) / 2);
    }
}

void computeGradients(const Image& source, Image& target) {
    target.create(source.size(), COLOR_MODE_GRADIENT);
    clear(target);
    if (source.width() < 3 || source.height() < 3) return;
    const double P = 3.1415927410125732;
    for (int y = 1; y + 1 < source.height(); ++y) {
        const unsigned char* up = source.row(y - 1);
        const unsigned char* mid = source.row(y);
        const unsigned char* down = source.row(y + 1);
        unsigned char* out = target.row(y);
        for (int x = 1; x + 1 < source.width(); ++x) {
            int gx, gy;
            sobelAt(up, mid, down, x, gx, gy);
            const int d = static_cast<int>(std::atan2(double(gx), double(gy)) * 4 / P + 4.5);
            out[2 * x] = static_cast<unsigned char>(d % 4);
            out[2 * x + 1] = static_cast<unsigned char>((std::abs(gx) + std::abs(gy)) >> 3);
        }
    }
}

void thinGradients(Image& image) {
    static const int forward[4][2] = {{0, 1}, {1, 1}, {1, 0}, {-1, 1}};
    // Marking in place is safe: a decision reads the pixel's own sector, which only it
    // changes, and the neighbours' magnitudes, which nothing here changes.
    for (int y = 1; y + 1 < image.height(); ++y) {
        for (int x = 1; x + 1 < image.width(); ++x) {
            unsigned char* p = image.pixel(x, y);
            const int d = p[0] > 3 ? 3 : p[0];
            const int m = p[1];
            const int fx = forward[d][0], fy = forward[d][1];
            const int ahead = image.pixel(x + fx, y + fy)[1];
            const int behind = image.pixel(x - fx, y - fy)[1];
            if (!(m >= ahead && m > behind)) p[0] = 255;
        }
    }
}

namespace {
// The hysteresis step with an explicit stack, since an edge may be longer than the call stack
// allows. A pixel is judged when it is taken from the stack, as a recursive call would judge
// it on entry, so the result is the recursion's.
void walkEdge(unsigned char* pixel, int low, ptrdiff_t stripLength, std::vector<unsigned char*>& pending) {
    const ptrdiff_t neighbours[8] = {-stripLength - 2, -stripLength, -stripLength + 2, -2, 2,
                                     stripLength - 2,  stripLength,  stripLength + 2};
    pending.assign(1, pixel);
    while (!pending.empty()) {
        unsigned char* p = pending.back();
        pending.pop_back();
        if (p[0] < 255 && p[1] > low) {
            if (p[1] == 255) continue;
            p[1] = 255;
            // pushed in reverse so that they are taken in the order of the rows
            for (int i = 7; i >= 0; --i) pending.push_back(p + neighbours[i]);
        } else {
            p[1] = 0;
        }
    }
}
}  // namespace

void updateGradients(unsigned char* pixel, int low, int stripLength) {
    std::vector<unsigned char*> pending;
    walkEdge(pixel, low, stripLength, pending);
}

void canny(const Image& source, Image& target, int minThreshold, int maxThreshold) {
    LQ_ASSERT_COLOR_MODE(source, COLOR_MODE_MONO);
    Image gradients;
    computeGradients(source, gradients);
    thinGradients(gradients);
    LQ_ASSERT_LT(minThreshold, maxThreshold);
    // a negative low threshold would let the edge walk leave the image through its zero border
    LQ_ASSERT_GE(minThreshold, 0);
    std::vector<unsigned char*> pending;  // one stack for every walk
    for (int y = 1; y + 1 < gradients.height(); ++y)
        for (int x = 1; x + 1 < gradients.width(); ++x) {
            unsigned char* p = gradients.pixel(x, y);
            if (p[0] != 255 && p[1] > maxThreshold) walkEdge(p, minThreshold, gradients.stripLength(), pending);
        }
    target.create(source.size(), COLOR_MODE_MONO);
    clear(target);
    for (int y = 1; y + 1 < source.height(); ++y)
        for (int x = 1; x + 1 < source.width(); ++x)
            target.row(y)[x] = gradients.pixel(x, y)[1] == 255 ? 255 : 0;
}

}  // namespace LQ
