#pragma once
// Training windows for a cascade ring: mono crops of a fixed size. The window says where
// the object lies in the window; a positive shows the gesture with its reference box fitted
// into the object rectangle (as large as fits, centred, the box's own aspect kept) and
// turned by the window's angle; negatives show backgrounds, other gestures fitted the same
// way, or the gesture itself badly placed.
//
// Window i of a set depends only on the set and i, so any number of workers make the same
// bytes.

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Canvas.h"
#include "HandModel.h"
#include "HandScene.h"

namespace handgen {

struct SampleWindow {
    int width = 24, height = 24;
    // the reference box's place in the window, pixels
    float objectX = 3, objectY = 3, objectWidth = 18, objectHeight = 18;
    float angle = 0;  // degrees counter-clockwise; the variation's rotation is added
};

enum class SampleKind { Positive, Background, OtherGesture, Misplaced };
const char* sampleKindName(SampleKind kind);  // "positive", "background", "otherGesture", "misplaced"

struct SampleLabel {
    SampleKind kind = SampleKind::Background;
    std::optional<Gesture> shown;  // the gesture in the window, if any
    HandSide side = HandSide::Right;
    OrientedBox box;               // its reference box, window pixels
};

struct SampleSet {
    Gesture gesture = Gesture::Fist;
    SampleWindow window;
    Variation variation;
    std::uint64_t seed = 1;
    bool negatives = false;
    // of negatives: shares of other gestures and of the misplaced gesture; the rest are
    // backgrounds with their distractors only
    float otherGestureShare = 0.35f, misplacedShare = 0.15f;
    int supersample = 4;
};

// window `index` of the set, in colour on a canvas of the window's size
SampleLabel renderSample(const SampleSet& set, std::uint64_t index, Canvas& canvas);
// 8-bit luma of the canvas, as the camera's Y plane would hold it
void toMono(const Canvas& canvas, std::uint8_t* mono);

// windows first .. first + count - 1 as mono bytes, one after another, made by `threads` workers
std::vector<std::uint8_t> generateSamples(const SampleSet& set, std::uint64_t first, int count, int threads,
                                          std::vector<SampleLabel>* labels = nullptr);

// The crop file: "HGCROPS1", then width, height and count as little-endian 32-bit numbers,
// then the windows' bytes, row by row, one window after another.
void writeCrops(const std::string& path, int width, int height, const std::vector<std::uint8_t>& windows);
// throws std::runtime_error naming the path when the file is not a whole crop file
std::vector<std::uint8_t> readCrops(const std::string& path, int& width, int& height);
void writePgm(const std::string& path, int width, int height, const std::uint8_t* pixels);
// {"index":..,"kind":..,"gesture":..,"side":..,"box":[cx,cy,w,h],"angle":..}
std::string labelJson(std::uint64_t index, const SampleLabel& label);

}  // namespace handgen
