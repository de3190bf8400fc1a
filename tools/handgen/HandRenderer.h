#pragma once
// Draws a placed hand: each bone and the palm are hit by view rays on a supersampled grid,
// the front-most surface wins, and is lit by one lamp and the ambient light. Where a part
// lies just behind another (curled fingers, the thumb over the fist) a dark crease is
// drawn. The result is a layer of premultiplied colour and coverage laid over the canvas.

#include <cstdint>
#include <vector>

#include "Canvas.h"
#include "HandModel.h"

namespace handgen {

struct Lighting {
    Vec3 toLight{-0.35f, -0.45f, 0.82f};  // unit, screen frame (y down, z toward the camera)
    float ambient = 0.5f, diffuse = 0.55f, specular = 0.06f;
    Rgb tint{1, 1, 1};
};

struct SkinLook {
    Rgb skin{0.85f, 0.65f, 0.52f}, nail{0.93f, 0.80f, 0.78f}, sleeve{0.2f, 0.25f, 0.4f};
    float mottle = 0.05f;    // blotchiness of the skin, a share of its brightness
    float creases = 1;       // 0 none .. 1 full-strength dark lines where parts meet
    float palmLines = 1;     // 0 none .. 1 the palm's main lines
    std::uint32_t seed = 0;  // the blotches' pattern
};

// tone 0 the lightest skin .. 1 the darkest; redness -1 .. 1 shifts toward yellow or pink
Rgb skinTone(float tone, float redness);

struct HandLayer {
    int x0 = 0, y0 = 0, width = 0, height = 0;
    std::vector<float> colour;  // premultiplied RGB
    std::vector<float> alpha;   // share of the pixel the hand covers
};

// The hand's layer over the part of a canvasWidth x canvasHeight picture it touches;
// supersample rays per pixel side.
void renderHand(const ScreenHand& hand, const SkinLook& look, const Lighting& light, int supersample,
                int canvasWidth, int canvasHeight, HandLayer& layer);
void composite(const HandLayer& layer, Canvas& canvas);

}  // namespace handgen
