#include "DeConvolutionLayer.h"

#include "LQ_Utils.h"

DeConvolutionLayer::DeConvolutionLayer(const Blob& filter, const Blob& bias, const std::string& name,
                                       int stride)
    : BaseLayer(name), filter_(filter), bias_(bias), stride_(stride) {
    LQ_ASSERT_EQ(filter_.num(), bias_.size());
    LQ_ASSERT_MSG(stride_ >= 1, "Stride is not correct, stride = " << stride_);
}

void DeConvolutionLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    LQ_ASSERT_GE(bottom.num(), 1);
    LQ_ASSERT_EQ(bottom.channels(), filter_.channels());
    // a model file bypasses the constructor's checks
    LQ_ASSERT_EQ(filter_.num(), bias_.size());
    LQ_ASSERT_MSG(stride_ >= 1, "Stride is not correct, stride = " << stride_);

    const int kernelWidth = filter_.width(), kernelHeight = filter_.height(), filters = filter_.num();
    const int width = kernelWidth + stride_ * (bottom.width() - 1);
    const int height = kernelHeight + stride_ * (bottom.height() - 1);
    top_.init(bottom.num(), filters, height, width);
    const float* bias = bias_.data();
    for (int n = 0; n < bottom.num(); ++n) {
        for (int f = 0; f < filters; ++f) {
            float* plane = top_.data(n, f, 0, 0);
            for (int i = 0; i < top_.area(); ++i) plane[i] = bias[f];
        }
        for (int c = 0; c < bottom.channels(); ++c) {
            for (int y = 0; y < bottom.height(); ++y) {
                for (int x = 0; x < bottom.width(); ++x) {
                    const float v = *bottom.data(n, c, y, x);
                    for (int f = 0; f < filters; ++f) {
                        const float* kernel = filter_.data(f, c, 0, 0);
                        for (int ky = 0; ky < kernelHeight; ++ky) {
                            float* out = top_.data(n, f, stride_ * y + ky, stride_ * x);
                            // the kernel row read backwards, from the opposite row
                            const float* row =
                                kernel + (kernelHeight - 1 - ky) * kernelWidth + kernelWidth - 1;
                            for (int kx = 0; kx < kernelWidth; ++kx) out[kx] += v * row[-kx];
                        }
                    }
                }
            }
        }
    }
}

void DeConvolutionLayer::serialize(LQ::ArchiveO& archive) const {
    archive & filter_ & bias_ & stride_;
}

void DeConvolutionLayer::serialize(LQ::ArchiveI& archive) {
    // fresh blobs: the old ones may be shared with clones or wrap a constant table
    Blob filter, bias;
    archive & filter & bias & stride_;
    filter_ = filter;
    bias_ = bias;
}

void DeConvolutionLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    filter_.saveToCpp(stream, name + "_filter");
    bias_.saveToCpp(stream, name + "_bias");
    stream << "DeConvolutionLayer& " << name << "()\n"
           << "{\n"
           << "    static DeConvolutionLayer deConvolutionLayer(" << name << "_filter(), " << name
           << "_bias(), \"" << name << "\", " << stride_ << ");\n"
           << "    return deConvolutionLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> DeConvolutionLayer::clone() {
    // not through the checking constructor: a loaded layer was never checked, and a clone
    // shouldn't fail where its source didn't
    DeConvolutionLayer* layer = new DeConvolutionLayer(name_);
    layer->filter_ = filter_;
    layer->bias_ = bias_;
    layer->stride_ = stride_;
    return LQ::SharedPtr<BaseLayer>(layer);
}

bool DeConvolutionLayer::compare(const BaseLayer& layer) const {
    const DeConvolutionLayer* other = dynamic_cast<const DeConvolutionLayer*>(&layer);
    return other && filter_ == other->filter_ && bias_ == other->bias_ && stride_ == other->stride_;
}
