#include "LQ_ImageRotate.h"

#include <cmath>
#include <cstring>
#include <vector>

#include "LQ_ImageCopy.h"
#include "LQ_ImageMath.h"

namespace LQ {

namespace {

#if defined(LQ_HAVE_SSSE3)
bool cpuHasSsse3() {
    static const bool have = __builtin_cpu_supports("ssse3");
    return have;
}
#endif

template <int N>
struct Pixel {
    unsigned char bytes[N];
};

// target = start + x stepX + y stepY for source pixel (x, y), in bytes
struct TurnMap {
    ptrdiff_t start, stepX, stepY;
};

TurnMap turnMap(const Image& source, const Image& target, Turn turn) {
    const ptrdiff_t d = source.depth(), stride = target.stripLength();
    switch (turn) {
        case Turn::Transpose: return {0, stride, d};
        case Turn::Once: return {(source.width() - 1) * stride, -stride, d};
        default: return {(source.height() - 1) * d, stride, -d};
    }
}

// The pixels of rect, in square tiles so that the rows read and the rows written stay
// in cache; each pixel size gets its own loop.
template <int N>
void turnPixels(const Image& source, Image& target, const TurnMap& map, const BaseRect<int>& rect) {
    constexpr int kTile = 32;
    for (int y0 = rect.top; y0 < rect.bottom; y0 += kTile) {
        const int y1 = std::min(y0 + kTile, rect.bottom);
        for (int x0 = rect.left; x0 < rect.right; x0 += kTile) {
            const int x1 = std::min(x0 + kTile, rect.right);
            for (int y = y0; y < y1; ++y) {
                const Pixel<N>* in = reinterpret_cast<const Pixel<N>*>(source.row(y));
                unsigned char* out = target.data() + map.start + y * map.stepY;
                for (int x = x0; x < x1; ++x) *reinterpret_cast<Pixel<N>*>(out + x * map.stepX) = in[x];
            }
        }
    }
}

void turnPixelsAnySize(const Image& source, Image& target, const TurnMap& map, const BaseRect<int>& rect) {
    switch (source.depth()) {
        case 1: return turnPixels<1>(source, target, map, rect);
        case 2: return turnPixels<2>(source, target, map, rect);
        case 3: return turnPixels<3>(source, target, map, rect);
        case 4: return turnPixels<4>(source, target, map, rect);
        case 8: return turnPixels<8>(source, target, map, rect);
        default: break;
    }
    const size_t d = source.depth();
    for (int y = rect.top; y < rect.bottom; ++y)
        for (int x = rect.left; x < rect.right; ++x)
            std::memcpy(target.data() + map.start + x * map.stepX + y * map.stepY, source.pixel(x, y), d);
}

// Whole N x N blocks through block(in, offset, out, step): in[j] + offset is the j-th row
// of the block in the order in which it lands along the target rows; out + i step is where
// the block's column i starts in the target. What lies outside whole blocks goes pixel by
// pixel.
template <int N, class Block>
void turnBlocks(const Image& source, Image& target, Turn turn, Block block) {
    const int W = source.width(), H = source.height();
    const ptrdiff_t d = source.depth();
    const int blockWidth = W - W % N, blockHeight = H - H % N;
    const bool rowsReversed = turn == Turn::Thrice, columnsReversed = turn == Turn::Once;
    const ptrdiff_t step = columnsReversed ? -static_cast<ptrdiff_t>(target.stripLength()) : target.stripLength();
    const unsigned char* in[N];
    // tiles of 64 x 64 pixels: the target rows a tile writes fill whole cache lines
    // before the next tile moves on
    constexpr int kTile = 64;
    for (int ty = 0; ty < blockHeight; ty += kTile)
        for (int tx = 0; tx < blockWidth; tx += kTile)
            for (int y0 = ty, y1 = std::min(ty + kTile, blockHeight); y0 < y1; y0 += N) {
                for (int j = 0; j < N; ++j) in[j] = source.row(rowsReversed ? y0 + N - 1 - j : y0 + j);
                const ptrdiff_t column = (rowsReversed ? H - y0 - N : y0) * d;
                for (int x0 = tx, x1 = std::min(tx + kTile, blockWidth); x0 < x1; x0 += N)
                    block(in, x0 * d, target.row(columnsReversed ? W - 1 - x0 : x0) + column, step);
            }
    const TurnMap map = turnMap(source, target, turn);
    turnPixelsAnySize(source, target, map, BaseRect<int>(blockWidth, 0, W, H));
    turnPixelsAnySize(source, target, map, BaseRect<int>(0, blockHeight, blockWidth, H));
}

}  // namespace

void turnScalar(const Image& source, Image& target, Turn turn) {
    turnPixelsAnySize(source, target, turnMap(source, target, turn), source.rect());
}

#if defined(LQ_HAVE_NEON)
namespace {
// rows r[0..7] to columns, in place
inline void transpose8x8(uint8x8_t* r) {
    const uint8x8x2_t t0 = vtrn_u8(r[0], r[1]), t1 = vtrn_u8(r[2], r[3]);
    const uint8x8x2_t t2 = vtrn_u8(r[4], r[5]), t3 = vtrn_u8(r[6], r[7]);
    const uint16x4x2_t u0 = vtrn_u16(vreinterpret_u16_u8(t0.val[0]), vreinterpret_u16_u8(t1.val[0]));
    const uint16x4x2_t u1 = vtrn_u16(vreinterpret_u16_u8(t0.val[1]), vreinterpret_u16_u8(t1.val[1]));
    const uint16x4x2_t u2 = vtrn_u16(vreinterpret_u16_u8(t2.val[0]), vreinterpret_u16_u8(t3.val[0]));
    const uint16x4x2_t u3 = vtrn_u16(vreinterpret_u16_u8(t2.val[1]), vreinterpret_u16_u8(t3.val[1]));
    const uint32x2x2_t v0 = vtrn_u32(vreinterpret_u32_u16(u0.val[0]), vreinterpret_u32_u16(u2.val[0]));
    const uint32x2x2_t v1 = vtrn_u32(vreinterpret_u32_u16(u1.val[0]), vreinterpret_u32_u16(u3.val[0]));
    const uint32x2x2_t v2 = vtrn_u32(vreinterpret_u32_u16(u0.val[1]), vreinterpret_u32_u16(u2.val[1]));
    const uint32x2x2_t v3 = vtrn_u32(vreinterpret_u32_u16(u1.val[1]), vreinterpret_u32_u16(u3.val[1]));
    r[0] = vreinterpret_u8_u32(v0.val[0]), r[4] = vreinterpret_u8_u32(v0.val[1]);
    r[1] = vreinterpret_u8_u32(v1.val[0]), r[5] = vreinterpret_u8_u32(v1.val[1]);
    r[2] = vreinterpret_u8_u32(v2.val[0]), r[6] = vreinterpret_u8_u32(v2.val[1]);
    r[3] = vreinterpret_u8_u32(v3.val[0]), r[7] = vreinterpret_u8_u32(v3.val[1]);
}
}  // namespace

void turnNeon(const Image& source, Image& target, Turn turn) {
    if (source.depth() == 1) {
        turnBlocks<8>(source, target, turn,
                      [](const unsigned char* const* in, ptrdiff_t offset, unsigned char* out, ptrdiff_t step) {
                          uint8x8_t r[8];
                          for (int j = 0; j < 8; ++j) r[j] = vld1_u8(in[j] + offset);
                          transpose8x8(r);
                          for (int i = 0; i < 8; ++i) vst1_u8(out + i * step, r[i]);
                      });
    } else if (source.depth() == 3) {
        // the loads split the channels; each channel turns like a byte image
        turnBlocks<8>(source, target, turn,
                      [](const unsigned char* const* in, ptrdiff_t offset, unsigned char* out, ptrdiff_t step) {
                          uint8x8_t channels[3][8];
                          for (int j = 0; j < 8; ++j) {
                              const uint8x8x3_t pixels = vld3_u8(in[j] + offset);
                              for (int c = 0; c < 3; ++c) channels[c][j] = pixels.val[c];
                          }
                          for (int c = 0; c < 3; ++c) transpose8x8(channels[c]);
                          for (int i = 0; i < 8; ++i) {
                              uint8x8x3_t pixels;
                              for (int c = 0; c < 3; ++c) pixels.val[c] = channels[c][i];
                              vst3_u8(out + i * step, pixels);
                          }
                      });
    } else {
        turnScalar(source, target, turn);
    }
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// SSE2: eight rows of 8 bytes to eight columns
inline void transposeBytes8x8(const unsigned char* const* in, ptrdiff_t offset, unsigned char* out,
                              ptrdiff_t step) {
    __m128i r[8];
    for (int j = 0; j < 8; ++j) r[j] = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(in[j] + offset));
    const __m128i a0 = _mm_unpacklo_epi8(r[0], r[1]), a1 = _mm_unpacklo_epi8(r[2], r[3]);
    const __m128i a2 = _mm_unpacklo_epi8(r[4], r[5]), a3 = _mm_unpacklo_epi8(r[6], r[7]);
    const __m128i b0 = _mm_unpacklo_epi16(a0, a1), b1 = _mm_unpackhi_epi16(a0, a1);
    const __m128i b2 = _mm_unpacklo_epi16(a2, a3), b3 = _mm_unpackhi_epi16(a2, a3);
    // two target rows in each
    const __m128i c[4] = {_mm_unpacklo_epi32(b0, b2), _mm_unpackhi_epi32(b0, b2), _mm_unpacklo_epi32(b1, b3),
                          _mm_unpackhi_epi32(b1, b3)};
    for (int i = 0; i < 4; ++i) {
        _mm_storel_epi64(reinterpret_cast<__m128i*>(out + 2 * i * step), c[i]);
        _mm_storel_epi64(reinterpret_cast<__m128i*>(out + (2 * i + 1) * step), _mm_unpackhi_epi64(c[i], c[i]));
    }
}

// SSSE3: four rows of four 3-byte pixels to four columns, each pixel padded to 32 bits
// for the transposition. Loads and stores are exactly 12 bytes.
__attribute__((target("ssse3"))) inline void transposeTriples4x4(const unsigned char* const* in, ptrdiff_t offset,
                                                                 unsigned char* out, ptrdiff_t step) {
    const __m128i widen = _mm_setr_epi8(0, 1, 2, -1, 3, 4, 5, -1, 6, 7, 8, -1, 9, 10, 11, -1);
    const __m128i narrow = _mm_setr_epi8(0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1);
    __m128i r[4];
    for (int j = 0; j < 4; ++j) {
        int last;
        const unsigned char* p = in[j] + offset;
        std::memcpy(&last, p + 8, 4);
        const __m128i bytes =
            _mm_unpacklo_epi64(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)), _mm_cvtsi32_si128(last));
        r[j] = _mm_shuffle_epi8(bytes, widen);
    }
    const __m128i t0 = _mm_unpacklo_epi32(r[0], r[1]), t1 = _mm_unpacklo_epi32(r[2], r[3]);
    const __m128i t2 = _mm_unpackhi_epi32(r[0], r[1]), t3 = _mm_unpackhi_epi32(r[2], r[3]);
    const __m128i c[4] = {_mm_unpacklo_epi64(t0, t1), _mm_unpackhi_epi64(t0, t1), _mm_unpacklo_epi64(t2, t3),
                          _mm_unpackhi_epi64(t2, t3)};
    for (int i = 0; i < 4; ++i) {
        const __m128i bytes = _mm_shuffle_epi8(c[i], narrow);
        unsigned char* p = out + i * step;
        _mm_storel_epi64(reinterpret_cast<__m128i*>(p), bytes);
        const int last = _mm_cvtsi128_si32(_mm_srli_si128(bytes, 8));
        std::memcpy(p + 8, &last, 4);
    }
}

__attribute__((target("ssse3"))) void turnTriplesSse(const Image& source, Image& target, Turn turn) {
    turnBlocks<4>(source, target, turn,
                  [](const unsigned char* const* in, ptrdiff_t offset, unsigned char* out, ptrdiff_t step) {
                      transposeTriples4x4(in, offset, out, step);
                  });
}
}  // namespace

void turnSse(const Image& source, Image& target, Turn turn) {
    if (source.depth() == 1)
        turnBlocks<8>(source, target, turn,
                      [](const unsigned char* const* in, ptrdiff_t offset, unsigned char* out, ptrdiff_t step) {
                          transposeBytes8x8(in, offset, out, step);
                      });
    else if (source.depth() == 3 && cpuHasSsse3())
        turnTriplesSse(source, target, turn);
    else
        turnScalar(source, target, turn);
}
#endif

namespace {
void turn(const Image& source, Image& target, Turn how) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    turnNeon(source, target, how);
#elif defined(LQ_HAVE_SSSE3)
    turnSse(source, target, how);
#else
    turnScalar(source, target, how);
#endif
}
}  // namespace

// ---- mirrors -------------------------------------------------------------------------------

namespace {
template <int N>
void flipPixels(const unsigned char* in, unsigned char* out, int width) {
    const Pixel<N>* from = reinterpret_cast<const Pixel<N>*>(in);
    Pixel<N>* to = reinterpret_cast<Pixel<N>*>(out);
    for (int x = 0; x < width; ++x) to[x] = from[width - 1 - x];
}
}  // namespace

void flipRowScalar(const unsigned char* in, unsigned char* out, int width, int depth) {
    switch (depth) {
        case 1: return flipPixels<1>(in, out, width);
        case 2: return flipPixels<2>(in, out, width);
        case 3: return flipPixels<3>(in, out, width);
        case 4: return flipPixels<4>(in, out, width);
        default:
            for (int x = 0; x < width; ++x) std::memcpy(out + x * depth, in + (width - 1 - x) * depth, depth);
    }
}

#if defined(LQ_HAVE_NEON)
void flipRowNeon(const unsigned char* in, unsigned char* out, int width, int depth) {
    int x = 0;
    if (depth == 1) {
        for (; x + 16 <= width; x += 16) {
            const uint8x16_t v = vrev64q_u8(vld1q_u8(in + width - 16 - x));
            vst1q_u8(out + x, vcombine_u8(vget_high_u8(v), vget_low_u8(v)));
        }
    } else if (depth == 3) {
        for (; x + 16 <= width; x += 16) {
            uint8x16x3_t v = vld3q_u8(in + 3 * (width - 16 - x));
            for (int c = 0; c < 3; ++c) {
                const uint8x16_t r = vrev64q_u8(v.val[c]);
                v.val[c] = vcombine_u8(vget_high_u8(r), vget_low_u8(r));
            }
            vst3q_u8(out + 3 * x, v);
        }
    }
    // the middle of the row that is left: target pixels x to width - 1
    flipRowScalar(in, out + x * depth, width - x, depth);
}
#endif

#if defined(LQ_HAVE_SSSE3)
__attribute__((target("ssse3"))) void flipRowSse(const unsigned char* in, unsigned char* out, int width,
                                                 int depth) {
    int x = 0;
    if (depth == 1) {
        const __m128i reverse = _mm_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0);
        for (; x + 16 <= width; x += 16) {
            const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + width - 16 - x));
            _mm_storeu_si128(reinterpret_cast<__m128i*>(out + x), _mm_shuffle_epi8(v, reverse));
        }
    } else if (depth == 3) {
        // Five pixels a step from a load that starts one byte early, so that it ends
        // at the step's last pixel. The 16th byte written is the next step's first; it is
        // written again by that step or by the tail.
        const __m128i reverse = _mm_setr_epi8(13, 14, 15, 10, 11, 12, 7, 8, 9, 4, 5, 6, 1, 2, 3, -1);
        for (; x + 6 <= width; x += 5) {
            const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + 3 * (width - 5 - x) - 1));
            _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 3 * x), _mm_shuffle_epi8(v, reverse));
        }
    }
    flipRowScalar(in, out + x * depth, width - x, depth);
}
#endif

namespace {
void flipRow(const unsigned char* in, unsigned char* out, int width, int depth) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    flipRowNeon(in, out, width, depth);
#else
#if defined(LQ_HAVE_SSSE3)
    if (cpuHasSsse3()) return flipRowSse(in, out, width, depth);
#endif
    flipRowScalar(in, out, width, depth);
#endif
}
}  // namespace

// ---- quarter turns and mirrors of images ------------------------------------------------------

void rotatePi4(const Image& source, Image& target, int quarterTurns) {
    if (&source == &target) {
        const Image copy(source);
        return rotatePi4(copy, target, quarterTurns);
    }
    LQ_ASSERT_CREATED(source);
    const int k = ((quarterTurns % 4) + 4) % 4;
    if (k == 0) return copyImage(source, target, BaseRect<int>());
    const int width = source.width(), height = source.height();
    if (k == 2) {
        // (x, y) -> (W - 1 - x, H - 1 - y): the rows mirrored, in reverse order
        target.create(source.size(), source.colorMode());
        for (int y = 0; y < height; ++y) flipRow(source.row(y), target.row(height - 1 - y), width, source.depth());
        return;
    }
    target.create(BaseSize<int>(height, width), source.colorMode());
    turn(source, target, k == 1 ? Turn::Once : Turn::Thrice);
}

void transpose(const Image& source, Image& target) {
    if (&source == &target) {
        const Image copy(source);
        return transpose(copy, target);
    }
    LQ_ASSERT_CREATED(source);
    target.create(BaseSize<int>(source.height(), source.width()), source.colorMode());
    turn(source, target, Turn::Transpose);
}

void flipLeftRight(const Image& source, Image& target) {
    if (&source == &target) {
        const Image copy(source);
        return flipLeftRight(copy, target);
    }
    LQ_ASSERT_CREATED(source);
    target.create(source.size(), source.colorMode());
    for (int y = 0; y < source.height(); ++y) flipRow(source.row(y), target.row(y), source.width(), source.depth());
}

void flipTopBottom(const Image& source, Image& target) {
    if (&source == &target) {
        const Image copy(source);
        return flipTopBottom(copy, target);
    }
    target.create(source.size(), source.colorMode());
    const size_t bytes = static_cast<size_t>(source.width()) * source.depth();
    if (bytes == 0) return;
    for (int y = 0; y < source.height(); ++y) std::memcpy(target.row(source.height() - 1 - y), source.row(y), bytes);
}

// ---- free rotation ----------------------------------------------------------------------------

namespace {
// target offsets to source offsets: the rotation by angle times zoom
void rotationMatrix(float angle, float zoom, float* m) {
    const float c = std::cos(angle), s = std::sin(angle);
    m[0] = c * zoom, m[1] = -s * zoom, m[2] = s * zoom, m[3] = c * zoom;
}

bool equal(float a, float b) {
    return std::fabs(static_cast<double>(a) - b) <= 1e-6 * std::fmax(std::fabs(a), std::fabs(b));
}

// Source positions of target pixels in 1/256 pixel: the column part tabulated once, the
// row part once per row.
class SourcePositions {
public:
    SourcePositions(const float* m, int width, const BasePoint<float>& sourceCentre,
                    const BasePoint<float>& targetCentre)
        : m_(m), sourceCentre_(sourceCentre), targetCentre_(targetCentre), columnX_(width), columnY_(width) {
        for (int x = 0; x < width; ++x) {
            columnX_[x] = static_cast<int>(m[0] * (x - targetCentre.x) * 256);
            columnY_[x] = static_cast<int>(m[2] * (x - targetCentre.x) * 256);
        }
    }
    void startRow(int y) {
        rowX_ = static_cast<int>((m_[1] * (y - targetCentre_.y) + sourceCentre_.x) * 256);
        rowY_ = static_cast<int>((m_[3] * (y - targetCentre_.y) + sourceCentre_.y) * 256);
    }
    int x(int column) const { return rowX_ + columnX_[column]; }
    int y(int column) const { return rowY_ + columnY_[column]; }

private:
    const float* m_;
    BasePoint<float> sourceCentre_, targetCentre_;
    std::vector<int> columnX_, columnY_;
    int rowX_ = 0, rowY_ = 0;
};

// One side of the averaging square: pushed inside the source, or the whole side of the
// source where the square is larger.
void placeSide(int centre, int side, int size, int& low, int& high) {
    low = centre - side / 2;
    if (side >= size) {
        low = 0, high = size;
        return;
    }
    low = std::max(0, std::min(low, size - side));
    high = low + side;
}
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
    LQ_ASSERT_COLOR_MODE(source, target.colorMode());
    // every sample reads a 2 x 2 neighbourhood
    LQ_ASSERT_MSG(source.width() >= 2 && source.height() >= 2, "source too small to sample: " << source.size());
    float m[4];
    rotationMatrix(angle, zoom, m);
    const int maxX = (source.width() - 1) * 256 - 1, maxY = (source.height() - 1) * 256 - 1;
    SourcePositions positions(m, target.width(), sourceCentre, targetCentre);
    const int depth = target.depth();
    for (int y = 0; y < target.height(); ++y) {
        positions.startRow(y);
        unsigned char* out = target.row(y);
        for (int x = 0; x < target.width(); ++x) {
            const int px = std::max(0, std::min(positions.x(x), maxX));
            const int py = std::max(0, std::min(positions.y(x), maxY));
            source.fractionalPixel256(px, py, out + x * depth);
        }
    }
    return allInside(source.size(), target.size(), m, sourceCentre, targetCentre);
}

bool rotateAndZoomImageAverage(const Image& source, Image& target, float angle, float zoom,
                               const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre) {
    LQ_ASSERT_COLOR_MODE(source, target.colorMode());
    float m[4];
    rotationMatrix(angle, zoom, m);
    const size_t rowBytes = static_cast<size_t>(target.width()) * target.depth();
    for (int y = 0; y < target.height() && rowBytes; ++y) std::memset(target.row(y), 0, rowBytes);
    const int side = static_cast<int>(zoom);
    const bool fits = side <= source.width() && side <= source.height();
    SourcePositions positions(m, target.width(), sourceCentre, targetCentre);
    for (int y = 0; y < target.height(); ++y) {
        positions.startRow(y);
        for (int x = 0; x < target.width(); ++x) {
            const int cx = positions.x(x) / 256, cy = positions.y(x) / 256;
            BaseRect<int> square(cx - side / 2, cy - side / 2, cx - side / 2 + side, cy - side / 2 + side);
            if (fits) {
                square.shiftInBoundary(source.rect());
            } else {
                placeSide(cx, side, source.width(), square.left, square.right);
                placeSide(cy, side, source.height(), square.top, square.bottom);
            }
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
