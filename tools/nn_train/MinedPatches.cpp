#include "MinedPatches.h"

#include <algorithm>
#include <chrono>
#include <fstream>
#include <mutex>
#include <random>
#include <sstream>
#include <thread>

#include "AdaBoostDetector.h"
#include "GestureRings.h"
#include "HandRandom.h"
#include "HandSamples.h"
#include "LQ_BaseDetector.h"
#include "LQ_ColorModeData.h"
#include "LQ_ImagePyramidData.h"
#include "LQ_States.h"
#include "LQ_Yuv420toBgr.h"
#include "NnDetector.h"
#include "clips.h"

namespace nntrain {

using handgen::Gesture;

namespace {

LQ::RelativeLocation R(float s, float dx, float dy, float a) {
    return LQ::RelativeLocation(s, LQ::BasePoint<float>(dx, dy), 0, a, 0);
}

// Takes every hit the trigger offers and refuses it, so that all grouped hits of a frame
// come through and none is stored.
class HitRecorder : public LQ::BaseDetector {
public:
    explicit HitRecorder(std::vector<LQ::ObjectLocation>& hits) : hits_(hits) {}
    void detect(LQ::SharedPtr<LQ::StateAggregator>& state) override {
        LQ::LocationState& location = state->get<LQ::LocationState>();
        hits_.push_back(location);
        location.reset();
    }

private:
    std::vector<LQ::ObjectLocation>& hits_;
};

// the rings' cascades keep per-scan bindings: one scan at a time
std::mutex& scanMutex() {
    static std::mutex m;
    return m;
}

std::uint64_t mix(std::uint64_t a, std::uint64_t b) { return handgen::mixSeed(a, b); }

}  // namespace

const TriggerSetup* triggerFor(const Recipe& recipe) {
    // the builders' trigger arguments (GestureEngines.cpp) and result locations, with the
    // minimum widths of VI_MultiEngines at a 640-pixel working image
    static const TriggerSetup fist{ada_Fist_2013_10_02__16_45_30, 28, 2, 3, 0.3f, R(1, 0, 0, 0)};
    static const TriggerSetup thumbUp{ada_thumbUp_ada__2017_11_13__20_01_17, 28, 3, 7, 0.3f, R(0.9f, 0, -0.1f, 1.9f)};
    static const TriggerSetup victory{ada_mono_ada_staticVictory_2017_11_10__14_34_17, 42, 3, 2, 0.3f,
                                      R(0.7f, 0, 0, 2.2f)};
    static const TriggerSetup pointer{ada_mono_ada_staticPointer0_2015_06_23__19_25_48, 30, 3, 1, 0.3f,
                                      R(1.2f, 0, 0, 1.6f)};
    if (recipe.shape != Shape::Small) return nullptr;
    switch (recipe.gesture) {
        case Gesture::Fist: return &fist;
        case Gesture::ThumbUp: return &thumbUp;
        case Gesture::Victory: return &victory;
        case Gesture::Pointer: return &pointer;
        default: return nullptr;  // the heart's chain is not built yet
    }
}

HitLabel labelHit(const Rect& reported, const std::vector<TruthHand>& hands, Gesture gesture, float positiveOverlap,
                  float negativeOverlap) {
    bool near = false;
    for (const TruthHand& hand : hands) {
        const float o = overlap(reported, hand.rect);
        if (hand.gesture == gesture && o >= positiveOverlap) return HitLabel::Positive;
        // a hand of unknown shape may be the gesture
        if ((!hand.gesture || hand.gesture == gesture) && o >= negativeOverlap) near = true;
    }
    return near ? HitLabel::Dropped : HitLabel::Negative;
}

LQ::Image workingImage(const std::vector<std::uint8_t>& rgb, int width, int height) {
    // the camera's buffer: luma rows, then the interleaved chroma rows, all counted in its height
    std::vector<unsigned char> nv21(static_cast<size_t>(width) * height * 3 / 2);
    rgbToNv21(rgb.data(), static_cast<size_t>(width) * 3, width, height, nv21.data());
    LQ::Image source;
    source.createRef(nv21.data(), LQ::BaseSize<int>(width, height * 3 / 2), LQ::COLOR_MODE_BGR);
    LQ::Image bgr;
    LQ::yuv420toBgr(source, bgr, true, false);
    LQ::Image copy(bgr.size(), LQ::COLOR_MODE_BGR);  // not tied to the buffer above
    for (int y = 0; y < bgr.height(); ++y) std::copy(bgr.row(y), bgr.row(y) + bgr.width() * 3, copy.row(y));
    return copy;
}

std::vector<Hit> mineFrame(const Recipe& recipe, const TriggerSetup& trigger, const LQ::Image& bgr,
                           const std::vector<TruthHand>& truth, LQ::Image& chainImage) {
    // the engine's nodes at orientation 0: BGR source, its mono, the pyramid over the mono
    LQ::SharedPtr<LQ::ImageData> source(new LQ::ImageData());
    source->set(bgr);
    LQ::SharedPtr<LQ::ImageData> mono(new LQ::ColorModeData(source, LQ::COLOR_MODE_MONO));
    LQ::SharedPtr<LQ::ImagePyramidData> pyramid(new LQ::ImagePyramidData(mono, 1));
    std::vector<LQ::ObjectLocation> found;
    {
        std::lock_guard<std::mutex> lock(scanMutex());
        ClassifierRing* ring = trigger.ring();
        const std::vector<CascadedClassifier*> cascades =
            ring->getClassifiers(LQ::AngleRange(-30, 30), LQ::Side::BOTH);
        LQ::BaseDetector* region = new LQ::DetectRegionSetter(
            LQ::DetectRegion(pyramid->rect(), LQ::BaseRange<float>(static_cast<float>(trigger.minWidth), 1000),
                             LQ::AngleRange(), LQ::Side::BOTH));
        AdaBoostDetector detector(cascades, pyramid, AdaBoostDetector::StoreTarget::CHILD_STATES, region, trigger.step,
                                  trigger.minWeight, trigger.similarity,
                                  LQ::SharedPtr<LQ::BaseDetector>(new HitRecorder(found)),
                                  LQ::SharedPtr<LQ::BaseDetector>(), LQ::SharedPtr<LQ::BaseDetector>(),
                                  R(1, 0, 0, 0), 1000);
        LQ::SharedPtr<LQ::StateAggregator> state = LQ::StateAggregator::newDetectorState();
        detector.detect(state);
    }
    chainImage = recipe.mode == LQ::COLOR_MODE_MONO ? mono->get() : source->get();
    std::vector<Hit> hits;
    for (const LQ::ObjectLocation& location : found) {
        Hit hit;
        hit.location = location;
        const LQ::BaseRect<float> r = trigger.result.getLocationState(location).getRect();
        hit.reported = {r.left, r.top, r.right, r.bottom};
        hit.label = labelHit(hit.reported, truth, recipe.gesture);
        hit.kind = static_cast<std::uint8_t>(handgen::SampleKind::Background);
        if (hit.label == HitLabel::Positive) hit.kind = static_cast<std::uint8_t>(handgen::SampleKind::Positive);
        for (const TruthHand& hand : truth)
            if (hit.label == HitLabel::Negative && overlap(hit.reported, hand.rect) >= 0.15f)
                hit.kind = static_cast<std::uint8_t>(handgen::SampleKind::OtherGesture);
        hits.push_back(hit);
    }
    return hits;
}

LQ::Image cutPatch(const Recipe& recipe, const LQ::Image& chainImage, const LQ::ObjectLocation& hit) {
    LQ::Image patch;
    recipe.relative().getLocationState(hit).getPatch(chainImage, LQ::BaseSize<int>(recipe.width, recipe.height), patch);
    return patch;
}

std::string MiningStats::describe() const {
    std::ostringstream out;
    out << frames << " frames, " << hits << " hits: " << positives << " positive, " << negatives << " negative ("
        << onOtherHands << " on other gestures' hands), " << dropped << " dropped; " << seconds << " s";
    return out.str();
}

PatchSet minePatches(const Recipe& recipe, const MiningOptions& options, MiningStats& stats) {
    const TriggerSetup* trigger = triggerFor(recipe);
    if (!trigger) throw std::runtime_error("no trigger to mine hits for " + recipe.name);
    const auto start = std::chrono::steady_clock::now();
    trigger->ring();  // built once before the workers
    std::vector<Gesture> gestures = options.gestures;
    if (gestures.empty()) {
        // the gesture itself, and the shapes its ring confuses most, more often
        gestures = {recipe.gesture,   recipe.gesture,   recipe.gesture,   Gesture::Fist, Gesture::ThumbUp,
                    Gesture::Victory, Gesture::Victory, Gesture::Pointer, Gesture::Pointer, Gesture::Palm,
                    Gesture::Heart};
    }
    struct Item {
        LQ::Image patch;
        int label;
        std::uint8_t kind;
    };
    struct ClipResult {
        std::vector<Item> items;
        MiningStats stats;
    };
    std::vector<ClipResult> results(options.clips);
    auto work = [&](int worker, int workers) {
        for (int clip = worker; clip < options.clips; clip += workers) {
            ClipResult& result = results[clip];
            handgen::ClipSetup setup;
            setup.width = options.width, setup.height = options.height, setup.frames = options.frames;
            setup.seed = mix(options.seed, static_cast<std::uint64_t>(clip));
            setup.variation = options.variation;
            setup.gestures = gestures;
            const handgen::ClipMaker maker(setup);
            const float toWorking = 0.5f;  // the engine halves the camera frame
            std::vector<std::uint8_t> rgb;
            for (int frame = clip % options.frameStep; frame < options.frames; frame += options.frameStep) {
                const handgen::FrameTruth t = maker.truth(frame);
                std::vector<TruthHand> truth;
                if (t.present)
                    truth.push_back({t.gesture, {t.rect[0] * toWorking, t.rect[1] * toWorking, t.rect[2] * toWorking,
                                                 t.rect[3] * toWorking}});
                maker.render(frame, rgb);
                const LQ::Image bgr = workingImage(rgb, options.width, options.height);
                LQ::Image chainImage;
                const std::vector<Hit> hits = mineFrame(recipe, *trigger, bgr, truth, chainImage);
                ++result.stats.frames;
                result.stats.hits += static_cast<long>(hits.size());
                std::mt19937_64 random(mix(setup.seed, 0x6a6974ull + static_cast<std::uint64_t>(frame)));
                int negatives = 0;
                for (const Hit& hit : hits) {
                    if (hit.label == HitLabel::Dropped) {
                        ++result.stats.dropped;
                        continue;
                    }
                    const bool positive = hit.label == HitLabel::Positive;
                    // a busy frame shouldn't fill the set with one background's hits
                    if (!positive && ++negatives > options.maxNegativesPerFrame) continue;
                    (positive ? result.stats.positives : result.stats.negatives)++;
                    if (hit.kind == static_cast<std::uint8_t>(handgen::SampleKind::OtherGesture))
                        ++result.stats.onOtherHands;
                    result.items.push_back({cutPatch(recipe, chainImage, hit.location), positive ? 1 : 0, hit.kind});
                    // the tracker's hits: the same cascades a little moved and scaled
                    for (int j = 0; j < options.jitter; ++j) {
                        std::uniform_real_distribution<float> shift(-0.06f, 0.06f), scale(0.9f, 1.1f);
                        LQ::ObjectLocation moved = hit.location;
                        const float w = moved.size.width;
                        moved.center.x += shift(random) * w;
                        moved.center.y += shift(random) * w;
                        const float s = scale(random);
                        moved.size = LQ::BaseSize<float>(moved.size.width * s, moved.size.height * s);
                        result.items.push_back({cutPatch(recipe, chainImage, moved), positive ? 1 : 0, hit.kind});
                    }
                }
            }
        }
    };
    const int workers = std::max(1, std::min(options.threads, options.clips));
    std::vector<std::thread> threads;
    for (int t = 1; t < workers; ++t) threads.emplace_back(work, t, workers);
    work(0, workers);
    for (std::thread& t : threads) t.join();

    size_t count = 0;
    for (const ClipResult& r : results) count += r.items.size();
    PatchSet set;
    set.inputs.resize(static_cast<int>(count), LQ::depth(recipe.mode), recipe.height, recipe.width);
    NnDetector converter;  // mean 0 and multiplier 1/256, as the loaded networks have
    converter.setInputColorMode(recipe.mode);
    Blob blob;
    size_t i = 0;
    for (const ClipResult& r : results) {
        stats.frames += r.stats.frames, stats.hits += r.stats.hits, stats.positives += r.stats.positives;
        stats.negatives += r.stats.negatives, stats.dropped += r.stats.dropped;
        stats.onOtherHands += r.stats.onOtherHands;
        for (const Item& item : r.items) {
            converter.convert(item.patch, blob, 0, 1);
            std::copy(blob.data(), blob.data() + set.inputs.volume(), set.inputs.sample(static_cast<int>(i)));
            set.labels.push_back(item.label);
            set.kinds.push_back(item.kind);
            ++i;
        }
    }
    stats.seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    return set;
}

PatchSet concatenate(const PatchSet& a, const PatchSet& b) {
    if (a.labels.empty()) return b;
    if (b.labels.empty()) return a;
    PatchSet set;
    set.inputs.resize(a.inputs.n + b.inputs.n, a.inputs.c, a.inputs.h, a.inputs.w);
    std::copy(a.inputs.v.begin(), a.inputs.v.end(), set.inputs.v.begin());
    std::copy(b.inputs.v.begin(), b.inputs.v.end(), set.inputs.v.begin() + static_cast<long>(a.inputs.v.size()));
    set.labels = a.labels;
    set.labels.insert(set.labels.end(), b.labels.begin(), b.labels.end());
    set.kinds = a.kinds;
    set.kinds.insert(set.kinds.end(), b.kinds.begin(), b.kinds.end());
    return set;
}

bool loadPatches(const std::string& path, PatchSet& set, MiningStats& stats) {
    std::ifstream file(path, std::ios::binary);
    if (!file) return false;
    char magic[8] = {};
    std::int32_t shape[4] = {};
    file.read(magic, 8);
    file.read(reinterpret_cast<char*>(shape), sizeof(shape));
    file.read(reinterpret_cast<char*>(&stats), sizeof(stats));
    if (!file || std::string(magic, 8) != "NNMINED1") return false;
    set.inputs.resize(shape[0], shape[1], shape[2], shape[3]);
    set.labels.resize(shape[0]);
    set.kinds.resize(shape[0]);
    file.read(reinterpret_cast<char*>(set.labels.data()), static_cast<long>(set.labels.size() * sizeof(int)));
    file.read(reinterpret_cast<char*>(set.kinds.data()), static_cast<long>(set.kinds.size()));
    file.read(reinterpret_cast<char*>(set.inputs.v.data()), static_cast<long>(set.inputs.v.size() * sizeof(float)));
    return static_cast<bool>(file);
}

void savePatches(const std::string& path, const PatchSet& set, const MiningStats& stats) {
    std::ofstream file(path, std::ios::binary);
    const std::int32_t shape[4] = {set.inputs.n, set.inputs.c, set.inputs.h, set.inputs.w};
    file.write("NNMINED1", 8);
    file.write(reinterpret_cast<const char*>(shape), sizeof(shape));
    file.write(reinterpret_cast<const char*>(&stats), sizeof(stats));
    file.write(reinterpret_cast<const char*>(set.labels.data()), static_cast<long>(set.labels.size() * sizeof(int)));
    file.write(reinterpret_cast<const char*>(set.kinds.data()), static_cast<long>(set.kinds.size()));
    file.write(reinterpret_cast<const char*>(set.inputs.v.data()), static_cast<long>(set.inputs.v.size() * sizeof(float)));
}

}  // namespace nntrain
