#include "PReluLayer.h"

#include <algorithm>

#include "LQ_Utils.h"

void PReluLrForwardFoOneCh(float* plane, int count, float slope) {
    // min and max rather than a condition, which the compiler turns into a branch around
    // the store; for a finite slope the result is the same, zeros included
    for (int i = 0; i < count; ++i) {
        const float x = plane[i];
        plane[i] = std::min(x, 0.f) * slope + std::max(x, 0.f);
    }
}

void PReluLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    top_ = bottomLayers_[0]->getBlob();
    LQ_ASSERT_EQ(top_.num(), 1);
    LQ_ASSERT_EQ(top_.channels(), slope_.num());
    const int area = top_.area();
    const float* slope = slope_.data();
    for (int c = 0; c < top_.channels(); ++c) PReluLrForwardFoOneCh(top_.data(0, c, 0, 0), area, slope[c]);
}

void PReluLayer::serialize(LQ::ArchiveO& archive) const {
    archive & slope_;
}

void PReluLayer::serialize(LQ::ArchiveI& archive) {
    // a fresh blob: the old one may be shared with clones or wrap a constant table
    Blob slope;
    archive & slope;
    slope_ = slope;
}

void PReluLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    slope_.saveToCpp(stream, name + "_slope");
    stream << "PReluLayer& " << name << "()\n"
           << "{\n"
           << "    static PReluLayer pReluLayer(\"" << name << "\", " << name << "_slope());\n"
           << "    return pReluLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> PReluLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new PReluLayer(name_, slope_));
}

bool PReluLayer::compare(const BaseLayer& layer) const {
    const PReluLayer* other = dynamic_cast<const PReluLayer*>(&layer);
    return other && other->slope_ == slope_;
}
