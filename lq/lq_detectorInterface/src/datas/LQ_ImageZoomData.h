#pragma once
// The parent scaled: halved, referenced as it is, or resized, for the rectangle asked for.

#include "LQ_ImageData.h"

namespace LQ {

struct ResizeAlgorithm {
    enum Value { BILINEAR = 0, NEAREST_NEIGHBOUR = 1 };
};

class ImageZoomData : public ImageData {
public:
    ImageZoomData(const SharedPtr<ImageData>& parent, int width);
    ImageZoomData(const SharedPtr<ImageData>& parent, float zoom);

    // for every zoom node: 0 bilinear (the start value), anything else nearest neighbour
    static void setResizeAlgorithm(ResizeAlgorithm::Value algorithm) { resizeAlgorithm_ = algorithm; }
    static ResizeAlgorithm::Value resizeAlgorithm() { return resizeAlgorithm_; }

    void compute(const BaseRect<int>& rect) override;
    void update() override;
    std::string name() const override { return derivedName("ImageZoomData"); }
    float zoom() const { return zoom_; }

private:
    BaseSize<int> zoomedSize() const;
    void init();

    SharedPtr<ImageData> pImageData_;
    float zoom_;
    static ResizeAlgorithm::Value resizeAlgorithm_;
};

}  // namespace LQ
