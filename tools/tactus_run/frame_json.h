#pragma once
// The host program's output: one JSON line per frame with everything the C interface
// returned for it.

#include <array>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

struct GestureResult {
    std::string gesture;
    std::optional<std::array<float, 4>> rect;  // left, top, right, bottom
    std::optional<float> angle;
    std::optional<std::array<float, 2>> point;
    std::optional<std::array<float, 3>> point3d;
    // the engine's named parameters: "text", "side" and "key-ring" stand on their own,
    // any other key named by the key-ring goes under "parameters"; empty values are left out
    std::vector<std::pair<std::string, std::string>> parameters;
};

// A JSON string literal; bytes that are not UTF-8 become U+FFFD so the line stays valid.
std::string jsonString(std::string_view text);

// The shortest decimal form that reads back as the same float; null for NaN and infinities.
std::string jsonNumber(float value);

std::string frameJson(int frameIndex, const std::vector<GestureResult>& results);
std::string frameErrorJson(int frameIndex, std::string_view error);
