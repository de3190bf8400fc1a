#include "TestImages.h"

#include <cstring>

LQ::Image randomImage(int width, int height, LQ::ColorMode mode, unsigned seed) {
    LQ::Image image(LQ::Size(width, height), mode);
    std::mt19937 random(seed);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width * image.depth(); ++x) image.row(y)[x] = static_cast<unsigned char>(random());
    return image;
}

LQ::Image randomView(int width, int height, LQ::ColorMode mode, unsigned seed, LQ::Image& parent) {
    parent = randomImage(width + 3, height + 2, mode, seed);
    LQ::Image view;
    view.createRef(parent, LQ::Rect(1, 1, width + 1, height + 1));
    return view;
}

std::vector<unsigned char> randomBytes(size_t count, std::mt19937& random) {
    std::vector<unsigned char> bytes(count);
    for (auto& b : bytes) b = static_cast<unsigned char>(random());
    return bytes;
}

bool samePixels(const LQ::Image& a, const LQ::Image& b) {
    if (a.size() != b.size() || a.colorMode() != b.colorMode()) return false;
    for (int y = 0; y < a.height(); ++y)
        if (std::memcmp(a.row(y), b.row(y), static_cast<size_t>(a.width()) * a.depth())) return false;
    return true;
}
