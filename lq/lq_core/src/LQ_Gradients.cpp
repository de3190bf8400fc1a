#include "LQ_Gradients.h"

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

// Gx / 8 and Gy / 8 as signed bytes over the interior part of rect
void sobelInto(const Image& source, Image& target, const BaseRect<int>& rect) {
    const int left = std::max(rect.left, 1), right = std::min(rect.right, source.width() - 1);
    const int top = std::max(rect.top, 1), bottom = std::min(rect.bottom, source.height() - 1);
    for (int y = top; y < bottom; ++y) {
        const unsigned char* up = source.row(y - 1);
        const unsigned char* mid = source.row(y);
        const unsigned char* down = source.row(y + 1);
        signed char* out = reinterpret_cast<signed char*>(target.row(y));
        for (int x = left; x < right; ++x) {
            int gx, gy;
            sobelAt(up, mid, down, x, gx, gy);
            out[2 * x] = static_cast<signed char>(gx / 8);
            out[2 * x + 1] = static_cast<signed char>(gy / 8);
        }
    }
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
        short* gxRow = first.row<short>(y);
        short* gyRow = second.row<short>(y);
        for (int x = 1; x + 1 < src.width(); ++x) {
            int gx, gy;
            sobelAt(src.row(y - 1), src.row(y), src.row(y + 1), x, gx, gy);
            gxRow[x] = static_cast<short>(gx);
            gyRow[x] = static_cast<short>(gy);
        }
    }
}

void SobelAbsolute(const Image& source, Image& target) {
    target.create(source.size(), COLOR_MODE_MONO);
    clear(target);
    for (int y = 1; y + 1 < source.height(); ++y) {
        unsigned char* out = target.row(y);
        for (int x = 1; x + 1 < source.width(); ++x) {
            int gx, gy;
            sobelAt(source.row(y - 1), source.row(y), source.row(y + 1), x, gx, gy);
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
        unsigned char* out = target.row(y);
        for (int x = 1; x + 1 < source.width(); ++x) {
            int gx, gy;
            sobelAt(source.row(y - 1), source.row(y), source.row(y + 1), x, gx, gy);
            const int d = static_cast<int>(std::atan2(double(gx), double(gy)) * 4 / P + 4.5);
            out[2 * x] = static_cast<unsigned char>(d % 4);
            out[2 * x + 1] = static_cast<unsigned char>((std::abs(gx) + std::abs(gy)) >> 3);
        }
    }
}

void thinGradients(Image& image) {
    static const int forward[4][2] = {{0, 1}, {1, 1}, {1, 0}, {-1, 1}};
    // decide on the magnitudes as they were, then mark
    std::vector<unsigned char> suppressed(static_cast<size_t>(image.width()) * image.height(), 0);
    for (int y = 1; y + 1 < image.height(); ++y) {
        for (int x = 1; x + 1 < image.width(); ++x) {
            const unsigned char* p = image.pixel(x, y);
            const int d = p[0] > 3 ? 3 : p[0];
            const int m = p[1];
            const int fx = forward[d][0], fy = forward[d][1];
            const int ahead = image.pixel(x + fx, y + fy)[1];
            const int behind = image.pixel(x - fx, y - fy)[1];
            if (!(m >= ahead && m > behind)) suppressed[static_cast<size_t>(y) * image.width() + x] = 1;
        }
    }
    for (int y = 1; y + 1 < image.height(); ++y)
        for (int x = 1; x + 1 < image.width(); ++x)
            if (suppressed[static_cast<size_t>(y) * image.width() + x]) image.pixel(x, y)[0] = 255;
}

void updateGradients(unsigned char* pixel, int low, int stripLength) {
    // an explicit stack: an edge may be longer than the call stack allows
    std::vector<unsigned char*> pending(1, pixel);
    const ptrdiff_t neighbours[8] = {-stripLength - 2, -stripLength, -stripLength + 2, -2, 2,
                                     stripLength - 2,  stripLength,  stripLength + 2};
    while (!pending.empty()) {
        unsigned char* p = pending.back();
        pending.pop_back();
        if (p[0] < 255 && p[1] > low) {
            if (p[1] == 255) continue;
            p[1] = 255;
            // pushed in reverse so they are taken in the order of the rows
            for (int i = 7; i >= 0; --i) pending.push_back(p + neighbours[i]);
        } else {
            p[1] = 0;
        }
    }
}

void canny(const Image& source, Image& target, int minThreshold, int maxThreshold) {
    LQ_ASSERT_COLOR_MODE(source, COLOR_MODE_MONO);
    Image gradients;
    computeGradients(source, gradients);
    thinGradients(gradients);
    LQ_ASSERT_LT(minThreshold, maxThreshold);
    // a negative low threshold would let the edge walk leave the image through its zero border
    LQ_ASSERT_GE(minThreshold, 0);
    const int stripLength = static_cast<int>(gradients.stripLength());
    for (int y = 1; y + 1 < gradients.height(); ++y)
        for (int x = 1; x + 1 < gradients.width(); ++x) {
            unsigned char* p = gradients.pixel(x, y);
            if (p[0] != 255 && p[1] > maxThreshold) updateGradients(p, minThreshold, stripLength);
        }
    target.create(source.size(), COLOR_MODE_MONO);
    clear(target);
    for (int y = 1; y + 1 < source.height(); ++y)
        for (int x = 1; x + 1 < source.width(); ++x)
            target.row(y)[x] = gradients.pixel(x, y)[1] == 255 ? 255 : 0;
}

}  // namespace LQ
