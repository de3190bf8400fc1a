#pragma once
// Hand-made cascades for tests: a glyph of bright cells on a 4 x 4 grid of 6-pixel cells,
// and a cascade that fires on it, so the machinery can be proved without trained tables.

#include <vector>

#include "CascadedClassifier.h"
#include "LQ_Image.h"

namespace glyphs {

constexpr int kWindow = 24;
constexpr unsigned char kDark = 40, kBright = 220;

struct Glyph {
    bool cells[4][4];
    // does the glyph cover the point (a, b) of its window, in window pixels
    bool covers(float a, float b) const;
};

// Neither a turn nor a mirror of F equals another, so each variant finds only its own pose.
extern const Glyph kF;
// A frame of bright cells with a dark middle: what the tests use as an open palm.
extern const Glyph kFrame;

// Tables outlive the cascades that point into them. Strict tables want every cell at a
// clear contrast; tolerant ones take a weaker contrast and one missed cell, so a glyph
// sampled off the grid or between zooms still yields the many hits a trained cascade gives.
struct Tables {
    std::vector<LQ::schar> any = std::vector<LQ::schar>(256, 1);
    std::vector<LQ::schar> bright = std::vector<LQ::schar>(256, -20);
    std::vector<LQ::schar> dark = std::vector<LQ::schar>(256, -20);
    int threshold = 16;
    explicit Tables(bool tolerant = false);
};

// A census stage that every window passes, then one Haar classifier per cell: the cell
// against the rest of the window, brighter or darker as the glyph says.
CascadedClassifier cascade(const Glyph& glyph, Tables& tables, const char* name);

struct Pose {
    bool flip;
    int turns;
};

// Draws the glyph as the cascade variant (flipped first, then turned) sees it, scaled by s
// with its window's top-left at (ox, oy), into the first channel.
void draw(const Glyph& glyph, LQ::Image& image, int ox, int oy, float s, Pose pose);

}  // namespace glyphs
