// A 1280x720 NV21 preview turned into the 640x360 BGR working image, by the
// engine's converter and by libyuv's fastest routes to the same picture.
//   build/release/bench/bench_yuv_to_bgr --benchmark_repetitions=15 --benchmark_report_aggregates_only=true

#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "LQ_Yuv420toBgr.h"

#if defined(TACTUS_WITH_LIBYUV)
#include <libyuv.h>
#endif

namespace {

constexpr int kWidth = 1280, kHeight = 720;

std::vector<unsigned char> makePreview() {
    std::vector<unsigned char> frame(kWidth * kHeight * 3 / 2);
    std::mt19937 random(1);
    // smooth luma with noise, chroma in a plausible range
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) frame[y * kWidth + x] = static_cast<unsigned char>((x + y) / 8 + random() % 16);
    for (size_t i = kWidth * kHeight; i < frame.size(); ++i) frame[i] = static_cast<unsigned char>(96 + random() % 64);
    return frame;
}

void BM_Tactus_Yuv420toBgr(benchmark::State& state) {
    std::vector<unsigned char> frame = makePreview();
    LQ::Image source;
    source.createRef(frame.data(), LQ::Size(kWidth, kHeight * 3 / 2), LQ::COLOR_MODE_BGR);
    LQ::Image bgr;
    for (auto _ : state) {
        LQ::yuv420toBgr(source, bgr, true, false);
        benchmark::DoNotOptimize(bgr.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_Tactus_Yuv420toBgr)->Unit(benchmark::kMicrosecond);

// The scalar reference rows alone, to show what the vector path buys.
void BM_Tactus_Yuv420toBgrScalar(benchmark::State& state) {
    std::vector<unsigned char> frame = makePreview();
    LQ::Image bgr(LQ::Size(kWidth / 2, kHeight / 2), LQ::COLOR_MODE_BGR);
    const unsigned char* chroma = frame.data() + kWidth * kHeight;
    for (auto _ : state) {
        for (int y = 0; y < kHeight / 2; ++y)
            LQ::yuvRowZoomScalar(frame.data() + 2 * y * kWidth, chroma + y * kWidth, bgr.row(y), kWidth / 2, false);
        benchmark::DoNotOptimize(bgr.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_Tactus_Yuv420toBgrScalar)->Unit(benchmark::kMicrosecond);

#if defined(TACTUS_WITH_LIBYUV)
// Half-size NV21 by point sampling, then NV21 to BGR (libyuv's RGB24 is B, G, R in memory).
void BM_Libyuv_NV12ScaleThenNV21ToRGB24(benchmark::State& state) {
    std::vector<unsigned char> frame = makePreview();
    const int w = kWidth / 2, h = kHeight / 2;
    std::vector<unsigned char> y(w * h), vu(w * h / 2), bgr(w * h * 3);
    for (auto _ : state) {
        libyuv::NV12Scale(frame.data(), kWidth, frame.data() + kWidth * kHeight, kWidth, kWidth, kHeight, y.data(), w,
                          vu.data(), w, w, h, libyuv::kFilterNone);
        libyuv::NV21ToRGB24(y.data(), w, vu.data(), w, bgr.data(), w * 3, w, h);
        benchmark::DoNotOptimize(bgr.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_Libyuv_NV12ScaleThenNV21ToRGB24)->Unit(benchmark::kMicrosecond);

// Luma point-sampled to half size, the full chroma split into planes, then 4:4:4 to BGR:
// the same picture as the engine's, one chroma pair per output pixel.
void BM_Libyuv_ScalePlaneSplitUVThenI444ToRGB24(benchmark::State& state) {
    std::vector<unsigned char> frame = makePreview();
    const int w = kWidth / 2, h = kHeight / 2;
    std::vector<unsigned char> y(w * h), u(w * h), v(w * h), bgr(w * h * 3);
    for (auto _ : state) {
        libyuv::ScalePlane(frame.data(), kWidth, kWidth, kHeight, y.data(), w, w, h, libyuv::kFilterNone);
        libyuv::SplitUVPlane(frame.data() + kWidth * kHeight, kWidth, v.data(), w, u.data(), w, w, h);
        libyuv::I444ToRGB24(y.data(), w, u.data(), w, v.data(), w, bgr.data(), w * 3, w, h);
        benchmark::DoNotOptimize(bgr.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_Libyuv_ScalePlaneSplitUVThenI444ToRGB24)->Unit(benchmark::kMicrosecond);
#endif

}  // namespace

BENCHMARK_MAIN();
