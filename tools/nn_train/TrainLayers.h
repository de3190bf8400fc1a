#pragma once
// The verifier trainer's layers: batched forward and backward passes of the layers our
// runtime runs, with its shapes, padding, strides and pooling rounding, so that a trained
// network exports to an NnDetector as it stands.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace nntrain {

// planar N x C x H x W floats, the runtime's Blob layout
struct Tensor {
    int n = 0, c = 0, h = 0, w = 0;
    std::vector<float> v;

    Tensor() = default;
    Tensor(int n_, int c_, int h_, int w_) { resize(n_, c_, h_, w_); }
    void resize(int n_, int c_, int h_, int w_) {
        n = n_, c = c_, h = h_, w = w_;
        v.assign(static_cast<size_t>(n) * c * h * w, 0.0f);
    }
    size_t size() const { return v.size(); }
    size_t volume() const { return static_cast<size_t>(c) * h * w; }
    float* sample(int i) { return v.data() + i * volume(); }
    const float* sample(int i) const { return v.data() + i * volume(); }
};

// a weight array in the shape of the runtime's Blob that will hold it
struct Param {
    int n = 0, c = 0, h = 0, w = 0;
    std::vector<float> value, grad, velocity;
    bool decay = true;  // weight decay applies (not to biases and slopes)

    void shape(int n_, int c_, int h_, int w_) {
        n = n_, c = c_, h = h_, w = w_;
        const size_t count = static_cast<size_t>(n) * c * h * w;
        value.assign(count, 0.0f);
        grad.assign(count, 0.0f);
        velocity.assign(count, 0.0f);
    }
};

class Layer {
public:
    explicit Layer(std::string name) : name_(std::move(name)) {}
    virtual ~Layer() = default;
    const std::string& name() const { return name_; }
    virtual const char* kind() const = 0;
    // output channels, height, width for an input of c x h x w
    virtual void outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const = 0;
    virtual void forward(const Tensor& in, Tensor& out) = 0;
    // adds the parameters' gradients; din, when given, receives the input's gradient
    virtual void backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) = 0;
    virtual std::vector<Param*> params() { return {}; }
    // fresh weights for `fanIn` inputs per output
    virtual void initialise(std::uint64_t seed) { (void)seed; }

private:
    std::string name_;
};

// cross-correlation without groups; output size rounds down as the runtime's does
class Conv : public Layer {
public:
    Conv(std::string name, int outputs, int inputs, int kernelHeight, int kernelWidth, int stride = 1, int pad = 0);
    const char* kind() const override { return "conv"; }
    void outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const override;
    void forward(const Tensor& in, Tensor& out) override;
    void backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) override;
    std::vector<Param*> params() override { return {&weight, &bias}; }
    void initialise(std::uint64_t seed) override;

    int outputs, inputs, kernelHeight, kernelWidth, stride, pad;
    Param weight;  // outputs x inputs x kh x kw
    Param bias;    // outputs x 1 x 1 x 1

private:
    void padded(const float* plane, int h, int w, float* out) const;
    std::vector<float> scratch_;
};

// one slope per channel for the negative side
class PRelu : public Layer {
public:
    PRelu(std::string name, int channels);
    const char* kind() const override { return "prelu"; }
    void outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const override { oc = c, oh = h, ow = w; }
    void forward(const Tensor& in, Tensor& out) override;
    void backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) override;
    std::vector<Param*> params() override { return {&slope}; }
    void initialise(std::uint64_t) override;

    Param slope;  // channels x 1 x 1 x 1
};

class Relu : public Layer {
public:
    explicit Relu(std::string name) : Layer(std::move(name)) {}
    const char* kind() const override { return "relu"; }
    void outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const override { oc = c, oh = h, ow = w; }
    void forward(const Tensor& in, Tensor& out) override;
    void backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) override;
};

// maximum pooling; the output size rounds up and the last windows are clipped
class MaxPool : public Layer {
public:
    MaxPool(std::string name, int kernel, int stride);
    const char* kind() const override { return "pool"; }
    void outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const override;
    void forward(const Tensor& in, Tensor& out) override;
    void backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) override;

    int kernel, stride;

private:
    std::vector<int> argmax_;
};

// every output reads the whole input in planar order
class InnerProduct : public Layer {
public:
    InnerProduct(std::string name, int outputs, int inputs);
    const char* kind() const override { return "inner"; }
    void outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const override;
    void forward(const Tensor& in, Tensor& out) override;
    void backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) override;
    std::vector<Param*> params() override { return {&weight, &bias}; }
    void initialise(std::uint64_t seed) override;

    int outputs, inputs;
    Param weight;  // 1 x 1 x outputs x inputs
    Param bias;    // 1 x 1 x 1 x outputs
};

// pooling output size, shared with the shape checks
int pooledSize(int size, int kernel, int stride);

}  // namespace nntrain
