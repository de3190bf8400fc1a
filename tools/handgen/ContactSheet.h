#pragma once
// A grid of generated positives, one row per gesture, for people to look at: in colour at
// a cell's size, or as the mono windows a trainer gets, enlarged.

#include <cstdint>
#include <string>
#include <vector>

#include "HandSamples.h"

namespace handgen {

struct SheetSetup {
    std::vector<Gesture> rows;  // empty: all six
    int columns = 10;
    int cell = 96;              // pixels per cell side
    std::uint64_t seed = 1;
    Variation variation;
    bool mono = false;          // the trainer's windows (of `window`) instead of colour cells
    SampleWindow window;
};

// interleaved RGB; a left margin holds the gestures' names where OpenCV draws them
std::vector<std::uint8_t> makeSheet(const SheetSetup& setup, int& width, int& height);
// PNG (with OpenCV) or binary PPM by the path's extension; throws std::runtime_error
void writeImage(const std::string& path, const std::vector<std::uint8_t>& rgb, int width, int height);

}  // namespace handgen
