#pragma once
// Joins two or more bottoms along channels (single sample) or along num, into the layer's
// own blob.

#include "BaseLayer.h"

class ConcatLayer : public BaseLayer {
public:
    explicit ConcatLayer(const std::string& name, bool alongChannels = true)
        : BaseLayer(name), alongChannels_(alongChannels) {}

    void forward() override;
    std::string type() const override { return "ConcatLayer"; }
    void serialize(LQ::ArchiveO& archive) const override { archive & alongChannels_; }
    void serialize(LQ::ArchiveI& archive) override { archive & alongChannels_; }
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    bool isAlongChannels() const { return alongChannels_; }

private:
    bool alongChannels_;
};
