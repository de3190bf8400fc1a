#include "FlattenLayer.h"

#include "LQ_Utils.h"

void FlattenLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    if (!interleave_) {
        top_.init(bottom.num(), bottom.volume(), 1, 1, bottom.getMemory());
        return;
    }
    top_.init(bottom.num(), bottom.volume(), 1, 1);
    if (bottom.num() < 1) return;
    const int channels = bottom.channels();
    const int area = bottom.area();
    const float* in = bottom.data();
    float* out = top_.data();
    for (int c = 0; c < channels; ++c) {
        const float* plane = in + c * area;
        for (int i = 0; i < area; ++i) out[i * channels + c] = plane[i];
    }
}

LQ::SharedPtr<BaseLayer> FlattenLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new FlattenLayer(name_, interleave_));
}

bool FlattenLayer::compare(const BaseLayer& layer) const {
    const FlattenLayer* other = dynamic_cast<const FlattenLayer*>(&layer);
    return other && other->name() == name_;
}
