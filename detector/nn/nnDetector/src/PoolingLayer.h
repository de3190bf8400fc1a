#pragma once
// Max pooling. The output size rounds up, so the last window of a row or column may be
// partial: it counts with the elements it has.

#include <cstdint>

#include "BaseLayer.h"

class PoolingLayer : public BaseLayer {
public:
    // kernel and stride 0 until a model file sets them
    explicit PoolingLayer(const std::string& name) : PoolingLayer(0, 0, name) {}
    PoolingLayer(int kernel, int stride, const std::string& name)
        : BaseLayer(name), kernel_(kernel), stride_(stride) {}

    void forward() override;
    std::string type() const override { return "PoolingLayer"; }
    void serialize(LQ::ArchiveO& archive) const override { archive & kernel_ & stride_; }
    void serialize(LQ::ArchiveI& archive) override { archive & kernel_ & stride_; }
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    int getKernel() const { return kernel_; }
    int getStride() const { return stride_; }

private:
    void poolingStrideEqualsKernel();
    void poolingDifferentStrideKernel();

    int32_t kernel_;
    int32_t stride_;
};

// Maximum of each 2 x 2 block of a width x height plane into a ceil(width / 2) x
// ceil(height / 2) plane; blocks at an odd right or bottom edge are 1 wide or 1 high.
template <class T>
void maxPool(const T* src, T* dst, int width, int height);
