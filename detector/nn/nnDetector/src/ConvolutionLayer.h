#pragma once
// Convolution of all input channels by each filter (a cross-correlation: the kernel isn't
// flipped), with a stride and a zero border. Nearly all the time of a frame is spent here.

#include <array>
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

    // How a layer whose kernel is smaller than its input is computed. Direct reads the taps in
    // place and is the fastest; the matrix product unfolds the patches first and gives the same
    // bits; the sliding windows are the plain loops, summed plane by plane, and differ from the
    // other two only in rounding.
    enum class Path { Direct, MatrixProduct, SlidingWindow };
    void setPath(Path path) { path_ = path; }
    Path getPath() const { return path_; }

    // A kernel that covers the whole input: one dot product per sample and filter.
    void calculateLayerAsScalarProduct(const Blob& input);
    void calculateLayerBySlidingWindow(const Blob& input, const LQ::Size& inputSize,
                                       const LQ::Size& outputSize, const LQ::Size& filterSize);
    void calculateLayerByMatrixProduct(const Blob& input, const LQ::Size& inputSize,
                                       const LQ::Size& outputSize, const LQ::Size& filterSize);
    // input without its border: the border is added while the input is split by phase
    void calculateLayerDirectly(const Blob& input, const LQ::Size& outputSize, const LQ::Size& filterSize);

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

    Path path_ = Path::Direct;
    // scratch kept between calls so that a frame allocates nothing
    std::vector<float> plane_;
    std::vector<float> columns_;
    std::vector<float> packed_;
    // the direct path's weights packed by groups, and what they were packed from
    std::vector<float> groups_;
    std::vector<float> packedFrom_;
    std::vector<bool> packedPruned_;
    std::vector<float> phases_;
    std::vector<float> wide_;
    // where the taps start, for the input shape and stride in offsetsFor_
    std::vector<int> offsets_;
    std::array<int, 6> offsetsFor_ = {};
};
