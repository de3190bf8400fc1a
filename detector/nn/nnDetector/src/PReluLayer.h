#pragma once
// Leaky rectifier with a learnt slope per channel, in place: the bottom's blob holds the
// activated values afterwards.

#include "BaseLayer.h"

class PReluLayer : public BaseLayer {
public:
    explicit PReluLayer(const std::string& name) : BaseLayer(name) {}
    // slope holds one value per channel along num; it is shared, not copied
    PReluLayer(const std::string& name, const Blob& slope) : BaseLayer(name), slope_(slope) {}

    void forward() override;
    std::string type() const override { return "PReluLayer"; }
    void serialize(LQ::ArchiveO& archive) const override;
    void serialize(LQ::ArchiveI& archive) override;
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    const Blob& getSlope() const { return slope_; }

private:
    Blob slope_;
};

// every negative value of the plane times slope; zeros and positives stay
void PReluLrForwardFoOneCh(float* plane, int count, float slope);
