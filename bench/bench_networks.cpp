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

LQ::Image patch(LQ::BaseSize<int> size) {
    std::mt19937 random(3);
    LQ::Image image(size, LQ::COLOR_MODE_MONO);
    for (int y = 0; y < size.height; ++y)
        for (int x = 0; x < size.width; ++x) image.pixel(x, y)[0] = static_cast<unsigned char>(random() % 256);
    return image;
}

NnDetector network(bool large) {
    return large ? palmNetwork("palm_verifier_iter_140000", kPalm50x60, LQ::BaseSize<int>(50, 60), 1)
                 : palmNetwork("palm_verifier__iter_250000", kPalm35x33, LQ::BaseSize<int>(35, 33), 1);
}

void BM_PalmNetwork(benchmark::State& state) {
    const bool large = state.range(0) != 0;
    NnDetector net = network(large);
    const LQ::Image image = patch(net.getSize());
    for (auto _ : state) benchmark::DoNotOptimize(net.detect(image).data());
    state.SetLabel(large ? "50x60" : "35x33");
}
BENCHMARK(BM_PalmNetwork)->Arg(0)->Arg(1)->Unit(benchmark::kMicrosecond);

#if defined(TACTUS_WITH_OPENCV_DNN)
void BM_PalmNetworkOpenCvDnn(benchmark::State& state) {
    const bool large = state.range(0) != 0;
    NnDetector net = network(large);
    cv::dnn::Net reference = openCvNetwork(net);
    cv::setNumThreads(1);
    const LQ::Image image = patch(net.getSize());
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
