#pragma once
// Each sample as one column of channels. Planar order is only a new shape over the
// bottom's memory; pixel-interleaved order (y, x, c) needs a copy, made for the first
// sample only.

#include "BaseLayer.h"

class FlattenLayer : public BaseLayer {
public:
    explicit FlattenLayer(const std::string& name, bool interleave = false)
        : BaseLayer(name), interleave_(interleave) {}

    void forward() override;
    std::string type() const override { return "FlattenLayer"; }
    // the interleave flag isn't part of model files
    void serialize(LQ::ArchiveO& archive) const override {}
    void serialize(LQ::ArchiveI& archive) override {}
    void saveToCpp(std::ostream& stream, const std::string& name) override { baseSaveToCpp(stream, name); }
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    bool isInterleave() const { return interleave_; }

private:
    bool interleave_;
};
