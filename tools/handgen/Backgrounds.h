#pragma once
// What lies behind the hand: textures, gradients, clutter, and skin-coloured things that
// are not the hand asked for (faces, arms). Sizes are measured against a unit, the size of
// the hand in pixels, so that a texture is as hard at any zoom.

#include <optional>
#include <string>

#include "Canvas.h"
#include "HandRandom.h"
#include "HandRenderer.h"

namespace handgen {

enum class BackgroundKind { Flat, Gradient, Noise, Stripes, Checker, Clutter };
constexpr int kBackgroundKindCount = 6;
const char* backgroundName(BackgroundKind kind);  // "flat", "gradient", "noise", "stripes", "checker", "clutter"
std::optional<BackgroundKind> backgroundFromName(const std::string& name);

// any colour, or with skinLike a skin tone under some light
Rgb randomColour(HandRandom& random, bool skinLike);

// fills the whole canvas; skinShare is the chance of each colour being skin-like;
// clutterCount shapes for the clutter kind
void drawBackground(Canvas& canvas, BackgroundKind kind, float unit, float skinShare, int clutterCount,
                    HandRandom& random);

// a face-like oval: skin, hair, eyes and mouth, width pixels wide, turned by angle degrees
void drawFace(Canvas& canvas, float cx, float cy, float width, float angle, Rgb skin, const Lighting& light,
              HandRandom& random);

}  // namespace handgen
