#include "SigmoidLayer.h"

#include <cmath>

#include "LQ_Utils.h"

void SigmoidLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    top_.init(bottom.num(), bottom.channels(), bottom.height(), bottom.width());
    const float* in = bottom.data();
    float* out = top_.data();
    const int size = bottom.size();
    // the exponential in float, sum and quotient in double: model outputs depend on this rounding
    for (int i = 0; i < size; ++i)
        out[i] = static_cast<float>(1.0 / (static_cast<double>(std::exp(-in[i])) + 1.0));
}

LQ::SharedPtr<BaseLayer> SigmoidLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new SigmoidLayer(name_));
}

bool SigmoidLayer::compare(const BaseLayer& layer) const {
    const SigmoidLayer* other = dynamic_cast<const SigmoidLayer*>(&layer);
    return other && other->name() == name_;
}
