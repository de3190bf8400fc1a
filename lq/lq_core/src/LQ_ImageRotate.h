#pragma once
// Rotations by quarter turns, transposition, mirrors, and free rotation with scale.

#include "LQ_Image.h"

namespace LQ {

// k quarter turns, taken modulo 4; 1: pixel (x, y) goes to column y, row W - 1 - x
void rotatePi4(const Image& source, Image& target, int quarterTurns);
void transpose(const Image& source, Image& target);
void flipLeftRight(const Image& source, Image& target);
void flipTopBottom(const Image& source, Image& target);

// Samples the source at M (target - targetCentre) + sourceCentre, M the rotation by angle
// times zoom; returns whether the target's frame maps entirely into the source. The
// target keeps its size; its mode must equal the source's.
bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoom,
                        const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);
bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoomX, float zoomY,
                        const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);
// the target's centre ((width - 1) / 2, (height - 1) / 2)
bool rotateAndZoomImage(const Image& source, Image& target, float angle, float zoomX, float zoomY,
                        const BasePoint<float>& sourceCentre);
bool rotateAndZoomImageNn(const Image& source, Image& target, float angle, float zoom,
                          const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);
bool rotateAndZoomImageAverage(const Image& source, Image& target, float angle, float zoom,
                               const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);

BaseSize<int> getRotatedFrameSize(const BaseSize<int>& size, float angle);
// m: the 2 x 2 matrix from target offsets to source offsets, row-major
bool allInside(const BaseSize<int>& sourceSize, const BaseSize<int>& targetSize, const float* m,
               const BasePoint<float>& sourceCentre, const BasePoint<float>& targetCentre);

}  // namespace LQ
