#pragma once
// Every way a generated picture varies, as ranges drawn per picture, and the pieces that
// draw a scene from them: a hand of some gesture, the light, the background with its
// distractors, and the camera's finish (light falloff, blur, noise). Held-out sets use
// other ranges than training sets (handgen's --set).

#include <array>
#include <optional>
#include <string>
#include <vector>

#include "Backgrounds.h"
#include "HandModel.h"
#include "HandRandom.h"
#include "HandRenderer.h"

namespace handgen {

struct Range {
    float low = 0, high = 0;
    float draw(HandRandom& random) const { return static_cast<float>(random.uniform(low, high)); }
};

struct Variation {
    // the hand and how it is held
    Range rotation{-12, 12};        // degrees added to the asked angle
    Range scale{0.93f, 1.07f};      // samples: factor on the size that fits the object rectangle
    Range shift{-0.05f, 0.05f};     // samples: offset of the centre, in object rectangle sizes
    Range yaw{-20, 20};             // degrees about the fingers' axis
    Range pitch{-15, 15};           // degrees about the knuckles' axis
    Range spread{0.6f, 1.4f};       // factor on the fingers' spread
    Range jointNoise{0, 8};         // degrees: the spread of each joint's random bend
    Range palmAspect{0.9f, 1.1f};   // the palm's width over its length
    Range fingerLength{0.9f, 1.1f}; // factor on finger and thumb lengths
    Range thickness{0.88f, 1.12f};  // factor on finger, palm and arm radii
    float leftShare = 0.5f;         // chance of a left hand
    float sleeveShare = 0.4f;       // chance of a sleeve on the forearm
    // the skin
    Range skinTone{0, 1};   // 0 lightest .. 1 darkest
    Range redness{-1, 1};   // yellow .. pink
    // light and camera
    Range ambient{0.3f, 0.65f};
    Range diffuse{0.3f, 0.7f};
    Range exposure{0.75f, 1.2f};
    Range gradient{0, 0.6f};  // brightness falloff across the picture
    Range noise{1, 6};        // sensor noise sigma, 8-bit levels
    Range blur{0, 0.7f};      // Gaussian sigma, pixels
    // what is behind
    std::array<float, kBackgroundKindCount> backgrounds{1, 1, 1.5f, 1, 1, 2};  // weights of the kinds
    Range clutter{3, 16};              // shapes in a cluttered background
    float skinBackgroundShare = 0.12f; // chance of each background colour being skin-like
    float faceShare = 0.12f;           // chance of a face in a picture
    float armShare = 0.15f;            // chance of a bare arm
    float otherHandShare = 0.12f;      // chance of a hand showing another gesture
};

// "name=low,high", "name=value" (both ends), or "backgrounds=noise,stripes:2" (those kinds only,
// weighted 1 unless given); false with a message for an unknown name or a bad value
bool setVariation(Variation& variation, const std::string& assignment, std::string& error);
// one "name=low,high" line per setting, which setVariation reads back
std::string describeVariation(const Variation& variation);

// a person's hand showing a gesture: the pose varied, the build, the side and the skin
struct HandDraw {
    HandPose pose;
    HandBuild build;
    HandSide side = HandSide::Right;
    SkinLook look;
};
HandPose variedPose(Gesture gesture, const Variation& variation, HandRandom& random);
HandDraw randomHand(Gesture gesture, const Variation& variation, HandRandom& random);
Lighting randomLighting(const Variation& variation, HandRandom& random);

// The background and its distractors over the whole canvas. unit is the hand's size in
// pixels; no distractor hand shows avoid; hands false leaves distractor hands out.
void drawScene(Canvas& canvas, float unit, const Variation& variation, const Lighting& light,
               std::optional<Gesture> avoid, bool hands, int supersample, HandRandom& random);

// draws a hand with its reference box's centre at (x, y), box height in pixels
ScreenHand drawHand(Canvas& canvas, const HandDraw& hand, const Lighting& light, float x, float y, float height,
                    float angle, int supersample);

struct Finish {
    float gradient = 0, gradientAngle = 0, exposure = 1, blur = 0, noise = 0, chroma = 0.3f;
};
Finish randomFinish(const Variation& variation, HandRandom& random);
void applyFinish(Canvas& canvas, const Finish& finish, HandRandom& noise);

}  // namespace handgen
