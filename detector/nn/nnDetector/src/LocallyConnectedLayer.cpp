#include "LocallyConnectedLayer.h"

#include "ConvolutionKernels.h"
#include "LQ_Utils.h"

LocallyConnectedLayer::LocallyConnectedLayer(const std::vector<Blob>& filters,
                                             const std::vector<Blob>& biases, const std::string& name)
    : BaseLayer(name),
      filter_(filters),
      bias_(biases),
      filterVolume_(filters.empty() ? 0 : filters[0].volume()) {
    checkWeights();
}

void LocallyConnectedLayer::checkWeights() const {
    LQ_ASSERT_EQ(filter_.size(), bias_.size());
    if (filter_.empty()) return;
    LQ_ASSERT_EQ(filter_[0].num(), bias_[0].size());
    for (size_t i = 0; i + 1 < filter_.size(); ++i) {
        LQ_ASSERT_EQ(filter_[i + 1].num(), bias_[i + 1].size());
        LQ_ASSERT_EQ(filter_[i].num(), filter_[i + 1].num());
        LQ_ASSERT_EQ(filter_[i].channels(), filter_[i + 1].channels());
        LQ_ASSERT_EQ(filter_[i].height(), filter_[i + 1].height());
        LQ_ASSERT_EQ(filter_[i].width(), filter_[i + 1].width());
        LQ_ASSERT_EQ(bias_[i].num(), bias_[i + 1].num());
        LQ_ASSERT_EQ(bias_[i].channels(), bias_[i + 1].channels());
        LQ_ASSERT_EQ(bias_[i].height(), bias_[i + 1].height());
        LQ_ASSERT_EQ(bias_[i].width(), bias_[i + 1].width());
    }
}

void LocallyConnectedLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    LQ_ASSERT_EQ(bottom.num(), 1);
    LQ_ASSERT_MSG(!filter_.empty(), "no weights");
    LQ_ASSERT_EQ(bottom.channels(), filter_[0].channels());
    // A model file bypasses the constructor's checks, and nothing ties the input size to
    // the number of positions: both would otherwise read past the weights.
    checkWeights();
    const Blob& first = filter_[0];
    const int kernelWidth = first.width(), kernelHeight = first.height(), filters = first.num();
    const int outWidth = bottom.width() + 1 - kernelWidth, outHeight = bottom.height() + 1 - kernelHeight;
    top_.init(1, filters, outHeight, outWidth);
    LQ_ASSERT_GE(static_cast<int>(filter_.size()), outWidth * outHeight);

    for (int f = 0; f < filters; ++f) {
        for (int y = 0; y < outHeight; ++y) {
            for (int x = 0; x < outWidth; ++x) {
                const int p = x + outWidth * y;
                float value = bias_[p].data()[f];
                for (int c = 0; c < bottom.channels(); ++c) {
                    float result = 0.f;
                    LQ::applyFilter(bottom.data(0, c, y, x), &result, kernelWidth, kernelHeight,
                                    filter_[p].data(f, c, 0, 0), kernelWidth, kernelHeight, value,
                                    bottom.width(), 1);
                    value = result;
                }
                *top_.data(0, f, y, x) = value;
            }
        }
    }
}

void LocallyConnectedLayer::serialize(LQ::ArchiveO& archive) const {
    archive & filter_ & bias_ & filterVolume_;
}

void LocallyConnectedLayer::serialize(LQ::ArchiveI& archive) {
    // fresh blobs: the old ones may be shared with clones or wrap constant tables
    std::vector<Blob> filters, biases;
    archive & filters & biases & filterVolume_;
    filter_.swap(filters);
    bias_.swap(biases);
}

void LocallyConnectedLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    for (size_t i = 0; i < filter_.size(); ++i) {
        filter_[i].saveToCpp(stream, name + "_filter" + std::to_string(i));
        bias_[i].saveToCpp(stream, name + "_bias" + std::to_string(i));
    }
    stream << "LocallyConnectedLayer& " << name << "()\n"
           << "{\n"
           << "    static std::vector<Blob> filter;\n"
           << "    static std::vector<Blob> bias;\n";
    for (size_t i = 0; i < filter_.size(); ++i)
        stream << "    filter.push_back(" << name << "_filter" << i << "());\n";
    for (size_t i = 0; i < bias_.size(); ++i)
        stream << "    bias.push_back(" << name << "_bias" << i << "());\n";
    stream << "    static LocallyConnectedLayer locallyConnectedLayer(filter, bias, \"" << name << "\");\n"
           << "    return locallyConnectedLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> LocallyConnectedLayer::clone() {
    LocallyConnectedLayer* layer = new LocallyConnectedLayer(name_);
    layer->filter_ = filter_;
    layer->bias_ = bias_;
    layer->filterVolume_ = filterVolume_;
    return LQ::SharedPtr<BaseLayer>(layer);
}

bool LocallyConnectedLayer::compare(const BaseLayer& layer) const {
    const LocallyConnectedLayer* other = dynamic_cast<const LocallyConnectedLayer*>(&layer);
    if (!other || filterVolume_ != other->filterVolume_ || filter_.size() != other->filter_.size() ||
        bias_.size() != other->bias_.size())
        return false;
    for (size_t i = 0; i < filter_.size(); ++i)
        if (filter_[i] != other->filter_[i]) return false;
    for (size_t i = 0; i < bias_.size(); ++i)
        if (bias_[i] != other->bias_[i]) return false;
    return true;
}
