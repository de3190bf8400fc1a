#pragma once
// The camera's semi-planar YUV 4:2:0 buffer as BGR (or its luma rows as mono), as a node.

#include "LQ_ImageData.h"

namespace LQ {

class Yuv420Converter : public ImageData {
public:
    // parent: a header over the whole buffer, its height counting luma and chroma rows
    Yuv420Converter(const SharedPtr<ImageData>& parent, ColorMode colorMode, bool zoomTwice, bool swapRedBlue);

    void compute(const BaseRect<int>& rect) override;
    void update() override;
    std::string name() const override { return derivedName("Yuv420Converter"); }
    std::string arguments() const override;

private:
    void init();

    SharedPtr<ImageData> pImageData_;
    ColorMode colorMode_;
    bool zoomTwice_;
    bool swapRedBlue_;
};

}  // namespace LQ
