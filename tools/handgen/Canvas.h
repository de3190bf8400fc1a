#pragma once
// The picture being made: RGB in floats, 0..1 for 0..255, so that shading, blending and
// blur don't round until the frame is finished.

#include <cstdint>
#include <vector>

#include "HandRandom.h"

namespace handgen {

struct Rgb {
    float r = 0, g = 0, b = 0;
};
inline Rgb operator*(Rgb c, float s) { return {c.r * s, c.g * s, c.b * s}; }
inline Rgb operator*(Rgb a, Rgb b) { return {a.r * b.r, a.g * b.g, a.b * b.b}; }
inline Rgb operator+(Rgb a, Rgb b) { return {a.r + b.r, a.g + b.g, a.b + b.b}; }
inline Rgb mix(Rgb a, Rgb b, float t) { return {a.r + (b.r - a.r) * t, a.g + (b.g - a.g) * t, a.b + (b.b - a.b) * t}; }

class Canvas {
public:
    Canvas() = default;
    Canvas(int width, int height, Rgb fill = {}) { reset(width, height, fill); }
    void reset(int width, int height, Rgb fill = {});
    int width() const { return width_; }
    int height() const { return height_; }
    float* row(int y) { return pixels_.data() + static_cast<size_t>(y) * width_ * 3; }
    const float* row(int y) const { return pixels_.data() + static_cast<size_t>(y) * width_ * 3; }
    // blends c over the pixel with coverage a
    void blend(int x, int y, Rgb c, float a) {
        float* p = row(y) + 3 * x;
        p[0] += (c.r - p[0]) * a;
        p[1] += (c.g - p[1]) * a;
        p[2] += (c.b - p[2]) * a;
    }

private:
    int width_ = 0, height_ = 0;
    std::vector<float> pixels_;
};

// separable Gaussian, edges repeated; sigma in pixels, below 0.2 nothing happens
void gaussianBlur(Canvas& canvas, float sigma);
// brightness that falls off linearly across the picture (a lamp to one side), then exposure
void lightGradient(Canvas& canvas, float strength, float angleDegrees, float exposure);
// sensor noise of sigma 8-bit levels in each channel; chroma (0..1) is the share of it
// that differs between the channels, the rest is common to all three
void sensorNoise(Canvas& canvas, float sigma, float chroma, HandRandom& random);
// rounded and clamped to interleaved 8-bit RGB
void toRgb8(const Canvas& canvas, std::vector<std::uint8_t>& rgb);
// BT.601 limited-range luma, as the camera's Y plane holds it
inline std::uint8_t lumaOf(int r, int g, int b) {
    return static_cast<std::uint8_t>((66 * r + 129 * g + 25 * b + 128 + (16 << 8)) >> 8);
}

// smooth lattice noise in 0..1 from a hash of the cell corners: the same at any crop
float valueNoise(float x, float y, std::uint32_t seed);
// octaves of value noise halving in size and weight
float fractalNoise(float x, float y, std::uint32_t seed, int octaves);

}  // namespace handgen
