#pragma once
// An articulated hand: a palm slab, four fingers of three bones, a thumb of three bones and
// a forearm, all swept spheres so that any view of them is drawn exactly by an orthographic
// renderer. Flexion turns a finger toward the camera (the palm faces it), so a curled finger
// shows foreshortened, in front of the palm; the view angles (roll, yaw, pitch) turn the
// whole hand out of the image plane.
//
// Frames: the hand is built in millimetres with x to the right, y up the fingers and z
// toward the camera, as a RIGHT hand with its palm to the camera (thumb on the image's
// right). A LEFT hand is its mirror image. On screen, x is right, y down, z toward the
// camera, and angles are degrees counter-clockwise as seen (+90 turns the fingers to the
// left), as a ring's quarter turn does.

#include <array>
#include <cmath>
#include <optional>
#include <string>
#include <vector>

namespace handgen {

struct Vec3 {
    float x = 0, y = 0, z = 0;
};
inline Vec3 operator+(Vec3 a, Vec3 b) { return {a.x + b.x, a.y + b.y, a.z + b.z}; }
inline Vec3 operator-(Vec3 a, Vec3 b) { return {a.x - b.x, a.y - b.y, a.z - b.z}; }
inline Vec3 operator*(Vec3 a, float s) { return {a.x * s, a.y * s, a.z * s}; }
inline float dot(Vec3 a, Vec3 b) { return a.x * b.x + a.y * b.y + a.z * b.z; }
inline float length(Vec3 a) { return std::sqrt(dot(a, a)); }
inline Vec3 normalized(Vec3 a) {
    const float l = length(a);
    return l > 0 ? a * (1 / l) : a;
}

enum class Gesture { Fist, ThumbUp, Victory, Pointer, Palm, Heart };
constexpr int kGestureCount = 6;
// the engine's names: "fist", "thumbUp", "victory", "pointer", "palm", "heart"
const char* gestureName(Gesture gesture);
std::optional<Gesture> gestureFromName(const std::string& name);

enum class HandSide { Right, Left };
const char* sideName(HandSide side);  // "RIGHT", "LEFT"

// Degrees. spread turns a finger in the palm plane (positive toward the thumb); flex bends
// its three joints toward the palm.
struct FingerPose {
    float spread = 0;
    std::array<float, 3> flex{};
};
// Each thumb bone's direction: azimuth in the palm plane from the fingers' direction toward
// the thumb side, elevation toward the camera.
struct ThumbPose {
    std::array<float, 3> azimuth{}, elevation{};
};
struct HandPose {
    std::array<FingerPose, 4> fingers;  // index, middle, ring, little
    ThumbPose thumb;
    float roll = 0, yaw = 0, pitch = 0;  // how the hand is held to the camera, degrees
    float wrist = 0;                     // the forearm's bend in the palm plane, degrees
};
HandPose gesturePose(Gesture gesture);
HandPose blendPoses(const HandPose& a, const HandPose& b, float t);

// One person's hand, as factors around 1, and what is drawn with it.
struct HandBuild {
    float palmWidth = 1, palmLength = 1, fingerLength = 1, thickness = 1, thumbLength = 1;
    bool forearm = true;
    float sleeve = -1;  // distance from the wrist where a sleeve starts, millimetres; < 0: bare arm
};

enum class BonePart { Finger, Thumb, Forearm, Sleeve };
struct Bone {
    Vec3 a, b;
    float radius = 0;
    BonePart part = BonePart::Finger;
    int digit = 0;    // 0-3 the fingers from the index, 4 the thumb, 5 the arm
    int segment = 0;  // 0 at the hand, 2 the fingertip's bone
    Vec3 dorsal;      // the side of the nail, a unit vector
};

// A hand in some frame: bones, and the palm as a convex polygon swept by a ball.
struct HandGeometry {
    std::vector<Bone> bones;
    std::vector<Vec3> palm;
    float palmRadius = 0;
    // the palm's own axes (a millimetre long each) for its lines, and its palm-side normal
    Vec3 palmOrigin, palmU, palmV, palmNormal;
    std::array<Vec3, 5> tips;  // index, middle, ring, little, thumb
};

// The reference box of every gesture is the bounding box of the hand without the forearm
// (palm, fingers and thumb) in the gesture's upright view, before the in-plane angle.
struct UprightHand {
    HandGeometry geometry;  // millimetres, y up
    float left = 0, bottom = 0, right = 0, top = 0;
};
UprightHand buildHand(const HandPose& pose, const HandBuild& build, HandSide side);

struct Point {
    float x = 0, y = 0;
};

// The reference box on screen: centre, size and angle (degrees, counter-clockwise).
struct OrientedBox {
    float cx = 0, cy = 0, width = 0, height = 0, angle = 0;
    std::array<Point, 4> corners() const;
    // the axis-aligned bounds of the corners: left, top, right, bottom
    std::array<float, 4> bounds() const;
};

// Where the hand goes: the reference box's centre in pixels, pixels per millimetre, angle.
struct Placement {
    float x = 0, y = 0, scale = 1, angle = 0;
};

struct ScreenHand {
    HandGeometry geometry;  // pixels, y down, z toward the camera (also in pixels)
    OrientedBox box;
    float scale = 1;
};
ScreenHand placeHand(const UprightHand& hand, const Placement& placement);

}  // namespace handgen
