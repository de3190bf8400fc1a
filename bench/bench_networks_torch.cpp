// The palm verifier shapes run by libtorch on one thread with the same weights and input
// as ours, beside our runtime's figures in bench_networks. Built where Debian's
// libtorch-dev is installed. The outputs are compared once before timing.

#include <benchmark/benchmark.h>
#include <torch/torch.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <random>

#include "ConvolutionLayer.h"
#include "NnDetector.h"
#include "PReluLayer.h"
#include "PalmNetworks.h"

namespace {

torch::Tensor tensorOf(const Blob& blob, std::vector<int64_t> shape) {
    return torch::from_blob(const_cast<float*>(blob.data()), shape, torch::kFloat32).clone();
}

torch::nn::Sequential torchNetwork(const NnDetector& net) {
    torch::nn::Sequential sequence;
    torch::NoGradGuard noGrad;
    for (const LQ::SharedPtr<BaseLayer>& layer : net.getNetwork()) {
        if (layer->type() == "ConvolutionLayer") {
            const ConvolutionLayer& conv = static_cast<const ConvolutionLayer&>(*layer);
            const Blob& f = conv.getFilter();
            torch::nn::Conv2d c(torch::nn::Conv2dOptions(f.channels(), f.num(), {f.height(), f.width()})
                                    .stride(conv.getStride())
                                    .padding(conv.getPad())
                                    .bias(true));
            c->weight.copy_(tensorOf(f, {f.num(), f.channels(), f.height(), f.width()}));
            c->bias.copy_(tensorOf(conv.getBias(), {conv.getBias().size()}));
            sequence->push_back(c);
        } else if (layer->type() == "PReluLayer") {
            const Blob& slope = static_cast<const PReluLayer&>(*layer).getSlope();
            torch::nn::PReLU p(torch::nn::PReLUOptions().num_parameters(slope.size()));
            p->weight.copy_(tensorOf(slope, {slope.size()}));
            sequence->push_back(p);
        }
    }
    sequence->eval();
    return sequence;
}

// the mono patch scaled as our input conversion does by default
torch::Tensor input(const LQ::Image& image) {
    torch::Tensor t = torch::empty({1, 1, image.height(), image.width()});
    float* p = t.data_ptr<float>();
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x) *p++ = image.pixel(x, y)[0] / 256.f;
    return t;
}

void BM_PalmNetworkLibtorch(benchmark::State& state) {
    const bool large = state.range(0) != 0;
    torch::set_num_threads(1);
    NnDetector net = palmVerifier(large, 1);
    torch::nn::Sequential reference = torchNetwork(net);
    const LQ::Image image = randomPatch(net.getSize(), 3);
    torch::NoGradGuard noGrad;
    {
        const Blob& ours = net.detect(image);
        const torch::Tensor theirs = reference->forward(input(image)).contiguous();
        float worst = 0;
        for (int i = 0; i < ours.size(); ++i)
            worst = std::max(worst, std::fabs(ours.data()[i] - theirs.data_ptr<float>()[i]));
        if (theirs.numel() != ours.size() || worst > 1e-4f) {
            std::fprintf(stderr, "libtorch disagrees with our runtime: %g\n", worst);
            std::abort();
        }
    }
    for (auto _ : state) benchmark::DoNotOptimize(reference->forward(input(image)).data_ptr<float>());
    state.SetLabel(large ? "50x60" : "35x33");
}
BENCHMARK(BM_PalmNetworkLibtorch)->Arg(0)->Arg(1)->Unit(benchmark::kMicrosecond);

}  // namespace
BENCHMARK_MAIN();
