#pragma once
// The one pixel container: a small header over a reference-counted byte buffer.
// Copying copies pixels; only createRef shares them.

#include <istream>
#include <ostream>

#include "LQ_ColorMode.h"
#include "LQ_Point.h"
#include "LQ_Rect.h"
#include "LQ_SharedPtr.h"
#include "LQ_Size.h"

namespace LQ {

class Image {
public:
    Image() = default;
    Image(const BaseSize<int>& size, ColorMode colorMode) { create(size, colorMode); }
    Image(const Image& other) { create(other); }
    Image& operator=(const Image& other) {
        if (this != &other) create(other);
        return *this;
    }
    ~Image() = default;

    // Keeps the present rows (and their owner) when size and mode already match.
    void create(const BaseSize<int>& size, ColorMode colorMode);
    // Deep copy of the source's pixels; writes through a matching reference.
    void create(const Image& source);
    // Sets the header only, no pixels.
    void createHeader(const BaseSize<int>& size, ColorMode colorMode);

    // Headers over foreign memory; they take no ownership.
    void createRef(unsigned char* data, const BaseSize<int>& size, ColorMode colorMode);
    void createRef(unsigned char* data, const BaseSize<int>& size, ColorMode colorMode, unsigned int stripLength);
    // Views of another image's rows, sharing its buffer.
    void createRef(const Image& image, const BaseRect<int>& rect);
    void createRef(const Image& image);

    void reset();

    const BaseSize<int>& size() const { return size_; }
    int width() const { return size_.width; }
    int height() const { return size_.height; }
    BaseRect<int> rect() const { return BaseRect<int>(size_); }
    ColorMode colorMode() const { return colorMode_; }
    int depth() const { return depth_; }
    unsigned int stripLength() const { return stripLength_; }
    unsigned char* data() const { return data_; }
    bool isCreated() const { return colorMode_ != COLOR_MODE_UNDEFINED; }
    // true when the rows lie one after another without padding
    bool isCompact() const { return stripLength_ == static_cast<unsigned int>(size_.width * depth_); }
    // true when the pixels live in a buffer that some Image owns
    bool hasOwner() const { return static_cast<bool>(buffer_) && buffer_.isOwning(); }

    unsigned char* row(int y) const { return data_ + static_cast<size_t>(y) * stripLength_; }
    template <class T>
    T* row(int y) const {
        return reinterpret_cast<T*>(row(y));
    }
    unsigned char* pixel(int x, int y) const { return row(y) + static_cast<size_t>(x) * depth_; }
    template <class T>
    T* pixel(int x, int y) const {
        return reinterpret_cast<T*>(pixel(x, y));
    }

    // Floats (FLOAT, FLOAT2) within a relative tolerance of 1e-6, everything else bytewise.
    bool operator==(const Image& other) const;
    bool operator!=(const Image& other) const { return !(*this == other); }

    // Sub-pixel reading, coordinates in 1/256 pixel; no bounds test, truncating.
    unsigned int fractionalValueMono(int x, int y) const;
    unsigned int fractionalValueDepth(int x, int y) const;
    unsigned int fractionalValue256(int x, int y) const;
    unsigned int fractionalPixel256(int x, int y) const;
    void fractionalPixel256(int x, int y, unsigned char* out) const;
    unsigned int fractionalPixel(float x, float y) const;
    unsigned int fractionalPixel(const BasePoint<float>& point) const { return fractionalPixel(point.x, point.y); }
    float fractionalPixelFloat(float x, float y) const;
    float fractionalPixelFloat(const BasePoint<float>& point) const {
        return fractionalPixelFloat(point.x, point.y);
    }

private:
    BaseSize<int> size_;
    ColorMode colorMode_ = COLOR_MODE_UNDEFINED;
    unsigned int stripLength_ = 0;
    int depth_ = 0;
    unsigned char* data_ = nullptr;
    SharedArray<unsigned char> buffer_;
};

std::ostream& operator<<(std::ostream& stream, const Image& image);
// Images are never read back from text; this only fails.
std::istream& operator>>(std::istream& stream, const Image& image);

// A colour as one word: R in the top byte, then G, B, A.
class Color {
public:
    Color() = default;
    explicit Color(unsigned int word) : word_(word) {}
    Color(unsigned char r, unsigned char g, unsigned char b, unsigned char a = 255)
        : word_((unsigned(r) << 24) | (unsigned(g) << 16) | (unsigned(b) << 8) | a) {}

    unsigned char r() const { return static_cast<unsigned char>(word_ >> 24); }
    unsigned char g() const { return static_cast<unsigned char>(word_ >> 16); }
    unsigned char b() const { return static_cast<unsigned char>(word_ >> 8); }
    unsigned char a() const { return static_cast<unsigned char>(word_); }
    unsigned int word() const { return word_; }
    bool operator==(const Color& o) const { return word_ == o.word_; }
    bool operator!=(const Color& o) const { return word_ != o.word_; }

    // The word whose bytes, stored little-endian, are the pixel bytes for the mode.
    unsigned int prepareColor(ColorMode colorMode) const;

    static const Color WHITE, BLACK, RED, GREEN, BLUE, YELLOW, ORANGE, VIOLET, GRAY, BROWN, PINK, TRANSPARENT_;

private:
    unsigned int word_ = 0;
};

}  // namespace LQ

// ---- image check macros ------------------------------------------------------
// Shared by the kernels so that their failed checks read alike.

#define LQ_ASSERT_CREATED(image) LQ_ASSERT_MSG((image).isCreated(), "image is not created")
#define LQ_ASSERT_COLOR_MODE(image, wanted)                                                   \
    LQ_ASSERT_MSG((image).colorMode() == (wanted), "have " << (image).colorMode() << ", but need " << (wanted))
#define LQ_ASSERT_SIZE(image, wanted)                                                         \
    LQ_ASSERT_MSG((image).size() == (wanted), "have " << (image).size() << ", but need " << (wanted))
#define LQ_ASSERT_CONTAINS(outer, inner) LQ_ASSERT_MSG((outer).contains(inner), (inner) << " is out of " << (outer))
