#include "LQ_ImageRotate.h"

#include <cmath>
#include <cstring>
#include <vector>

#include "LQ_ImageCopy.h"
#include "LQ_ImageMath.h"
#include "LQ_Neon.h"

namespace LQ {

namespace {
// Pixel moves in square tiles, so that both the rows read and the rows written stay in
// cache; the pixel size is a template argument so each size gets its own tight loop.
template <int N>
struct Pixel {
    unsigned char bytes[N];
};

// target(mapX(x, y), mapY(x, y)) = source(x, y) for the four quarter-turn maps and the
// transpose, given as the target's start and the steps of one source step in x and y.
template <int N>
void movePixels(const Image& source, Image& target, long start, long stepX, long stepY) {
    const int width = source.width(), height = source.height();
    constexpr int kTile = 32;
    for (int y0 = 0; y0 < height; y0 += kTile) {
        const int y1 = y0 + kTile < height ? y0 + kTile : height;
        for (int x0 = 0; x0 < width; x0 += kTile) {
            const int x1 = x0 + kTile < width ? x0 + kTile : width;
            for (int y = y0; y < y1; ++y) {
                const Pixel<N>* in = reinterpret_cast<const Pixel<N>*>(source.row(y));
                unsigned char* out = target.data() + start + y * stepY;
                for (int x = x0; x < x1; ++x) *reinterpret_cast<Pixel<N>*>(out + x * stepX) = in[x];
            }
        }
    }
}

#if defined(LQ_HAVE_SSSE3)
// Byte images turned or transposed in 8 x 8 blocks held in registers (SSE2, which every
// x86-64 processor has); the pixels outside whole blocks go the plain way. Each source
// column becomes a target row, written at the start of that row's band.
void movePixelsBytes(const Image& source, Image& target, long start, long stepX, long stepY) {
    const int width = source.width(), height = source.height();
    const int blockWidth = width & ~7, blockHeight = height & ~7;
    const long stride = source.stripLength();
    // down the source in the inner loop, so that the eight target rows fill in order
    for (int x = 0; x < blockWidth; x += 8) {
        for (int y = 0; y < blockHeight; y += 8) {
            // rows in the order in which they land along the target row
            __m128i r[8];
            const bool reversed = stepY < 0;
            for (int i = 0; i < 8; ++i) {
                const int row = reversed ? y + 7 - i : y + i;
                r[i] = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(source.row(row) + x));
            }
            const __m128i a0 = _mm_unpacklo_epi8(r[0], r[1]), a1 = _mm_unpacklo_epi8(r[2], r[3]);
            const __m128i a2 = _mm_unpacklo_epi8(r[4], r[5]), a3 = _mm_unpacklo_epi8(r[6], r[7]);
            const __m128i b0 = _mm_unpacklo_epi16(a0, a1), b1 = _mm_unpackhi_epi16(a0, a1);
            const __m128i b2 = _mm_unpacklo_epi16(a2, a3), b3 = _mm_unpackhi_epi16(a2, a3);
            const __m128i columns[4] = {_mm_unpacklo_epi32(b0, b2), _mm_unpackhi_epi32(b0, b2),
                                        _mm_unpacklo_epi32(b1, b3), _mm_unpackhi_epi32(b1, b3)};
            // the target address of source pixel (x + i, first row of the band)
            const long firstRow = reversed ? y + 7 : y;
            for (int i = 0; i < 8; ++i) {
                const __m128i column = i % 2 ? _mm_srli_si128(columns[i / 2], 8) : columns[i / 2];
                unsigned char* out = target.data() + start + (x + i) * stepX + firstRow * stepY;
                _mm_storel_epi64(reinterpret_cast<__m128i*>(out), column);
            }
        }
    }
    (void)stride;
    // the bands right of and below the whole blocks
    for (int y = 0; y < height; ++y) {
        const unsigned char* in = source.row(y);
        unsigned char* out = target.data() + start + y * stepY;
        for (int x = y < blockHeight ? blockWidth : 0; x < width; ++x) out[x * stepX] = in[x];
    }
}
#endif

void movePixelsAnySize(const Image& source, Image& target, long start, long stepX, long stepY) {
    switch (source.depth()) {
        case 1:
#if defined(LQ_HAVE_SSSE3)
            // a column of the source becomes a row of the target only when one step is one byte
            if (stepY == 1 || stepY == -1) return movePixelsBytes(source, target, start, stepX, stepY);
#endif
            return movePixels<1>(source, target, start, stepX, stepY);
        case 2: return movePixels<2>(source, target, start, stepX, stepY);
        case 3: return movePixels<3>(source, target, start, stepX, stepY);
        case 4: return movePixels<4>(source, target, start, stepX, stepY);
        case 8: return movePixels<8>(source, target, start, stepX, stepY);
        case 12: return movePixels<12>(source, target, start, stepX, stepY);
        case 28: return movePixels<28>(source, target, start, stepX, stepY);
        case 52: return movePixels<52>(source, target, start, stepX, stepY);
        default: LQ_FAIL("pixel size is not supported: " << source.depth());
    }
}
}  // namespace

void rotatePi4(const Image& source, Image& target, int quarterTurns) {
    LQ_ASSERT_CREATED(source);
    const int k = ((quarterTurns % 4) + 4) % 4;
    if (k == 0) {
        copyImage(source, target, BaseRect<int>());
        return;
    }
    const int width = source.width(), height = source.height();
    const long d = source.depth();
    if (k == 2) {
        target.create(source.size(), source.colorMode());
        if (width == 0 || height == 0) return;
        const long stride = target.stripLength();
        // (x, y) -> (W - 1 - x, H - 1 - y)
        movePixelsAnySize(source, target, (height - 1) * stride + (width - 1) * d, -d, -stride);
        return;
    }
    target.create(BaseSize<int>(height, width), source.colorMode());
    if (width == 0 || height == 0) return;
    const long stride = target.stripLength();
    if (k == 1)  // (x, y) -> column y, row W - 1 - x
        movePixelsAnySize(source, target, (width - 1) * stride, -stride, d);
    else  // (x, y) -> column H - 1 - y, row x
        movePixelsAnySize(source, target, (height - 1) * d, stride, -d);
}

void transpose(const Image& source, Image& target) {
    LQ_ASSERT_CREATED(source);
    target.create(BaseSize<int>(source.height(), source.width()), source.colorMode());
    if (source.width() == 0 || source.height() == 0) return;
    movePixelsAnySize(source, target, 0, target.stripLength(), source.depth());
}

void flipLeftRight(const Image& source, Image& target) {
    LQ_ASSERT_CREATED(source);
    target.create(source.size(), source.colorMode());
    if (source.width() == 0 || source.height() == 0) return;
    const long d = source.depth();
    movePixelsAnySize(source, target, (source.width() - 1) * d, -d, target.stripLength());
}

void flipTopBottom(const Image& source, Image& target) {
    target.create(source.size(), source.colorMode());
    const size_t bytes = static_cast<size_t>(source.width()) * source.depth();
    for (int y = 0; y < source.height(); ++y)
        std::memcpy(target.row(source.height() - 1 - y), source.row(y), bytes);
}

namespace {
// target offsets to source offsets: the rotation by angle times zoom
void rotationMatrix(float angle, float zoom, float* m) {
    const float c = static_cast<float>(std::cos(static_cast<double>(angle)));
    const float s = static_cast<float>(std::sin(static_cast<double>(angle)));
    m[0] = c * zoom, m[1] = -s * zoom, m[2] = s * zoom, m[3] = c * zoom;
}

bool equal(float a, float b) { return std::fabs(a - b) <= 1e-6f * std::fmax(std::fabs(a), std::fabs(b)); }
}  // namespace

bool allInside(const BaseSize<int>& sourceSize, const BaseSize<int>& targetSize, const float* m,
               const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre) {
    const float xs[2] = {0.f, static_cast<float>(targetSize.width - 1)};
    const float ys[2] = {0.f, static_cast<float>(targetSize.height - 1)};
    for (float y : ys)
        for (float x : xs) {
            const float dx = x - targetCentre.x, dy = y - targetCentre.y;
            const float sx = m[0] * dx + m[1] * dy + sourceCentre.x;
            const float sy = m[2] * dx + m[3] * dy + sourceCentre.y;
            if (sx < 0 || sy < 0 || sx >= sourceSize.width - 1 || sy >= sourceSize.height - 1) return false;
        }
    return true;
}

bool rotateAndZoomImageNn(const Image& source, Image& target, float angle, float zoom,
                          const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre) {
    // every sample reads a 2 x 2 neighbourhood
    LQ_ASSERT_MSG(source.width() >= 2 && source.height() >= 2, "source too small to sample: " << source.size());
    float m[4];
    rotationMatrix(angle, zoom, m);
    const int width = target.width(), height = target.height();
    const int maxX = (source.width() - 1) * 256 - 1, maxY = (source.height() - 1) * 256 - 1;
    // the column part of the map, once per column, in 1/256 pixel
    std::vector<int> columnX(width), columnY(width);
    for (int x = 0; x < width; ++x) {
        columnX[x] = static_cast<int>(m[0] * (x - targetCentre.x) * 256);
        columnY[x] = static_cast<int>(m[2] * (x - targetCentre.x) * 256);
    }
    const int depth = target.depth();
    for (int y = 0; y < height; ++y) {
        const int rowX = static_cast<int>((m[1] * (y - targetCentre.y) + sourceCentre.x) * 256);
        const int rowY = static_cast<int>((m[3] * (y - targetCentre.y) + sourceCentre.y) * 256);
        unsigned char* out = target.row(y);
        for (int x = 0; x < width; ++x) {
            int px = rowX + columnX[x], py = rowY + columnY[x];
            px = px < 0 ? 0 : (px > maxX ? maxX : px);
            py = py < 0 ? 0 : (py > maxY ? maxY : py);
            source.fractionalPixel256(px, py, out + x * depth);
        }
    }
    return allInside(source.size(), target.size(), m, sourceCentre, targetCentre);
}

bool rotateAndZoomImageAverage(const Image& source, Image& target, float angle, float zoom,
                               const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre) {
    float m[4];
    rotationMatrix(angle, zoom, m);
    for (int y = 0; y < target.height(); ++y) std::memset(target.row(y), 0, static_cast<size_t>(target.width()) * target.depth());
    const int side = static_cast<int>(zoom);
    for (int y = 0; y < target.height(); ++y) {
        for (int x = 0; x < target.width(); ++x) {
            const float dx = x - targetCentre.x, dy = y - targetCentre.y;
            const int px = static_cast<int>((m[0] * dx + m[1] * dy + sourceCentre.x) * 256) / 256;
            const int py = static_cast<int>((m[2] * dx + m[3] * dy + sourceCentre.y) * 256) / 256;
            BaseRect<int> square(px - side / 2, py - side / 2, px - side / 2 + side, py - side / 2 + side);
            // a square larger than the source is cut to it instead
            if (side <= source.width() && side <= source.height())
                square.shiftInBoundary(source.rect());
            else
                square = square.intersect(source.rect());
            imageMean(source, target.pixel(x, y), square);
        }
    }
    return allInside(source.size(), target.size(), m, sourceCentre, targetCentre);
}

bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoom,
                        const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre) {
    LQ_ASSERT_COLOR_MODE(source, target.colorMode());
    if (zoom <= 3.0f) return rotateAndZoomImageNn(source, target, angle, zoom, sourceCentre, targetCentre);
    return rotateAndZoomImageAverage(source, target, angle, zoom, sourceCentre, targetCentre);
}

bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoomX, float zoomY,
                        const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre) {
    LQ_ASSERT_MSG(equal(zoomX, zoomY), "different zooms not implemented yet");
    return rotateAndZoomImage(source, target, angle, zoomX, sourceCentre, targetCentre);
}

bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoomX, float zoomY,
                        const BasePoint<float>& sourceCentre) {
    const BasePoint<float> centre((target.width() - 1) * 0.5f, (target.height() - 1) * 0.5f);
    return rotateAndZoomImage(source, target, angle, zoomX, zoomY, sourceCentre, centre);
}

BaseSize<int> getRotatedFrameSize(const BaseSize<int>& size, float angle) {
    const float c = std::cos(angle);
    const float c2 = c * c;
    return BaseSize<int>(static_cast<int>(c2 * size.width + (1 - c2) * size.height + 0.5f),
                         static_cast<int>(c2 * size.height + (1 - c2) * size.width + 0.5f));
}

}  // namespace LQ
