#include "TrainLayers.h"

#include <algorithm>
#include <cfloat>
#include <cmath>
#include <random>
#include <stdexcept>

namespace nntrain {

namespace {

// uniform in -scale .. scale from raw words, so weights don't depend on the library's
// distributions
void fillUniform(std::vector<float>& values, float scale, std::uint64_t seed) {
    std::mt19937_64 random(seed);
    for (float& x : values) x = static_cast<float>((static_cast<double>(random() >> 11) / 9007199254740992.0 * 2 - 1) * scale);
}

}  // namespace

Conv::Conv(std::string name, int outputs_, int inputs_, int kernelHeight_, int kernelWidth_, int stride_, int pad_)
    : Layer(std::move(name)), outputs(outputs_), inputs(inputs_), kernelHeight(kernelHeight_), kernelWidth(kernelWidth_),
      stride(stride_), pad(pad_) {
    if (stride < 1 || pad < 0) throw std::invalid_argument(this->name() + ": bad stride or pad");
    weight.shape(outputs, inputs, kernelHeight, kernelWidth);
    bias.shape(outputs, 1, 1, 1);
    bias.decay = false;
}

void Conv::outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const {
    if (c != inputs) throw std::invalid_argument(name() + ": input channels differ from the filter's");
    oc = outputs;
    oh = (h + 2 * pad - kernelHeight) / stride + 1;
    ow = (w + 2 * pad - kernelWidth) / stride + 1;
    if (h + 2 * pad < kernelHeight || w + 2 * pad < kernelWidth) throw std::invalid_argument(name() + ": input too small");
}

void Conv::initialise(std::uint64_t seed) {
    // He-style range for the PReLUs that follow
    const float fanIn = static_cast<float>(inputs * kernelHeight * kernelWidth);
    fillUniform(weight.value, std::sqrt(6.0f / fanIn), seed);
    std::fill(bias.value.begin(), bias.value.end(), 0.0f);
}

void Conv::padded(const float* plane, int h, int w, float* out) const {
    const int pw = w + 2 * pad;
    std::fill(out, out + static_cast<size_t>(h + 2 * pad) * pw, 0.0f);
    for (int y = 0; y < h; ++y) std::copy(plane + y * w, plane + (y + 1) * w, out + (y + pad) * pw + pad);
}

void Conv::forward(const Tensor& in, Tensor& out) {
    int oc, oh, ow;
    outputShape(in.c, in.h, in.w, oc, oh, ow);
    out.resize(in.n, oc, oh, ow);
    const int ph = in.h + 2 * pad, pw = in.w + 2 * pad;
    scratch_.resize(static_cast<size_t>(in.c) * ph * pw);
    for (int n = 0; n < in.n; ++n) {
        const float* x = in.sample(n);
        if (pad) {
            for (int c = 0; c < in.c; ++c) padded(x + static_cast<size_t>(c) * in.h * in.w, in.h, in.w, &scratch_[static_cast<size_t>(c) * ph * pw]);
            x = scratch_.data();
        }
        float* y = out.sample(n);
        for (int f = 0; f < oc; ++f) {
            float* plane = y + static_cast<size_t>(f) * oh * ow;
            std::fill(plane, plane + oh * ow, bias.value[f]);
            for (int c = 0; c < in.c; ++c) {
                const float* src = x + static_cast<size_t>(c) * ph * pw;
                const float* k = &weight.value[((static_cast<size_t>(f) * inputs + c) * kernelHeight) * kernelWidth];
                for (int oy = 0; oy < oh; ++oy) {
                    float* row = plane + oy * ow;
                    for (int ky = 0; ky < kernelHeight; ++ky) {
                        const float* s = src + (oy * stride + ky) * pw;
                        for (int kx = 0; kx < kernelWidth; ++kx) {
                            const float kv = k[ky * kernelWidth + kx];
                            const float* sx = s + kx;
                            if (stride == 1)
                                for (int ox = 0; ox < ow; ++ox) row[ox] += kv * sx[ox];
                            else
                                for (int ox = 0; ox < ow; ++ox) row[ox] += kv * sx[ox * stride];
                        }
                    }
                }
            }
        }
    }
}

void Conv::backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) {
    const int oh = out.h, ow = out.w;
    const int ph = in.h + 2 * pad, pw = in.w + 2 * pad;
    std::vector<float> dpad(static_cast<size_t>(in.c) * ph * pw);
    scratch_.resize(static_cast<size_t>(in.c) * ph * pw);
    if (din) din->resize(in.n, in.c, in.h, in.w);
    for (int n = 0; n < in.n; ++n) {
        const float* x = in.sample(n);
        if (pad) {
            for (int c = 0; c < in.c; ++c) padded(x + static_cast<size_t>(c) * in.h * in.w, in.h, in.w, &scratch_[static_cast<size_t>(c) * ph * pw]);
            x = scratch_.data();
        }
        std::fill(dpad.begin(), dpad.end(), 0.0f);
        const float* g = dout.sample(n);
        for (int f = 0; f < outputs; ++f) {
            const float* gp = g + static_cast<size_t>(f) * oh * ow;
            float sum = 0;
            for (int i = 0; i < oh * ow; ++i) sum += gp[i];
            bias.grad[f] += sum;
            for (int c = 0; c < in.c; ++c) {
                const float* src = x + static_cast<size_t>(c) * ph * pw;
                float* dsrc = &dpad[static_cast<size_t>(c) * ph * pw];
                const size_t kBase = ((static_cast<size_t>(f) * inputs + c) * kernelHeight) * kernelWidth;
                const float* k = &weight.value[kBase];
                float* dk = &weight.grad[kBase];
                for (int ky = 0; ky < kernelHeight; ++ky)
                    for (int kx = 0; kx < kernelWidth; ++kx) {
                        const float kv = k[ky * kernelWidth + kx];
                        float acc = 0;
                        for (int oy = 0; oy < oh; ++oy) {
                            const float* grow = gp + oy * ow;
                            const float* s = src + (oy * stride + ky) * pw + kx;
                            float* ds = dsrc + (oy * stride + ky) * pw + kx;
                            if (stride == 1) {
                                for (int ox = 0; ox < ow; ++ox) acc += grow[ox] * s[ox];
                                if (din)
                                    for (int ox = 0; ox < ow; ++ox) ds[ox] += kv * grow[ox];
                            } else {
                                for (int ox = 0; ox < ow; ++ox) acc += grow[ox] * s[ox * stride];
                                if (din)
                                    for (int ox = 0; ox < ow; ++ox) ds[ox * stride] += kv * grow[ox];
                            }
                        }
                        dk[ky * kernelWidth + kx] += acc;
                    }
            }
        }
        if (din) {
            float* d = din->sample(n);
            for (int c = 0; c < in.c; ++c)
                for (int y = 0; y < in.h; ++y) {
                    const float* srow = &dpad[(static_cast<size_t>(c) * ph + y + pad) * pw + pad];
                    std::copy(srow, srow + in.w, d + (static_cast<size_t>(c) * in.h + y) * in.w);
                }
        }
    }
}

PRelu::PRelu(std::string name, int channels) : Layer(std::move(name)) {
    slope.shape(channels, 1, 1, 1);
    slope.decay = false;
    initialise(0);
}

void PRelu::initialise(std::uint64_t) { std::fill(slope.value.begin(), slope.value.end(), 0.25f); }

void PRelu::forward(const Tensor& in, Tensor& out) {
    if (in.c != slope.n) throw std::invalid_argument(name() + ": channels differ from the slopes");
    out.resize(in.n, in.c, in.h, in.w);
    const int area = in.h * in.w;
    for (int n = 0; n < in.n; ++n)
        for (int c = 0; c < in.c; ++c) {
            const float s = slope.value[c];
            const float* x = in.sample(n) + static_cast<size_t>(c) * area;
            float* y = out.sample(n) + static_cast<size_t>(c) * area;
            for (int i = 0; i < area; ++i) y[i] = x[i] < 0 ? x[i] * s : x[i];
        }
}

void PRelu::backward(const Tensor& in, const Tensor&, const Tensor& dout, Tensor* din) {
    if (din) din->resize(in.n, in.c, in.h, in.w);
    const int area = in.h * in.w;
    for (int n = 0; n < in.n; ++n)
        for (int c = 0; c < in.c; ++c) {
            const float s = slope.value[c];
            const size_t base = static_cast<size_t>(c) * area;
            const float* x = in.sample(n) + base;
            const float* g = dout.sample(n) + base;
            float ds = 0;
            for (int i = 0; i < area; ++i)
                if (x[i] < 0) ds += g[i] * x[i];
            slope.grad[c] += ds;
            if (din) {
                float* d = din->sample(n) + base;
                for (int i = 0; i < area; ++i) d[i] = x[i] < 0 ? g[i] * s : g[i];
            }
        }
}

void Relu::forward(const Tensor& in, Tensor& out) {
    out.resize(in.n, in.c, in.h, in.w);
    for (size_t i = 0; i < in.size(); ++i) out.v[i] = std::max(in.v[i], 0.0f);
}

void Relu::backward(const Tensor& in, const Tensor&, const Tensor& dout, Tensor* din) {
    if (!din) return;
    din->resize(in.n, in.c, in.h, in.w);
    for (size_t i = 0; i < in.size(); ++i) din->v[i] = in.v[i] > 0 ? dout.v[i] : 0.0f;
}

int pooledSize(int size, int kernel, int stride) {
    // the runtime divides in floats and rounds up
    if (kernel == stride) return static_cast<int>(std::ceil(static_cast<float>(size) / static_cast<float>(stride)));
    return static_cast<int>(std::ceil(static_cast<float>(size - kernel) / static_cast<float>(stride))) + 1;
}

MaxPool::MaxPool(std::string name, int kernel_, int stride_) : Layer(std::move(name)), kernel(kernel_), stride(stride_) {
    // a window wholly outside the input would keep the lowest float in the runtime
    if (kernel < 1 || stride < 1 || stride > kernel) throw std::invalid_argument(this->name() + ": bad kernel or stride");
}

void MaxPool::outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const {
    oc = c;
    oh = pooledSize(h, kernel, stride);
    ow = pooledSize(w, kernel, stride);
}

void MaxPool::forward(const Tensor& in, Tensor& out) {
    int oc, oh, ow;
    outputShape(in.c, in.h, in.w, oc, oh, ow);
    out.resize(in.n, oc, oh, ow);
    argmax_.assign(out.size(), 0);
    size_t o = 0;
    for (int n = 0; n < in.n; ++n)
        for (int c = 0; c < in.c; ++c) {
            const float* x = in.sample(n) + static_cast<size_t>(c) * in.h * in.w;
            for (int oy = 0; oy < oh; ++oy)
                for (int ox = 0; ox < ow; ++ox, ++o) {
                    float best = -FLT_MAX;
                    int at = 0;
                    for (int y = oy * stride; y < std::min(in.h, oy * stride + kernel); ++y)
                        for (int x0 = ox * stride; x0 < std::min(in.w, ox * stride + kernel); ++x0)
                            if (x[y * in.w + x0] > best) best = x[y * in.w + x0], at = y * in.w + x0;
                    out.v[o] = best;
                    argmax_[o] = at;
                }
        }
}

void MaxPool::backward(const Tensor& in, const Tensor& out, const Tensor& dout, Tensor* din) {
    if (!din) return;
    din->resize(in.n, in.c, in.h, in.w);
    const size_t area = static_cast<size_t>(out.h) * out.w, inArea = static_cast<size_t>(in.h) * in.w;
    for (size_t o = 0; o < out.size(); ++o) din->v[(o / area) * inArea + argmax_[o]] += dout.v[o];
}

InnerProduct::InnerProduct(std::string name, int outputs_, int inputs_)
    : Layer(std::move(name)), outputs(outputs_), inputs(inputs_) {
    weight.shape(1, 1, outputs, inputs);
    bias.shape(1, 1, 1, outputs);
    bias.decay = false;
}

void InnerProduct::outputShape(int c, int h, int w, int& oc, int& oh, int& ow) const {
    if (c * h * w != inputs) throw std::invalid_argument(name() + ": input size differs from the weights'");
    oc = outputs, oh = 1, ow = 1;
}

void InnerProduct::initialise(std::uint64_t seed) {
    fillUniform(weight.value, std::sqrt(6.0f / static_cast<float>(inputs)), seed);
    std::fill(bias.value.begin(), bias.value.end(), 0.0f);
}

void InnerProduct::forward(const Tensor& in, Tensor& out) {
    int oc, oh, ow;
    outputShape(in.c, in.h, in.w, oc, oh, ow);
    out.resize(in.n, outputs, 1, 1);
    for (int n = 0; n < in.n; ++n) {
        const float* x = in.sample(n);
        for (int o = 0; o < outputs; ++o) {
            const float* row = &weight.value[static_cast<size_t>(o) * inputs];
            float acc = bias.value[o];
            for (int i = 0; i < inputs; ++i) acc += x[i] * row[i];
            out.v[static_cast<size_t>(n) * outputs + o] = acc;
        }
    }
}

void InnerProduct::backward(const Tensor& in, const Tensor&, const Tensor& dout, Tensor* din) {
    if (din) din->resize(in.n, in.c, in.h, in.w);
    for (int n = 0; n < in.n; ++n) {
        const float* x = in.sample(n);
        for (int o = 0; o < outputs; ++o) {
            const float g = dout.v[static_cast<size_t>(n) * outputs + o];
            bias.grad[o] += g;
            float* drow = &weight.grad[static_cast<size_t>(o) * inputs];
            const float* row = &weight.value[static_cast<size_t>(o) * inputs];
            for (int i = 0; i < inputs; ++i) drow[i] += g * x[i];
            if (din) {
                float* d = din->sample(n);
                for (int i = 0; i < inputs; ++i) d[i] += g * row[i];
            }
        }
    }
}

}  // namespace nntrain
