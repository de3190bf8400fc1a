#pragma once
// a[i] x + b[i] for every element i, in place: one coefficient pair per element, not
// per channel, so the layer fits exactly one bottom size.

#include <vector>

#include "BaseLayer.h"

class LinearTransformLayer : public BaseLayer {
public:
    explicit LinearTransformLayer(const std::string& name) : BaseLayer(name) {}

    void forward() override;
    std::string type() const override { return "LinearTransformLayer"; }
    void serialize(LQ::ArchiveO& archive) const override { archive & a_ & b_; }
    void serialize(LQ::ArchiveI& archive) override { archive & a_ & b_; }
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    void setTransform(const std::vector<float>& a, const std::vector<float>& b);
    const std::vector<float>& getA() const { return a_; }
    const std::vector<float>& getB() const { return b_; }

private:
    std::vector<float> a_;
    std::vector<float> b_;
};
