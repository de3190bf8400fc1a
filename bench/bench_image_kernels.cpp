// The image kernels on the 640x360 working image, each beside its peer where Debian has
// one (OpenCV on one thread, libyuv). The formulas of the peers differ in detail; the work
// is the same.
//   build/release/bench/bench_image_kernels --benchmark_repetitions=9 --benchmark_report_aggregates_only=true

#include <benchmark/benchmark.h>

#include <random>

#include "LQ_ColorSpaceConversion.h"
#include "LQ_Gradients.h"
#include "LQ_ImageResize.h"
#include "LQ_ImageRotate.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"

#if defined(TACTUS_WITH_OPENCV)
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif
#if defined(TACTUS_WITH_LIBYUV)
#include <libyuv.h>
#endif

namespace {
constexpr int kWidth = 640, kHeight = 360;

// smooth content with noise, like a camera picture
LQ::Image picture(LQ::ColorMode mode) {
    LQ::Image image(LQ::Size(kWidth, kHeight), mode);
    std::mt19937 random(3);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth * image.depth(); ++x)
            image.row(y)[x] = static_cast<unsigned char>((x / image.depth() + 2 * y) / 5 + random() % 24);
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
    return cv::Mat(image.height(), image.width(), CV_8UC(image.depth()), image.data(), image.stripLength());
}
struct OneThread {
    OneThread() { cv::setNumThreads(1); }
} oneThread;
#endif

// ---- colour -------------------------------------------------------------------------------

void BgrToMono_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_BGR), out;
    run(s, [&] { LQ::bgrToMono(in, out, LQ::Rect()); });
}
void YuvToMono_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_YUV), out;
    run(s, [&] { LQ::yuvToMono(in, out, LQ::Rect()); });
}
void BgrToYuv_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_BGR), out;
    run(s, [&] { LQ::bgrToYuv(in, out, LQ::Rect()); });
}
void YuvToBgr_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_YUV), out;
    run(s, [&] { LQ::yuvToBgr(in, out, LQ::Rect()); });
}
void BgrToRgb_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_BGR), out;
    run(s, [&] { LQ::bgrToRgb(in, out, LQ::Rect()); });
}
void MonoToBgr_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::monoToBgr(in, out, LQ::Rect()); });
}
BENCHMARK(BgrToMono_tactus);
BENCHMARK(YuvToMono_tactus);
BENCHMARK(BgrToYuv_tactus);
BENCHMARK(YuvToBgr_tactus);
BENCHMARK(BgrToRgb_tactus);
BENCHMARK(MonoToBgr_tactus);

#if defined(TACTUS_WITH_OPENCV)
void cvtColorBench(benchmark::State& s, LQ::ColorMode mode, int code) {
    LQ::Image in = picture(mode);
    cv::Mat source = asMat(in), target;
    run(s, [&] { cv::cvtColor(source, target, code); });
}
void BgrToMono_opencv(benchmark::State& s) { cvtColorBench(s, LQ::COLOR_MODE_BGR, cv::COLOR_BGR2GRAY); }
void BgrToYuv_opencv(benchmark::State& s) { cvtColorBench(s, LQ::COLOR_MODE_BGR, cv::COLOR_BGR2YUV); }
void YuvToBgr_opencv(benchmark::State& s) { cvtColorBench(s, LQ::COLOR_MODE_YUV, cv::COLOR_YUV2BGR); }
void BgrToRgb_opencv(benchmark::State& s) { cvtColorBench(s, LQ::COLOR_MODE_BGR, cv::COLOR_BGR2RGB); }
void MonoToBgr_opencv(benchmark::State& s) { cvtColorBench(s, LQ::COLOR_MODE_MONO, cv::COLOR_GRAY2BGR); }
BENCHMARK(BgrToMono_opencv);
BENCHMARK(BgrToYuv_opencv);
BENCHMARK(YuvToBgr_opencv);
BENCHMARK(BgrToRgb_opencv);
BENCHMARK(MonoToBgr_opencv);
#endif
#if defined(TACTUS_WITH_LIBYUV)
void BgrToMono_libyuv(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_BGR), out(LQ::Size(kWidth, kHeight), LQ::COLOR_MODE_MONO);
    run(s, [&] { libyuv::RGB24ToJ400(in.data(), kWidth * 3, out.data(), kWidth, kWidth, kHeight); });
}
BENCHMARK(BgrToMono_libyuv);
#endif

// ---- scaling ------------------------------------------------------------------------------

void ResizeNearest_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::resizeImageNn(in, out, 0.5f, LQ::Rect()); });
}
void ResizeNearestOdd_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::resizeImageNn(in, out, 0.7f, LQ::Rect()); });
}
void ResizeBilinear_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::resizeImageBilinear(in, out, 0.7f, LQ::Rect()); });
}
void ResizeBilinear4Bit_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out(LQ::Size(448, 252), LQ::COLOR_MODE_MONO);
    run(s, [&] { LQ::resizeBilinear(in, out); });
}
void Halve_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::zoomImageTwice(in, out, LQ::Rect()); });
}
void Average3_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::zoomImageAverage(in, out, 3.f, LQ::Rect()); });
}
BENCHMARK(ResizeNearest_tactus);
BENCHMARK(ResizeNearestOdd_tactus);
BENCHMARK(ResizeBilinear_tactus);
BENCHMARK(ResizeBilinear4Bit_tactus);
BENCHMARK(Halve_tactus);
BENCHMARK(Average3_tactus);

#if defined(TACTUS_WITH_OPENCV)
void resizeBench(benchmark::State& s, int width, int height, int interpolation) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO);
    cv::Mat source = asMat(in), target;
    run(s, [&] { cv::resize(source, target, cv::Size(width, height), 0, 0, interpolation); });
}
void ResizeNearest_opencv(benchmark::State& s) { resizeBench(s, 320, 180, cv::INTER_NEAREST); }
void ResizeNearestOdd_opencv(benchmark::State& s) { resizeBench(s, 448, 252, cv::INTER_NEAREST); }
void ResizeBilinear_opencv(benchmark::State& s) { resizeBench(s, 448, 252, cv::INTER_LINEAR); }
void Halve_opencv(benchmark::State& s) { resizeBench(s, 320, 180, cv::INTER_AREA); }
void Average3_opencv(benchmark::State& s) { resizeBench(s, 213, 120, cv::INTER_AREA); }
BENCHMARK(ResizeNearest_opencv);
BENCHMARK(ResizeNearestOdd_opencv);
BENCHMARK(ResizeBilinear_opencv);
BENCHMARK(Halve_opencv);
BENCHMARK(Average3_opencv);
#endif
#if defined(TACTUS_WITH_LIBYUV)
void scaleBench(benchmark::State& s, int width, int height, libyuv::FilterMode filter) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out(LQ::Size(width, height), LQ::COLOR_MODE_MONO);
    run(s, [&] { libyuv::ScalePlane(in.data(), kWidth, kWidth, kHeight, out.data(), width, width, height, filter); });
}
void ResizeNearest_libyuv(benchmark::State& s) { scaleBench(s, 320, 180, libyuv::kFilterNone); }
void ResizeNearestOdd_libyuv(benchmark::State& s) { scaleBench(s, 448, 252, libyuv::kFilterNone); }
void ResizeBilinear_libyuv(benchmark::State& s) { scaleBench(s, 448, 252, libyuv::kFilterBilinear); }
void Halve_libyuv(benchmark::State& s) { scaleBench(s, 320, 180, libyuv::kFilterBox); }
BENCHMARK(ResizeNearest_libyuv);
BENCHMARK(ResizeNearestOdd_libyuv);
BENCHMARK(ResizeBilinear_libyuv);
BENCHMARK(Halve_libyuv);
#endif

// ---- rotation -----------------------------------------------------------------------------

void RotateMono_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::rotatePi4(in, out, 1); });
}
void RotateBgr_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_BGR), out;
    run(s, [&] { LQ::rotatePi4(in, out, 1); });
}
void FlipBgr_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_BGR), out;
    run(s, [&] { LQ::flipLeftRight(in, out); });
}
BENCHMARK(RotateMono_tactus);
BENCHMARK(RotateBgr_tactus);
BENCHMARK(FlipBgr_tactus);
#if defined(TACTUS_WITH_OPENCV)
void rotateBench(benchmark::State& s, LQ::ColorMode mode) {
    LQ::Image in = picture(mode);
    cv::Mat source = asMat(in), target;
    // our quarter turn moves (x, y) to column y, row W - 1 - x: counterclockwise
    run(s, [&] { cv::rotate(source, target, cv::ROTATE_90_COUNTERCLOCKWISE); });
}
void RotateMono_opencv(benchmark::State& s) { rotateBench(s, LQ::COLOR_MODE_MONO); }
void RotateBgr_opencv(benchmark::State& s) { rotateBench(s, LQ::COLOR_MODE_BGR); }
void FlipBgr_opencv(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_BGR);
    cv::Mat source = asMat(in), target;
    run(s, [&] { cv::flip(source, target, 1); });
}
BENCHMARK(RotateMono_opencv);
BENCHMARK(RotateBgr_opencv);
BENCHMARK(FlipBgr_opencv);
#endif

// ---- detector features --------------------------------------------------------------------

void Integral_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::computeIntegral(in, out); });
}
void Rmct_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::computeRmct(in, out); });
}
void IntegralHog_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::computeIntegralHog(in, out, in.rect(), LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6); });
}
void Sobel_tactus(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO), out;
    run(s, [&] { LQ::SobelGradient(in, out); });
}
BENCHMARK(Integral_tactus);
BENCHMARK(Rmct_tactus);
BENCHMARK(IntegralHog_tactus);
BENCHMARK(Sobel_tactus);
#if defined(TACTUS_WITH_OPENCV)
void Integral_opencv(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO);
    cv::Mat source = asMat(in), sums;
    run(s, [&] { cv::integral(source, sums, CV_32S); });
}
void Sobel_opencv(benchmark::State& s) {
    LQ::Image in = picture(LQ::COLOR_MODE_MONO);
    cv::Mat source = asMat(in), dx, dy;
    run(s, [&] {
        cv::Sobel(source, dx, CV_16S, 1, 0);
        cv::Sobel(source, dy, CV_16S, 0, 1);
    });
}
BENCHMARK(Integral_opencv);
BENCHMARK(Sobel_opencv);
#endif
}  // namespace

BENCHMARK_MAIN();
