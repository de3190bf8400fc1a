#pragma once
// Conversion of the host's semi-planar YUV 4:2:0 preview (luma rows, then rows of
// interleaved V, U pairs) into the BGR working image.

#include "LQ_Image.h"
#include "LQ_Neon.h"

namespace LQ {

// width W / d and height (2 * (headerHeight / 3)) / d, with d = 2 when zoomTwice
BaseSize<int> getOutputSize(const BaseSize<int>& size, bool zoomTwice);

// source: a header over the whole buffer, height counting luma and chroma rows.
// destination is created as BGR. With zoomTwice one output pixel per chroma pair.
void yuv420toBgr(const Image& source, Image& destination, bool zoomTwice, bool swapRedBlue);

// One pixel: y, u, v as stored; writes three bytes and advances destination.
inline void computeBgr(int y, int u, int v, unsigned char*& destination, bool swapRedBlue) {
    const int luma = 1192 * y;
    const int vs = v - 128, us = u - 128;
    int b = luma + 2066 * us;
    int g = luma - 833 * vs - 400 * us;
    int r = luma + 1634 * vs;
    b = b <= 0 ? 0 : (b < 0x3FFFF ? b : 0x3FFFF) >> 10;
    g = g <= 0 ? 0 : (g < 0x3FFFF ? g : 0x3FFFF) >> 10;
    r = r <= 0 ? 0 : (r < 0x3FFFF ? r : 0x3FFFF) >> 10;
    destination[swapRedBlue ? 2 : 0] = static_cast<unsigned char>(b);
    destination[1] = static_cast<unsigned char>(g);
    destination[swapRedBlue ? 0 : 2] = static_cast<unsigned char>(r);
    destination += 3;
}

// Row kernels, exposed so that the vector path can be compared with the scalar one.
// Zoomed: output pixel x takes luma[2x] and the pair chroma[2x], chroma[2x + 1].
void yuvRowZoomScalar(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                      bool swapRedBlue);
// Full size: output pixel x takes luma[x] and the pair of column x / 2; width >= 2.
void yuvRowFullScalar(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                      bool swapRedBlue);
#if defined(LQ_HAVE_NEON)
void yuvRowZoomNeon(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                    bool swapRedBlue);
void yuvRowFullNeon(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                    bool swapRedBlue);
#endif
#if defined(LQ_HAVE_SSSE3)
// x86 hosts, where emulated NEON is slow; needs SSSE3 (haveSsse3()).
void yuvRowZoomSse(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                   bool swapRedBlue);
bool haveSsse3();
// the same with AVX2 (haveAvx2()), 32 pixels at a time
void yuvRowZoomAvx2(const unsigned char* luma, const unsigned char* chroma, unsigned char* bgr, int width,
                    bool swapRedBlue);
bool haveAvx2();
#endif

}  // namespace LQ
