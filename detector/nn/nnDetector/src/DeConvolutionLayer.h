#pragma once
// Transposed convolution: every input value spreads its kernel, rotated by 180 degrees,
// over a window of the output at stride steps; overlapping windows add up.

#include <string>

#include "BaseLayer.h"

class DeConvolutionLayer : public BaseLayer {
public:
    // stride 1, no weights until loaded
    explicit DeConvolutionLayer(const std::string& name) : BaseLayer(name) {}
    // filter: outputs x inputs x kernel height x kernel width; bias: one value per output.
    // Both are shared, not copied.
    DeConvolutionLayer(const Blob& filter, const Blob& bias, const std::string& name, int stride);

    void forward() override;

    std::string type() const override { return "DeConvolutionLayer"; }
    void serialize(LQ::ArchiveO& archive) const override;
    void serialize(LQ::ArchiveI& archive) override;
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    const Blob& getFilter() const { return filter_; }
    const Blob& getBias() const { return bias_; }
    int getStride() const { return stride_; }

private:
    Blob filter_;
    Blob bias_;
    int stride_ = 1;
};
