#pragma once
// Convolution of all input channels by each filter (a cross-correlation: the kernel isn't
// flipped), with a stride and a zero border. Nearly all the time of a frame is spent here.

#include <string>
#include <vector>

#include "BaseLayer.h"
#include "LQ_Size.h"

class ConvolutionLayer : public BaseLayer {
public:
    // stride 1, no border, no weights until loaded
    explicit ConvolutionLayer(const std::string& name);
    // filter: outputs x inputs x kernel height x kernel width; bias: one value per output.
    // Both are shared, not copied.
    ConvolutionLayer(const Blob& filter, const Blob& bias, const std::string& name, int stride, int pad);

    // clamp the output at 0 inside this layer; not stored in model files
    void setDoRelu(bool doRelu) { doRelu_ = doRelu; }
    bool getDoRelu() const { return doRelu_; }
    // Marks the (output, input) kernel planes whose weights are all but zero, so that the
    // sliding windows skip them.
    void prune() override;
    void forward() override;

    std::string type() const override { return "ConvolutionLayer"; }
    void serialize(LQ::ArchiveO& archive) const override;
    void serialize(LQ::ArchiveI& archive) override;
    void saveToCpp(std::ostream& stream, const std::string& name) override;
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;

    // A kernel that covers the whole input: one dot product per sample and filter.
    void calculateLayerAsScalarProduct(const Blob& input);
    // The plain loops, plane by plane: each input plane through its kernel, added up. Kept
    // as the reference the matrix product is checked against.
    void calculateLayerBySlidingWindow(const Blob& input, const LQ::Size& inputSize,
                                       const LQ::Size& outputSize, const LQ::Size& filterSize);
    // The same sums as one matrix product per sample: patches unfolded into columns, the
    // filters packed into panels.
    void calculateLayerByMatrixProduct(const Blob& input, const LQ::Size& inputSize,
                                       const LQ::Size& outputSize, const LQ::Size& filterSize);
    // forward through the sliding windows instead of the matrix product
    void setReferencePath(bool reference) { referencePath_ = reference; }

    const Blob& getFilter() const { return filter_; }
    const Blob& getBias() const { return bias_; }
    int getStride() const { return stride_; }
    int getPad() const { return pad_; }
    int getFilterVolume() const { return filterVolume_; }
    // one flag per (output, input) pair, output major; empty until prune()
    const std::vector<bool>& getPrunedFlags() const { return pruned_; }

private:
    // the input with its zero border, or the input itself without one
    Blob workingInput(const Blob& input);

    Blob filter_;
    Blob bias_;
    Blob borderedInput_;
    std::vector<bool> pruned_;
    int stride_ = 1;
    int pad_ = 0;
    int filterVolume_ = 0;
    bool doRelu_ = false;

    bool referencePath_ = false;
    // scratch kept between calls so that a frame allocates nothing
    std::vector<float> plane_;
    std::vector<float> columns_;
    std::vector<float> packed_;
};
