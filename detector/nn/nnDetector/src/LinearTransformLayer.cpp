#include "LinearTransformLayer.h"

#include "LQ_Utils.h"

void LinearTransformLayer::setTransform(const std::vector<float>& a, const std::vector<float>& b) {
    a_ = a;
    b_ = b;
    LQ_ASSERT_EQ(a_.size(), b_.size());
}

void LinearTransformLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    top_ = bottomLayers_[0]->getBlob();
    const int size = top_.size();
    // a model file may hold vectors of different lengths
    LQ_ASSERT_EQ(a_.size(), b_.size());
    LQ_ASSERT_EQ((int)a_.size(), size);
    const float* a = a_.data();
    const float* b = b_.data();
    float* data = top_.data();
    for (int i = 0; i < size; ++i) data[i] = a[i] * data[i] + b[i];
}

void LinearTransformLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    stream << "LinearTransformLayer& " << name << "()\n"
           << "{\n"
           << "    std::vector<float> a, b;\n";
    for (size_t i = 0; i < a_.size() && i < b_.size(); ++i)
        stream << "    a.push_back(" << a_[i] << ");\n"
               << "    b.push_back(" << b_[i] << ");\n";
    stream << "    static LinearTransformLayer linearTransformLayer(\"" << name << "\");\n"
           << "    linearTransformLayer.setTransform(a, b);\n"
           << "    return linearTransformLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> LinearTransformLayer::clone() {
    LinearTransformLayer* layer = new LinearTransformLayer(name_);
    layer->a_ = a_;
    layer->b_ = b_;
    return LQ::SharedPtr<BaseLayer>(layer);
}

bool LinearTransformLayer::compare(const BaseLayer& layer) const {
    const LinearTransformLayer* other = dynamic_cast<const LinearTransformLayer*>(&layer);
    return other && other->a_ == a_ && other->b_ == b_;
}
