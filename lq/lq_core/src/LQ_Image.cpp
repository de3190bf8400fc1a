#include "LQ_Image.h"

#include <cmath>
#include <cstring>
#include <iomanip>

namespace LQ {

void Image::createHeader(const BaseSize<int>& size, ColorMode colorMode) {
    LQ_ASSERT_MSG(size.width >= 0 && size.height >= 0, "negative size " << size);
    const int pixelDepth = LQ::depth(colorMode);
    size_ = size;
    colorMode_ = colorMode;
    depth_ = pixelDepth;
    stripLength_ = static_cast<unsigned int>(size.width * pixelDepth);
    data_ = nullptr;
    buffer_ = SharedArray<unsigned char>();
}

void Image::create(const BaseSize<int>& size, ColorMode colorMode) {
    // per-frame work images are created again each frame: no allocation when nothing changed
    if (size == size_ && colorMode == colorMode_) return;
    createHeader(size, colorMode);
    const size_t bytes = static_cast<size_t>(size.height) * stripLength_;
    buffer_ = new unsigned char[bytes];
    data_ = buffer_.get();
}

void Image::create(const Image& source) {
    if (!source.isCreated()) {
        reset();
        return;
    }
    create(source.size_, source.colorMode_);
    const size_t rowBytes = static_cast<size_t>(size_.width) * depth_;
    if (rowBytes == 0) return;
    for (int y = 0; y < size_.height; ++y) std::memmove(row(y), source.row(y), rowBytes);
}

void Image::createRef(unsigned char* data, const BaseSize<int>& size, ColorMode colorMode) {
    createHeader(size, colorMode);
    data_ = data;
}

void Image::createRef(unsigned char* data, const BaseSize<int>& size, ColorMode colorMode, unsigned int stripLength) {
    createHeader(size, colorMode);
    stripLength_ = stripLength;
    data_ = data;
}

void Image::createRef(const Image& image, const BaseRect<int>& rect) {
    LQ_ASSERT_MSG(image.isCreated(), "createRef: source image not created");
    LQ_ASSERT_MSG((image.rect()).contains(rect), rect << " is out of " << image.size());
    LQ_ASSERT_MSG(rect.area(), "empty rect: " << rect);
    // copy what is needed before the header changes, in case image aliases *this
    const unsigned int stripLength = image.stripLength_;
    unsigned char* data = image.data_ + static_cast<size_t>(rect.top) * stripLength +
                          static_cast<size_t>(rect.left) * image.depth_;
    SharedArray<unsigned char> buffer = image.buffer_;
    const ColorMode colorMode = image.colorMode_;
    createHeader(rect.size(), colorMode);
    stripLength_ = stripLength;
    data_ = data;
    buffer_ = buffer;
}

void Image::createRef(const Image& image) { createRef(image, image.rect()); }

void Image::reset() {
    size_ = BaseSize<int>();
    colorMode_ = COLOR_MODE_UNDEFINED;
    stripLength_ = 0;
    depth_ = 0;
    data_ = nullptr;
    buffer_ = SharedArray<unsigned char>();
}

namespace {
bool floatsEqual(const float* a, const float* b, int count) {
    for (int i = 0; i < count; ++i) {
        const double x = a[i], y = b[i];
        // NaN fails this comparison, also against itself
        if (!(std::max(std::fabs(x), std::fabs(y)) * 1e-6 >= std::fabs(x - y))) return false;
    }
    return true;
}
}  // namespace

bool Image::operator==(const Image& other) const {
    if (colorMode_ != other.colorMode_ || size_ != other.size_) return false;
    if (!isCreated()) return true;
    const size_t rowBytes = static_cast<size_t>(size_.width) * depth_;
    const bool floats = colorMode_ == COLOR_MODE_FLOAT || colorMode_ == COLOR_MODE_FLOAT2;
    for (int y = 0; y < size_.height; ++y) {
        if (floats) {
            if (!floatsEqual(row<float>(y), other.row<float>(y), static_cast<int>(rowBytes / 4))) return false;
        } else if (rowBytes && std::memcmp(row(y), other.row(y), rowBytes) != 0) {
            return false;
        }
    }
    return true;
}

// ---- sub-pixel reading ------------------------------------------------------

namespace {
struct Bilinear {
    int ix, iy, fx, fy;
    Bilinear(int x, int y) : ix(x >> 8), iy(y >> 8), fx(x - 256 * (x / 256)), fy(y - 256 * (y / 256)) {}
};
}  // namespace

unsigned int Image::fractionalValueMono(int x, int y) const {
    const Bilinear p(x, y);
    const unsigned char* top = pixel(p.ix, p.iy);
    const unsigned char* bottom = top + stripLength_;
    const unsigned int fx = static_cast<unsigned int>(p.fx), fy = static_cast<unsigned int>(p.fy);
    return ((256 - fx) * top[0] + fx * top[1]) * (256 - fy) + ((256 - fx) * bottom[0] + fx * bottom[1]) * fy;
}

unsigned int Image::fractionalValueDepth(int x, int y) const {
    const Bilinear p(x, y);
    const unsigned short* top = pixel<unsigned short>(p.ix, p.iy);
    const unsigned short* bottom = reinterpret_cast<const unsigned short*>(
        reinterpret_cast<const unsigned char*>(top) + stripLength_);
    const unsigned int fx = static_cast<unsigned int>(p.fx), fy = static_cast<unsigned int>(p.fy);
    const unsigned int samples[4] = {top[0], top[1], bottom[0], bottom[1]};
    const unsigned int weights[4] = {(256 - fx) * (256 - fy), fx * (256 - fy), (256 - fx) * fy, fx * fy};
    unsigned int weight = 0;
    unsigned long long sum = 0;
    for (int i = 0; i < 4; ++i) {
        // 0 and 5000 on mean no measurement
        if (samples[i] >= 1 && samples[i] <= 4999) {
            weight += weights[i];
            sum += static_cast<unsigned long long>(weights[i]) * samples[i];
        }
    }
    if (weight < 32768) return 0;
    return static_cast<unsigned int>((65536.0f / static_cast<float>(weight)) * static_cast<float>(sum));
}

unsigned int Image::fractionalValue256(int x, int y) const {
    if (colorMode_ == COLOR_MODE_MONO) return fractionalValueMono(x, y);
    if (colorMode_ == COLOR_MODE_DEPTH) return fractionalValueDepth(x, y);
    LQ_FAIL("only COLOR_MODE_MONO, COLOR_MODE_DEPTH are implemented." << "Got " << colorMode_);
}

unsigned int Image::fractionalPixel256(int x, int y) const { return fractionalValue256(x, y) >> 16; }

void Image::fractionalPixel256(int x, int y, unsigned char* out) const {
    switch (colorMode_) {
        case COLOR_MODE_MONO: out[0] = static_cast<unsigned char>(fractionalValueMono(x, y) >> 16); return;
        case COLOR_MODE_BGR:
        case COLOR_MODE_RGB:
        case COLOR_MODE_YUV: {
            const Bilinear p(x, y);
            const unsigned char* top = pixel(p.ix, p.iy);
            const unsigned char* bottom = top + stripLength_;
            const unsigned int fx = static_cast<unsigned int>(p.fx), fy = static_cast<unsigned int>(p.fy);
            for (int c = 0; c < 3; ++c) {
                const unsigned int value = ((256 - fx) * top[c] + fx * top[3 + c]) * (256 - fy) +
                                           ((256 - fx) * bottom[c] + fx * bottom[3 + c]) * fy;
                out[c] = static_cast<unsigned char>(value >> 16);
            }
            return;
        }
        case COLOR_MODE_DEPTH: {
            const unsigned short value = static_cast<unsigned short>(fractionalValueDepth(x, y) >> 16);
            std::memcpy(out, &value, sizeof(value));
            return;
        }
        default:
            LQ_FAIL("only COLOR_MODE_MONO, COLOR_MODE_BGR, COLOR_MODE_RGB, COLOR_MODE_YUV, COLOR_MODE_DEPTH are "
                    "implemented."
                    << "Got " << colorMode_);
    }
}

unsigned int Image::fractionalPixel(float x, float y) const {
    return fractionalPixel256(static_cast<int>(x * 256.0f), static_cast<int>(y * 256.0f));
}

float Image::fractionalPixelFloat(float x, float y) const {
    return static_cast<float>(fractionalValue256(static_cast<int>(x * 256.0f), static_cast<int>(y * 256.0f))) *
           1.5258789e-5f;
}

// ---- text forms -------------------------------------------------------------

std::ostream& operator<<(std::ostream& stream, const Image& image) {
    stream << "Image(" << image.size() << ", " << image.colorMode();
    if (!image.isCreated()) return stream << ")";
    stream << ", \ndata =\n";
    const ColorMode mode = image.colorMode();
    for (int y = 0; y < image.height(); ++y) {
        for (int x = 0; x < image.width(); ++x) {
            const unsigned char* p = image.pixel(x, y);
            switch (mode) {
                case COLOR_MODE_MONO16:
                case COLOR_MODE_DEPTH:
                    stream << std::setw(5) << *reinterpret_cast<const unsigned short*>(p) << ", ";
                    break;
                case COLOR_MODE_INTEGRAL:
                case COLOR_MODE_INTEGRAL_HOG_UNSIGNED6:
                case COLOR_MODE_INTEGRAL_HOG_SIGNED12:
                    for (int i = 0; i < image.depth() / 4; ++i)
                        stream << std::setw(10) << reinterpret_cast<const unsigned int*>(p)[i] << ", ";
                    break;
                case COLOR_MODE_FLOAT: {
                    const std::streamsize precision = stream.precision(8);
                    stream << *reinterpret_cast<const float*>(p) << ", ";
                    stream.precision(precision);
                    break;
                }
                case COLOR_MODE_FLOAT2: {
                    const float* v = reinterpret_cast<const float*>(p);
                    stream << std::setw(5) << v[0] << " " << v[1] << ", ";
                    break;
                }
                case COLOR_MODE_USHORT2: {
                    const unsigned short* v = reinterpret_cast<const unsigned short*>(p);
                    stream << std::setw(5) << v[0] << " " << v[1] << ", ";
                    break;
                }
                default:
                    for (int i = 0; i < image.depth(); ++i) stream << std::setw(3) << int(p[i]) << ", ";
                    break;
            }
        }
        stream << "\n";
    }
    return stream << ")";
}

std::istream& operator>>(std::istream& stream, const Image&) {
    LQ_FAIL("loading images from stream is not implemented");
}

// ---- colours ----------------------------------------------------------------

const Color Color::WHITE(0xFFFFFFFFu);
const Color Color::BLACK(0x000000FFu);
const Color Color::RED(0xFF0000FFu);
const Color Color::GREEN(0x00FF00FFu);
const Color Color::BLUE(0x0000FFFFu);
const Color Color::YELLOW(0xFFFF00FFu);
const Color Color::ORANGE(0xFFA500FFu);
const Color Color::VIOLET(0xEE82EEFFu);
const Color Color::GRAY(0x696969FFu);
const Color Color::BROWN(0xA52A2AFFu);
const Color Color::PINK(0xFFC0CBFFu);
const Color Color::TRANSPARENT_(0x00000000u);

unsigned int Color::prepareColor(ColorMode colorMode) const {
    const int R = r(), G = g(), B = b();
    const unsigned int A = a();
    switch (colorMode) {
        case COLOR_MODE_MONO: {
            const unsigned int m = static_cast<unsigned int>((16 * G + 11 * R + 5 * B) >> 5);
            return m * 0x010101u | (A << 24);
        }
        case COLOR_MODE_BGR:
            return static_cast<unsigned int>(B) | (static_cast<unsigned int>(G) << 8) |
                   (static_cast<unsigned int>(R) << 16) | (A << 24);
        case COLOR_MODE_RGB:
        case COLOR_MODE_RGBA:
            return __builtin_bswap32(word_);
        case COLOR_MODE_YUV: {
            const int Y = ((66 * R + 129 * G + 25 * B) >> 8) + 16;
            const int U = ((-38 * R - 74 * G + 112 * B) >> 8) + 128;
            const int V = ((112 * R - 94 * G - 18 * B) >> 8) + 128;
            return static_cast<unsigned int>(Y & 0xFF) | (static_cast<unsigned int>(U & 0xFF) << 8) |
                   (static_cast<unsigned int>(V & 0xFF) << 16) | (A << 24);
        }
        default:
            LQ_FAIL("wrong color mode: " << colorMode);
    }
}

}  // namespace LQ
