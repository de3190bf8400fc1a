#include "Glyphs.h"

#include <algorithm>
#include <cmath>

namespace glyphs {

const Glyph kF = {{{true, true, true, false}, {true, false, false, false}, {true, true, false, false},
                   {true, false, false, false}}};
const Glyph kFrame = {{{true, true, true, true}, {true, false, false, true}, {true, false, false, true},
                       {true, true, true, true}}};

bool Glyph::covers(float a, float b) const {
    if (a < 0 || b < 0 || a >= kWindow || b >= kWindow) return false;
    return cells[std::min(3, static_cast<int>(b / 6))][std::min(3, static_cast<int>(a / 6))];
}

Tables::Tables(bool tolerant) {
    const int brightFrom = tolerant ? 127 + 8 : 127 + 25, darkTo = tolerant ? 127 - 8 : 127 - 15;
    const LQ::schar pass = tolerant ? 2 : 1;
    for (int i = brightFrom; i < 256; ++i) bright[i] = pass;
    for (int i = 0; i <= darkTo; ++i) dark[i] = pass;
    // all 16 cells, or 15 and one miss
    threshold = tolerant ? 2 * 15 - 20 : 16;
}

CascadedClassifier cascade(const Glyph& glyph, Tables& tables, const char* name) {
    CascadedClassifier result;
    result.setMonoSize(LQ::BaseSize<int>(kWindow, kWindow));
    result.setName(name);
    WeakClassifierRmct any(LQ::BasePoint<int>(12, 12));
    any.setData(tables.any.data());
    StrongClassifier first;
    first.addRmctClassifier(any);
    first.setThreshold(1);
    StrongClassifier cells;
    for (int row = 0; row < 4; ++row)
        for (int col = 0; col < 4; ++col) {
            WeakClassifierHaar haar;
            haar.set(LQ::BaseRect<int>(0, 0, kWindow, kWindow),
                     LQ::BaseRect<int>(col * 6, row * 6, col * 6 + 6, row * 6 + 6));
            haar.setData(glyph.cells[row][col] ? tables.bright.data() : tables.dark.data());
            cells.addHaarClassifier(haar);
        }
    cells.setThreshold(tables.threshold);
    result.addStrongClassifier(first);
    result.addStrongClassifier(cells);
    return result;
}

void draw(const Glyph& glyph, LQ::Image& image, int ox, int oy, float s, Pose pose) {
    const int extent = static_cast<int>(std::ceil(kWindow * s));
    for (int y = std::max(0, oy); y < oy + extent && y < image.height(); ++y)
        for (int x = std::max(0, ox); x < ox + extent && x < image.width(); ++x) {
            float a = (x - ox + 0.5f) / s, b = (y - oy + 0.5f) / s;
            for (int k = 0; k < pose.turns; ++k) {  // undo the turns
                const float a0 = a;
                a = kWindow - b;
                b = a0;
            }
            if (pose.flip) a = kWindow - a;
            if (glyph.covers(a, b)) image.pixel(x, y)[0] = kBright;
        }
}

}  // namespace glyphs
