#include "ContrastiveLayer.h"

#include <cmath>

#include "LQ_Utils.h"

void ContrastiveLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (2), bottomLayers_.size() << " != " << 2);
    const Blob& bottom0 = bottomLayers_[0]->getBlob();
    const Blob& bottom1 = bottomLayers_[1]->getBlob();
    LQ_ASSERT_EQ(bottom0.num(), bottom1.num());
    const int num = bottom0.num();
    // a sample without elements would leave fewer than num values to read
    LQ_ASSERT_GE(bottom0.size(), num);
    LQ_ASSERT_GE(bottom1.size(), num);
    const float* a = bottom0.data();
    const float* b = bottom1.data();
    // each square in double, the running sum rounded back to float at every step
    float sum = 0.f;
    for (int i = 0; i < num; ++i) {
        const double difference = static_cast<double>(a[i] - b[i]);
        sum = static_cast<float>(sum + difference * difference);
    }
    top_.init(1, 1, 1, 1);
    top_.data()[0] = std::sqrt(sum / num);
}

void ContrastiveLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    stream << "ContrastiveLayer& " << name << "()\n"
           << "{\n"
           << "    static ContrastiveLayer ContrastiveLayer(\"" << name << "\");\n"
           << "    return ContrastiveLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> ContrastiveLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new ContrastiveLayer(name_));
}

bool ContrastiveLayer::compare(const BaseLayer& layer) const {
    const ContrastiveLayer* other = dynamic_cast<const ContrastiveLayer*>(&layer);
    return other && other->name() == name_;
}
