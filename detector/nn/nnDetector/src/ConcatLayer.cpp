#include "ConcatLayer.h"

#include <cstring>

#include "LQ_Utils.h"

void ConcatLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) > (1), bottomLayers_.size() << " <= " << 1);
    const Blob& bottom0 = bottomLayers_[0]->getBlob();
    int total = alongChannels_ ? bottom0.channels() : bottom0.num();
    for (size_t i = 1; i < bottomLayers_.size(); ++i) {
        LQ_ASSERT_EQ(bottom0.width(), bottomLayers_[i]->getBlob().width());
        LQ_ASSERT_EQ(bottom0.height(), bottomLayers_[i]->getBlob().height());
        if (alongChannels_) {
            LQ_ASSERT_EQ(bottom0.num(), bottomLayers_[i]->getBlob().num());
            total += bottomLayers_[i]->getBlob().channels();
        } else {
            LQ_ASSERT_EQ(bottom0.channels(), bottomLayers_[i]->getBlob().channels());
            total += bottomLayers_[i]->getBlob().num();
        }
    }
    if (alongChannels_) {
        // with one sample the channel planes of the bottoms simply follow each other
        LQ_ASSERT_EQ(bottom0.num(), 1);
        top_.init(bottom0.num(), total, bottom0.height(), bottom0.width());
    } else {
        top_.init(total, bottom0.channels(), bottom0.height(), bottom0.width());
    }
    float* out = top_.data();
    for (const LQ::SharedPtr<BaseLayer>& layer : bottomLayers_) {
        const Blob& bottom = layer->getBlob();
        if (bottom.size())
            std::memcpy(out, bottom.data(), static_cast<size_t>(bottom.size()) * sizeof(float));
        out += bottom.size();
    }
}

void ConcatLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    stream << "ConcatLayer& " << name << "()\n"
           << "{\n"
           << "    static ConcatLayer concatLayer(\"" << name << "\", " << alongChannels_ << ");\n"
           << "    return concatLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> ConcatLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new ConcatLayer(name_, alongChannels_));
}

bool ConcatLayer::compare(const BaseLayer& layer) const {
    const ConcatLayer* other = dynamic_cast<const ConcatLayer*>(&layer);
    return other && other->alongChannels_ == alongChannels_;
}
