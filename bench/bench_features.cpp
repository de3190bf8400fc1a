// The detector features on the 640x360 working image: integral image, census transform,
// integral HOG and Sobel gradients, each beside OpenCV (one thread) where it has the same work.
// cv::Sobel is a rough peer: it writes two 16-bit planes where SobelGradient writes one
// interleaved plane of Gx / 8 and Gy / 8.
//   build/release/bench/bench_features --benchmark_repetitions=5 --benchmark_report_aggregates_only=true

#include <benchmark/benchmark.h>

#include <random>

#include "LQ_Gradients.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"

#if defined(TACTUS_WITH_OPENCV)
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace {
constexpr int kWidth = 640, kHeight = 360;

// smooth content with noise, like a camera picture; the same on every run
LQ::Image picture() {
    LQ::Image image(LQ::Size(kWidth, kHeight), LQ::COLOR_MODE_MONO);
    std::mt19937 random(5);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) image.row(y)[x] = static_cast<unsigned char>((x + 2 * y) / 5 + random() % 24);
    return image;
}

template <class F>
void run(benchmark::State& state, F f) {
    for (auto _ : state) {
        f();
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
}

#if defined(TACTUS_WITH_OPENCV)
cv::Mat asMat(const LQ::Image& image) {
    return cv::Mat(image.height(), image.width(), CV_8UC1, image.data(), image.stripLength());
}
struct OneThread {
    OneThread() { cv::setNumThreads(1); }
} oneThread;
#endif

void Integral_tactus(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    run(s, [&] { LQ::computeIntegral(in, out); });
}
BENCHMARK(Integral_tactus)->Name("Integral/tactus")->Unit(benchmark::kMicrosecond);

void Integral_scalar(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    LQ::computeIntegral(in, out);
    run(s, [&] {
        for (int y = 0; y < kHeight; ++y)
            LQ::integralRowScalar(in.row(y), out.row<unsigned int>(y), out.row<unsigned int>(y + 1), kWidth);
    });
}
BENCHMARK(Integral_scalar)->Name("Integral/tactus-scalar-rows")->Unit(benchmark::kMicrosecond);

void Rmct_tactus(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    run(s, [&] { LQ::computeRmct(in, out); });
}
BENCHMARK(Rmct_tactus)->Name("Rmct/tactus")->Unit(benchmark::kMicrosecond);

void Rmct_scalar(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    LQ::computeRmct(in, out);
    run(s, [&] {
        for (int y = 1; y + 1 < kHeight; ++y) LQ::rmctRowScalar(in.row(y - 1), in.row(y), in.row(y + 1), out.row(y), kWidth);
    });
}
BENCHMARK(Rmct_scalar)->Name("Rmct/tactus-scalar-rows")->Unit(benchmark::kMicrosecond);

void IntegralHog6_tactus(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    run(s, [&] { LQ::computeIntegralHog(in, out, in.rect(), LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6); });
}
BENCHMARK(IntegralHog6_tactus)->Name("IntegralHogUnsigned6/tactus")->Unit(benchmark::kMicrosecond);

void IntegralHog12_tactus(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    run(s, [&] { LQ::computeIntegralHog(in, out, in.rect(), LQ::COLOR_MODE_INTEGRAL_HOG_SIGNED12); });
}
BENCHMARK(IntegralHog12_tactus)->Name("IntegralHogSigned12/tactus")->Unit(benchmark::kMicrosecond);

void Sobel_tactus(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    run(s, [&] { LQ::SobelGradient(in, out); });
}
BENCHMARK(Sobel_tactus)->Name("Sobel/tactus")->Unit(benchmark::kMicrosecond);

void Sobel_scalar(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image out;
    LQ::SobelGradient(in, out);
    run(s, [&] {
        for (int y = 1; y + 1 < kHeight; ++y)
            LQ::sobelRowScalar(in.row(y - 1), in.row(y), in.row(y + 1), reinterpret_cast<signed char*>(out.row(y)), kWidth);
    });
}
BENCHMARK(Sobel_scalar)->Name("Sobel/tactus-scalar-rows")->Unit(benchmark::kMicrosecond);

void Sobel16_tactus(benchmark::State& s) {
    const LQ::Image in = picture();
    LQ::Image first, second;
    run(s, [&] { LQ::computeSobelGradient(in, first, second); });
}
BENCHMARK(Sobel16_tactus)->Name("Sobel16/tactus")->Unit(benchmark::kMicrosecond);

#if defined(TACTUS_WITH_OPENCV)
void Integral_opencv(benchmark::State& s) {
    const LQ::Image in = picture();
    cv::Mat source = asMat(in), sums;
    run(s, [&] { cv::integral(source, sums, CV_32S); });
}
BENCHMARK(Integral_opencv)->Name("Integral/opencv")->Unit(benchmark::kMicrosecond);

void Sobel_opencv(benchmark::State& s) {
    const LQ::Image in = picture();
    cv::Mat source = asMat(in), dx, dy;
    run(s, [&] {
        cv::Sobel(source, dx, CV_16S, 1, 0);
        cv::Sobel(source, dy, CV_16S, 0, 1);
    });
}
BENCHMARK(Sobel_opencv)->Name("Sobel/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK(Sobel_opencv)->Name("Sobel16/opencv")->Unit(benchmark::kMicrosecond);
#endif
}  // namespace

BENCHMARK_MAIN();
