#include "ReshapeLayer.h"

#include "LQ_Utils.h"

void ReshapeLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    // a layer that no model file has set up would divide by zero
    LQ_ASSERT_GT(size_.area(), 0);
    LQ_ASSERT_EQ(bottom.channels() * bottom.height() * bottom.width() % size_.area(), 0);
    top_.init(bottom.num(), bottom.volume() / size_.area(), size_.height, size_.width, bottom.getMemory());
}

void ReshapeLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    stream << "ReshapeLayer& " << name << "()\n"
           << "{\n"
           << "    static ReshapeLayer reshapeLayer(\"" << name << "\" ," << size_ << ");\n"
           << "    return reshapeLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> ReshapeLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new ReshapeLayer(name_, size_));
}

bool ReshapeLayer::compare(const BaseLayer& layer) const {
    const ReshapeLayer* other = dynamic_cast<const ReshapeLayer*>(&layer);
    return other && other->size_ == size_;
}
