#pragma once
// Depth samples as colours: a ramp from red over green to blue between two limits.

#include "LQ_Image.h"

namespace LQ {

// black at or outside the limits
void pixelToRGB(unsigned short value, unsigned char& r, unsigned char& g, unsigned char& b, unsigned short minDepth,
                unsigned short maxDepth);
void depthToRgb(const Image& source, Image& target, unsigned short minDepth, unsigned short maxDepth,
                const BaseRect<int>& rect);
void depthToBgr(const Image& source, Image& target, unsigned short minDepth, unsigned short maxDepth,
                const BaseRect<int>& rect);
// (255 / (max - min)) (value - min), truncated, stored without clamping
void depthToMono(const Image& source, Image& target, unsigned short minDepth, unsigned short maxDepth,
                 const BaseRect<int>& rect);

}  // namespace LQ
