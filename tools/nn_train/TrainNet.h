#pragma once
// A chain of trainer layers with its loss, its optimiser and its export to the runtime.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "LQ_ColorMode.h"
#include "NnDetector.h"
#include "PalmNetworks.h"
#include "TrainLayers.h"

namespace nntrain {

class Net {
public:
    Net(int channels, int height, int width) : channels_(channels), height_(height), width_(width) {}

    // appends a layer; its input shape must fit the chain so far
    Layer& add(std::unique_ptr<Layer> layer);
    void initialise(std::uint64_t seed);
    // the last layer's output for a batch; intermediate outputs are kept for backward
    const Tensor& forward(const Tensor& input);
    // dout is the gradient of the loss by the last output; adds to the parameters' gradients
    void backward(const Tensor& dout);
    void zeroGradients();
    std::vector<Param*> params();
    const std::vector<std::unique_ptr<Layer>>& layers() const { return layers_; }
    int channels() const { return channels_; }
    int height() const { return height_; }
    int width() const { return width_; }
    // output shape of the whole chain
    void outputShape(int& c, int& h, int& w) const;

private:
    int channels_, height_, width_;
    std::vector<std::unique_ptr<Layer>> layers_;
    std::vector<Tensor> outputs_;
    const Tensor* input_ = nullptr;
    Tensor gradIn_, gradOut_;
};

// Two-class softmax cross-entropy over N x 2 x 1 x 1 scores, each sample weighted; returns
// the weighted mean loss and writes its gradient.
float softmaxCrossEntropy(const Tensor& scores, const std::vector<int>& labels, const std::vector<float>& weights,
                          Tensor& gradient);
// probability of class 1 as the verifier step reads two scores: in double, rounded to float
float secondClassProbability(const float* scores);

struct Sgd {
    float rate = 0.01f, momentum = 0.9f, decay = 1e-4f;
    // the gradient's overall length is cut to this: the deep palm chains have no
    // normalisation, and one bad batch early on can throw them off for good
    float clip = 5.0f;
    // one step on the mean gradient of a batch of `batch` samples
    void step(Net& net, int batch) const;
};

// The runtime's network with the trained weights: a data layer, then one runtime layer per
// trainer layer in a plain chain.
NnDetector exportNetwork(const Net& net, const std::string& name, LQ::ColorMode mode);

// the palm verifier chains (every convolution but "final" followed by a PReLU)
Net palmChain(const std::vector<ConvShape>& shape, int height, int width);

}  // namespace nntrain
