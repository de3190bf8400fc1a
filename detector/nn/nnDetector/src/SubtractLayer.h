#pragma once
// Subtracts a mean image from a single sample, into the layer's own blob.

#include "BaseLayer.h"

class SubtractLayer : public BaseLayer {
public:
    explicit SubtractLayer(const std::string& name) : BaseLayer(name) {}
    // the mean image is shared, not copied
    SubtractLayer(const std::string& name, const Blob& meanImage) : BaseLayer(name), meanImage_(meanImage) {}

    void forward() override;
    std::string type() const override { return "SubtractLayer"; }
    void serialize(LQ::ArchiveO& archive) const override;
    void serialize(LQ::ArchiveI& archive) override;
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    const Blob& getMeanImage() const { return meanImage_; }

private:
    Blob meanImage_;
};
