#pragma once
// The root mean square difference of two bottoms over their first num values: a
// distance between two embeddings of one element per sample.

#include "BaseLayer.h"

class ContrastiveLayer : public BaseLayer {
public:
    explicit ContrastiveLayer(const std::string& name) : BaseLayer(name) {}

    void forward() override;
    std::string type() const override { return "ContrastiveLayer"; }
    void serialize(LQ::ArchiveO& archive) const override {}
    void serialize(LQ::ArchiveI& archive) override {}
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;
};
