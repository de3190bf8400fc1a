#include "LQ_ImageCopy.h"

#include <cstring>

namespace LQ {

void copyImage(const Image& source, Image& target, const BaseRect<int>& rect) {
    if (rect == BaseRect<int>()) {
        target = source;
        return;
    }
    LQ_ASSERT_CONTAINS(source.rect(), rect);
    target.create(source.size(), source.colorMode());
    copyImage(source, target, rect, BasePoint<int>(rect.left, rect.top));
}

void copyImage(const Image& source, Image& target, const BaseRect<int>& rect, const BasePoint<int>& origin) {
    if (!target.isCreated()) target.create(source.size(), source.colorMode());
    LQ_ASSERT_COLOR_MODE(target, source.colorMode());
    // Both ends are checked so that a bad rectangle fails instead of writing past a buffer.
    LQ_ASSERT_CONTAINS(source.rect(), rect);
    const BaseRect<int> destination(origin, rect.size());
    LQ_ASSERT_CONTAINS(target.rect(), destination);
    const size_t bytes = static_cast<size_t>(rect.width()) * source.depth();
    if (bytes == 0) return;
    for (int y = 0; y < rect.height(); ++y)
        std::memmove(target.pixel(origin.x, origin.y + y), source.pixel(rect.left, rect.top + y), bytes);
}

void copyImageBorder(const Image& source, Image& target, const BaseRect<int>& rect) {
    target.create(rect.size(), source.colorMode());
    const BaseRect<int> innerRect = rect.intersect(source.rect());
    LQ_ASSERT(innerRect.area() != 0);

    const int depth = source.depth();
    const int left = innerRect.left - rect.left;   // first column of the band in the target
    const int top = innerRect.top - rect.top;      // first row of the band in the target
    const int bandWidth = innerRect.width();
    const int right = left + bandWidth;
    for (int y = 0; y < innerRect.height(); ++y) {
        unsigned char* out = target.row(top + y);
        std::memcpy(out + static_cast<size_t>(left) * depth, source.pixel(innerRect.left, innerRect.top + y),
                    static_cast<size_t>(bandWidth) * depth);
        const unsigned char* first = out + static_cast<size_t>(left) * depth;
        const unsigned char* last = out + static_cast<size_t>(right - 1) * depth;
        for (int x = 0; x < left; ++x) std::memcpy(out + static_cast<size_t>(x) * depth, first, depth);
        for (int x = right; x < target.width(); ++x) std::memcpy(out + static_cast<size_t>(x) * depth, last, depth);
    }
    const size_t rowBytes = static_cast<size_t>(target.width()) * depth;
    for (int y = 0; y < top; ++y) std::memcpy(target.row(y), target.row(top), rowBytes);
    const int bottom = top + innerRect.height();
    for (int y = bottom; y < target.height(); ++y) std::memcpy(target.row(y), target.row(bottom - 1), rowBytes);
}

void splitChannels(const Image& source, std::vector<Image>& channels) {
    const int numChannels = source.depth();
    LQ_ASSERT_MSG(numChannels > 1, "not enougth channels: " << numChannels);
    channels.resize(numChannels);
    for (Image& channel : channels) channel.create(source.size(), COLOR_MODE_MONO);
    for (int y = 0; y < source.height(); ++y) {
        const unsigned char* in = source.row(y);
        for (int c = 0; c < numChannels; ++c) {
            unsigned char* out = channels[c].row(y);
            for (int x = 0; x < source.width(); ++x) out[x] = in[x * numChannels + c];
        }
    }
}

void mergeChannels(const std::vector<Image>& images, Image& target, ColorMode targetColorMode) {
    LQ_ASSERT_GE(images.size(), 2u);
    const BaseSize<int> size = images[0].size();
    for (size_t i = 1; i < images.size(); ++i) LQ_ASSERT_EQ(images[i].size(), size);
    const int numChannels = static_cast<int>(images.size());
    LQ_ASSERT_MSG((numChannels) == (depth(targetColorMode)), "Wrong number of channels: " << numChannels);
    target.create(size, targetColorMode);
    for (int y = 0; y < size.height; ++y) {
        unsigned char* out = target.row(y);
        for (int c = 0; c < numChannels; ++c) {
            const unsigned char* in = images[c].row(y);
            const int step = images[c].depth();
            for (int x = 0; x < size.width; ++x) out[x * numChannels + c] = in[x * step];
        }
    }
}

}  // namespace LQ
