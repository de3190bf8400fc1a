#include "LQ_ImageMath.h"

#include <cstring>

namespace LQ {

namespace {
template <class T>
unsigned int sumSamples(const Image& image, const BaseRect<int>& rect, int step, int channel) {
    unsigned int sum = 0;
    for (int y = rect.top; y < rect.bottom; ++y) {
        const T* row = image.row<T>(y);
        for (int x = rect.left; x < rect.right; ++x) sum += row[x * step + channel];
    }
    return sum;
}
}  // namespace

unsigned int imageSum(const Image& image, const BaseRect<int>& rect_) {
    const BaseRect<int> rect = rect_.area() == 0 ? image.rect() : rect_;
    LQ_ASSERT_CONTAINS(image.rect(), rect);
    switch (image.colorMode()) {
        case COLOR_MODE_MONO: return sumSamples<unsigned char>(image, rect, 1, 0);
        case COLOR_MODE_MONO16:
        case COLOR_MODE_DEPTH: return sumSamples<unsigned short>(image, rect, 1, 0);
        default: LQ_FAIL("color mode not handled:" << image.colorMode());
    }
}

float imageMean(const Image& image, const BaseRect<int>& rect) {
    const int area = rect.area() == 0 ? image.rect().area() : rect.area();
    return static_cast<float>(imageSum(image, rect)) / static_cast<float>(area);
}

void imageMean(const Image& image, unsigned char* out, const BaseRect<int>& rect) {
    LQ_ASSERT_CONTAINS(image.rect(), rect);
    const ColorMode mode = image.colorMode();
    const unsigned int area = rect.area() > 0 ? static_cast<unsigned int>(rect.area()) : 0;
    switch (mode) {
        case COLOR_MODE_MONO:
            out[0] = static_cast<unsigned char>(area ? sumSamples<unsigned char>(image, rect, 1, 0) / area : 0);
            return;
        case COLOR_MODE_MONO16:
        case COLOR_MODE_DEPTH: {
            const unsigned short mean =
                static_cast<unsigned short>(area ? sumSamples<unsigned short>(image, rect, 1, 0) / area : 0);
            std::memcpy(out, &mean, sizeof(mean));
            return;
        }
        case COLOR_MODE_BGR:
        case COLOR_MODE_RGB:
        case COLOR_MODE_YUV:
            for (int c = 0; c < 3; ++c)
                out[c] = static_cast<unsigned char>(area ? sumSamples<unsigned char>(image, rect, 3, c) / area : 0);
            return;
        default: LQ_FAIL("color mode not handled:" << mode);
    }
}

}  // namespace LQ
