#pragma once
// Gives the bottom's memory another shape: planes of the given size, as many as the
// elements of a sample fill. Nothing moves.

#include "BaseLayer.h"
#include "LQ_Size.h"

class ReshapeLayer : public BaseLayer {
public:
    // size (0, 0) until a model file sets it
    explicit ReshapeLayer(const std::string& name) : BaseLayer(name) {}
    ReshapeLayer(const std::string& name, const LQ::BaseSize<int>& size) : BaseLayer(name), size_(size) {}

    void forward() override;
    std::string type() const override { return "ReshapeLayer"; }
    void serialize(LQ::ArchiveO& archive) const override { archive & size_; }
    void serialize(LQ::ArchiveI& archive) override { archive & size_; }
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    const LQ::BaseSize<int>& getSize() const { return size_; }

private:
    LQ::BaseSize<int> size_;
};
