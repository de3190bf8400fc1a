#include "HandScene.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "frame_json.h"

namespace handgen {

namespace {

constexpr float kDegree = 3.14159265f / 180;

struct RangeField {
    const char* name;
    Range Variation::*member;
};
struct ShareField {
    const char* name;
    float Variation::*member;
};
const RangeField kRanges[] = {
    {"rotation", &Variation::rotation},   {"scale", &Variation::scale},
    {"shift", &Variation::shift},         {"yaw", &Variation::yaw},
    {"pitch", &Variation::pitch},         {"spread", &Variation::spread},
    {"jointNoise", &Variation::jointNoise}, {"palmAspect", &Variation::palmAspect},
    {"fingerLength", &Variation::fingerLength}, {"thickness", &Variation::thickness},
    {"skinTone", &Variation::skinTone},   {"redness", &Variation::redness},
    {"ambient", &Variation::ambient},     {"diffuse", &Variation::diffuse},
    {"exposure", &Variation::exposure},   {"gradient", &Variation::gradient},
    {"noise", &Variation::noise},         {"blur", &Variation::blur},
    {"clutter", &Variation::clutter},
};
const ShareField kShares[] = {
    {"leftShare", &Variation::leftShare},   {"sleeveShare", &Variation::sleeveShare},
    {"skinBackgroundShare", &Variation::skinBackgroundShare}, {"faceShare", &Variation::faceShare},
    {"armShare", &Variation::armShare},     {"otherHandShare", &Variation::otherHandShare},
};

bool parseNumber(const std::string& text, float& value) {
    char* end = nullptr;
    value = std::strtof(text.c_str(), &end);
    return !text.empty() && end == text.c_str() + text.size() && std::isfinite(value);
}

// the shortest text that reads back as the same float
std::string number(float value) { return jsonNumber(value); }

}  // namespace

bool setVariation(Variation& variation, const std::string& assignment, std::string& error) {
    const size_t equals = assignment.find('=');
    if (equals == std::string::npos) {
        error = "expected name=value in \"" + assignment + "\"";
        return false;
    }
    const std::string name = assignment.substr(0, equals), value = assignment.substr(equals + 1);
    if (name == "backgrounds") {
        std::array<float, kBackgroundKindCount> weights{};
        size_t from = 0;
        while (from <= value.size()) {
            const size_t comma = std::min(value.find(',', from), value.size());
            const std::string item = value.substr(from, comma - from);
            const size_t colon = item.find(':');
            const std::string kind = item.substr(0, colon);
            const auto parsed = backgroundFromName(kind);
            if (!parsed) {
                error = "unknown background \"" + kind + "\" (flat, gradient, noise, stripes, checker, clutter)";
                return false;
            }
            float weight = 1;
            if (colon != std::string::npos && (!parseNumber(item.substr(colon + 1), weight) || weight <= 0)) {
                error = "bad weight for background " + kind + ": \"" + item.substr(colon + 1) + "\"";
                return false;
            }
            weights[static_cast<int>(*parsed)] = weight;
            from = comma + 1;
        }
        variation.backgrounds = weights;
        return true;
    }
    for (const RangeField& field : kRanges) {
        if (name != field.name) continue;
        const size_t comma = value.find(',');
        Range range;
        const bool ok = comma == std::string::npos
                            ? parseNumber(value, range.low) && parseNumber(value, range.high)
                            : parseNumber(value.substr(0, comma), range.low) &&
                                  parseNumber(value.substr(comma + 1), range.high);
        if (!ok || range.low > range.high) {
            error = "bad range for " + name + ": \"" + value + "\" (low,high or one value)";
            return false;
        }
        variation.*field.member = range;
        return true;
    }
    for (const ShareField& field : kShares) {
        if (name != field.name) continue;
        float share;
        if (!parseNumber(value, share) || share < 0 || share > 1) {
            error = "bad share for " + name + ": \"" + value + "\" (0 .. 1)";
            return false;
        }
        variation.*field.member = share;
        return true;
    }
    error = "unknown setting \"" + name + "\"";
    return false;
}

std::string describeVariation(const Variation& variation) {
    std::string out;
    for (const RangeField& field : kRanges) {
        const Range& r = variation.*field.member;
        out += std::string(field.name) + "=" + number(r.low) + "," + number(r.high) + "\n";
    }
    for (const ShareField& field : kShares) out += std::string(field.name) + "=" + number(variation.*field.member) + "\n";
    out += "backgrounds=";
    bool first = true;
    for (int i = 0; i < kBackgroundKindCount; ++i) {
        if (variation.backgrounds[i] <= 0) continue;
        out += (first ? "" : ",") + std::string(backgroundName(static_cast<BackgroundKind>(i))) + ":" +
               number(variation.backgrounds[i]);
        first = false;
    }
    return out + "\n";
}

HandPose variedPose(Gesture gesture, const Variation& variation, HandRandom& random) {
    HandPose pose = gesturePose(gesture);
    const float spread = variation.spread.draw(random);
    const float noise = variation.jointNoise.draw(random);
    for (FingerPose& finger : pose.fingers) {
        finger.spread = finger.spread * spread + 0.5f * noise * static_cast<float>(random.normal());
        for (float& flex : finger.flex) flex += noise * static_cast<float>(random.normal());
        // a straight finger bends back only a little
        finger.flex[0] = std::max(finger.flex[0], -12.f);
        finger.flex[1] = std::max(finger.flex[1], -3.f);
        finger.flex[2] = std::max(finger.flex[2], -5.f);
    }
    for (int j = 0; j < 3; ++j) {
        pose.thumb.azimuth[j] += 0.5f * noise * static_cast<float>(random.normal());
        pose.thumb.elevation[j] += 0.5f * noise * static_cast<float>(random.normal());
    }
    pose.yaw += variation.yaw.draw(random);
    pose.pitch += variation.pitch.draw(random);
    return pose;
}

HandDraw randomHand(Gesture gesture, const Variation& variation, HandRandom& random) {
    HandDraw hand;
    hand.pose = variedPose(gesture, variation, random);
    const float aspect = std::sqrt(variation.palmAspect.draw(random));
    hand.build.palmWidth = aspect;
    hand.build.palmLength = 1 / aspect;
    hand.build.fingerLength = variation.fingerLength.draw(random);
    hand.build.thumbLength = hand.build.fingerLength * static_cast<float>(random.uniform(0.95, 1.05));
    hand.build.thickness = variation.thickness.draw(random);
    hand.build.sleeve = random.chance(variation.sleeveShare) ? static_cast<float>(random.uniform(15, 120)) : -1.f;
    hand.side = random.chance(variation.leftShare) ? HandSide::Left : HandSide::Right;
    SkinLook& look = hand.look;
    look.skin = skinTone(variation.skinTone.draw(random), variation.redness.draw(random));
    look.nail = mix(look.skin, Rgb{0.96f, 0.86f, 0.86f}, 0.5f);
    look.sleeve = randomColour(random, false);
    look.mottle = static_cast<float>(random.uniform(0.02, 0.08));
    look.creases = static_cast<float>(random.uniform(0.6, 1));
    look.palmLines = static_cast<float>(random.uniform(0.3, 1));
    look.seed = random.raw();
    return hand;
}

Lighting randomLighting(const Variation& variation, HandRandom& random) {
    Lighting light;
    const float azimuth = static_cast<float>(random.uniform(0, 360)) * kDegree;
    const float elevation = static_cast<float>(random.uniform(25, 80)) * kDegree;
    light.toLight = {std::cos(elevation) * std::cos(azimuth), std::cos(elevation) * std::sin(azimuth), std::sin(elevation)};
    light.ambient = variation.ambient.draw(random);
    light.diffuse = variation.diffuse.draw(random);
    light.specular = static_cast<float>(random.uniform(0, 0.1));
    const float warm = static_cast<float>(random.uniform(-0.08, 0.1));
    light.tint = {1 + warm, 1, 1 - warm};
    return light;
}

ScreenHand drawHand(Canvas& canvas, const HandDraw& hand, const Lighting& light, float x, float y, float height,
                    float angle, int supersample) {
    const UprightHand upright = buildHand(hand.pose, hand.build, hand.side);
    const float scale = height / std::max(1e-3f, upright.top - upright.bottom);
    const ScreenHand screen = placeHand(upright, Placement{x, y, scale, angle});
    HandLayer layer;
    renderHand(screen, hand.look, light, supersample, canvas.width(), canvas.height(), layer);
    composite(layer, canvas);
    return screen;
}

void drawScene(Canvas& canvas, float unit, const Variation& variation, const Lighting& light,
               std::optional<Gesture> avoid, bool hands, int supersample, HandRandom& random) {
    float total = 0;
    for (float w : variation.backgrounds) total += std::max(0.f, w);
    float pick = static_cast<float>(random.uniform()) * total;
    int kind = 0;
    for (; kind < kBackgroundKindCount - 1; ++kind) {
        pick -= std::max(0.f, variation.backgrounds[kind]);
        if (pick < 0 && variation.backgrounds[kind] > 0) break;
    }
    // rounding may walk past the last kind with a weight
    while (kind > 0 && variation.backgrounds[kind] <= 0) --kind;
    const int clutter = static_cast<int>(variation.clutter.draw(random));
    drawBackground(canvas, static_cast<BackgroundKind>(kind), unit, variation.skinBackgroundShare, clutter, random);

    const float w = static_cast<float>(canvas.width()), h = static_cast<float>(canvas.height());
    if (random.chance(variation.faceShare)) {
        const Rgb skin = skinTone(variation.skinTone.draw(random), variation.redness.draw(random));
        drawFace(canvas, static_cast<float>(random.uniform(0, w)), static_cast<float>(random.uniform(0, h)),
                 unit * static_cast<float>(random.uniform(0.8, 2.0)), static_cast<float>(random.uniform(-25, 25)), skin,
                 light, random);
    }
    if (random.chance(variation.armShare)) {
        // a bare arm across the picture, a forearm with no hand in view
        ScreenHand arm;
        arm.scale = unit / 100;
        const float angle = static_cast<float>(random.uniform(0, 360)) * kDegree;
        const float cx = static_cast<float>(random.uniform(0, w)), cy = static_cast<float>(random.uniform(0, h));
        const float reach = unit * 3, radius = unit * static_cast<float>(random.uniform(0.12, 0.25));
        Bone bone;
        bone.a = {cx - std::cos(angle) * reach, cy - std::sin(angle) * reach, 0};
        bone.b = {cx + std::cos(angle) * reach, cy + std::sin(angle) * reach, 0};
        bone.radius = radius;
        bone.part = BonePart::Forearm;
        bone.digit = 5;
        arm.geometry.bones.push_back(bone);
        SkinLook look;
        look.skin = skinTone(variation.skinTone.draw(random), variation.redness.draw(random));
        look.seed = random.raw();
        HandLayer layer;
        renderHand(arm, look, light, 1, canvas.width(), canvas.height(), layer);
        composite(layer, canvas);
    }
    if (hands && random.chance(variation.otherHandShare)) {
        std::vector<Gesture> others;
        for (int g = 0; g < kGestureCount; ++g)
            if (!avoid || static_cast<Gesture>(g) != *avoid) others.push_back(static_cast<Gesture>(g));
        const Gesture other = others[random.below(static_cast<int>(others.size()))];
        const HandDraw hand = randomHand(other, variation, random);
        drawHand(canvas, hand, light, static_cast<float>(random.uniform(0, w)), static_cast<float>(random.uniform(0, h)),
                 unit * static_cast<float>(random.uniform(0.6, 1.4)), static_cast<float>(random.uniform(-90, 90)),
                 supersample);
    }
}

Finish randomFinish(const Variation& variation, HandRandom& random) {
    Finish finish;
    finish.gradient = variation.gradient.draw(random);
    finish.gradientAngle = static_cast<float>(random.uniform(0, 360));
    finish.exposure = variation.exposure.draw(random);
    finish.blur = variation.blur.draw(random);
    finish.noise = variation.noise.draw(random);
    finish.chroma = static_cast<float>(random.uniform(0.1, 0.5));
    return finish;
}

void applyFinish(Canvas& canvas, const Finish& finish, HandRandom& noise) {
    lightGradient(canvas, finish.gradient, finish.gradientAngle, finish.exposure);
    gaussianBlur(canvas, finish.blur);
    sensorNoise(canvas, finish.noise, finish.chroma, noise);
}

}  // namespace handgen
