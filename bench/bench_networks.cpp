// One forward pass of each palm verifier shape, the input conversion of a mono patch
// included, with OpenCV's dnn module beside it running the same weights on one thread.

#include <benchmark/benchmark.h>

#include <random>

#include "NnDetector.h"
#include "PalmNetworks.h"

#if defined(TACTUS_WITH_OPENCV_DNN)
#include <opencv2/core.hpp>

#include "OpenCvNetwork.h"
#endif

namespace {

void BM_PalmNetwork(benchmark::State& state) {
    const bool large = state.range(0) != 0;
    NnDetector net = palmVerifier(large, 1);
    const LQ::Image image = randomPatch(net.getSize(), 3);
    for (auto _ : state) benchmark::DoNotOptimize(net.detect(image).data());
    state.SetLabel(large ? "50x60" : "35x33");
}
BENCHMARK(BM_PalmNetwork)->Arg(0)->Arg(1)->Unit(benchmark::kMicrosecond);

#if defined(TACTUS_WITH_OPENCV_DNN)
void BM_PalmNetworkOpenCvDnn(benchmark::State& state) {
    const bool large = state.range(0) != 0;
    NnDetector net = palmVerifier(large, 1);
    cv::dnn::Net reference = openCvNetwork(net);
    cv::setNumThreads(1);
    const LQ::Image image = randomPatch(net.getSize(), 3);
    const cv::Mat mono(image.height(), image.width(), CV_8UC1, image.data(), image.stripLength());
    for (auto _ : state) {
        reference.setInput(cv::dnn::blobFromImage(mono, 1.0 / 256));
        benchmark::DoNotOptimize(reference.forward().data);
    }
    state.SetLabel(large ? "50x60" : "35x33");
}
BENCHMARK(BM_PalmNetworkOpenCvDnn)->Arg(0)->Arg(1)->Unit(benchmark::kMicrosecond);
#endif

}  // namespace
BENCHMARK_MAIN();
