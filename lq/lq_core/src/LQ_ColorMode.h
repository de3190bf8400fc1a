#pragma once

#include <istream>
#include <ostream>

#include "LQ_Utils.h"

namespace LQ {

enum ColorMode {
    COLOR_MODE_UNDEFINED = 0,
    COLOR_MODE_MONO = 1,
    COLOR_MODE_MONO16 = 2,
    COLOR_MODE_DEPTH = 3,
    COLOR_MODE_GRADIENT = 4,
    COLOR_MODE_RMCT = 5,
    COLOR_MODE_BGR = 6,
    COLOR_MODE_RGB = 7,
    COLOR_MODE_YUV = 8,
    COLOR_MODE_RGBA = 9,
    COLOR_MODE_INTEGRAL = 10,
    COLOR_MODE_FLOAT = 11,
    COLOR_MODE_INTEGRAL_HOG_UNSIGNED6 = 12,
    COLOR_MODE_INTEGRAL_HOG_SIGNED12 = 13,
    COLOR_MODE_FLOAT2 = 14,
    COLOR_MODE_USHORT2 = 15,
    COLOR_MODE_END = 16
};

template <>
struct EnumNames<ColorMode> {
    static const char* typeName() { return "ColorMode"; }
    static const char* const* names();
    static int count() { return COLOR_MODE_END + 1; }
};

// bytes per pixel; fails for COLOR_MODE_END and beyond
int depth(ColorMode colorMode);
// BGR, RGB, YUV and RGBA
bool isColor(ColorMode colorMode);

// prints the enumerator's own name
std::ostream& operator<<(std::ostream& stream, ColorMode colorMode);
std::istream& operator>>(std::istream& stream, ColorMode& colorMode);

}  // namespace LQ
