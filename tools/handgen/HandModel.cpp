#include "HandModel.h"

#include <algorithm>

namespace handgen {

namespace {

constexpr float kDegree = 3.14159265358979f / 180;

const char* const kGestureNames[kGestureCount] = {"fist", "thumbUp", "victory", "pointer", "palm", "heart"};

// An adult hand, millimetres, drawn as a right hand with its palm to the camera.
struct FingerAnatomy {
    float x, y;                    // the knuckle, inside the palm
    std::array<float, 3> lengths;  // proximal, middle, distal bones
    std::array<float, 3> radii;
};
const FingerAnatomy kFingers[4] = {
    {22, 37, {42, 24, 21}, {9.4f, 8.6f, 7.9f}},   // index
    {5, 40, {46, 28, 22}, {9.8f, 9.0f, 8.2f}},    // middle
    {-12, 38, {43, 27, 21}, {9.3f, 8.5f, 7.7f}},  // ring
    {-27, 32, {34, 21, 19}, {8.2f, 7.5f, 6.9f}},  // little
};
const Vec3 kThumbBase{17, -28, 0};
const std::array<float, 3> kThumbLengths{44, 32, 27};
const std::array<float, 3> kThumbRadii{13.5f, 11.0f, 10.0f};
// the palm's core; swept by kPalmRadius it reaches about x -44..42, y -50..50
const float kPalm[][2] = {{-31, 28}, {-14, 36}, {6, 38}, {24, 35}, {30, 22}, {29, -12},
                          {20, -34}, {0, -38},  {-21, -33}, {-31, -8}};
const float kPalmRadius = 12;
const Vec3 kWrist{0, -40, -13};
const float kForearmRadii[2] = {23, 28};

Vec3 direction(float azimuth, float elevation) {
    const float a = azimuth * kDegree, e = elevation * kDegree;
    return {std::sin(a) * std::cos(e), std::cos(a) * std::cos(e), std::sin(e)};
}

// a finger bent forward by the sum of its joints: turns from the fingers' direction toward z
FingerPose finger(float spread, float mcp, float pip, float dip) { return FingerPose{spread, {mcp, pip, dip}}; }
ThumbPose thumb(std::array<float, 3> azimuth, std::array<float, 3> elevation) { return ThumbPose{azimuth, elevation}; }

// rotation of the whole hand: yaw about y, then pitch about x, then roll about z
struct Rotation {
    float m[3][3];
    Vec3 operator()(Vec3 v) const {
        return {m[0][0] * v.x + m[0][1] * v.y + m[0][2] * v.z, m[1][0] * v.x + m[1][1] * v.y + m[1][2] * v.z,
                m[2][0] * v.x + m[2][1] * v.y + m[2][2] * v.z};
    }
};
Rotation viewRotation(float roll, float yaw, float pitch) {
    const float cr = std::cos(roll * kDegree), sr = std::sin(roll * kDegree);
    const float cy = std::cos(yaw * kDegree), sy = std::sin(yaw * kDegree);
    const float cp = std::cos(pitch * kDegree), sp = std::sin(pitch * kDegree);
    const float ry[3][3] = {{cy, 0, sy}, {0, 1, 0}, {-sy, 0, cy}};
    const float rx[3][3] = {{1, 0, 0}, {0, cp, -sp}, {0, sp, cp}};
    const float rz[3][3] = {{cr, -sr, 0}, {sr, cr, 0}, {0, 0, 1}};
    float xy[3][3] = {};
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j)
            for (int k = 0; k < 3; ++k) xy[i][j] += rx[i][k] * ry[k][j];
    Rotation r{};
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j)
            for (int k = 0; k < 3; ++k) r.m[i][j] += rz[i][k] * xy[k][j];
    return r;
}

}  // namespace

const char* gestureName(Gesture gesture) { return kGestureNames[static_cast<int>(gesture)]; }

std::optional<Gesture> gestureFromName(const std::string& name) {
    for (int i = 0; i < kGestureCount; ++i)
        if (name == kGestureNames[i]) return static_cast<Gesture>(i);
    return std::nullopt;
}

const char* sideName(HandSide side) { return side == HandSide::Right ? "RIGHT" : "LEFT"; }

HandPose gesturePose(Gesture gesture) {
    HandPose pose;
    // curled fingers converge a little toward the palm's middle
    const FingerPose curled[4] = {finger(4, 88, 100, 55), finger(1, 90, 102, 55), finger(-3, 90, 102, 55),
                                  finger(-8, 88, 100, 55)};
    switch (gesture) {
        case Gesture::Fist:
            pose.fingers = {curled[0], curled[1], curled[2], curled[3]};
            pose.thumb = thumb({18, -50, -95}, {35, 35, 5});
            break;
        case Gesture::ThumbUp:
            // a fist shown from its side, the knuckles toward the left of a right hand
            pose.fingers = {curled[0], curled[1], curled[2], curled[3]};
            pose.thumb = thumb({55, 84, 90}, {25, 6, 0});
            pose.roll = 90;
            pose.wrist = -30;
            break;
        case Gesture::Victory:
            pose.fingers = {finger(13, 0, 4, 4), finger(-9, 0, 4, 4), curled[2], curled[3]};
            pose.thumb = thumb({10, -45, -85}, {35, 40, 15});
            break;
        case Gesture::Pointer:
            pose.fingers = {finger(4, 0, 4, 4), curled[1], curled[2], curled[3]};
            pose.thumb = thumb({15, -42, -90}, {35, 35, 10});
            break;
        case Gesture::Palm:
            pose.fingers = {finger(12, 3, 5, 3), finger(2, 3, 5, 3), finger(-9, 3, 5, 3), finger(-21, 3, 5, 3)};
            pose.thumb = thumb({40, 58, 66}, {15, 5, 0});
            break;
        case Gesture::Heart:
            // the index leans toward the thumb, which crosses it: their tips make an X above the fist
            pose.fingers = {finger(40, 50, 40, 0), curled[1], curled[2], curled[3]};
            pose.thumb = thumb({12, -8, -45}, {30, 20, 5});
            break;
    }
    return pose;
}

HandPose blendPoses(const HandPose& a, const HandPose& b, float t) {
    auto mix = [t](float x, float y) { return x + (y - x) * t; };
    HandPose out;
    for (int f = 0; f < 4; ++f) {
        out.fingers[f].spread = mix(a.fingers[f].spread, b.fingers[f].spread);
        for (int j = 0; j < 3; ++j) out.fingers[f].flex[j] = mix(a.fingers[f].flex[j], b.fingers[f].flex[j]);
    }
    for (int j = 0; j < 3; ++j) {
        out.thumb.azimuth[j] = mix(a.thumb.azimuth[j], b.thumb.azimuth[j]);
        out.thumb.elevation[j] = mix(a.thumb.elevation[j], b.thumb.elevation[j]);
    }
    out.roll = mix(a.roll, b.roll);
    out.yaw = mix(a.yaw, b.yaw);
    out.pitch = mix(a.pitch, b.pitch);
    out.wrist = mix(a.wrist, b.wrist);
    return out;
}

UprightHand buildHand(const HandPose& pose, const HandBuild& build, HandSide side) {
    HandGeometry g;
    const float sx = build.palmWidth, sy = build.palmLength, thick = build.thickness;

    for (const auto& v : kPalm) g.palm.push_back({v[0] * sx, v[1] * sy, 0});
    g.palmRadius = kPalmRadius * thick;
    g.palmOrigin = {0, 0, 0};
    g.palmU = {1, 0, 0};
    g.palmV = {0, 1, 0};
    g.palmNormal = {0, 0, 1};

    for (int f = 0; f < 4; ++f) {
        const FingerAnatomy& anatomy = kFingers[f];
        const FingerPose& fp = pose.fingers[f];
        Vec3 at{anatomy.x * sx, anatomy.y * sy, 0};
        float bend = 0;
        for (int s = 0; s < 3; ++s) {
            bend += fp.flex[s];
            const float a = fp.spread * kDegree, e = bend * kDegree;
            const Vec3 d{std::sin(a) * std::cos(e), std::cos(a) * std::cos(e), std::sin(e)};
            const Vec3 dorsal{std::sin(a) * std::sin(e), std::cos(a) * std::sin(e), -std::cos(e)};
            const Vec3 next = at + d * (anatomy.lengths[s] * build.fingerLength);
            g.bones.push_back({at, next, anatomy.radii[s] * thick, BonePart::Finger, f, s, dorsal});
            at = next;
        }
        g.tips[f] = at;
    }

    Vec3 at{kThumbBase.x * sx, kThumbBase.y * sy, 0};
    for (int s = 0; s < 3; ++s) {
        const Vec3 d = direction(pose.thumb.azimuth[s], pose.thumb.elevation[s]);
        // the thumb's nail faces outward and back, square to the bone
        const Vec3 out{0.75f, 0, -0.66f};
        const Vec3 dorsal = normalized(out - d * dot(out, d));
        const Vec3 next = at + d * (kThumbLengths[s] * build.thumbLength);
        g.bones.push_back({at, next, kThumbRadii[s] * thick, BonePart::Thumb, 4, s, dorsal});
        at = next;
    }
    g.tips[4] = at;

    if (build.forearm) {
        const float w = pose.wrist * kDegree;
        const Vec3 down{std::sin(w), -std::cos(w), 0};
        const Vec3 wrist{kWrist.x * sx, kWrist.y * sy, kWrist.z * thick};
        // two bones widening toward the elbow, beyond the edge of any view
        const float stations[3] = {14, 100, 700};
        for (int s = 0; s < 2; ++s) {
            const float from = stations[s], to = stations[s + 1];
            const float r = kForearmRadii[s] * thick;
            const bool sleeved = build.sleeve >= 0 && build.sleeve < to;
            const float bare = sleeved ? std::max(from, build.sleeve) : to;
            if (bare > from)
                g.bones.push_back({wrist + down * from, wrist + down * bare, r, BonePart::Forearm, 5, s, {0, 0, -1}});
            if (sleeved)
                g.bones.push_back({wrist + down * bare, wrist + down * to, r + 4 * thick, BonePart::Sleeve, 5, s, {0, 0, -1}});
        }
    }

    const Rotation rotate = viewRotation(pose.roll, pose.yaw, pose.pitch);
    const float mirror = side == HandSide::Left ? -1.f : 1.f;
    auto view = [&](Vec3 v) {
        Vec3 r = rotate(v);
        r.x *= mirror;
        return r;
    };
    for (Bone& bone : g.bones) {
        bone.a = view(bone.a);
        bone.b = view(bone.b);
        bone.dorsal = view(bone.dorsal);
    }
    for (Vec3& v : g.palm) v = view(v);
    g.palmOrigin = view(g.palmOrigin);
    g.palmU = view(g.palmU);
    g.palmV = view(g.palmV);
    g.palmNormal = view(g.palmNormal);
    for (Vec3& tip : g.tips) tip = view(tip);

    UprightHand hand;
    hand.left = hand.bottom = 1e9f;
    hand.right = hand.top = -1e9f;
    auto grow = [&hand](Vec3 v, float r) {
        hand.left = std::min(hand.left, v.x - r);
        hand.right = std::max(hand.right, v.x + r);
        hand.bottom = std::min(hand.bottom, v.y - r);
        hand.top = std::max(hand.top, v.y + r);
    };
    for (const Vec3& v : g.palm) grow(v, g.palmRadius);
    for (const Bone& bone : g.bones) {
        if (bone.part == BonePart::Forearm || bone.part == BonePart::Sleeve) continue;
        grow(bone.a, bone.radius);
        grow(bone.b, bone.radius);
    }
    hand.geometry = std::move(g);
    return hand;
}

std::array<Point, 4> OrientedBox::corners() const {
    const float c = std::cos(angle * kDegree), s = std::sin(angle * kDegree);
    const float hx = width / 2, hy = height / 2;
    std::array<Point, 4> out;
    const float signs[4][2] = {{-1, 1}, {1, 1}, {1, -1}, {-1, -1}};
    for (int i = 0; i < 4; ++i) {
        // y up in the box's own frame, down on screen
        const float x = signs[i][0] * hx, y = signs[i][1] * hy;
        out[i] = {cx + c * x - s * y, cy - (s * x + c * y)};
    }
    return out;
}

std::array<float, 4> OrientedBox::bounds() const {
    std::array<float, 4> b{1e9f, 1e9f, -1e9f, -1e9f};
    for (const Point& p : corners()) {
        b[0] = std::min(b[0], p.x);
        b[1] = std::min(b[1], p.y);
        b[2] = std::max(b[2], p.x);
        b[3] = std::max(b[3], p.y);
    }
    return b;
}

ScreenHand placeHand(const UprightHand& hand, const Placement& placement) {
    const float c = std::cos(placement.angle * kDegree), s = std::sin(placement.angle * kDegree);
    const float k = placement.scale;
    const float bx = (hand.left + hand.right) / 2, by = (hand.bottom + hand.top) / 2;
    auto point = [&](Vec3 v) {
        const float x = v.x - bx, y = v.y - by;
        return Vec3{placement.x + k * (c * x - s * y), placement.y - k * (s * x + c * y), k * v.z};
    };
    auto turn = [&](Vec3 v) { return Vec3{c * v.x - s * v.y, -(s * v.x + c * v.y), v.z}; };

    ScreenHand out;
    out.scale = k;
    const HandGeometry& g = hand.geometry;
    HandGeometry& h = out.geometry;
    h = g;
    for (Bone& bone : h.bones) {
        bone.a = point(bone.a);
        bone.b = point(bone.b);
        bone.radius *= k;
        bone.dorsal = turn(bone.dorsal);
    }
    for (Vec3& v : h.palm) v = point(v);
    h.palmRadius *= k;
    h.palmOrigin = point(g.palmOrigin);
    h.palmU = turn(g.palmU) * k;
    h.palmV = turn(g.palmV) * k;
    h.palmNormal = turn(g.palmNormal);
    for (Vec3& tip : h.tips) tip = point(tip);
    out.box = {placement.x, placement.y, k * (hand.right - hand.left), k * (hand.top - hand.bottom), placement.angle};
    return out;
}

}  // namespace handgen
