#include "PatchData.h"

#include <algorithm>
#include <cmath>
#include <random>
#include <thread>

#include "Canvas.h"
#include "HandSamples.h"
#include "NnDetector.h"

namespace nntrain {

using handgen::Gesture;

const std::vector<Recipe>& recipes() {
    // boxFraction and boxAspect follow the chains' result locations and the generator's
    // reference boxes (fist 85x100, thumbUp 100x161, victory 92x193, pointer 85x181,
    // palm 166x193, heart 92x118)
    static const std::vector<Recipe> all = {
        {"palm_verifier__iter_250000", Gesture::Palm, Task::Verify, 1, 0, 0, 35, 33, LQ::COLOR_MODE_MONO, 0.2f, 0.9f, 1.16f,
         Shape::Palm35x33},
        {"palm_verifier_iter_140000", Gesture::Palm, Task::Verify, 1, 0, 0, 50, 60, LQ::COLOR_MODE_MONO, 0.5f, 0.9f, 1.16f,
         Shape::Palm50x60},
        {"fist_verifier_iter_135000", Gesture::Fist, Task::Verify, 2.83f, 0, 0, 32, 32, LQ::COLOR_MODE_MONO, 0.3f, 0.85f,
         1.18f, Shape::Small},
        {"thumbUp_verifier_iter_55000", Gesture::ThumbUp, Task::Verify, 1.43f, 0, 0, 30, 40, LQ::COLOR_MODE_MONO, 0.5f, 0.9f,
         1.61f, Shape::Small},
        {"victory_verifier_face_pos_color_2017_12_14__iter_39000", Gesture::Victory, Task::Verify, 2, 0, -0.1f, 32, 32,
         LQ::COLOR_MODE_BGR, 0.05f, 0.7f, 2.1f, Shape::Small},
        {"pointer_verifier__iter_18000", Gesture::Pointer, Task::Verify, 2, 0, -0.4f, 32, 40, LQ::COLOR_MODE_MONO, 0.9f, 1.2f,
         2.13f, Shape::Small},
        {"pointer_hand_side__iter_7500", Gesture::Pointer, Task::Side, 2, 0, -0.4f, 32, 40, LQ::COLOR_MODE_MONO, 0.5f, 1.2f,
         2.13f, Shape::Small},
        {"heart_verifier_vent_iter_60000", Gesture::Heart, Task::Verify, 1, 0, 0, 32, 32, LQ::COLOR_MODE_MONO, 0.8f, 0.7f,
         1.28f, Shape::Small},
    };
    return all;
}

const Recipe* findRecipe(const std::string& name) {
    for (const Recipe& r : recipes())
        if (r.name == name) return &r;
    return nullptr;
}

namespace {

std::uint64_t mix(std::uint64_t a, std::uint64_t b) {
    std::uint64_t z = a * 0x9E3779B97F4A7C15ull + b + 0x632BE59BD9B4E019ull;
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
    return z ^ (z >> 31);
}

double uniform(std::mt19937_64& random) { return static_cast<double>(random() >> 11) / 9007199254740992.0; }

LQ::Image canvasImage(const handgen::Canvas& canvas, LQ::ColorMode mode) {
    LQ::Image image(LQ::BaseSize<int>(canvas.width(), canvas.height()), mode);
    if (mode == LQ::COLOR_MODE_MONO) {
        std::vector<std::uint8_t> mono(static_cast<size_t>(canvas.width()) * canvas.height());
        handgen::toMono(canvas, mono.data());
        for (int y = 0; y < canvas.height(); ++y)
            std::copy(mono.begin() + static_cast<long>(y) * canvas.width(), mono.begin() + static_cast<long>(y + 1) * canvas.width(),
                      image.row(y));
    } else {
        std::vector<std::uint8_t> rgb;
        handgen::toRgb8(canvas, rgb);
        for (int y = 0; y < canvas.height(); ++y)
            for (int x = 0; x < canvas.width(); ++x) {
                const std::uint8_t* p = &rgb[(static_cast<size_t>(y) * canvas.width() + x) * 3];
                unsigned char* q = image.pixel(x, y);
                q[0] = p[2], q[1] = p[1], q[2] = p[0];
            }
    }
    return image;
}

}  // namespace

LQ::Image makePatch(const Recipe& recipe, const DataOptions& options, int index, int& label, std::uint8_t& kind) {
    // Side networks see only the gesture; half of the hits carry the wrong side.
    const bool positive = recipe.task == Task::Side || index < options.positives;
    std::mt19937_64 random(mix(options.seed, static_cast<std::uint64_t>(index) * 2 + 1));
    const float hitAngle = static_cast<float>((uniform(random) * 2 - 1) * options.angleRange);
    const bool wrongSide = recipe.task == Task::Side && uniform(random) < 0.5;

    // the hit, in scene pixels, sized so that the patch is scaled down by `oversample`
    const float hit = options.oversample * static_cast<float>(recipe.width) / recipe.scale;
    const float boxWidth = hit * recipe.boxFraction, boxHeight = boxWidth * recipe.boxAspect;
    const float aspect = static_cast<float>(recipe.height) / static_cast<float>(recipe.width);
    const float patchReach =
        hit * (std::hypot(recipe.shiftX, recipe.shiftY) + 0.5f * recipe.scale * std::sqrt(1 + aspect * aspect));
    const float boxReach = 0.6f * std::hypot(boxWidth, boxHeight);
    const int side = 2 * static_cast<int>(std::ceil(std::max(patchReach, boxReach))) + 4;

    handgen::SampleSet set;
    set.gesture = recipe.gesture;
    set.variation = options.variation;
    set.seed = options.seed;
    set.negatives = !positive;
    set.otherGestureShare = options.otherGestureShare;
    set.misplacedShare = options.misplacedShare;
    set.supersample = options.supersample;
    set.window.width = set.window.height = side;
    set.window.objectWidth = boxWidth;
    set.window.objectHeight = boxHeight;
    set.window.objectX = 0.5f * (side - boxWidth);
    set.window.objectY = 0.5f * (side - boxHeight);
    set.window.angle = hitAngle;
    const std::uint64_t sceneIndex =
        recipe.task == Task::Side ? static_cast<std::uint64_t>(index)
                                  : static_cast<std::uint64_t>(positive ? index : index - options.positives);
    handgen::Canvas canvas;
    const handgen::SampleLabel scene = handgen::renderSample(set, sceneIndex, canvas);
    kind = static_cast<std::uint8_t>(scene.kind);

    LQ::Side::Value hitSide;
    if (scene.shown)
        hitSide = scene.side == handgen::HandSide::Left ? LQ::Side::LEFT : LQ::Side::RIGHT;
    else
        hitSide = uniform(random) < 0.5 ? LQ::Side::LEFT : LQ::Side::RIGHT;
    if (wrongSide) hitSide = hitSide == LQ::Side::LEFT ? LQ::Side::RIGHT : LQ::Side::LEFT;
    label = recipe.task == Task::Side ? (wrongSide ? 1 : 0) : (positive ? 1 : 0);

    const LQ::Image image = canvasImage(canvas, recipe.mode);
    const LQ::ObjectLocation location(LQ::BasePoint<float>(0.5f * side, 0.5f * side), LQ::BaseSize<float>(hit, hit), hitAngle,
                                      hitSide);
    LQ::Image patch;
    recipe.relative().getLocationState(location).getPatch(image, LQ::BaseSize<int>(recipe.width, recipe.height), patch);
    return patch;
}

PatchSet makePatches(const Recipe& recipe, const DataOptions& options) {
    const int count = options.positives + options.negatives;
    const int depth = LQ::depth(recipe.mode);
    PatchSet set;
    set.inputs.resize(count, depth, recipe.height, recipe.width);
    set.labels.assign(count, 0);
    set.kinds.assign(count, 0);
    auto work = [&](int worker, int workers) {
        NnDetector converter;  // default mean 0 and multiplier 1/256, as the loaded networks have
        converter.setInputColorMode(recipe.mode);
        Blob blob;
        for (int i = worker; i < count; i += workers) {
            const LQ::Image patch = makePatch(recipe, options, i, set.labels[i], set.kinds[i]);
            converter.convert(patch, blob, 0, 1);
            std::copy(blob.data(), blob.data() + set.inputs.volume(), set.inputs.sample(i));
        }
    };
    const int workers = std::max(1, options.threads);
    std::vector<std::thread> threads;
    for (int t = 1; t < workers; ++t) threads.emplace_back(work, t, workers);
    work(0, workers);
    for (std::thread& t : threads) t.join();
    return set;
}

}  // namespace nntrain
