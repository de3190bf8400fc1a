#include "SubtractLayer.h"

#include "LQ_Utils.h"

void SubtractLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    LQ_ASSERT_EQ(bottom.num(), 1);
    LQ_ASSERT_EQ(bottom.channels(), meanImage_.channels());
    LQ_ASSERT_EQ(bottom.height(), meanImage_.height());
    LQ_ASSERT_EQ(bottom.width(), meanImage_.width());
    top_.init(bottom.num(), bottom.channels(), bottom.height(), bottom.width());
    const float* in = bottom.data();
    const float* mean = meanImage_.data();
    float* out = top_.data();
    const int size = bottom.size();
    for (int i = 0; i < size; ++i) out[i] = in[i] - mean[i];
}

// the name goes into the file a second time, inside the parameters
void SubtractLayer::serialize(LQ::ArchiveO& archive) const {
    archive & name_ & meanImage_;
}

void SubtractLayer::serialize(LQ::ArchiveI& archive) {
    // a fresh blob: the old one may be shared with clones or wrap a constant table
    Blob meanImage;
    archive & name_ & meanImage;
    meanImage_ = meanImage;
}

void SubtractLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    meanImage_.saveToCpp(stream, name + "_meanImage");
    stream << "SubtractLayer& " << name << "()\n"
           << "{\n"
           << "    static SubtractLayer subtractLayer(\"" << name << "\", " << name << "_meanImage());\n"
           << "    return subtractLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> SubtractLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new SubtractLayer(name_, meanImage_));
}

bool SubtractLayer::compare(const BaseLayer& layer) const {
    const SubtractLayer* other = dynamic_cast<const SubtractLayer*>(&layer);
    return other && other->name() == name_ && other->meanImage_ == meanImage_;
}
