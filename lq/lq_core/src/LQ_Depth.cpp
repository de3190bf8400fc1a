#include "LQ_Depth.h"

namespace LQ {

void pixelToRGB(unsigned short value, unsigned char& r, unsigned char& g, unsigned char& b, unsigned short minDepth,
                unsigned short maxDepth) {
    LQ_ASSERT_GT(maxDepth, minDepth);
    if (value <= minDepth || value >= maxDepth) {
        r = g = b = 0;
        return;
    }
    const int t = (value - minDepth) * 765 / (maxDepth - minDepth);
    // bytes: the seams wrap at 256
    switch (t / 255) {
        case 0: r = 255, g = static_cast<unsigned char>(t), b = 0; break;
        case 1: r = static_cast<unsigned char>(254 - t), g = 255, b = static_cast<unsigned char>(t + 2); break;
        default: r = static_cast<unsigned char>(t + 3), g = static_cast<unsigned char>(252 - t), b = 255; break;
    }
}

namespace {
template <class F>
void eachDepth(const Image& source, Image& target, const BaseRect<int>& area, F f) {
    for (int y = area.top; y < area.bottom; ++y) {
        const unsigned short* in = source.row<unsigned short>(y);
        for (int x = area.left; x < area.right; ++x) f(in[x], target.pixel(x, y));
    }
}
}  // namespace

#define LQ_DEPTH_START(targetMode)                                                            \
    LQ_ASSERT_CONTAINS(source.rect(), rect);                                                  \
    const BaseRect<int> area = rect.area() == 0 ? source.rect() : rect;                      \
    LQ_ASSERT_COLOR_MODE(source, COLOR_MODE_DEPTH);                                           \
    target.create(source.size(), targetMode)

void depthToRgb(const Image& source, Image& target, unsigned short minDepth, unsigned short maxDepth,
                const BaseRect<int>& rect) {
    LQ_DEPTH_START(COLOR_MODE_RGB);
    eachDepth(source, target, area, [=](unsigned short v, unsigned char* q) { pixelToRGB(v, q[0], q[1], q[2], minDepth, maxDepth); });
}

void depthToBgr(const Image& source, Image& target, unsigned short minDepth, unsigned short maxDepth,
                const BaseRect<int>& rect) {
    LQ_DEPTH_START(COLOR_MODE_BGR);
    eachDepth(source, target, area, [=](unsigned short v, unsigned char* q) { pixelToRGB(v, q[2], q[1], q[0], minDepth, maxDepth); });
}

void depthToMono(const Image& source, Image& target, unsigned short minDepth, unsigned short maxDepth,
                 const BaseRect<int>& rect) {
    LQ_DEPTH_START(COLOR_MODE_MONO);
    const double scale = 255.0 / (maxDepth - minDepth);
    eachDepth(source, target, area, [=](unsigned short v, unsigned char* q) {
        q[0] = static_cast<unsigned char>(static_cast<int>(scale * (static_cast<int>(v) - minDepth)));
    });
}

}  // namespace LQ
