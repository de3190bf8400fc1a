#include "LQ_Check.h"

namespace LQ {

void checkForCreation(const Image& image) { LQ_ASSERT_MSG(image.isCreated(), "image is not created"); }

void checkColorMode(const Image& image, ColorMode colorMode) {
    LQ_ASSERT_MSG(image.colorMode() == colorMode, "have " << image.colorMode() << ", but need " << colorMode);
}

void checkSize(const Image& image, const BaseSize<int>& size) {
    LQ_ASSERT_MSG(image.size() == size, "have " << image.size() << ", but need " << size);
}

void checkImage(const Image& image, const BaseSize<int>& size, ColorMode colorMode) {
    checkColorMode(image, colorMode);
    checkSize(image, size);
}

void checkImages(const Image& a, const Image& b) {
    checkColorMode(a, b.colorMode());
    checkSize(a, b.size());
}

}  // namespace LQ
