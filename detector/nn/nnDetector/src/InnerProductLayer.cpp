#include "InnerProductLayer.h"

#include "ConvolutionKernels.h"
#include "LQ_Utils.h"

InnerProductLayer::InnerProductLayer(const Blob& weights, const Blob& bias, const std::string& name)
    : BaseLayer(name), weights_(weights), bias_(bias) {
    LQ_ASSERT_MSG(weights_.height() == bias_.width(), weights_.height() << " != " << bias_.width());
}

void InnerProductLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    LQ_ASSERT_GE(bottom.num(), 1);
    const int inputSize = bottom.volume();
    // an empty sample would make the remainder below a division by zero
    LQ_ASSERT_GT(inputSize, 0);
    LQ_ASSERT_EQ(weights_.size() % inputSize, 0);
    const int outputs = weights_.size() / inputSize;
    // a model file bypasses the constructor's check: one bias per output, or reads go astray
    LQ_ASSERT_EQ(bias_.size(), outputs);
    top_.init(bottom.num(), outputs, 1, 1);
    const float* bias = bias_.data();
    for (int n = 0; n < bottom.num(); ++n) {
        const float* sample = bottom.data(n, 0, 0, 0);
        for (int o = 0; o < outputs; ++o)
            *top_.data(n, o, 0, 0) = LQ::dotProduct(
                sample, weights_.data() + static_cast<size_t>(o) * inputSize, inputSize, bias[o]);
    }
    if (doRelu_) LQ::maxVector(top_.data(), top_.size(), 0.f);
}

void InnerProductLayer::serialize(LQ::ArchiveO& archive) const {
    archive & weights_ & bias_;
}

void InnerProductLayer::serialize(LQ::ArchiveI& archive) {
    // fresh blobs: the old ones may be shared with clones or wrap a constant table
    Blob weights, bias;
    archive & weights & bias;
    weights_ = weights;
    bias_ = bias;
    doRelu_ = false;
}

void InnerProductLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    weights_.saveToCpp(stream, name + "_weights");
    bias_.saveToCpp(stream, name + "_bias");
    stream << "InnerProductLayer& " << name << "()\n"
           << "{\n"
           << "    static InnerProductLayer innerProductLayer(" << name << "_weights(), " << name
           << "_bias(), \"" << name << "\");\n"
           << "    return innerProductLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> InnerProductLayer::clone() {
    InnerProductLayer* layer = new InnerProductLayer(name_);
    layer->weights_ = weights_;
    layer->bias_ = bias_;
    layer->doRelu_ = doRelu_;
    return LQ::SharedPtr<BaseLayer>(layer);
}

bool InnerProductLayer::compare(const BaseLayer& layer) const {
    const InnerProductLayer* other = dynamic_cast<const InnerProductLayer*>(&layer);
    return other && weights_ == other->weights_ && bias_ == other->bias_;
}
