#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <cstdio>
#include <filesystem>
#include <random>
#include <sstream>

#include "CascadeTrainer.h"
#include "ClassifierRing.h"
#include "GestureRings.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"
#include "RingTrainer.h"

using namespace ctrain;

namespace {

std::vector<std::uint8_t> noiseCrop(const SampleSet& set, std::mt19937& random) {
    std::vector<std::uint8_t> crop(set.cropBytes());
    for (std::uint8_t& v : crop) v = static_cast<std::uint8_t>(random() & 0xff);
    return crop;
}

// a 3x3 patch centred on window point (x, y): one bright row, the rest dark
void putPatch(const SampleSet& set, std::vector<std::uint8_t>& crop, int x, int y, int brightRow) {
    for (int dy = -1; dy <= 1; ++dy)
        for (int dx = -1; dx <= 1; ++dx)
            crop[static_cast<size_t>(y + kMargin + dy) * set.cropWidth() + x + kMargin + dx] =
                dy == brightRow ? 220 : 30;
}

}  // namespace

TEST(CascadeTrainer, OneSeparatingPointIsFoundWithItsSigns) {
    SampleSet samples(12, 10);
    std::mt19937 random(5);
    for (int i = 0; i < 300; ++i) {
        std::vector<std::uint8_t> crop = noiseCrop(samples, random);
        const bool positive = i % 2 == 0;
        putPatch(samples, crop, 5, 4, positive ? -1 : 1);
        samples.add(crop.data(), positive);
    }
    WindowFeatures window;
    window.compute(samples.image(0));
    Feature point;
    point.x = 5;
    point.y = 4;
    const int positiveCode = window.value(point);
    window.compute(samples.image(1));
    const int negativeCode = window.value(point);
    ASSERT_NE(positiveCode, negativeCode);

    const std::vector<Feature> candidates = rmctFeatures(12, 10);
    FeatureMatrix matrix;
    matrix.compute(samples, candidates, 2);
    StageOptions options;
    options.rounds = 1;
    options.threads = 2;
    StageReport report;
    const StageModel stage = trainStage(samples, candidates, matrix, options, &report);
    ASSERT_EQ(stage.weak.size(), 1u);
    const WeakModel& weak = stage.weak[0];
    EXPECT_TRUE(weak.feature.kind == Feature::Kind::Rmct && weak.feature.x == 5 && weak.feature.y == 4);
    // the two codes score opposite amounts and the rest nothing; one weak classifier's
    // stage threshold is what a positive scores
    EXPECT_GT(weak.table[positiveCode], 0);
    EXPECT_EQ(weak.table[negativeCode], -weak.table[positiveCode]);
    for (int code = 0; code < 256; ++code) {
        if (code != positiveCode && code != negativeCode) {
            EXPECT_EQ(weak.table[code], 0) << code;
        }
    }
    EXPECT_EQ(stage.threshold, weak.table[positiveCode]);
    EXPECT_EQ(report.hitRate, 1.0);
    EXPECT_EQ(report.falsePositiveRate, 0.0);

    // the threshold keeps the asked share of positives and no more is dropped
    EXPECT_EQ(thresholdFor({5, 1, 3, 2, 4}, 0.8), 2);
    EXPECT_EQ(thresholdFor({5, 1, 3, 2, 4}, 0.99), 1);
    EXPECT_EQ(thresholdFor({7, 7, 7}, 0.5), 7);

    // the engine's stage from the model accepts the positives and refuses the negatives
    CascadedClassifier cascade;
    cascade.setMonoSize(LQ::BaseSize<int>(12, 10));
    cascade.setName("test");
    cascade.addStrongClassifier(toStrongClassifier(stage));
    CropJudge judge(cascade);
    for (size_t i = 0; i < 20; ++i)
        EXPECT_EQ(judge.accepts(samples.crop(i), samples.cropWidth(), samples.cropHeight()),
                  samples.positive(i))
            << i;
}

// Stage sums of the trainer's feature code against the engine's layer scan, over every
// window of a textured picture, with classifiers of all three kinds.
TEST(CascadeTrainer, StageSumsAgreeWithTheLayerScan) {
    const int width = 22, height = 19;
    std::mt19937 random(11);
    StageModel first, second;
    for (const Feature& f : rmctFeatures(width, height))
        if ((f.x * 7 + f.y * 3) % 11 == 0) first.weak.push_back({f, {}});
    for (const Feature& f : randomHaarFeatures(width, height, 12, 3)) second.weak.push_back({f, {}});
    for (const Feature& f : randomHogFeatures(width, height, 12, 4)) second.weak.push_back({f, {}});
    second.weak.insert(second.weak.end(), first.weak.begin(), first.weak.begin() + 5);
    for (StageModel* stage : {&first, &second}) {
        for (WeakModel& w : stage->weak)
            for (signed char& v : w.table)
                v = static_cast<signed char>(static_cast<int>(random() % 255) - 127);
        stage->threshold = INT_MIN;
    }
    CascadedClassifier cascade;
    cascade.setMonoSize(LQ::BaseSize<int>(width, height));
    cascade.setName("agreement");
    cascade.addStrongClassifier(toStrongClassifier(first));
    cascade.addStrongClassifier(toStrongClassifier(second));

    // smooth blobs over noise, so that gradients and rectangle means vary
    const int W = 70, H = 48;
    std::vector<std::uint8_t> pixels(static_cast<size_t>(W) * H);
    for (int y = 0; y < H; ++y)
        for (int x = 0; x < W; ++x)
            pixels[static_cast<size_t>(y) * W + x] = static_cast<std::uint8_t>(
                std::min(255.0, 90 + 60 * std::sin(x * 0.31) * std::cos(y * 0.23) +
                                    40 * std::sin((x + 2 * y) * 0.11) + (random() % 50)));
    LQ::Image mono, rmct, integral;
    mono.createRef(pixels.data(), LQ::BaseSize<int>(W, H), LQ::COLOR_MODE_MONO, W);
    LQ::computeRmct(mono, rmct);
    LQ::computeIntegral(mono, integral);
    std::vector<AdaObject> objects;
    CascadedClassifier scanner(cascade);
    scanner.addMatches(rmct, mono, integral, objects, 1.0f, 1);
    ASSERT_EQ(objects.size(), static_cast<size_t>((W - width + 1) * (H - height + 1)));

    // crops with the trainer's margin exist for windows off the picture's edge
    SampleSet crops(width, height);
    std::vector<int> scanned;
    const LQ::BasePoint<int> center = cascade.getObjectCenter();
    for (const AdaObject& o : objects) {
        const int x = o.center.x - center.x - kMargin, y = o.center.y - center.y - kMargin;
        if (x < 0 || y < 0 || x + crops.cropWidth() > W || y + crops.cropHeight() > H) continue;
        std::vector<std::uint8_t> crop;
        for (int row = 0; row < crops.cropHeight(); ++row)
            crop.insert(crop.end(), &pixels[static_cast<size_t>(y + row) * W + x],
                        &pixels[static_cast<size_t>(y + row) * W + x] + crops.cropWidth());
        crops.add(crop.data(), false);
        scanned.push_back(o.score);
    }
    ASSERT_GT(crops.size(), 500u);
    std::vector<Feature> features;
    for (const WeakModel& w : second.weak) features.push_back(w.feature);
    FeatureMatrix matrix;
    matrix.compute(crops, features, 2);
    WindowFeatures window;
    CropJudge judge(cascade);
    int mismatches = 0;
    for (size_t i = 0; i < crops.size(); ++i) {
        window.compute(crops.image(i));
        int fromMatrix = 0;
        for (size_t f = 0; f < features.size(); ++f) fromMatrix += second.weak[f].table[matrix.row(f)[i]];
        int judged = 0;
        EXPECT_TRUE(judge.accepts(crops.crop(i), crops.cropWidth(), crops.cropHeight(), &judged));
        mismatches += second.sum(window) != scanned[i] || fromMatrix != scanned[i] || judged != scanned[i];
    }
    EXPECT_EQ(mismatches, 0);
}

// A small cascade from generated hands: the stage layout, training hit rates, and the
// ring's file and its round trip.
TEST(CascadeTrainer, SmallRingFromGeneratedHands) {
    const RingPlan* fist = findRingPlan("fist");
    ASSERT_NE(fist, nullptr);
    EXPECT_EQ(fist->name, "ada_Fist_2013_10_02__16_45_30");
    TrainOptions options;
    options.positives = 120;
    options.negatives = 240;
    options.stageSizes = {2, 3, 3};
    options.haarStart = 2;
    options.hogStart = 3;
    options.haarPool = 40;
    options.hogPool = 40;
    options.maxMiningRounds = 1;
    options.sceneWidth = 96;
    options.sceneHeight = 80;
    std::ostringstream log;
    CascadeResult result = trainCascade(*fist, 1, options, log);
    const std::vector<StrongClassifier>& stages = result.cascade.stages();
    ASSERT_EQ(stages.size(), 3u) << log.str();
    EXPECT_TRUE(stages[0].haarClassifiers().empty() && stages[0].hogClassifiers().empty());
    EXPECT_TRUE(stages[1].hogClassifiers().empty());
    for (size_t s = 0; s < stages.size(); ++s) {
        EXPECT_EQ(static_cast<int>(stages[s].size()), options.stageSizes[s]);
        EXPECT_GE(result.stages[s].hitRate, 0.99);
    }
    EXPECT_EQ(result.cascade.getMonoSize(), LQ::BaseSize<int>(40, 35));
    EXPECT_EQ(result.cascade.getObjectRect(), LQ::BaseRect<int>(7, 5, 33, 31));
    EXPECT_EQ(result.cascade.getAngle(), 0);

    ClassifierRing ring(std::vector<CascadedClassifier*>{&result.cascade});
    ring.setName(fist->name);
    ring.setConfig(ringConfig(*fist, options));
    const std::string path = testing::TempDir() + "small_fist.ring";
    ASSERT_TRUE(ring.save(path));
    ClassifierRing loaded(path);
    ASSERT_EQ(loaded.getNumClassifiers(), 1u);
    EXPECT_TRUE(loaded.getBaseClassifiers()[0]->stages() == stages);
    // the file keeps no centre: a loaded window has its object in the middle
    EXPECT_EQ(loaded.getBaseClassifiers()[0]->getObjectRect(), LQ::BaseRect<int>(7, 4, 33, 30));
    EXPECT_EQ(loaded.getConfig().at("tab_iterAtFirstCascade"), "2");
    EXPECT_EQ(loaded.getConfig().at("tab_hogStartCascade"), "3");
    std::remove(path.c_str());
}

// With no ring file in the ring directory the compiled tables serve (a file there wins: see
// GestureRings in the ring tests), and they hold the same cascades as the committed ".ring" file.
TEST(GestureRings, CompiledTablesMatchTheirFile) {
    const std::string directory = testing::TempDir() + "gesture_rings_test";
    std::filesystem::create_directories(directory);
    setRingDirectory(directory);
    const std::string fist = "ada_Fist_2013_10_02__16_45_30";
    if (!hasCompiledRing(fist)) GTEST_SKIP() << "no compiled fist ring in this build";
    ClassifierRing* compiled = ada_Fist_2013_10_02__16_45_30();
    EXPECT_EQ(compiled, ada_Fist_2013_10_02__16_45_30());
    EXPECT_EQ(compiled->getName(), fist);
    ClassifierRing file(std::string(TACTUS_RING_MODELS) + "/" + fist + ".ring");
    ASSERT_EQ(compiled->getNumClassifiers(), file.getNumClassifiers());
    const RingPlan* plan = findRingPlan(fist);
    for (size_t k = 0; k < file.getNumClassifiers(); ++k) {
        const CascadedClassifier& c = *compiled->getBaseClassifiers()[k];
        EXPECT_TRUE(c.stages() == file.getBaseClassifiers()[k]->stages()) << k;
        EXPECT_EQ(c.getMonoSize(), LQ::BaseSize<int>(plan->cascades[k].width, plan->cascades[k].height));
        EXPECT_EQ(c.getObjectCenter(),
                  LQ::BasePoint<int>(plan->cascades[k].centerX, plan->cascades[k].centerY));
        EXPECT_EQ(c.getAngle(), plan->cascades[k].angle);
        EXPECT_TRUE(c.stages()[0].haarClassifiers().empty() && c.stages()[0].hogClassifiers().empty());
    }
    EXPECT_EQ(compiled->getConfig(), file.getConfig());
}

// Scenes follow from the seed and the scene's number alone, and every window mined from
// them, mirrored and turned ones included, is one the cascade accepts as a crop.
TEST(CascadeTrainer, MinedScenesAreReproducibleAndAccepted) {
    const RingPlan* fist = findRingPlan("fist");
    const CascadePlan& plan = fist->cascades[1];
    const handgen::Variation variation;
    const std::vector<std::uint8_t> whole =
        negativeScenes(plan, fist->gesture, variation, 9, 0, 6, 96, 80, 2);
    std::vector<std::uint8_t> parts = negativeScenes(plan, fist->gesture, variation, 9, 0, 2, 96, 80, 1);
    const std::vector<std::uint8_t> rest = negativeScenes(plan, fist->gesture, variation, 9, 2, 4, 96, 80, 2);
    parts.insert(parts.end(), rest.begin(), rest.end());
    EXPECT_TRUE(parts == whole);

    // a loose census stage, so that a good share of windows pass
    StageModel stage;
    std::mt19937 random(3);
    for (const Feature& f : rmctFeatures(plan.width, plan.height))
        if ((f.x + f.y * 5) % 37 == 0) {
            WeakModel w{f, {}};
            for (signed char& v : w.table) v = static_cast<signed char>(static_cast<int>(random() % 21) - 10);
            stage.weak.push_back(w);
        }
    stage.threshold = 5;
    CascadedClassifier cascade = emptyCascade(plan, "fist", fist->setsCenter);
    cascade.addStrongClassifier(toStrongClassifier(stage));
    std::vector<std::uint8_t> crops;
    const SceneScan scan = scanScenes(cascade, whole, 96, 80, 50, &crops, 4);
    EXPECT_EQ(scan.windows, 4LL * 6 * (96 - plan.width + 1) * (80 - plan.height + 1));
    const int cropWidth = plan.width + 2 * kMargin, cropHeight = plan.height + 2 * kMargin;
    const size_t cropBytes = static_cast<size_t>(cropWidth) * cropHeight;
    ASSERT_GT(crops.size(), 20 * cropBytes);
    ASSERT_LT(scan.hits, scan.windows);
    CropJudge judge(cascade);
    WindowFeatures window;
    SampleSet set(plan.width, plan.height);
    int refused = 0;
    for (size_t at = 0; at < crops.size(); at += cropBytes) {
        refused += !judge.accepts(crops.data() + at, cropWidth, cropHeight);
        set.add(crops.data() + at, false);
        window.compute(set.image(set.size() - 1));
        refused += stage.sum(window) < stage.threshold;
    }
    EXPECT_EQ(refused, 0);
}
