#pragma once
// The parent's pixels in another colour mode (or as census, gradient or integral image).

#include "LQ_ImageData.h"

namespace LQ {

class ColorModeData : public ImageData {
public:
    ColorModeData(const SharedPtr<ImageData>& parent, ColorMode colorMode);

    void compute(const BaseRect<int>& rect) override;
    void update() override;
    std::string name() const override { return derivedName("ColorModeData"); }

private:
    void init();

    SharedPtr<ImageData> pImageData_;
    ColorMode targetMode_;
};

}  // namespace LQ
