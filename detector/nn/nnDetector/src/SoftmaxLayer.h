#pragma once
// Softmax across channels, in place over the first sample. A bottom of one channel and
// two values is a two-class output instead, and becomes a single 0 or 1 decision.

#include <vector>

#include "BaseLayer.h"

class SoftmaxLayer : public BaseLayer {
public:
    explicit SoftmaxLayer(const std::string& name, float threshold = 0.5f)
        : BaseLayer(name), threshold_(threshold) {}

    void forward() override;
    std::string type() const override { return "SoftmaxLayer"; }
    void serialize(LQ::ArchiveO& archive) const override { archive & threshold_; }
    void serialize(LQ::ArchiveI& archive) override { archive & threshold_; }
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    float getThreshold() const { return threshold_; }

private:
    float threshold_;
    // per position maximum and sum; kept between frames so that forward doesn't allocate
    std::vector<float> scratch_;
};
