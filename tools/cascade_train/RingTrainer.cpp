#include "RingTrainer.h"

#include <algorithm>
#include <chrono>
#include <cstring>

#include "HandRandom.h"
#include "HandSamples.h"
#include "LQ_Check.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"

namespace ctrain {

using handgen::Gesture;

const std::vector<RingPlan>& ringPlans() {
    static const std::vector<RingPlan> plans = {
        {"ada_thumbUp_ada__2017_11_13__20_01_17",
         "",
         Gesture::ThumbUp,
         "SimpleThumbUp",
         false,
         {{24, 29, 24, 29, 12, 14, -30, {15, 30, 100, 464, 464, 464}},
          {21, 30, 21, 30, 10, 15, 0, {15, 30, 100, 458, 458, 458}},
          {24, 29, 24, 29, 12, 14, 30, {15, 30, 100, 460, 460, 460}}}},
        {"ada_mono_ada_staticVictory_2017_11_10__14_34_17",
         "",
         Gesture::Victory,
         "SimpleVictoryBack",
         false,
         {{29, 33, 29, 33, 14, 16, -30, {20, 84, 522, 522, 522, 522}},
          {25, 33, 25, 33, 12, 16, 0, {22, 98, 518, 518, 518, 518}},
          {29, 33, 29, 33, 14, 16, 30, {18, 78, 517, 517, 517, 517}}}},
        {"ada_Fist_2013_10_02__16_45_30",
         "fist",
         Gesture::Fist,
         "SimpleFist",
         true,
         {{41, 39, 26, 26, 20, 20, -30, {7, 36, 98, 628}},
          {40, 35, 26, 26, 20, 18, 0, {5, 30, 104, 628}},
          {41, 39, 26, 26, 20, 20, 30, {5, 30, 66, 628}}}},
        {"ada_mono_ada_staticPointer0_2015_06_23__19_25_48",
         "",
         Gesture::Pointer,
         "SimplePointer",
         true,
         {{54, 54, 25, 25, 27, 27, -30, {5, 50, 200, 951, 951}},
          {50, 50, 25, 25, 25, 25, 0, {5, 50, 200, 949, 949}},
          {54, 54, 25, 25, 27, 27, 30, {5, 50, 200, 954, 954}}}},
        {"ada__ada_staticPalm_2014_12_05__17_40_12",
         "",
         Gesture::Palm,
         "SimplePalm",
         false,
         {{36, 35, 36, 35, 18, 17, -30, {7, 17, 147, 854, 854}},
          {35, 33, 35, 33, 17, 16, 0, {5, 12, 42, 453, 834}},
          {36, 35, 36, 35, 18, 17, 30, {6, 14, 87, 854, 854}}}},
        {"ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26",
         "",
         Gesture::Heart,
         "SimpleHeart",
         false,
         {{32, 32, 32, 32, 16, 16, 0, {5, 10, 100, 296, 296}},
          {34, 34, 34, 34, 17, 17, 30, {5, 10, 100, 295, 295, 295}}}},
    };
    return plans;
}

const RingPlan* findRingPlan(const std::string& name) {
    for (const RingPlan& plan : ringPlans())
        if (plan.name == name || handgen::gestureName(plan.gesture) == name) return &plan;
    return nullptr;
}

LQ::BaseRect<int> objectRect(const CascadePlan& plan) {
    const int left = plan.centerX - plan.baseWidth / 2, top = plan.centerY - plan.baseHeight / 2;
    return LQ::BaseRect<int>(left, top, left + plan.baseWidth, top + plan.baseHeight);
}

CascadedClassifier emptyCascade(const CascadePlan& plan, const std::string& name, bool setsCenter) {
    CascadedClassifier cascade;
    cascade.setMonoSize(LQ::BaseSize<int>(plan.width, plan.height));
    cascade.setBaseSize(LQ::BaseSize<int>(plan.baseWidth, plan.baseHeight));
    cascade.setAngle(plan.angle);
    cascade.setName(name);
    cascade.setSymmetry(false);
    if (setsCenter) cascade.setObjectCenter(LQ::BasePoint<int>(plan.centerX, plan.centerY));
    return cascade;
}

namespace {

handgen::SampleSet windowSet(const CascadePlan& plan, Gesture gesture, const handgen::Variation& variation,
                             std::uint64_t seed, bool negatives) {
    handgen::SampleSet set;
    set.gesture = gesture;
    set.variation = variation;
    set.seed = seed;
    set.negatives = negatives;
    const LQ::BaseRect<int> object = objectRect(plan);
    set.window.width = plan.width + 2 * kMargin;
    set.window.height = plan.height + 2 * kMargin;
    set.window.objectX = static_cast<float>(object.left + kMargin);
    set.window.objectY = static_cast<float>(object.top + kMargin);
    set.window.objectWidth = static_cast<float>(object.width());
    set.window.objectHeight = static_cast<float>(object.height());
    set.window.angle = static_cast<float>(plan.angle);
    return set;
}

void appendCrops(SampleSet& samples, const std::vector<std::uint8_t>& bytes, bool positive) {
    for (size_t at = 0; at + samples.cropBytes() <= bytes.size(); at += samples.cropBytes())
        samples.add(bytes.data() + at, positive);
}

std::string cascadeName(const RingPlan& ring, size_t index) {
    return ring.cascadeName.empty() ? ring.name + "_r" + std::to_string(index) : ring.cascadeName;
}

double seconds(std::chrono::steady_clock::time_point since) {
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - since).count();
}

}  // namespace

SampleSet positiveSamples(const CascadePlan& plan, Gesture gesture, const handgen::Variation& variation,
                          std::uint64_t seed, std::uint64_t first, int count, int threads) {
    // the cascades are right-handed; the left hand comes from the ring's mirror images
    handgen::Variation right = variation;
    right.leftShare = 0;
    SampleSet samples(plan.width, plan.height);
    appendCrops(samples,
                handgen::generateSamples(windowSet(plan, gesture, right, seed, false), first, count, threads),
                true);
    return samples;
}

CropJudge::CropJudge(const CascadedClassifier& cascade) : cascade_(cascade) {}

bool CropJudge::accepts(const std::uint8_t* crop, int cropWidth, int cropHeight, int* score) {
    mono_.createRef(const_cast<std::uint8_t*>(crop), LQ::BaseSize<int>(cropWidth, cropHeight),
                    LQ::COLOR_MODE_MONO, static_cast<unsigned int>(cropWidth));
    LQ::computeRmct(mono_, rmct_);
    LQ::computeIntegral(mono_, integral_);
    if (!activated_) {
        cascade_.activate(static_cast<int>(rmct_.stripLength()), static_cast<int>(mono_.stripLength()),
                          static_cast<int>(integral_.stripLength()), 1.0f, cascade_.getMonoSize());
        activated_ = true;
    }
    int value = 0;
    const bool passed = cascade_.detect(rmct_.row(kMargin) + kMargin, mono_.row(kMargin) + kMargin,
                                        integral_.row<unsigned int>(kMargin) + kMargin, 0, value);
    if (score) *score = value;
    return passed;
}

SceneScan scanScenes(const CascadedClassifier& cascade, const std::vector<std::uint8_t>& scenes,
                     int sceneWidth, int sceneHeight, int maxCropsPerScene, std::vector<std::uint8_t>* crops,
                     int variants) {
    SceneScan scan;
    CascadedClassifier scanner(cascade);
    const LQ::BaseSize<int> window = cascade.getMonoSize();
    const LQ::BasePoint<int> center = cascade.getObjectCenter();
    const int cropWidth = window.width + 2 * kMargin, cropHeight = window.height + 2 * kMargin;
    const size_t sceneBytes = static_cast<size_t>(sceneWidth) * sceneHeight;
    LQ::Image mono, rmct, integral;
    std::vector<AdaObject> objects;
    std::vector<std::uint8_t> turned(sceneBytes);
    for (size_t at = 0; at + sceneBytes <= scenes.size() * static_cast<size_t>(variants); at += sceneBytes) {
        // variant v of a scene: bit 0 mirrors it, bit 1 turns it upside down
        const int v = static_cast<int>(at / sceneBytes) % variants;
        const std::uint8_t* scene =
            scenes.data() + at / sceneBytes / static_cast<size_t>(variants) * sceneBytes;
        for (int y = 0; y < sceneHeight; ++y)
            for (int x = 0; x < sceneWidth; ++x)
                turned[static_cast<size_t>(y) * sceneWidth + x] =
                    scene[static_cast<size_t>(v & 2 ? sceneHeight - 1 - y : y) * sceneWidth +
                          (v & 1 ? sceneWidth - 1 - x : x)];
        mono.createRef(turned.data(), LQ::BaseSize<int>(sceneWidth, sceneHeight), LQ::COLOR_MODE_MONO,
                       static_cast<unsigned int>(sceneWidth));
        LQ::computeRmct(mono, rmct);
        LQ::computeIntegral(mono, integral);
        objects.clear();
        scanner.addMatches(rmct, mono, integral, objects, 1.0f, 1);
        scan.windows += static_cast<long long>(std::max(0, sceneWidth - window.width + 1)) *
                        std::max(0, sceneHeight - window.height + 1);
        scan.hits += static_cast<long long>(objects.size());
        if (!crops || objects.empty() || maxCropsPerScene <= 0) continue;
        const size_t every = std::max<size_t>(1, objects.size() / static_cast<size_t>(maxCropsPerScene));
        for (size_t k = 0; k < objects.size(); k += every) {
            const int x = objects[k].center.x - center.x - kMargin,
                      y = objects[k].center.y - center.y - kMargin;
            if (x < 0 || y < 0 || x + cropWidth > sceneWidth || y + cropHeight > sceneHeight) continue;
            for (int row = 0; row < cropHeight; ++row) {
                const std::uint8_t* from = mono.row(y + row) + x;
                crops->insert(crops->end(), from, from + cropWidth);
            }
        }
    }
    return scan;
}

std::vector<std::uint8_t> negativeScenes(const CascadePlan& plan, Gesture gesture,
                                         const handgen::Variation& variation, std::uint64_t seed,
                                         std::uint64_t first, int count, int width, int height, int threads) {
    // the other hand and the textures at several sizes against the window
    static const float factors[] = {0.6f, 0.8f, 1.0f, 1.3f, 1.7f, 2.2f};
    constexpr int kFactors = 6;
    std::vector<std::uint8_t> out(static_cast<size_t>(count) * width * height);
    for (int f = 0; f < kFactors; ++f) {
        handgen::SampleSet set;
        set.gesture = gesture;
        set.variation = variation;
        set.seed = handgen::mixSeed(seed, 7000 + static_cast<std::uint64_t>(f));
        set.negatives = true;
        set.otherGestureShare = 0.6f;
        set.misplacedShare = 0;
        const float w = plan.baseWidth * factors[f], h = plan.baseHeight * factors[f];
        set.window.width = width;
        set.window.height = height;
        set.window.objectWidth = w;
        set.window.objectHeight = h;
        set.window.objectX = (width - w) / 2;
        set.window.objectY = (height - h) / 2;
        set.window.angle = static_cast<float>(plan.angle);
        // scene i of the whole series uses the factor i mod 6
        std::vector<int> mine;
        for (int i = 0; i < count; ++i)
            if ((first + static_cast<std::uint64_t>(i)) % kFactors == static_cast<std::uint64_t>(f))
                mine.push_back(i);
        if (mine.empty()) continue;
        const std::uint64_t from = (first + static_cast<std::uint64_t>(mine.front())) / kFactors;
        const std::vector<std::uint8_t> bytes =
            handgen::generateSamples(set, from, static_cast<int>(mine.size()), threads);
        for (size_t k = 0; k < mine.size(); ++k)
            std::memcpy(out.data() + static_cast<size_t>(mine[k]) * width * height,
                        bytes.data() + k * width * height, static_cast<size_t>(width) * height);
    }
    return out;
}

CascadeResult trainCascade(const RingPlan& ring, size_t cascadeIndex, const TrainOptions& options,
                           std::ostream& log) {
    const CascadePlan& plan = ring.cascades[cascadeIndex];
    const auto start = std::chrono::steady_clock::now();
    CascadeResult result{emptyCascade(plan, cascadeName(ring, cascadeIndex), ring.setsCenter), {}};
    const std::uint64_t seed = handgen::mixSeed(options.seed, cascadeIndex);
    log << "cascade " << cascadeIndex << " " << cascadeName(ring, cascadeIndex) << " window " << plan.width
        << "x" << plan.height << " object " << objectRect(plan) << " angle " << plan.angle << "\n";

    SampleSet samples =
        positiveSamples(plan, ring.gesture, options.variation, seed, 0, options.positives, options.threads);
    const handgen::SampleSet negativeWindows = windowSet(plan, ring.gesture, options.variation, seed, true);
    appendCrops(samples, handgen::generateSamples(negativeWindows, 0, options.negatives, options.threads),
                false);
    // boosting sums of its own positives are optimistic: thresholds come from positives it
    // hasn't seen
    SampleSet validation = positiveSamples(plan, ring.gesture, options.variation, handgen::mixSeed(seed, 50),
                                           0, std::max(200, options.positives / 2), options.threads);
    std::uint64_t nextWindow = static_cast<std::uint64_t>(options.negatives), nextScene = 0;
    log << "  " << samples.positives() << " positives, " << samples.size() - samples.positives()
        << " negatives (" << seconds(start) << " s)" << std::endl;

    const std::vector<Feature> census = rmctFeatures(plan.width, plan.height);
    for (size_t s = 0; s < options.stageSizes.size(); ++s) {
        const int number = static_cast<int>(s) + 1;
        std::vector<Feature> candidates = census;
        if (number >= options.haarStart) {
            const std::vector<Feature> haar = randomHaarFeatures(plan.width, plan.height, options.haarPool,
                                                                 handgen::mixSeed(seed, 100 + s));
            candidates.insert(candidates.end(), haar.begin(), haar.end());
        }
        if (number >= options.hogStart) {
            const std::vector<Feature> hog =
                randomHogFeatures(plan.width, plan.height, options.hogPool, handgen::mixSeed(seed, 200 + s));
            candidates.insert(candidates.end(), hog.begin(), hog.end());
        }
        FeatureMatrix matrix;
        matrix.compute(samples, candidates, options.threads);
        StageOptions stageOptions = options.stage;
        stageOptions.rounds = options.stageSizes[s];
        stageOptions.threads = options.threads;
        StageReport report;
        log << "stage " << number << ": " << stageOptions.rounds << " rounds over " << candidates.size()
            << " candidates, " << samples.positives() << " positives, "
            << samples.size() - samples.positives() << " negatives" << std::endl;
        StageModel stage = trainStage(samples, candidates, matrix, stageOptions, &report, &log);
        const int trainingThreshold = stage.threshold;
        {
            std::vector<int> sums(validation.size());
            WindowFeatures window;
            for (size_t i = 0; i < validation.size(); ++i) {
                window.compute(validation.image(i));
                sums[i] = stage.sum(window);
            }
            stage.threshold = std::min(trainingThreshold, thresholdFor(sums, options.stage.hitRate));
            std::vector<bool> keep(validation.size());
            for (size_t i = 0; i < validation.size(); ++i) keep[i] = sums[i] >= stage.threshold;
            validation.keep(keep);
        }
        size_t hits = 0, falsePositives = 0;
        for (int v : report.positiveSums) hits += v >= stage.threshold;
        for (int v : report.negativeSums) falsePositives += v >= stage.threshold;
        report.hitRate =
            static_cast<double>(hits) / static_cast<double>(std::max<size_t>(1, report.positiveSums.size()));
        report.falsePositiveRate = static_cast<double>(falsePositives) /
                                   static_cast<double>(std::max<size_t>(1, report.negativeSums.size()));
        result.cascade.addStrongClassifier(toStrongClassifier(stage));
        result.stages.push_back(report);
        log << "stage " << number << " threshold " << stage.threshold << " (on its own positives "
            << trainingThreshold << ") hit rate " << report.hitRate << " false positives "
            << report.falsePositiveRate << ", " << validation.size() << " unseen positives pass ("
            << seconds(start) << " s)" << std::endl;
        if (s + 1 == options.stageSizes.size()) break;

        // what reaches the next stage: the samples the cascade so far accepts, topped up
        // with new negatives that it accepts as well
        CropJudge judge(result.cascade);
        std::vector<bool> keep(samples.size());
        for (size_t i = 0; i < samples.size(); ++i)
            keep[i] = judge.accepts(samples.crop(i), samples.cropWidth(), samples.cropHeight());
        samples.keep(keep);
        const size_t kept = samples.size() - samples.positives();
        long long tried = 0, found = 0, sceneWindows = 0, sceneHits = 0;
        for (int round = 0; round < options.maxMiningRounds; ++round) {
            if (static_cast<int>(samples.size() - samples.positives()) >= options.negatives) break;
            // scenes give far more windows per rendered pixel than single windows do
            const int batch = 128;
            const std::vector<std::uint8_t> fresh =
                handgen::generateSamples(negativeWindows, nextWindow, batch, options.threads);
            nextWindow += batch;
            tried += batch;
            for (size_t at = 0; at < fresh.size(); at += samples.cropBytes())
                if (judge.accepts(fresh.data() + at, samples.cropWidth(), samples.cropHeight())) {
                    samples.add(fresh.data() + at, false);
                    ++found;
                }
            const int sceneBatch = 24;
            const std::vector<std::uint8_t> scenes =
                negativeScenes(plan, ring.gesture, options.variation, seed, nextScene, sceneBatch,
                               options.sceneWidth, options.sceneHeight, options.threads);
            nextScene += sceneBatch;
            std::vector<std::uint8_t> crops;
            const SceneScan scan =
                scanScenes(result.cascade, scenes, options.sceneWidth, options.sceneHeight, 20, &crops, 4);
            sceneWindows += scan.windows;
            sceneHits += scan.hits;
            appendCrops(samples, crops, false);
        }
        const size_t negatives = samples.size() - samples.positives();
        log << "  kept " << samples.positives() << " positives, " << kept << " negatives; mined "
            << negatives - kept << " (windows accepted " << found << " of " << tried << ", scene hits "
            << sceneHits << " of " << sceneWindows << " windows) (" << seconds(start) << " s)" << std::endl;
        if (negatives < 50) {
            log << "  too few negatives left to train another stage\n";
            break;
        }
        if (static_cast<int>(negatives) > options.negatives) {
            std::vector<bool> trim(samples.size(), true);
            size_t seen = 0;
            for (size_t i = 0; i < samples.size(); ++i)
                if (!samples.positive(i) && ++seen > static_cast<size_t>(options.negatives)) trim[i] = false;
            samples.keep(trim);
        }
    }
    log << "cascade " << cascadeIndex << " done in " << seconds(start) << " s\n";
    return result;
}

HeldOut measureHeldOut(const CascadedClassifier& cascade, const CascadePlan& plan, Gesture gesture,
                       const handgen::Variation& variation, std::uint64_t seed, int positives, int scenes,
                       int threads) {
    HeldOut out;
    const SampleSet samples = positiveSamples(plan, gesture, variation, seed, 0, positives, threads);
    CropJudge judge(cascade);
    long long hits = 0;
    for (size_t i = 0; i < samples.size(); ++i)
        hits += judge.accepts(samples.crop(i), samples.cropWidth(), samples.cropHeight());
    out.positives = static_cast<long long>(samples.size());
    out.hitRate = samples.size() ? static_cast<double>(hits) / static_cast<double>(samples.size()) : 0;
    const int width = 160, height = 120, batch = 50;
    for (int first = 0; first < scenes; first += batch) {
        const std::vector<std::uint8_t> bytes =
            negativeScenes(plan, gesture, variation, seed, static_cast<std::uint64_t>(first),
                           std::min(batch, scenes - first), width, height, threads);
        const SceneScan scan = scanScenes(cascade, bytes, width, height, 0, nullptr);
        out.windows += scan.windows;
        out.falsePositives += scan.hits;
    }
    out.falsePositivesPerWindow =
        out.windows ? static_cast<double>(out.falsePositives) / static_cast<double>(out.windows) : 0;
    return out;
}

mapStringString ringConfig(const RingPlan& ring, const TrainOptions& options) {
    mapStringString config;
    const CascadePlan* upright = &ring.cascades.front();
    for (const CascadePlan& plan : ring.cascades)
        if (plan.angle == 0) upright = &plan;
    auto stage = [&](size_t i) {
        return i < options.stageSizes.size() ? std::to_string(options.stageSizes[i]) : "0";
    };
    config["shape"] = ring.shape;
    config["gestureType"] = handgen::gestureName(ring.gesture);
    config["ringName"] = ring.name;
    config["colorMode"] = "COLOR_MODE_MONO";
    config["baseSizeX"] = std::to_string(upright->width);
    config["baseSizeY"] = std::to_string(upright->height);
    config["maxNumbCascades"] = std::to_string(options.stageSizes.size());
    config["tab_iterAtFirstCascade"] = stage(0);
    config["tab_iterAtSecondCascade"] = stage(1);
    config["tab_iterAtThirdCascade"] = stage(2);
    config["tab_iterAtFourthCascade"] = stage(3);
    config["tab_haarStartCascade"] = std::to_string(options.haarStart);
    config["tab_hogStartCascade"] = std::to_string(options.hogStart);
    config["tab_allRectMinWidth"] = "4";
    config["tab_allRectMinHeight"] = "4";
    config["ni_maxAngle"] = "30";
    config["useRmct"] = "1";
    config["useHaar"] = options.haarStart <= static_cast<int>(options.stageSizes.size()) ? "1" : "0";
    config["useHog"] = options.hogStart <= static_cast<int>(options.stageSizes.size()) ? "1" : "0";
    config["maxHogFeature"] = std::to_string(options.hogPool);
    config["database"] = "handgen seed " + std::to_string(options.seed);
    config["imageNumb"] = std::to_string(options.positives);
    config["negative"] = std::to_string(options.negatives);
    config["quantileFactor"] = std::to_string(options.stage.hitRate);
    config["flip"] = "0";
    return config;
}

}  // namespace ctrain
