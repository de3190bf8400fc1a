#pragma once
// Stand-in models made from glyphs, for the tests and the sample run until trained
// tables land: every ring the engines ask for, built from a glyph cascade, and the six
// networks and two palm verifiers, each a one-layer network whose answer is fixed. Also
// NV21 frames with a glyph drawn upright for a given device turn.

#include <string>
#include <vector>

#include "Glyphs.h"
#include "LQ_Rect.h"

namespace glyphModels {

// what each network answers, whatever the patch
struct Answers {
    float fist = 1, thumbUp = 1, victory = 1, heart = 1;
    float pointer = 0.5f;  // passes the lax pointer verifier, fails the strict one
    float palm = 1;        // the rejectors' palm verifiers
    float sideWrong = 1;   // the pointer's hand-side network: 1 turns every hit's side
};
// Every verifier passes, no palm is seen and no side is turned: the chains run on their
// rings alone.
Answers permissiveAnswers();

// the palm ring fires on glyphs::kFrame, every other ring on glyphs::kF; throws
// std::runtime_error if a file can't be written
void write(const std::string& directory, const Answers& answers = Answers());

constexpr int kCameraWidth = 1280, kCameraHeight = 720;

// One camera frame. The engine halves it and turns the half by `turns` quarter turns
// (pixel (x, y) to column y, row W - 1 - x for one turn); a glyph given in that upright,
// half-size image is drawn so that the engine sees it upright.
class Frame {
public:
    explicit Frame(int turns);
    void draw(const glyphs::Glyph& glyph, float uprightLeft, float uprightTop, float scale);
    // the camera pixels that come from the upright rectangle, as a box
    LQ::BaseRect<float> cameraBox(const LQ::BaseRect<float>& upright) const;
    std::vector<unsigned char>& nv21() { return nv21_; }

private:
    void toUpright(int x, int y, float& u, float& v) const;
    int turns_;
    std::vector<unsigned char> nv21_;
};

}  // namespace glyphModels
