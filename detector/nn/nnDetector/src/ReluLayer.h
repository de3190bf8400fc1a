#pragma once
// max(x, 0), in place: the bottom's blob holds the activated values afterwards.

#include "BaseLayer.h"

class ReluLayer : public BaseLayer {
public:
    explicit ReluLayer(const std::string& name) : BaseLayer(name) {}

    void forward() override;
    std::string type() const override { return "ReluLayer"; }
    void serialize(LQ::ArchiveO& archive) const override {}
    void serialize(LQ::ArchiveI& archive) override {}
    void saveToCpp(std::ostream& stream, const std::string& name) override { baseSaveToCpp(stream, name); }
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    static void relu(Blob& blob);
};
