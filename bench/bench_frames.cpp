// Whole frames through the exported C functions at 1280 x 720, per mode, as a camera
// application drives the engine, with the trained models: the rings compiled into the
// library and the networks of models/networks. Three runs per mode on generated scenes:
//   no_hand   one background frame with its distractors, over and over
//   one_hand  one frame with a hand of the mode's gesture held still (tracked after birth)
//   clip      a clip of 150 frames in which hands of four gestures come, move and go
// Each run times every frame after a warm-up and reports the median, the 95th percentile
// and the worst frame (trigger frames are the slow ones). The frames are drawn once,
// before timing; the clip is drawn upright, so the frames go in with orientation 270 of
// a back camera, which asks for no turn.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "HandClip.h"
#include "VI_Tactus_Interface.h"
#include "clips.h"

namespace {

constexpr int kWidth = 1280, kHeight = 720;
using Nv21 = std::vector<unsigned char>;

Nv21 toNv21(const std::vector<std::uint8_t>& rgb) {
    Nv21 nv21(static_cast<size_t>(kWidth) * kHeight * 3 / 2);
    rgbToNv21(rgb.data(), static_cast<size_t>(kWidth) * 3, kWidth, kHeight, nv21.data());
    return nv21;
}

handgen::ClipSetup setupFor(std::vector<handgen::Gesture> gestures, int frames, std::uint64_t seed) {
    handgen::ClipSetup setup;
    setup.width = kWidth;
    setup.height = kHeight;
    setup.frames = frames;
    setup.seed = seed;
    setup.gestures = std::move(gestures);
    return setup;
}

// {frame with no hand, frame with the gesture in full view} of a clip showing only that gesture
const std::pair<Nv21, Nv21>& stillFrames(handgen::Gesture gesture) {
    static std::map<handgen::Gesture, std::pair<Nv21, Nv21>> frames;
    auto found = frames.find(gesture);
    if (found != frames.end()) return found->second;
    const handgen::ClipMaker maker(setupFor({gesture}, 200, 11));
    int empty = -1, hand = -1;
    for (int f = 0; f < maker.frames() && (empty < 0 || hand < 0); ++f) {
        const handgen::FrameTruth truth = maker.truth(f);
        if (!truth.present && empty < 0) empty = f;
        // well inside the appearance, so that the hand is whole and settled
        if (truth.gesture == gesture && truth.visible == 1.f && hand < 0 && f > 30) hand = f;
    }
    std::vector<std::uint8_t> rgb;
    std::pair<Nv21, Nv21> pair;
    maker.render(std::max(empty, 0), rgb);
    pair.first = toNv21(rgb);
    maker.render(std::max(hand, 0), rgb);
    pair.second = toNv21(rgb);
    return frames.emplace(gesture, std::move(pair)).first->second;
}

const std::vector<Nv21>& clipFrames() {
    static std::vector<Nv21> frames;
    if (frames.empty()) {
        using handgen::Gesture;
        const handgen::ClipMaker maker(
            setupFor({Gesture::Fist, Gesture::ThumbUp, Gesture::Victory, Gesture::Pointer}, 150, 12));
        std::vector<std::uint8_t> rgb;
        for (int f = 0; f < maker.frames(); ++f) {
            maker.render(f, rgb);
            frames.push_back(toNv21(rgb));
        }
    }
    return frames;
}

double oneFrame(const Nv21& frame, int& reported) {
    const auto begin = std::chrono::steady_clock::now();
    // the interface takes a mutable buffer but only reads it
    VI_Tactus_SetFrame(const_cast<unsigned char*>(frame.data()), kWidth, kHeight * 3 / 2, 0);
    VI_Tactus_SetFrameParameter("orientation", "270");
    VI_Tactus_ProcessFrame();
    const double micros = std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - begin).count();
    const char* gesture = nullptr;
    reported += VI_Tactus_GetGesture(gesture, 0) > 0 ? 1 : 0;
    return micros;
}

// Starts the mode and runs `warmUp` frames (set-up, networks, the first detections); a mode
// that fails its checks (a ring not trained yet) skips the run with the engine's text.
bool start(benchmark::State& state, const char* mode, const Nv21& frame, int warmUp) {
    VI_Tactus_SetParameter("mode", mode);
    VI_Tactus_SetParameter("nn-path", TACTUS_NETWORK_MODELS);
    VI_Tactus_SetParameter("is-flip", "false");
    VI_Tactus_Init();
    VI_Tactus_Reset();
    int reported = 0;
    try {
        for (int i = 0; i < warmUp; ++i) oneFrame(frame, reported);
    } catch (const char* what) {
        state.SkipWithError((std::string("mode ") + mode + ": " + (what ? what : "")).c_str());
        return false;
    }
    return true;
}

void report(benchmark::State& state, std::vector<double>& micros, int reported) {
    std::sort(micros.begin(), micros.end());
    state.counters["median_us"] = micros[micros.size() / 2];
    state.counters["p95_us"] = micros[std::min(micros.size() - 1, micros.size() * 95 / 100)];
    state.counters["max_us"] = micros.back();
    state.counters["reported"] = static_cast<double>(reported) / micros.size();
}

void BM_Still(benchmark::State& state, const char* mode, handgen::Gesture gesture, bool hand) {
    const Nv21& frame = hand ? stillFrames(gesture).second : stillFrames(gesture).first;
    if (!start(state, mode, frame, 10)) return;
    int reported = 0;
    std::vector<double> micros;
    for (auto _ : state) micros.push_back(oneFrame(frame, reported));
    report(state, micros, reported);
}

// every iteration is the whole clip; the statistics are over all its frames
void BM_Clip(benchmark::State& state, const char* mode) {
    const std::vector<Nv21>& frames = clipFrames();
    if (!start(state, mode, frames.front(), 1)) return;
    int reported = 0;
    std::vector<double> micros;
    for (auto _ : state) {
        VI_Tactus_Reset();
        for (const Nv21& frame : frames) micros.push_back(oneFrame(frame, reported));
    }
    report(state, micros, reported);
}

using handgen::Gesture;
#define TACTUS_FRAMES(mode, gesture)                                                                         \
    BENCHMARK_CAPTURE(BM_Still, mode##_no_hand, #mode, gesture, false)->Iterations(200)->Unit(benchmark::kMicrosecond); \
    BENCHMARK_CAPTURE(BM_Still, mode##_one_hand, #mode, gesture, true)->Iterations(200)->Unit(benchmark::kMicrosecond); \
    BENCHMARK_CAPTURE(BM_Clip, mode##_clip, #mode)->Iterations(2)->Unit(benchmark::kMillisecond)

TACTUS_FRAMES(fist, Gesture::Fist);
TACTUS_FRAMES(thumbUp, Gesture::ThumbUp);
TACTUS_FRAMES(victory, Gesture::Victory);
TACTUS_FRAMES(pointer, Gesture::Pointer);

}  // namespace

BENCHMARK_MAIN();
