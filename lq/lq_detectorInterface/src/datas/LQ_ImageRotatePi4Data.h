#pragma once
// The parent turned by the quarter turns nearest to the engine's angle, read through a
// pointer so that the node follows the device orientation.

#include "LQ_ImageData.h"

namespace LQ {

class ImageRotatePi4Data : public ImageData {
public:
    ImageRotatePi4Data(const SharedPtr<ImageData>& parent, int* angle);

    // normalises the angle in place; 315..44 is 0, 45..134 is 1, 135..224 is 2, 225..314 is 3
    int quarterTurns() const;
    void compute(const BaseRect<int>& rect) override;
    void update() override;
    std::string name() const override { return derivedName("ImageRotatePi4Data"); }

    // the device's turn from an accelerometer reading
    static float getAngle(float x, float y, float z);

private:
    BaseSize<int> turnedSize() const;
    void init();

    SharedPtr<ImageData> pImageData_;
    int* angle_;
};

}  // namespace LQ
