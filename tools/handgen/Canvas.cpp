#include "Canvas.h"

#include <algorithm>
#include <cmath>

namespace handgen {

void Canvas::reset(int width, int height, Rgb fill) {
    width_ = width;
    height_ = height;
    pixels_.resize(static_cast<size_t>(width) * height * 3);
    for (size_t i = 0; i < pixels_.size(); i += 3) {
        pixels_[i] = fill.r;
        pixels_[i + 1] = fill.g;
        pixels_[i + 2] = fill.b;
    }
}

void gaussianBlur(Canvas& canvas, float sigma) {
    if (sigma < 0.2f || canvas.width() == 0 || canvas.height() == 0) return;
    const int radius = std::max(1, static_cast<int>(std::ceil(3 * sigma)));
    std::vector<float> kernel(2 * radius + 1);
    float sum = 0;
    for (int i = -radius; i <= radius; ++i) sum += kernel[i + radius] = std::exp(-0.5f * i * i / (sigma * sigma));
    for (float& k : kernel) k /= sum;

    const int w = canvas.width(), h = canvas.height();
    std::vector<float> line(3 * static_cast<size_t>(std::max(w, h)));
    for (int y = 0; y < h; ++y) {
        float* row = canvas.row(y);
        std::copy(row, row + 3 * w, line.begin());
        for (int x = 0; x < w; ++x) {
            float r = 0, g = 0, b = 0;
            for (int i = -radius; i <= radius; ++i) {
                const int xi = std::clamp(x + i, 0, w - 1);
                const float k = kernel[i + radius];
                r += k * line[3 * xi];
                g += k * line[3 * xi + 1];
                b += k * line[3 * xi + 2];
            }
            row[3 * x] = r;
            row[3 * x + 1] = g;
            row[3 * x + 2] = b;
        }
    }
    for (int x = 0; x < w; ++x) {
        for (int y = 0; y < h; ++y) {
            const float* p = canvas.row(y) + 3 * x;
            line[3 * y] = p[0];
            line[3 * y + 1] = p[1];
            line[3 * y + 2] = p[2];
        }
        for (int y = 0; y < h; ++y) {
            float r = 0, g = 0, b = 0;
            for (int i = -radius; i <= radius; ++i) {
                const int yi = std::clamp(y + i, 0, h - 1);
                const float k = kernel[i + radius];
                r += k * line[3 * yi];
                g += k * line[3 * yi + 1];
                b += k * line[3 * yi + 2];
            }
            float* p = canvas.row(y) + 3 * x;
            p[0] = r;
            p[1] = g;
            p[2] = b;
        }
    }
}

void lightGradient(Canvas& canvas, float strength, float angleDegrees, float exposure) {
    const float a = angleDegrees * 3.14159265f / 180;
    const float dx = std::cos(a), dy = std::sin(a);
    const float cx = canvas.width() / 2.f, cy = canvas.height() / 2.f;
    const float reach = std::max(1.f, std::hypot(cx, cy));
    for (int y = 0; y < canvas.height(); ++y) {
        float* row = canvas.row(y);
        for (int x = 0; x < canvas.width(); ++x) {
            const float t = ((x - cx) * dx + (y - cy) * dy) / reach;  // -1 .. 1
            const float gain = exposure * (1 + 0.5f * strength * t);
            row[3 * x] *= gain;
            row[3 * x + 1] *= gain;
            row[3 * x + 2] *= gain;
        }
    }
}

void sensorNoise(Canvas& canvas, float sigma, float chroma, HandRandom& random) {
    if (sigma <= 0) return;
    // each channel's sigma is the one asked for; chroma is the share of its variance that
    // the other channels do not share
    const float shared = sigma * std::sqrt(1 - chroma) / 255, own = sigma * std::sqrt(chroma) / 255;
    for (int y = 0; y < canvas.height(); ++y) {
        float* row = canvas.row(y);
        for (int x = 0; x < canvas.width(); ++x) {
            const float n = shared * random.fastNormal();
            row[3 * x] += n + own * random.fastNormal();
            row[3 * x + 1] += n + own * random.fastNormal();
            row[3 * x + 2] += n + own * random.fastNormal();
        }
    }
}

void toRgb8(const Canvas& canvas, std::vector<std::uint8_t>& rgb) {
    rgb.resize(static_cast<size_t>(canvas.width()) * canvas.height() * 3);
    size_t i = 0;
    for (int y = 0; y < canvas.height(); ++y) {
        const float* row = canvas.row(y);
        for (int x = 0; x < 3 * canvas.width(); ++x)
            rgb[i++] = static_cast<std::uint8_t>(std::clamp(row[x] * 255 + 0.5f, 0.f, 255.f));
    }
}

namespace {

float latticeValue(int x, int y, std::uint32_t seed) {
    std::uint32_t h = static_cast<std::uint32_t>(x) * 0x8da6b343u ^ static_cast<std::uint32_t>(y) * 0xd8163841u ^
                      seed * 0xcb1ab31fu;
    h ^= h >> 15;
    h *= 0x2c1b3c6du;
    h ^= h >> 12;
    h *= 0x297a2d39u;
    h ^= h >> 15;
    return static_cast<float>(h >> 8) * (1.f / 16777216.f);
}

}  // namespace

float valueNoise(float x, float y, std::uint32_t seed) {
    const float fx = std::floor(x), fy = std::floor(y);
    const int ix = static_cast<int>(fx), iy = static_cast<int>(fy);
    float tx = x - fx, ty = y - fy;
    tx = tx * tx * (3 - 2 * tx);
    ty = ty * ty * (3 - 2 * ty);
    const float a = latticeValue(ix, iy, seed), b = latticeValue(ix + 1, iy, seed);
    const float c = latticeValue(ix, iy + 1, seed), d = latticeValue(ix + 1, iy + 1, seed);
    return (a + (b - a) * tx) + ((c + (d - c) * tx) - (a + (b - a) * tx)) * ty;
}

float fractalNoise(float x, float y, std::uint32_t seed, int octaves) {
    float sum = 0, weight = 0, amplitude = 1, frequency = 1;
    for (int i = 0; i < octaves; ++i) {
        sum += amplitude * valueNoise(x * frequency, y * frequency, seed + 101u * i);
        weight += amplitude;
        amplitude *= 0.5f;
        frequency *= 2.03f;
    }
    return sum / weight;
}

}  // namespace handgen
