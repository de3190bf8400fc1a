#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <vector>

#include "HandModel.h"
#include "HandRenderer.h"

using namespace handgen;

namespace {

constexpr int kSize = 240;
constexpr float kCentre = 120, kScale = 0.8f;  // pixels per millimetre

// the pixels the hand covers at least half of
struct Mask {
    std::vector<char> on = std::vector<char>(kSize * kSize, 0);
    int count = 0;
    bool at(int x, int y) const { return on[y * kSize + x] != 0; }
    // left, top, right, bottom pixel edges of the covered pixels
    std::array<float, 4> bounds() const {
        std::array<float, 4> b{1e9f, 1e9f, -1e9f, -1e9f};
        for (int y = 0; y < kSize; ++y)
            for (int x = 0; x < kSize; ++x)
                if (at(x, y)) {
                    b[0] = std::min(b[0], static_cast<float>(x));
                    b[1] = std::min(b[1], static_cast<float>(y));
                    b[2] = std::max(b[2], x + 1.f);
                    b[3] = std::max(b[3], y + 1.f);
                }
        return b;
    }
};

ScreenHand place(Gesture gesture, HandSide side, float angle) {
    HandBuild build;
    build.forearm = false;  // the reference box leaves the forearm out
    return placeHand(buildHand(gesturePose(gesture), build, side), Placement{kCentre, kCentre, kScale, angle});
}

Mask render(const ScreenHand& hand) {
    HandLayer layer;
    renderHand(hand, SkinLook{}, Lighting{}, 4, kSize, kSize, layer);
    Mask mask;
    for (int y = 0; y < layer.height; ++y)
        for (int x = 0; x < layer.width; ++x)
            if (layer.alpha[static_cast<size_t>(y) * layer.width + x] >= 0.5f) {
                mask.on[(layer.y0 + y) * kSize + layer.x0 + x] = 1;
                ++mask.count;
            }
    return mask;
}

// pixels where a and b (b mirrored about the vertical through kCentre when mirrored) differ
int differences(const Mask& a, const Mask& b, bool mirrored) {
    int n = 0;
    for (int y = 0; y < kSize; ++y)
        for (int x = 0; x < kSize; ++x) n += a.at(x, y) != b.at(mirrored ? kSize - 1 - x : x, y);
    return n;
}

}  // namespace

TEST(HandGeometry, EveryGestureFillsItsReferenceBox) {
    for (int g = 0; g < kGestureCount; ++g) {
        const char* name = gestureName(static_cast<Gesture>(g));
        for (float angle : {0.f, 35.f}) {
            const ScreenHand hand = place(static_cast<Gesture>(g), HandSide::Right, angle);
            const Mask mask = render(hand);
            EXPECT_NEAR(hand.box.cx, kCentre, 1e-3f);
            EXPECT_NEAR(hand.box.cy, kCentre, 1e-3f);
            // the covered pixels' extent along the box's own axes (x right, y up when upright)
            const float c = std::cos(angle * 3.14159265f / 180), s = std::sin(angle * 3.14159265f / 180);
            float extent[4] = {1e9f, 1e9f, -1e9f, -1e9f};
            for (int y = 0; y < kSize; ++y)
                for (int x = 0; x < kSize; ++x) {
                    if (!mask.at(x, y)) continue;
                    const float dx = x + 0.5f - kCentre, dy = y + 0.5f - kCentre;
                    const float u = c * dx - s * dy, v = -(s * dx + c * dy);
                    extent[0] = std::min(extent[0], u);
                    extent[1] = std::min(extent[1], v);
                    extent[2] = std::max(extent[2], u);
                    extent[3] = std::max(extent[3], v);
                }
            const float half[4] = {-hand.box.width / 2, -hand.box.height / 2, hand.box.width / 2, hand.box.height / 2};
            for (int i = 0; i < 4; ++i)
                EXPECT_NEAR(extent[i], half[i], 1.0f) << name << " angle " << angle << " side " << i;
            // a hand, not a dot in its box
            EXPECT_GT(mask.count, 0.3f * hand.box.width * hand.box.height) << name;
        }
    }
}

TEST(HandGeometry, PointerTurnsCounterClockwiseWithItsBox) {
    const ScreenHand upright = place(Gesture::Pointer, HandSide::Right, 0);
    // a pointer is taller than wide, its fingertip the highest point
    ASSERT_GT(upright.box.height, 1.5f * upright.box.width);
    const float tipRadius = 7.9f * kScale;
    struct Case {
        float angle;
        int side;  // the bound the fingertip makes: 0 left, 1 top, 2 right, 3 bottom
    };
    for (const Case& c : {Case{0, 1}, Case{90, 0}, Case{180, 3}, Case{-90, 2}}) {
        const ScreenHand hand = place(Gesture::Pointer, HandSide::Right, c.angle);
        const Mask mask = render(hand);
        const std::array<float, 4> drawn = mask.bounds(), box = hand.box.bounds();
        for (int i = 0; i < 4; ++i) EXPECT_NEAR(drawn[i], box[i], 1.0f) << "angle " << c.angle << " side " << i;
        const Vec3& tip = hand.geometry.tips[0];
        const float reach[4] = {tip.x - tipRadius, tip.y - tipRadius, tip.x + tipRadius, tip.y + tipRadius};
        EXPECT_NEAR(drawn[c.side], reach[c.side], 1.0f) << "angle " << c.angle;
        EXPECT_TRUE(mask.at(static_cast<int>(tip.x), static_cast<int>(tip.y))) << "angle " << c.angle;
        // a quarter turn swaps the box's sides on screen
        const bool turned = c.side == 0 || c.side == 2;
        EXPECT_NEAR(box[2] - box[0], turned ? upright.box.height : upright.box.width, 1e-2f) << "angle " << c.angle;
        EXPECT_NEAR(box[3] - box[1], turned ? upright.box.width : upright.box.height, 1e-2f) << "angle " << c.angle;
    }
}

TEST(HandGeometry, LeftHandIsTheRightHandMirrored) {
    const ScreenHand right = place(Gesture::Palm, HandSide::Right, 0), left = place(Gesture::Palm, HandSide::Left, 0);
    const Mask r = render(right), l = render(left);
    ASSERT_GT(r.count, 1000);
    // the same up to antialiasing at the outline, and not symmetric by itself
    EXPECT_LT(differences(r, l, true), r.count / 100);
    EXPECT_GT(differences(r, l, false), r.count / 20);
    // palm to the camera: a right thumb is on the image's right
    EXPECT_GT(right.geometry.tips[4].x, kCentre + 30);
    EXPECT_LT(left.geometry.tips[4].x, kCentre - 30);
    EXPECT_NEAR(left.geometry.tips[4].x, 2 * kCentre - right.geometry.tips[4].x, 1e-3f);

    // mirroring turns the angle around, as a ring's mirrored cascade does
    const Mask right30 = render(place(Gesture::Palm, HandSide::Right, 30));
    const Mask leftMinus30 = render(place(Gesture::Palm, HandSide::Left, -30));
    EXPECT_LT(differences(right30, leftMinus30, true), right30.count / 100);
    EXPECT_GT(differences(right30, render(place(Gesture::Palm, HandSide::Left, 30)), true), right30.count / 20);
}

TEST(HandGeometry, CurledFingersHideTheirLengthAndSitInFront) {
    // a fist's fingers are drawn foreshortened: the fist is much shorter than the palm pose
    const UprightHand fist = buildHand(gesturePose(Gesture::Fist), HandBuild{}, HandSide::Right);
    const UprightHand palm = buildHand(gesturePose(Gesture::Palm), HandBuild{}, HandSide::Right);
    EXPECT_LT(fist.top - fist.bottom, 0.6f * (palm.top - palm.bottom));
    // curled toward the camera, in front of the palm's face; straight ones stay near its plane
    const float palmFront = fist.geometry.palmRadius;
    for (const Bone& bone : fist.geometry.bones) {
        if (bone.part == BonePart::Finger && bone.segment == 1) {
            EXPECT_GT(bone.a.z - bone.radius, palmFront);
        }
    }
    for (const Bone& bone : palm.geometry.bones) {
        if (bone.part == BonePart::Finger) {
            EXPECT_LT(bone.b.z, palmFront);
        }
    }

    // blending halfway gives a hand between the two
    const UprightHand half = buildHand(blendPoses(gesturePose(Gesture::Fist), gesturePose(Gesture::Palm), 0.5f),
                                       HandBuild{}, HandSide::Right);
    EXPECT_GT(half.top, fist.top + 5);
    EXPECT_LT(half.top, palm.top - 5);
}
