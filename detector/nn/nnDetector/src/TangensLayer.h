#pragma once
// The scaled hyperbolic tangent 1.7159 tanh(2x/3), in place, through a rational
// approximation of tanh.

#include "BaseLayer.h"

class TangensLayer : public BaseLayer {
public:
    explicit TangensLayer(const std::string& name) : BaseLayer(name) {}

    void forward() override;
    std::string type() const override { return "TangensLayer"; }
    void serialize(LQ::ArchiveO& archive) const override {}
    void serialize(LQ::ArchiveI& archive) override {}
    void saveToCpp(std::ostream& stream, const std::string& name) override { baseSaveToCpp(stream, name); }
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    static float approxTanh(float x);
};
