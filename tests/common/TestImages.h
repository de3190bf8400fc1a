#pragma once
// Images for kernel tests: random, ramps, and views with a wider stride, so that kernels
// that ignore the stride or read past a row show up.

#include <random>
#include <vector>

#include "LQ_Image.h"

// random bytes, the same for a seed
LQ::Image randomImage(int width, int height, LQ::ColorMode mode, unsigned seed);
// A view of width x height inside a larger random image: the stride is wider than a row,
// and the pixels around the view are there to be read by mistake.
LQ::Image randomView(int width, int height, LQ::ColorMode mode, unsigned seed, LQ::Image& parent);
// exact-size row buffers with random bytes, for row kernels under the sanitizer
std::vector<unsigned char> randomBytes(size_t count, std::mt19937& random);
bool samePixels(const LQ::Image& a, const LQ::Image& b);
