#include "ReluLayer.h"

#include <algorithm>

#include "LQ_Utils.h"

void ReluLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    top_ = bottomLayers_[0]->getBlob();
    relu(top_);
}

void ReluLayer::relu(Blob& blob) {
    float* data = blob.data();
    const int size = blob.size();
    for (int i = 0; i < size; ++i) data[i] = std::max(data[i], 0.f);
}

LQ::SharedPtr<BaseLayer> ReluLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new ReluLayer(name_));
}

bool ReluLayer::compare(const BaseLayer& layer) const {
    const ReluLayer* other = dynamic_cast<const ReluLayer*>(&layer);
    return other && other->name() == name_;
}
