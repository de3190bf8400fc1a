// Colour conversions of the 640x360 working image and of the 1280x720 NV21 preview, each
// beside its nearest peer: OpenCV's cvtColor on one core, libyuv for the camera frames.
// The peers' formulas differ from ours; the work is the same.
//   build/helper-color/bench/bench_color --benchmark_repetitions=5 --benchmark_report_aggregates_only=true

#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "LQ_ColorSpaceConversion.h"

#if defined(TACTUS_WITH_OPENCV)
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif
#if defined(TACTUS_WITH_LIBYUV)
#include <libyuv.h>
#endif

namespace {

constexpr int kWidth = 640, kHeight = 360;
constexpr int kFrameWidth = 1280, kFrameHeight = 720;

LQ::Image randomImage(LQ::ColorMode mode) {
    LQ::Image image(LQ::Size(kWidth, kHeight), mode);
    std::mt19937 random(5);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth * image.depth(); ++x) image.row(y)[x] = static_cast<unsigned char>(random());
    return image;
}

std::vector<unsigned char> randomFrame() {
    std::vector<unsigned char> frame(kFrameWidth * kFrameHeight * 3 / 2);
    std::mt19937 random(6);
    for (auto& b : frame) b = static_cast<unsigned char>(random());
    return frame;
}

using Conversion = void (*)(const LQ::Image&, LQ::Image&, const LQ::BaseRect<int>&);

void tactus(benchmark::State& state, LQ::ColorMode from, Conversion convert) {
    const LQ::Image source = randomImage(from);
    LQ::Image target;
    for (auto _ : state) {
        convert(source, target, LQ::Rect());
        benchmark::DoNotOptimize(target.data());
        benchmark::ClobberMemory();
    }
}

BENCHMARK_CAPTURE(tactus, BgrToMono, LQ::COLOR_MODE_BGR, LQ::bgrToMono)->Name("BgrToMono/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactus, RgbaToMono, LQ::COLOR_MODE_RGBA, LQ::rgbaToMono)->Name("RgbaToMono/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactus, YuvToMono, LQ::COLOR_MODE_YUV, LQ::yuvToMono)->Name("YuvToMono/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactus, BgrToRgb, LQ::COLOR_MODE_BGR, LQ::bgrToRgb)->Name("BgrToRgb/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactus, BgrToYuv, LQ::COLOR_MODE_BGR, LQ::bgrToYuv)->Name("BgrToYuv/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactus, YuvToBgr, LQ::COLOR_MODE_YUV, LQ::yuvToBgr)->Name("YuvToBgr/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactus, MonoToBgr, LQ::COLOR_MODE_MONO, LQ::monoToBgr)->Name("MonoToBgr/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactus, BgrToRgba, LQ::COLOR_MODE_BGR, LQ::bgrToRgba)->Name("BgrToRgba/tactus")->Unit(benchmark::kMicrosecond);

#if defined(TACTUS_WITH_OPENCV)
// code < 0: the first channel, as the peer of a YUV image's luma
void opencv(benchmark::State& state, LQ::ColorMode from, int code) {
    cv::setNumThreads(1);
    const LQ::Image image = randomImage(from);
    const cv::Mat source(kHeight, kWidth, CV_8UC(image.depth()), const_cast<unsigned char*>(image.data()));
    cv::Mat target;
    for (auto _ : state) {
        if (code < 0)
            cv::extractChannel(source, target, 0);
        else
            cv::cvtColor(source, target, code);
        benchmark::DoNotOptimize(target.data);
        benchmark::ClobberMemory();
    }
}

BENCHMARK_CAPTURE(opencv, BgrToMono, LQ::COLOR_MODE_BGR, cv::COLOR_BGR2GRAY)->Name("BgrToMono/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(opencv, RgbaToMono, LQ::COLOR_MODE_RGBA, cv::COLOR_RGBA2GRAY)->Name("RgbaToMono/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(opencv, YuvToMono, LQ::COLOR_MODE_YUV, -1)->Name("YuvToMono/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(opencv, BgrToRgb, LQ::COLOR_MODE_BGR, cv::COLOR_BGR2RGB)->Name("BgrToRgb/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(opencv, BgrToYuv, LQ::COLOR_MODE_BGR, cv::COLOR_BGR2YUV)->Name("BgrToYuv/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(opencv, YuvToBgr, LQ::COLOR_MODE_YUV, cv::COLOR_YUV2BGR)->Name("YuvToBgr/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(opencv, MonoToBgr, LQ::COLOR_MODE_MONO, cv::COLOR_GRAY2BGR)->Name("MonoToBgr/opencv")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(opencv, BgrToRgba, LQ::COLOR_MODE_BGR, cv::COLOR_BGR2RGBA)->Name("BgrToRgba/opencv")->Unit(benchmark::kMicrosecond);
#endif

using FrameConversion = void (*)(const unsigned char*, const LQ::BaseSize<int>&, LQ::Image&);

void tactusFrame(benchmark::State& state, FrameConversion convert) {
    const std::vector<unsigned char> frame = randomFrame();
    LQ::Image target;
    for (auto _ : state) {
        convert(frame.data(), LQ::Size(kFrameWidth, kFrameHeight), target);
        benchmark::DoNotOptimize(target.data());
        benchmark::ClobberMemory();
    }
}

BENCHMARK_CAPTURE(tactusFrame, Nv21ToMono, LQ::nv21ToMono)->Name("Nv21ToMono/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactusFrame, Nv21ToYuv, LQ::nv21ToYuv)->Name("Nv21ToYuv/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactusFrame, Nv21ToYuvZoom2, LQ::nv21ToYuvZoom2)->Name("Nv21ToYuvZoom2/tactus")->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(tactusFrame, Nv21ToYuvZoom2Flip, LQ::nv21ToYuvZoom2Flip)->Name("Nv21ToYuvZoom2Flip/tactus")->Unit(benchmark::kMicrosecond);

#if defined(TACTUS_WITH_LIBYUV)
// the luma plane alone, as the first step of libyuv's NV12ToI420 does it
void BM_LibyuvCopyPlane(benchmark::State& state) {
    const std::vector<unsigned char> frame = randomFrame();
    std::vector<unsigned char> mono(kFrameWidth * kFrameHeight);
    for (auto _ : state) {
        libyuv::CopyPlane(frame.data(), kFrameWidth, mono.data(), kFrameWidth, kFrameWidth, kFrameHeight);
        benchmark::DoNotOptimize(mono.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_LibyuvCopyPlane)->Name("Nv21ToMono/libyuv")->Unit(benchmark::kMicrosecond);

void BM_LibyuvNV21ToYUV24(benchmark::State& state) {
    const std::vector<unsigned char> frame = randomFrame();
    std::vector<unsigned char> yuv(kFrameWidth * kFrameHeight * 3);
    for (auto _ : state) {
        libyuv::NV21ToYUV24(frame.data(), kFrameWidth, frame.data() + kFrameWidth * kFrameHeight, kFrameWidth, yuv.data(),
                            kFrameWidth * 3, kFrameWidth, kFrameHeight);
        benchmark::DoNotOptimize(yuv.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_LibyuvNV21ToYUV24)->Name("Nv21ToYuv/libyuv")->Unit(benchmark::kMicrosecond);

// Half size by point sampling, then interleaved: the nearest libyuv route to a half-size
// YUV picture (it keeps a quarter of our chroma pairs, so it reads less).
void BM_LibyuvNV12ScaleThenNV21ToYUV24(benchmark::State& state) {
    const std::vector<unsigned char> frame = randomFrame();
    const int w = kFrameWidth / 2, h = kFrameHeight / 2;
    std::vector<unsigned char> y(w * h), vu(w * h / 2), yuv(w * h * 3);
    for (auto _ : state) {
        libyuv::NV12Scale(frame.data(), kFrameWidth, frame.data() + kFrameWidth * kFrameHeight, kFrameWidth, kFrameWidth,
                          kFrameHeight, y.data(), w, vu.data(), w, w, h, libyuv::kFilterNone);
        libyuv::NV21ToYUV24(y.data(), w, vu.data(), w, yuv.data(), w * 3, w, h);
        benchmark::DoNotOptimize(yuv.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_LibyuvNV12ScaleThenNV21ToYUV24)->Name("Nv21ToYuvZoom2/libyuv")->Unit(benchmark::kMicrosecond);
#endif

}  // namespace

BENCHMARK_MAIN();
