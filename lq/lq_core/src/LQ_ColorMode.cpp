#include "LQ_ColorMode.h"

namespace LQ {

const char* const* EnumNames<ColorMode>::names() {
    static const char* const table[] = {"COLOR_MODE_UNDEFINED",
                                        "COLOR_MODE_MONO",
                                        "COLOR_MODE_MONO16",
                                        "COLOR_MODE_DEPTH",
                                        "COLOR_MODE_GRADIENT",
                                        "COLOR_MODE_RMCT",
                                        "COLOR_MODE_BGR",
                                        "COLOR_MODE_RGB",
                                        "COLOR_MODE_YUV",
                                        "COLOR_MODE_RGBA",
                                        "COLOR_MODE_INTEGRAL",
                                        "COLOR_MODE_FLOAT",
                                        "COLOR_MODE_INTEGRAL_HOG_UNSIGNED6",
                                        "COLOR_MODE_INTEGRAL_HOG_SIGNED12",
                                        "COLOR_MODE_FLOAT2",
                                        "COLOR_MODE_USHORT2",
                                        "COLOR_MODE_END"};
    return table;
}

int depth(ColorMode colorMode) {
    static const int depths[COLOR_MODE_END] = {0, 1, 2, 2, 2, 1, 3, 3, 3, 4, 4, 4, 28, 52, 8, 4};
    LQ_ASSERT_MSG(colorMode >= 0 && colorMode < COLOR_MODE_END, "Invalid color mode: " << colorMode);
    return depths[colorMode];
}

bool isColor(ColorMode colorMode) { return colorMode >= COLOR_MODE_BGR && colorMode <= COLOR_MODE_RGBA; }

std::ostream& operator<<(std::ostream& stream, ColorMode colorMode) {
    const char* name = enumName(colorMode);
    if (name) return stream << name;
    return stream << static_cast<int>(colorMode);
}

std::istream& operator>>(std::istream& stream, ColorMode& colorMode) { return readEnum(stream, colorMode); }

}  // namespace LQ
