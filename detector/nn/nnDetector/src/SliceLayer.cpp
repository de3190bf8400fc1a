#include "SliceLayer.h"

#include <cstring>

#include "LQ_Utils.h"

SliceLayer::SliceLayer(const std::string& name, int segmentNumber, int numSegments, int axis)
    : BaseLayer(name), segmentNumber_(segmentNumber), numSegments_(numSegments), axis_(axis) {
    LQ_ASSERT_GE(segmentNumber, 0);
    LQ_ASSERT_LT(segmentNumber, numSegments);
    LQ_ASSERT_GE(axis, 0);
    LQ_ASSERT_LT(axis, 4);
}

void SliceLayer::addSlicePoint(int slicePoint, int sliceSize) {
    slicePoint_ = slicePoint;
    sliceSize_ = sliceSize;
    LQ_ASSERT_GE(slicePoint_, 0);
    LQ_ASSERT_NE(sliceSize_, 0);
}

void SliceLayer::allocateBlobMemory(unsigned int count) {
    if (memory_) return;
    memory_ = LQ::SharedArray<float>(new float[count]);
    memoryCount_ = count;
}

void SliceLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& bottom = bottomLayers_[0]->getBlob();
    if (axis_ < 0 || axis_ > 3) LQ_FAIL("unknown slice axis " << axis_);
    const int extents[4] = {bottom.num(), bottom.channels(), bottom.height(), bottom.width()};
    const int bottomSize = extents[axis_];
    // derived once: the bottom's shape stays the same from frame to frame
    if (sliceSize_ == 0) {
        LQ_ASSERT_GT(numSegments_, 0);
        LQ_ASSERT_EQ(bottomSize % numSegments_, 0);
        sliceSize_ = bottomSize / numSegments_;
        slicePoint_ = segmentNumber_ * sliceSize_;
    }
    if (sliceSize_ < 0) sliceSize_ = bottomSize - slicePoint_;
    // a model file can hold any numbers; never read outside the bottom
    LQ_ASSERT_GE(slicePoint_, 0);
    LQ_ASSERT_GE(sliceSize_, 0);
    LQ_ASSERT_LE(slicePoint_ + sliceSize_, bottomSize);
    switch (axis_) {
        case 0:
            sliceNum();
            break;
        case 1:
            sliceChannels();
            break;
        case 2:
            sliceHeight();
            break;
        default:
            sliceWidth();
            break;
    }
}

void SliceLayer::sliceNum() {
    const Blob& bottom = bottomLayers_[0]->getBlob();
    // a view of the bottom's samples: nothing is copied
    memory_ = LQ::SharedArray<float>(const_cast<float*>(bottom.data(slicePoint_, 0, 0, 0)), false);
    memoryCount_ = 0;
    top_.init(sliceSize_, bottom.channels(), bottom.height(), bottom.width(), memory_);
}

void SliceLayer::sliceChannels() {
    const Blob& bottom = bottomLayers_[0]->getBlob();
    const int n = bottom.num(), h = bottom.height(), w = bottom.width();
    const unsigned int count = static_cast<unsigned int>(n * sliceSize_ * h * w);
    allocateBlobMemory(count);
    LQ_ASSERT_LE(count, memoryCount_);
    const size_t block = static_cast<size_t>(sliceSize_) * h * w;
    for (int i = 0; i < n; ++i)
        std::memcpy(memory_.get() + i * block, bottom.data(i, slicePoint_, 0, 0), block * sizeof(float));
    top_.init(n, sliceSize_, h, w, memory_);
}

void SliceLayer::sliceHeight() {
    const Blob& bottom = bottomLayers_[0]->getBlob();
    const int n = bottom.num(), c = bottom.channels(), w = bottom.width();
    const unsigned int count = static_cast<unsigned int>(n * c * sliceSize_ * w);
    allocateBlobMemory(count);
    LQ_ASSERT_LE(count, memoryCount_);
    const size_t block = static_cast<size_t>(sliceSize_) * w;
    float* out = memory_.get();
    for (int i = 0; i < n; ++i)
        for (int j = 0; j < c; ++j, out += block)
            std::memcpy(out, bottom.data(i, j, slicePoint_, 0), block * sizeof(float));
    top_.init(n, c, sliceSize_, w, memory_);
}

void SliceLayer::sliceWidth() {
    const Blob& bottom = bottomLayers_[0]->getBlob();
    const int n = bottom.num(), c = bottom.channels(), h = bottom.height();
    const unsigned int count = static_cast<unsigned int>(n * c * h * sliceSize_);
    allocateBlobMemory(count);
    LQ_ASSERT_LE(count, memoryCount_);
    const size_t block = static_cast<size_t>(sliceSize_);
    float* out = memory_.get();
    for (int i = 0; i < n; ++i)
        for (int j = 0; j < c; ++j)
            for (int y = 0; y < h; ++y, out += block)
                std::memcpy(out, bottom.data(i, j, y, slicePoint_), block * sizeof(float));
    top_.init(n, c, h, sliceSize_, memory_);
}

void SliceLayer::serialize(LQ::ArchiveO& archive) const {
    archive & segmentNumber_ & numSegments_ & axis_;
    archive.archiveFromVersion("Version 3", slicePoint_);
    archive.archiveFromVersion("Version 3", sliceSize_);
}

void SliceLayer::serialize(LQ::ArchiveI& archive) {
    archive & segmentNumber_ & numSegments_ & axis_;
    // older files have segments only
    slicePoint_ = 0;
    sliceSize_ = 0;
    archive.archiveFromVersion("Version 3", slicePoint_);
    archive.archiveFromVersion("Version 3", sliceSize_);
}

void SliceLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    stream << "SliceLayer& " << name << "()\n"
           << "{\n"
           << "    static SliceLayer sliceLayer(\"" << name << "\", " << axis_ << ");\n"
           << "    sliceLayer.addSlicePoint(" << slicePoint_ << ", " << sliceSize_ << ");\n"
           << "    return sliceLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> SliceLayer::clone() {
    // same parameters, but output memory of its own
    // built on a valid axis: a model file may hold one that only forward refuses
    SliceLayer* layer = new SliceLayer(name_, 1);
    layer->axis_ = axis_;
    layer->segmentNumber_ = segmentNumber_;
    layer->numSegments_ = numSegments_;
    layer->slicePoint_ = slicePoint_;
    layer->sliceSize_ = sliceSize_;
    return LQ::SharedPtr<BaseLayer>(layer);
}

bool SliceLayer::compare(const BaseLayer& layer) const {
    const SliceLayer* other = dynamic_cast<const SliceLayer*>(&layer);
    return other && other->segmentNumber_ == segmentNumber_ && other->numSegments_ == numSegments_ &&
           other->axis_ == axis_ && other->slicePoint_ == slicePoint_ && other->sliceSize_ == sliceSize_;
}
