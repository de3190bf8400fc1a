#include "Backgrounds.h"

#include <algorithm>
#include <cmath>

namespace handgen {

namespace {

const char* const kNames[kBackgroundKindCount] = {"flat", "gradient", "noise", "stripes", "checker", "clutter"};
constexpr float kDegree = 3.14159265f / 180;

Rgb hsv(float h, float s, float v) {
    const float c = v * s, x = c * (1 - std::fabs(std::fmod(h / 60, 2.f) - 1)), m = v - c;
    Rgb out;
    if (h < 60) out = {c, x, 0};
    else if (h < 120) out = {x, c, 0};
    else if (h < 180) out = {0, c, x};
    else if (h < 240) out = {0, x, c};
    else if (h < 300) out = {x, 0, c};
    else out = {c, 0, x};
    return {out.r + m, out.g + m, out.b + m};
}

template <class Colour>
void fill(Canvas& canvas, Colour colour) {
    for (int y = 0; y < canvas.height(); ++y) {
        float* row = canvas.row(y);
        for (int x = 0; x < canvas.width(); ++x) {
            const Rgb c = colour(x + 0.5f, y + 0.5f);
            row[3 * x] = c.r;
            row[3 * x + 1] = c.g;
            row[3 * x + 2] = c.b;
        }
    }
}

// A soft-edged shape laid over the canvas: sdf(x, y) in pixels, negative inside; the
// colour darkens a little across the shape as if lit from one side.
template <class Sdf>
void stamp(Canvas& canvas, float left, float top, float right, float bottom, Rgb colour, float shading,
           float shadeAngle, Sdf sdf) {
    const int x0 = std::max(0, static_cast<int>(left)), x1 = std::min(canvas.width(), static_cast<int>(right) + 2);
    const int y0 = std::max(0, static_cast<int>(top)), y1 = std::min(canvas.height(), static_cast<int>(bottom) + 2);
    const float cx = (left + right) / 2, cy = (top + bottom) / 2, reach = std::max(1.f, (right - left + bottom - top) / 4);
    const float sx = std::cos(shadeAngle), sy = std::sin(shadeAngle);
    for (int y = y0; y < y1; ++y)
        for (int x = x0; x < x1; ++x) {
            const float px = x + 0.5f, py = y + 0.5f;
            const float a = std::clamp(0.5f - sdf(px, py), 0.f, 1.f);
            if (a <= 0) continue;
            const float t = std::clamp(((px - cx) * sx + (py - cy) * sy) / reach, -1.f, 1.f);
            canvas.blend(x, y, colour * (1 + shading * t), a);
        }
}

float segmentDistance(float px, float py, float ax, float ay, float bx, float by) {
    const float ex = bx - ax, ey = by - ay, wx = px - ax, wy = py - ay;
    const float len2 = ex * ex + ey * ey;
    const float t = len2 > 0 ? std::clamp((wx * ex + wy * ey) / len2, 0.f, 1.f) : 0;
    return std::hypot(wx - ex * t, wy - ey * t);
}

// distance to an ellipse's outline, roughly, in pixels: exact on the axes, close elsewhere
float ellipseDistance(float px, float py, float cx, float cy, float rx, float ry, float c, float s) {
    const float dx = px - cx, dy = py - cy;
    const float u = (c * dx + s * dy) / rx, v = (-s * dx + c * dy) / ry;
    const float k = std::sqrt(u * u + v * v);
    return (k - 1) * std::min(rx, ry);
}

void clutter(Canvas& canvas, float unit, float skinShare, int count, HandRandom& random) {
    const float w = static_cast<float>(canvas.width()), h = static_cast<float>(canvas.height());
    for (int n = 0; n < count; ++n) {
        const Rgb colour = randomColour(random, random.chance(skinShare));
        const float cx = static_cast<float>(random.uniform(-0.1, 1.1)) * w;
        const float cy = static_cast<float>(random.uniform(-0.1, 1.1)) * h;
        const float size = unit * static_cast<float>(random.uniform(0.1, 1.4));
        const float angle = static_cast<float>(random.uniform(0, 180)) * kDegree;
        const float c = std::cos(angle), s = std::sin(angle);
        const float shading = static_cast<float>(random.uniform(0, 0.3));
        const float shadeAngle = static_cast<float>(random.uniform(0, 6.2832));
        const float reach = size * 1.5f;
        switch (random.below(4)) {
            case 0: {  // rectangle
                const float hw = size / 2, hh = size * static_cast<float>(random.uniform(0.2, 1.0));
                stamp(canvas, cx - reach, cy - reach, cx + reach, cy + reach, colour, shading, shadeAngle,
                      [=](float px, float py) {
                          const float dx = px - cx, dy = py - cy;
                          const float u = std::fabs(c * dx + s * dy) - hw, v = std::fabs(-s * dx + c * dy) - hh;
                          return std::max(u, v);
                      });
                break;
            }
            case 1: {  // ellipse
                const float rx = size / 2, ry = rx * static_cast<float>(random.uniform(0.3, 1.0));
                stamp(canvas, cx - reach, cy - reach, cx + reach, cy + reach, colour, shading, shadeAngle,
                      [=](float px, float py) { return ellipseDistance(px, py, cx, cy, rx, ry, c, s); });
                break;
            }
            case 2: {  // a thick line or a rod
                const float half = size, thick = std::max(0.7f, size * static_cast<float>(random.uniform(0.03, 0.25)));
                const float ax = cx - c * half, ay = cy - s * half, bx = cx + c * half, by = cy + s * half;
                stamp(canvas, cx - reach, cy - reach, cx + reach, cy + reach, colour, shading, shadeAngle,
                      [=](float px, float py) { return segmentDistance(px, py, ax, ay, bx, by) - thick; });
                break;
            }
            default: {  // ring
                const float r = size / 2, thick = std::max(0.7f, r * static_cast<float>(random.uniform(0.1, 0.4)));
                stamp(canvas, cx - reach, cy - reach, cx + reach, cy + reach, colour, shading, shadeAngle,
                      [=](float px, float py) { return std::fabs(std::hypot(px - cx, py - cy) - r) - thick; });
                break;
            }
        }
    }
}

}  // namespace

const char* backgroundName(BackgroundKind kind) { return kNames[static_cast<int>(kind)]; }

std::optional<BackgroundKind> backgroundFromName(const std::string& name) {
    for (int i = 0; i < kBackgroundKindCount; ++i)
        if (name == kNames[i]) return static_cast<BackgroundKind>(i);
    return std::nullopt;
}

Rgb randomColour(HandRandom& random, bool skinLike) {
    if (skinLike) {
        const Rgb skin = skinTone(static_cast<float>(random.uniform()), static_cast<float>(random.uniform(-1, 1)));
        return skin * static_cast<float>(random.uniform(0.6, 1.1));
    }
    const float h = static_cast<float>(random.uniform(0, 360));
    const float s = static_cast<float>(random.uniform(0, 1) * random.uniform(0, 1));  // mostly dull
    const float v = static_cast<float>(random.uniform(0.08, 0.95));
    return hsv(h, s, v);
}

void drawBackground(Canvas& canvas, BackgroundKind kind, float unit, float skinShare, int clutterCount,
                    HandRandom& random) {
    const Rgb a = randomColour(random, random.chance(skinShare));
    const Rgb b = randomColour(random, random.chance(skinShare));
    const float angle = static_cast<float>(random.uniform(0, 360)) * kDegree;
    const float c = std::cos(angle), s = std::sin(angle);
    const std::uint32_t seed = random.raw();
    switch (kind) {
        case BackgroundKind::Flat:
            fill(canvas, [&](float, float) { return a; });
            break;
        case BackgroundKind::Gradient: {
            const float span = unit * static_cast<float>(random.uniform(1, 5));
            const float mid = static_cast<float>(random.uniform(-0.5, 0.5)) * span;
            const float cx = canvas.width() / 2.f, cy = canvas.height() / 2.f;
            fill(canvas, [&](float x, float y) {
                const float t = std::clamp(0.5f + ((x - cx) * c + (y - cy) * s - mid) / span, 0.f, 1.f);
                return mix(a, b, t * t * (3 - 2 * t));
            });
            break;
        }
        case BackgroundKind::Noise: {
            const float period = unit * static_cast<float>(random.uniform(0.1, 1.5));
            const int octaves = 1 + random.below(4);
            const float contrast = static_cast<float>(random.uniform(1, 2.5));
            fill(canvas, [&](float x, float y) {
                const float n = fractalNoise(x / period, y / period, seed, octaves);
                return mix(a, b, std::clamp(0.5f + (n - 0.5f) * contrast, 0.f, 1.f));
            });
            break;
        }
        case BackgroundKind::Stripes: {
            const float period = std::max(2.f, unit * static_cast<float>(random.uniform(0.06, 0.8)));
            const float duty = static_cast<float>(random.uniform(0.25, 0.75));
            fill(canvas, [&](float x, float y) {
                const float u = (x * c + y * s) / period;
                const float f = u - std::floor(u);
                // distance to the nearest stripe edge in pixels, signed by the side
                const float edge = std::min(std::fabs(f - duty), std::min(f, 1 - f)) * period;
                const Rgb own = f < duty ? a : b;
                return mix(mix(a, b, 0.5f), own, std::min(1.f, 2 * edge));
            });
            break;
        }
        case BackgroundKind::Checker: {
            const float period = std::max(2.f, unit * static_cast<float>(random.uniform(0.08, 0.8)));
            fill(canvas, [&](float x, float y) {
                const float u = (x * c + y * s) / period, v = (-x * s + y * c) / period;
                const float fu = u - std::floor(u), fv = v - std::floor(v);
                const bool odd = (static_cast<long>(std::floor(u)) + static_cast<long>(std::floor(v))) & 1;
                const float edge = std::min(std::min(fu, 1 - fu), std::min(fv, 1 - fv)) * period;
                return mix(mix(a, b, 0.5f), odd ? a : b, std::min(1.f, 2 * edge));
            });
            break;
        }
        case BackgroundKind::Clutter: {
            // clutter lies over one of the plainer kinds
            const auto base = static_cast<BackgroundKind>(random.below(3));
            drawBackground(canvas, base, unit, skinShare, 0, random);
            clutter(canvas, unit, skinShare, clutterCount, random);
            break;
        }
    }
}

void drawFace(Canvas& canvas, float cx, float cy, float width, float angle, Rgb skin, const Lighting& light,
              HandRandom& random) {
    const float rx = width / 2, ry = width * static_cast<float>(random.uniform(0.62, 0.72));
    const float a = angle * kDegree, c = std::cos(a), s = std::sin(a);
    const Rgb hair = randomColour(random, false) * 0.35f;
    const float hairline = static_cast<float>(random.uniform(-0.75, -0.35));
    const Rgb dark = skin * 0.35f, lips = skin * Rgb{0.85f, 0.55f, 0.55f};
    const float reach = std::max(rx, ry) * 1.1f;
    const int x0 = std::max(0, static_cast<int>(cx - reach)), x1 = std::min(canvas.width(), static_cast<int>(cx + reach) + 2);
    const int y0 = std::max(0, static_cast<int>(cy - reach)), y1 = std::min(canvas.height(), static_cast<int>(cy + reach) + 2);
    auto blob = [](float u, float v, float bu, float bv, float su, float sv) {
        const float du = (u - bu) / su, dv = (v - bv) / sv;
        return du * du + dv * dv < 1;
    };
    for (int y = y0; y < y1; ++y)
        for (int x = x0; x < x1; ++x) {
            const float dx = x + 0.5f - cx, dy = y + 0.5f - cy;
            // u across the face, v down it, both -1 .. 1 at the outline
            const float u = (c * dx + s * dy) / rx, v = (-s * dx + c * dy) / ry;
            const float k = std::sqrt(u * u + v * v);
            const float cover = std::clamp(0.5f - (k - 1) * std::min(rx, ry), 0.f, 1.f);
            if (cover <= 0) continue;
            const float z = std::sqrt(std::max(0.f, 1 - k * k));
            const Vec3 n{c * u - s * v, s * u + c * v, z};
            Rgb albedo = skin;
            if (v < hairline + 0.25f * u * u || (std::fabs(u) > 0.82f && v < 0.1f)) albedo = hair;
            else if (blob(u, v, -0.35f, -0.12f, 0.16f, 0.07f) || blob(u, v, 0.35f, -0.12f, 0.16f, 0.07f)) albedo = dark;
            else if (blob(u, v, 0, 0.5f, 0.28f, 0.07f)) albedo = lips;
            else if (blob(u, v, 0, 0.2f, 0.07f, 0.16f)) albedo = skin * 0.85f;
            Rgb lit = albedo * (light.ambient * (0.6f + 0.4f * z) + light.diffuse * std::max(0.f, dot(normalized(n), light.toLight)));
            canvas.blend(x, y, lit * light.tint, cover);
        }
}

}  // namespace handgen
