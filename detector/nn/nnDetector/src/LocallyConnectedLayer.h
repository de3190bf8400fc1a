#pragma once
// A convolution without weight sharing: every output position has its own filters and
// biases, so the input size is fixed by the weights. Window step 1, no border, one sample.

#include <string>
#include <vector>

#include "BaseLayer.h"

class LocallyConnectedLayer : public BaseLayer {
public:
    explicit LocallyConnectedLayer(const std::string& name) : BaseLayer(name) {}
    // One element per output position x + outputWidth * y; each filter is outputs x inputs
    // x kernel height x kernel width, each bias one value per output. Shared, not copied.
    LocallyConnectedLayer(const std::vector<Blob>& filters, const std::vector<Blob>& biases,
                          const std::string& name);

    void forward() override;

    std::string type() const override { return "LocallyConnectedLayer"; }
    void serialize(LQ::ArchiveO& archive) const override;
    void serialize(LQ::ArchiveI& archive) override;
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    const std::vector<Blob>& getFilters() const { return filter_; }
    const std::vector<Blob>& getBiases() const { return bias_; }
    int getFilterVolume() const { return filterVolume_; }

private:
    // all elements of one shape, one bias per filter
    void checkWeights() const;

    std::vector<Blob> filter_;
    std::vector<Blob> bias_;
    int filterVolume_ = 0;
};
