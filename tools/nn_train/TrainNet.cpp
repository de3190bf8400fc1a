#include "TrainNet.h"

#include <cmath>
#include <stdexcept>

#include "ConvolutionLayer.h"
#include "DataLayer.h"
#include "InnerProductLayer.h"
#include "PReluLayer.h"
#include "PoolingLayer.h"
#include "ReluLayer.h"

namespace nntrain {

Layer& Net::add(std::unique_ptr<Layer> layer) {
    int c, h, w;
    outputShape(c, h, w);
    int oc, oh, ow;
    layer->outputShape(c, h, w, oc, oh, ow);  // throws when the layer can't take this input
    layers_.push_back(std::move(layer));
    return *layers_.back();
}

void Net::outputShape(int& c, int& h, int& w) const {
    c = channels_, h = height_, w = width_;
    for (const auto& layer : layers_) {
        int oc, oh, ow;
        layer->outputShape(c, h, w, oc, oh, ow);
        c = oc, h = oh, w = ow;
    }
}

void Net::initialise(std::uint64_t seed) {
    for (size_t i = 0; i < layers_.size(); ++i) layers_[i]->initialise(seed * 1000003u + i);
}

const Tensor& Net::forward(const Tensor& input) {
    if (input.c != channels_ || input.h != height_ || input.w != width_)
        throw std::invalid_argument("input shape differs from the network's");
    input_ = &input;
    outputs_.resize(layers_.size());
    const Tensor* x = &input;
    for (size_t i = 0; i < layers_.size(); ++i) {
        layers_[i]->forward(*x, outputs_[i]);
        x = &outputs_[i];
    }
    return *x;
}

void Net::backward(const Tensor& dout) {
    gradOut_ = dout;
    for (size_t i = layers_.size(); i-- > 0;) {
        const Tensor& in = i ? outputs_[i - 1] : *input_;
        layers_[i]->backward(in, outputs_[i], gradOut_, i ? &gradIn_ : nullptr);
        if (i) std::swap(gradIn_, gradOut_);
    }
}

void Net::zeroGradients() {
    for (Param* p : params()) std::fill(p->grad.begin(), p->grad.end(), 0.0f);
}

std::vector<Param*> Net::params() {
    std::vector<Param*> all;
    for (auto& layer : layers_)
        for (Param* p : layer->params()) all.push_back(p);
    return all;
}

float softmaxCrossEntropy(const Tensor& scores, const std::vector<int>& labels, const std::vector<float>& weights,
                          Tensor& gradient) {
    if (scores.c * scores.h * scores.w != 2) throw std::invalid_argument("two class scores expected");
    gradient.resize(scores.n, scores.c, scores.h, scores.w);
    double loss = 0, total = 0;
    for (int n = 0; n < scores.n; ++n) total += weights[n];
    if (total <= 0) return 0;
    for (int n = 0; n < scores.n; ++n) {
        const float* s = scores.sample(n);
        const double m = std::max(s[0], s[1]);
        const double e0 = std::exp(s[0] - m), e1 = std::exp(s[1] - m);
        const double p1 = e1 / (e0 + e1), p0 = 1 - p1;
        const double w = weights[n] / total;
        loss -= w * std::log(std::max(labels[n] ? p1 : p0, 1e-12));
        gradient.sample(n)[0] = static_cast<float>(w * (p0 - (labels[n] == 0)));
        gradient.sample(n)[1] = static_cast<float>(w * (p1 - (labels[n] == 1)));
    }
    return static_cast<float>(loss);
}

float secondClassProbability(const float* o) {
    return static_cast<float>(std::exp(static_cast<double>(o[1])) /
                              (std::exp(static_cast<double>(o[0])) + std::exp(static_cast<double>(o[1]))));
}

void Sgd::step(Net& net, int batch) const {
    (void)batch;  // the loss is already a mean over the batch
    double norm = 0;
    for (Param* p : net.params())
        for (float g : p->grad) norm += double(g) * g;
    norm = std::sqrt(norm);
    const float cut = clip > 0 && norm > clip ? static_cast<float>(clip / norm) : 1.0f;
    for (Param* p : net.params()) {
        const float d = p->decay ? decay : 0.0f;
        for (size_t i = 0; i < p->value.size(); ++i) {
            p->velocity[i] = momentum * p->velocity[i] - rate * (cut * p->grad[i] + d * p->value[i]);
            p->value[i] += p->velocity[i];
        }
    }
}

namespace {

Blob toBlob(const Param& p) {
    Blob blob(p.n, p.c, p.h, p.w);
    for (size_t i = 0; i < p.value.size(); ++i) blob.data()[i] = p.value[i];
    // the model reader clears these, so the network in memory matches a loaded one
    blob.zeroSmallValues(1e-10f);
    return blob;
}

}  // namespace

NnDetector exportNetwork(const Net& net, const std::string& name, LQ::ColorMode mode) {
    if (LQ::depth(mode) != net.channels()) throw std::invalid_argument("colour mode depth differs from the input channels");
    NnDetector out;
    out.setName(name);
    out.setInputColorMode(mode);
    LQ::SharedPtr<BaseLayer> previous(new DataLayer("data"));
    out.addLayer(previous);
    for (const auto& layer : net.layers()) {
        LQ::SharedPtr<BaseLayer> next;
        if (auto* conv = dynamic_cast<const Conv*>(layer.get()))
            next = LQ::SharedPtr<BaseLayer>(new ConvolutionLayer(toBlob(conv->weight), toBlob(conv->bias), conv->name(), conv->stride, conv->pad));
        else if (auto* prelu = dynamic_cast<const PRelu*>(layer.get()))
            next = LQ::SharedPtr<BaseLayer>(new PReluLayer(prelu->name(), toBlob(prelu->slope)));
        else if (dynamic_cast<const Relu*>(layer.get()))
            next = LQ::SharedPtr<BaseLayer>(new ReluLayer(layer->name()));
        else if (auto* pool = dynamic_cast<const MaxPool*>(layer.get()))
            next = LQ::SharedPtr<BaseLayer>(new PoolingLayer(pool->kernel, pool->stride, pool->name()));
        else if (auto* inner = dynamic_cast<const InnerProduct*>(layer.get()))
            next = LQ::SharedPtr<BaseLayer>(new InnerProductLayer(toBlob(inner->weight), toBlob(inner->bias), inner->name()));
        else
            throw std::invalid_argument("no runtime layer for " + layer->name());
        next->addBottomLayer(previous);
        out.addLayer(next);
        previous = next;
    }
    out.setSize(LQ::BaseSize<int>(net.width(), net.height()));
    return out;
}

Net palmChain(const std::vector<ConvShape>& shape, int height, int width) {
    Net net(1, height, width);
    int relu = 0;
    for (const ConvShape& c : shape) {
        net.add(std::make_unique<Conv>(c.name, c.outputs, c.inputs, c.height, c.width, c.stride, c.pad));
        if (std::string(c.name) == "final") break;
        net.add(std::make_unique<PRelu>("PReLU" + std::to_string(++relu), c.outputs));
    }
    return net;
}

}  // namespace nntrain
