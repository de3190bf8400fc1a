// Scaling, halving, quarter turns and mirrors of the 640x360 working image, each kernel
// beside its peer doing the same work (OpenCV on one thread, libyuv): "Name/tactus" against
// "Name/opencv" or "Name/libyuv". The peers round differently; the work is the same.
//   build/release/bench/bench_resize --benchmark_repetitions=5 --benchmark_report_aggregates_only=true

#include <benchmark/benchmark.h>

#include <functional>
#include <random>
#include <string>

#include "LQ_ImageResize.h"
#include "LQ_ImageRotate.h"

#if defined(TACTUS_WITH_OPENCV)
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif
#if defined(TACTUS_WITH_LIBYUV)
#include <libyuv.h>
#endif

namespace {

constexpr int kWidth = 640, kHeight = 360;

// smooth content with noise, like a camera picture; the same on every run
LQ::Image picture(LQ::ColorMode mode) {
    LQ::Image image(LQ::Size(kWidth, kHeight), mode);
    std::mt19937 random(5);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth * image.depth(); ++x)
            image.row(y)[x] = static_cast<unsigned char>((x / image.depth() + 2 * y) / 5 + random() % 24);
    return image;
}

void add(const std::string& name, std::function<void()> work) {
    benchmark::RegisterBenchmark(name.c_str(),
                                 [work](benchmark::State& state) {
                                     for (auto _ : state) {
                                         work();
                                         benchmark::ClobberMemory();
                                     }
                                 })
        ->Unit(benchmark::kMicrosecond);
}

// Inputs and outputs live as long as the program, so the registered work can refer to them.
struct Images {
    LQ::Image mono = picture(LQ::COLOR_MODE_MONO), bgr = picture(LQ::COLOR_MODE_BGR);
    LQ::Image out[32];
    int next = 0;
    LQ::Image& fresh() { return out[next++]; }
};

void registerTactus(Images& im) {
    const LQ::Image &mono = im.mono, &bgr = im.bgr;
    {
        LQ::Image& out = im.fresh();
        add("ResizeNnMono/tactus", [&] { LQ::resizeImageNn(mono, out, 0.5f, LQ::Rect()); });
        LQ::Image& odd = im.fresh();
        add("ResizeNnMono0.7/tactus", [&] { LQ::resizeImageNn(mono, odd, 0.7f, LQ::Rect()); });
        LQ::Image& colour = im.fresh();
        add("ResizeNnBgr/tactus", [&] { LQ::resizeImageNn(bgr, colour, 0.5f, LQ::Rect()); });
    }
    {
        LQ::Image& out = im.fresh();
        add("ResizeBilinearMono0.7/tactus", [&] { LQ::resizeImageBilinear(mono, out, 0.7f, LQ::Rect()); });
        LQ::Image& colour = im.fresh();
        add("ResizeBilinearBgr0.7/tactus", [&] { LQ::resizeImageBilinear(bgr, colour, 0.7f, LQ::Rect()); });
    }
    {
        LQ::Image& out = im.fresh();
        out.create(LQ::Size(448, 252), LQ::COLOR_MODE_MONO);
        add("ResizeBilinearBaseMono0.7/tactus", [&] { LQ::resizeBilinear(mono, out); });
        LQ::Image& half = im.fresh();
        half.create(LQ::Size(320, 180), LQ::COLOR_MODE_MONO);
        add("ResizeBilinearBaseMono0.5/tactus", [&] { LQ::resizeBilinear(mono, half); });
        LQ::Image& up = im.fresh();
        up.create(LQ::Size(800, 450), LQ::COLOR_MODE_MONO);
        add("ResizeBilinearBaseMono1.25/tactus", [&] { LQ::resizeBilinear(mono, up); });
        LQ::Image& colour = im.fresh();
        colour.create(LQ::Size(448, 252), LQ::COLOR_MODE_BGR);
        add("ResizeBilinearBaseBgr0.7/tactus", [&] { LQ::resizeBilinear(bgr, colour); });
    }
    {
        LQ::Image& out = im.fresh();
        add("HalveMono/tactus", [&] { LQ::zoomImageTwice(mono, out, LQ::Rect()); });
        LQ::Image& colour = im.fresh();
        add("HalveBgr/tactus", [&] { LQ::zoomImageTwice(bgr, colour, LQ::Rect()); });
        LQ::Image& average = im.fresh();
        add("AverageMono3/tactus", [&] { LQ::zoomImageAverage(mono, average, 3.f, LQ::Rect()); });
        LQ::Image& averageBgr = im.fresh();
        add("AverageBgr2.5/tactus", [&] { LQ::zoomImageAverage(bgr, averageBgr, 2.5f, LQ::Rect()); });
    }
    {
        LQ::Image& out = im.fresh();
        add("RotateMono/tactus", [&] { LQ::rotatePi4(mono, out, 1); });
        LQ::Image& colour = im.fresh();
        add("RotateBgr/tactus", [&] { LQ::rotatePi4(bgr, colour, 1); });
        LQ::Image& transposed = im.fresh();
        add("TransposeMono/tactus", [&] { LQ::transpose(mono, transposed); });
        LQ::Image& flipped = im.fresh();
        add("FlipMono/tactus", [&] { LQ::flipLeftRight(mono, flipped); });
        LQ::Image& flippedBgr = im.fresh();
        add("FlipBgr/tactus", [&] { LQ::flipLeftRight(bgr, flippedBgr); });
    }
}

#if defined(TACTUS_WITH_OPENCV)
cv::Mat asMat(const LQ::Image& image) {
    return cv::Mat(image.height(), image.width(), CV_8UC(image.depth()), image.data(), image.stripLength());
}

void registerOpencv(Images& im) {
    static cv::Mat mono = asMat(im.mono), bgr = asMat(im.bgr), out[32];
    int next = 0;
    const auto resize = [&](const char* name, const cv::Mat& in, int width, int height, int interpolation) {
        cv::Mat& target = out[next++];
        add(name, [&in, &target, width, height, interpolation] {
            cv::resize(in, target, cv::Size(width, height), 0, 0, interpolation);
        });
    };
    resize("ResizeNnMono/opencv", mono, 320, 180, cv::INTER_NEAREST);
    resize("ResizeNnMono0.7/opencv", mono, 448, 252, cv::INTER_NEAREST);
    resize("ResizeNnBgr/opencv", bgr, 320, 180, cv::INTER_NEAREST);
    resize("ResizeBilinearMono0.7/opencv", mono, 448, 252, cv::INTER_LINEAR);
    resize("ResizeBilinearBgr0.7/opencv", bgr, 448, 252, cv::INTER_LINEAR);
    resize("ResizeBilinearBaseMono0.7/opencv", mono, 448, 252, cv::INTER_LINEAR);
    resize("ResizeBilinearBaseMono0.5/opencv", mono, 320, 180, cv::INTER_LINEAR);
    resize("ResizeBilinearBaseMono1.25/opencv", mono, 800, 450, cv::INTER_LINEAR);
    resize("ResizeBilinearBaseBgr0.7/opencv", bgr, 448, 252, cv::INTER_LINEAR);
    resize("HalveMono/opencv", mono, 320, 180, cv::INTER_AREA);
    resize("HalveBgr/opencv", bgr, 320, 180, cv::INTER_AREA);
    resize("AverageMono3/opencv", mono, 213, 120, cv::INTER_AREA);
    resize("AverageBgr2.5/opencv", bgr, 256, 144, cv::INTER_AREA);
    // our quarter turn moves (x, y) to column y, row W - 1 - x: counterclockwise
    cv::Mat& turned = out[next++];
    add("RotateMono/opencv", [&turned] { cv::rotate(mono, turned, cv::ROTATE_90_COUNTERCLOCKWISE); });
    cv::Mat& turnedBgr = out[next++];
    add("RotateBgr/opencv", [&turnedBgr] { cv::rotate(bgr, turnedBgr, cv::ROTATE_90_COUNTERCLOCKWISE); });
    cv::Mat& transposed = out[next++];
    add("TransposeMono/opencv", [&transposed] { cv::transpose(mono, transposed); });
    cv::Mat& flipped = out[next++];
    add("FlipMono/opencv", [&flipped] { cv::flip(mono, flipped, 1); });
    cv::Mat& flippedBgr = out[next++];
    add("FlipBgr/opencv", [&flippedBgr] { cv::flip(bgr, flippedBgr, 1); });
}
#endif

#if defined(TACTUS_WITH_LIBYUV)
void registerLibyuv(Images& im) {
    static LQ::Image nn(LQ::Size(320, 180), LQ::COLOR_MODE_MONO), half(LQ::Size(320, 180), LQ::COLOR_MODE_MONO),
        bilinear(LQ::Size(448, 252), LQ::COLOR_MODE_MONO);
    const LQ::Image& mono = im.mono;
    const auto scale = [&mono](LQ::Image& out, libyuv::FilterMode filter) {
        return [&mono, &out, filter] {
            libyuv::ScalePlane(mono.data(), kWidth, kWidth, kHeight, out.data(), out.width(), out.width(),
                               out.height(), filter);
        };
    };
    add("ResizeNnMono/libyuv", scale(nn, libyuv::kFilterNone));
    add("ResizeBilinearBaseMono0.7/libyuv", scale(bilinear, libyuv::kFilterBilinear));
    add("HalveMono/libyuv", scale(half, libyuv::kFilterBox));
}
#endif

}  // namespace

int main(int argc, char** argv) {
#if defined(TACTUS_WITH_OPENCV)
    cv::setNumThreads(1);
#endif
    static Images images;
    registerTactus(images);
#if defined(TACTUS_WITH_OPENCV)
    registerOpencv(images);
#endif
#if defined(TACTUS_WITH_LIBYUV)
    registerLibyuv(images);
#endif
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
