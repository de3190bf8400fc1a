#pragma once
// Clips: a hand enters the frame, moves, turns, changes from one gesture to another and
// leaves, over and over with pauses between, on a background that stays; with the ground
// truth of every frame.
//
// Ground truth per frame: the hand is "present" while any of its reference box is inside the
// frame. Its rectangle is the axis-aligned bounds of the part of the (turned) box inside the
// frame, so it never leaves the frame. It is labelled with its gesture only when at least
// minVisible of the box is inside and it is not between two shapes; otherwise "none".

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Canvas.h"
#include "HandModel.h"
#include "HandScene.h"

namespace handgen {

struct ClipSetup {
    int width = 1280, height = 720, frames = 300, fps = 30;
    std::uint64_t seed = 1;
    Variation variation;
    std::vector<Gesture> gestures;  // those shown; empty: all
    Range handSize{0.25f, 0.5f};    // the reference box's height over the frame's
    Range gap{5, 40};               // frames without a hand between appearances
    Range duration{70, 180};        // frames of one appearance, entry to exit
    Range turn{0, 20};              // degrees the hand sways while it is in view
    int transition = 8;             // frames to change from one gesture to the next
    float minVisible = 0.75f;
    int supersample = 2;
};

struct FrameTruth {
    bool present = false;
    std::optional<Gesture> gesture;
    std::array<float, 4> rect{};  // left, top, right, bottom
    float angle = 0;
    float visible = 0;  // the share of the reference box inside the frame
    HandSide side = HandSide::Right;
    std::optional<Point> fingertip;  // the index fingertip of a pointer, when inside the frame
};

class ClipMaker {
public:
    explicit ClipMaker(const ClipSetup& setup);
    int frames() const { return setup_.frames; }
    FrameTruth truth(int frame) const;
    // interleaved 8-bit RGB, width x height
    void render(int frame, std::vector<std::uint8_t>& rgb) const;

private:
    struct Appearance {
        int start = 0, end = 0;
        HandDraw hand;
        std::vector<HandPose> poses;
        std::vector<Gesture> shapes;
        std::vector<int> changes;  // frames (from start) where the change to the next shape begins
        std::vector<Point> path;   // through-points, the first and last outside the frame
        float boxHeight = 0, angle = 0, sway = 0, swayPeriod = 1, swayPhase = 0, zoom = 0, zoomPeriod = 1;
    };
    struct HandState {
        const Appearance* appearance = nullptr;
        HandPose pose;
        std::optional<Gesture> shape;  // none between two shapes
        float x = 0, y = 0, boxHeight = 0, angle = 0;
    };
    HandState state(int frame) const;
    ScreenHand place(const HandState& state) const;

    ClipSetup setup_;
    Lighting light_;
    Finish finish_;
    Canvas background_;
    std::vector<Appearance> appearances_;
};

// Writes the clip as Y4M when videoPath ends in ".y4m", else as raw NV21 frames, and its
// truth as one JSON line per frame in the host program's form; frames are made by `threads`
// workers.
void writeClip(const ClipSetup& setup, const std::string& videoPath, const std::string& truthPath, int threads);
// {"frame":N,"gestures":[...]}: empty when no hand is present
std::string truthJson(int frame, const FrameTruth& truth);

// The part of a convex polygon inside [0, width] x [0, height], and a polygon's area.
std::vector<Point> clipToFrame(const std::vector<Point>& polygon, float width, float height);
float polygonArea(const std::vector<Point>& polygon);

}  // namespace handgen
