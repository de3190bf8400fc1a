#pragma once
// The logistic function into the layer's own blob; the bottom keeps its values.

#include "BaseLayer.h"

class SigmoidLayer : public BaseLayer {
public:
    explicit SigmoidLayer(const std::string& name) : BaseLayer(name) {}

    void forward() override;
    std::string type() const override { return "SigmoidLayer"; }
    void serialize(LQ::ArchiveO& archive) const override {}
    void serialize(LQ::ArchiveI& archive) override {}
    void saveToCpp(std::ostream& stream, const std::string& name) override { baseSaveToCpp(stream, name); }
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;
};
