#include "SoftmaxLayer.h"

#include <algorithm>
#include <cmath>

#include "LQ_Utils.h"

void SoftmaxLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();

    if (bottom.channels() == 1) {
        LQ_ASSERT_EQ(bottom.size(), 2);
        const float b0 = bottom.data()[0];
        const float b1 = bottom.data()[1];
        // own memory even if top_ shared a bottom before: that count was never 1
        top_.init(1, 1, 1, 1);
        const float e1 = std::exp(b1);
        top_.data()[0] = e1 / (e1 + std::exp(b0)) >= threshold_ ? 1.f : 0.f;
        return;
    }

    top_ = bottom;
    const int channels = top_.channels();
    const int area = top_.area();
    if (top_.num() < 1 || area < 1) return;
    if (static_cast<int>(scratch_.size()) < 2 * area) scratch_.resize(2 * area);
    float* maximum = scratch_.data();
    float* sum = maximum + area;

    // channel by channel over whole planes, so that the inner loops run over contiguous memory
    std::fill(maximum, maximum + area, -999999.f);
    for (int c = 0; c < channels; ++c) {
        const float* plane = top_.data(0, c, 0, 0);
        for (int i = 0; i < area; ++i) maximum[i] = std::max(maximum[i], plane[i]);
    }
    std::fill(sum, sum + area, 0.f);
    for (int c = 0; c < channels; ++c) {
        const float* plane = top_.data(0, c, 0, 0);
        for (int i = 0; i < area; ++i) sum[i] += std::exp(plane[i] - maximum[i]);
    }
    // the log of the normaliser, reusing the maximum's space
    float* logNorm = maximum;
    for (int i = 0; i < area; ++i) logNorm[i] = maximum[i] + std::log(sum[i]);
    for (int c = 0; c < channels; ++c) {
        float* plane = top_.data(0, c, 0, 0);
        for (int i = 0; i < area; ++i) plane[i] = std::exp(plane[i] - logNorm[i]);
    }
}

void SoftmaxLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    stream << "SoftmaxLayer& " << name << "()\n"
           << "{\n"
           << "    static SoftmaxLayer softmaxLayer(\"" << name << "\", " << threshold_ << ");\n"
           << "    return softmaxLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> SoftmaxLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new SoftmaxLayer(name_, threshold_));
}

bool SoftmaxLayer::compare(const BaseLayer& layer) const {
    const SoftmaxLayer* other = dynamic_cast<const SoftmaxLayer*>(&layer);
    if (!other) return false;
    const double a = threshold_, b = other->threshold_;
    return std::fabs(a - b) <= 1e-6 * std::max(std::fabs(a), std::fabs(b));
}
