#pragma once
// Moving pixels without changing them: parts of images, borders, channels.

#include <vector>

#include "LQ_Image.h"

namespace LQ {

// An all-zero rect copies the whole image (target = source); otherwise the target gets the
// source's size and mode and only rect is written, at the same place.
void copyImage(const Image& source, Image& target, const BaseRect<int>& rect);
// rect of the source to origin in the target; an uncreated target takes the source's size.
void copyImage(const Image& source, Image& target, const BaseRect<int>& rect, const BasePoint<int>& origin);
// The target has rect's size; what lies outside the source repeats the nearest edge pixel.
void copyImageBorder(const Image& source, Image& target, const BaseRect<int>& rect);

void splitChannels(const Image& source, std::vector<Image>& channels);
void mergeChannels(const std::vector<Image>& images, Image& target, ColorMode targetColorMode);

}  // namespace LQ
