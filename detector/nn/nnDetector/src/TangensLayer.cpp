#include "TangensLayer.h"

#include <cmath>

#include "LQ_Utils.h"

float TangensLayer::approxTanh(float x) {
    const double s = static_cast<double>(x * x);
    const float t =
        static_cast<float>(1.0 - 1.0 / (1.0 + std::fabs(static_cast<double>(x)) + s + 1.41645 * s * s));
    // a select, not copysign: -0 maps to +0
    return x < 0 ? -t : t;
}

void TangensLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    top_ = bottomLayers_[0]->getBlob();
    float* data = top_.data();
    const int size = top_.size();
    for (int i = 0; i < size; ++i) {
        // 0.66666666 rather than 2/3: the networks were trained with this constant
        const float u = static_cast<float>(static_cast<double>(data[i]) * 0.66666666);
        data[i] = static_cast<float>(static_cast<double>(approxTanh(u)) * 1.7159);
    }
}

LQ::SharedPtr<BaseLayer> TangensLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new TangensLayer(name_));
}

bool TangensLayer::compare(const BaseLayer& layer) const {
    const TangensLayer* other = dynamic_cast<const TangensLayer*>(&layer);
    return other && other->name() == name_;
}
