#pragma once
// A part of the bottom along one axis: either one of equal segments, or an explicit
// start and length. Along num the output is a view of the bottom; along the other axes
// the part is copied into memory allocated on the first run.

#include <cstdint>

#include "BaseLayer.h"

class SliceLayer : public BaseLayer {
public:
    // the whole axis, until addSlicePoint or a model file says otherwise
    SliceLayer(const std::string& name, int axis) : SliceLayer(name, 0, 1, axis) {}
    SliceLayer(const std::string& name, int segmentNumber, int numSegments, int axis);

    void forward() override;
    std::string type() const override { return "SliceLayer"; }
    void serialize(LQ::ArchiveO& archive) const override;
    void serialize(LQ::ArchiveI& archive) override;
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    // sliceSize negative: up to the end of the axis
    void addSlicePoint(int slicePoint, int sliceSize);
    // allocates count floats unless memory is already there
    void allocateBlobMemory(unsigned int count);
    float* getPointer() const { return memory_.get(); }

    int getSegmentNumber() const { return segmentNumber_; }
    int getNumSegments() const { return numSegments_; }
    int getAxis() const { return axis_; }
    int getSlicePoint() const { return slicePoint_; }
    int getSliceSize() const { return sliceSize_; }

private:
    void sliceNum();
    void sliceChannels();
    void sliceHeight();
    void sliceWidth();

    int32_t segmentNumber_;
    int32_t numSegments_;
    int32_t axis_;
    int32_t slicePoint_ = 0;
    // 0: derived from the segments on the first run
    int32_t sliceSize_ = 0;
    LQ::SharedArray<float> memory_;
    // what memory_ holds, so that a bottom that grew is refused rather than overrun
    unsigned int memoryCount_ = 0;
};
