// Whole frames through the exported C functions at 1280 x 720, per mode, with no hand in
// view and with one hand held still, as a camera application drives the engine. Each run
// times every frame after a warm-up and reports the median, the 95th percentile and the
// worst frame (trigger frames are the slow ones).
//
// The rings and networks are the glyph stand-ins until trained ones land: their first
// stage lets every window through, so the full-frame scan here costs more than a trained
// ring's would.

#include <benchmark/benchmark.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <string>
#include <vector>

#include "GlyphModels.h"
#include "VI_Tactus_Interface.h"

namespace {

const std::string& modelDirectory() {
    static std::string directory;
    if (directory.empty()) {
        directory = "/tmp/tactus_bench_models_" + std::to_string(getpid());
        mkdir(directory.c_str(), 0700);
        glyphModels::write(directory);
    }
    return directory;
}

void runFrames(benchmark::State& state, const char* mode, bool hand) {
    VI_Tactus_SetParameter("mode", mode);
    VI_Tactus_SetParameter("nn-path", modelDirectory().c_str());
    VI_Tactus_Init();
    VI_Tactus_Reset();
    // orientation 0 of a front camera: the engine turns the frame a quarter
    glyphModels::Frame frame(1);
    if (hand) frame.draw(glyphs::kF, 100, 200, 2.f);
    auto one = [&] {
        VI_Tactus_SetFrame(frame.nv21().data(), glyphModels::kCameraWidth, glyphModels::kCameraHeight * 3 / 2, 0);
        VI_Tactus_SetFrameParameter("orientation", "0");
        VI_Tactus_ProcessFrame();
    };
    for (int i = 0; i < 10; ++i) one();  // set-up, networks and the first detections

    std::vector<double> micros;
    int reported = 0;
    for (auto _ : state) {
        const auto start = std::chrono::steady_clock::now();
        one();
        micros.push_back(std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - start).count());
        const char* gesture = nullptr;
        reported += VI_Tactus_GetGesture(gesture, 0);
    }
    std::sort(micros.begin(), micros.end());
    state.counters["median_us"] = micros[micros.size() / 2];
    state.counters["p95_us"] = micros[std::min(micros.size() - 1, micros.size() * 95 / 100)];
    state.counters["max_us"] = micros.back();
    state.counters["reported"] = static_cast<double>(reported) / micros.size();
}

void BM_Frames(benchmark::State& state, const char* mode, bool hand) { runFrames(state, mode, hand); }

}  // namespace

BENCHMARK_CAPTURE(BM_Frames, fist_no_hand, "fist", false)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_Frames, fist_one_hand, "fist", true)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_Frames, thumbUp_no_hand, "thumbUp", false)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_Frames, thumbUp_one_hand, "thumbUp", true)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_Frames, victory_no_hand, "victory", false)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_Frames, victory_one_hand, "victory", true)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_Frames, pointer_no_hand, "pointer", false)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_Frames, pointer_one_hand, "pointer", true)->Iterations(200)->Unit(benchmark::kMicrosecond);

BENCHMARK_MAIN();
