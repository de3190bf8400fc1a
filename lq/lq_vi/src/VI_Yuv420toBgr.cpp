#include "VI_Yuv420toBgr.h"

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
#if defined(LQ_HAVE_NEON)
            yuvRowZoomNeon(lumaRow, chromaRow, out, size.width, swapRedBlue);
#else
            yuvRowZoomScalar(lumaRow, chromaRow, out, size.width, swapRedBlue);
#endif
        } else {
            const unsigned char* lumaRow = luma + static_cast<size_t>(y) * sourceStride;
            const unsigned char* chromaRow = chroma + static_cast<size_t>(y / 2) * sourceStride;
#if defined(LQ_HAVE_NEON)
            yuvRowFullNeon(lumaRow, chromaRow, out, size.width, swapRedBlue);
#else
            yuvRowFullScalar(lumaRow, chromaRow, out, size.width, swapRedBlue);
#endif
        }
    }
}

}  // namespace LQ
