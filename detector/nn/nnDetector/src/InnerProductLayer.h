#pragma once
// Fully connected: every output is a weighted sum of the whole input sample, read in its
// planar order.

#include <string>

#include "BaseLayer.h"

class InnerProductLayer : public BaseLayer {
public:
    explicit InnerProductLayer(const std::string& name) : BaseLayer(name) {}
    // weights: 1 x 1 x outputs x inputs; bias: 1 x 1 x 1 x outputs. Both are shared.
    InnerProductLayer(const Blob& weights, const Blob& bias, const std::string& name);

    // clamp the output at 0 inside this layer; not stored in model files
    void setDoRelu(bool doRelu) { doRelu_ = doRelu; }
    bool getDoRelu() const { return doRelu_; }
    void forward() override;

    std::string type() const override { return "InnerProductLayer"; }
    void serialize(LQ::ArchiveO& archive) const override;
    void serialize(LQ::ArchiveI& archive) override;
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    const Blob& getWeights() const { return weights_; }
    const Blob& getBias() const { return bias_; }

private:
    Blob weights_;
    Blob bias_;
    bool doRelu_ = false;
};
