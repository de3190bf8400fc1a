#include "LQ_ImageMath.h"

#include <cstring>

namespace LQ {

unsigned int imageSum(const Image& image, const BaseRect<int>& rect) {
    unsigned int sum = 0;
    switch (image.colorMode()) {
        case COLOR_MODE_MONO:
            for (int y = rect.top; y < rect.bottom; ++y) {
                const unsigned char* row = image.row(y);
                for (int x = rect.left; x < rect.right; ++x) sum += row[x];
            }
            break;
        case COLOR_MODE_MONO16:
        case COLOR_MODE_DEPTH:
            for (int y = rect.top; y < rect.bottom; ++y) {
                const unsigned short* row = image.row<unsigned short>(y);
                for (int x = rect.left; x < rect.right; ++x) sum += row[x];
            }
            break;
        default: LQ_FAIL("color mode not handled:" << image.colorMode());
    }
    return sum;
}

float imageMean(const Image& image, const BaseRect<int>& rect) {
    return static_cast<float>(imageSum(image, rect)) / rect.area();
}

void imageMean(const Image& image, unsigned char* out, const BaseRect<int>& rect) {
    const int depth = image.depth();
    const unsigned int area = rect.area() > 0 ? static_cast<unsigned int>(rect.area()) : 0;
    if (image.colorMode() == COLOR_MODE_MONO16 || image.colorMode() == COLOR_MODE_DEPTH) {
        const unsigned short mean = area ? static_cast<unsigned short>(imageSum(image, rect) / area) : 0;
        std::memcpy(out, &mean, sizeof(mean));
        return;
    }
    LQ_ASSERT_MSG(depth == 1 || depth == 3, "color mode not handled:" << image.colorMode());
    for (int c = 0; c < depth; ++c) {
        unsigned int sum = 0;
        for (int y = rect.top; y < rect.bottom; ++y) {
            const unsigned char* row = image.row(y);
            for (int x = rect.left; x < rect.right; ++x) sum += row[x * depth + c];
        }
        out[c] = area ? static_cast<unsigned char>(sum / area) : 0;
    }
}

}  // namespace LQ
