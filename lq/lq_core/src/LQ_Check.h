#pragma once
// Preconditions on images, with the texts every kernel reports.

#include "LQ_Image.h"

namespace LQ {

void checkForCreation(const Image& image);
void checkColorMode(const Image& image, ColorMode colorMode);
void checkSize(const Image& image, const BaseSize<int>& size);
// colour mode first, then size
void checkImage(const Image& image, const BaseSize<int>& size, ColorMode colorMode);
void checkImages(const Image& a, const Image& b);

}  // namespace LQ
