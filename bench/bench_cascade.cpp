// Full-frame trigger scan of a 640x360 working image by the cascade detector, with cascades
// of the fist ring's shape (window sizes, stage sizes and feature mix) whose random tables
// are given thresholds that pass about 5 % of windows at the first stage and about 20 % of
// what reaches each later stage. OpenCV's LBP face cascade on the same frame runs beside it
// where Debian's opencv-data is installed. Then the same scan with the trained rings
// compiled into the library, over a generated background, with the share of windows that
// reaches each stage, and one layer's census stages taken in lists or densely by row.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <climits>
#include <cmath>
#include <fstream>
#include <map>
#include <memory>
#include <random>
#include <vector>

#include "AdaBoostDetector.h"
#include "GestureRings.h"
#include "HandClip.h"
#include "LQ_BaseDetector.h"
#include "LQ_ImageData.h"
#include "LQ_States.h"

#if defined(TACTUS_WITH_OPENCV_OBJDETECT)
#include <opencv2/imgproc.hpp>
#include <opencv2/objdetect.hpp>
#endif

namespace {

const int kWidth = 640, kHeight = 360;

// Smooth shading, blocks of texture and fine noise: census codes of every kind.
LQ::Image sceneImage() {
    std::mt19937 random(7);
    std::vector<float> value(static_cast<size_t>(kWidth) * kHeight);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) value[y * kWidth + x] = 90.f + 60.f * std::sin(x * 0.013f + y * 0.021f);
    for (int k = 0; k < 220; ++k) {
        const int w = 8 + random() % 90, h = 8 + random() % 90;
        const int x0 = random() % (kWidth - w), y0 = random() % (kHeight - h);
        const float add = static_cast<float>(static_cast<int>(random() % 120) - 60);
        for (int y = y0; y < y0 + h; ++y)
            for (int x = x0; x < x0 + w; ++x) value[y * kWidth + x] += add;
    }
    LQ::Image image(LQ::BaseSize<int>(kWidth, kHeight), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) {
            const float v = value[y * kWidth + x] + static_cast<float>(random() % 9) - 4.f;
            image.pixel(x, y)[0] = static_cast<unsigned char>(std::min(255.f, std::max(0.f, v)));
        }
    return image;
}

struct Shape {
    LQ::BaseSize<int> window;
    LQ::BasePoint<int> center;
    int angle;
    std::vector<int> rmct, haar, hog;  // per stage
};

// The fist ring: windows, object 26 x 26, stages 7/36/98/628 and the like; RMCT alone in
// the first stage, Haar from the third, HOG in the fourth.
const Shape kFist[3] = {
    {{41, 39}, {20, 20}, -30, {7, 36, 33, 395}, {0, 0, 65, 0}, {0, 0, 0, 233}},
    {{40, 35}, {20, 18}, 0, {5, 30, 19, 391}, {0, 0, 85, 0}, {0, 0, 0, 237}},
    {{41, 39}, {20, 20}, 30, {5, 30, 10, 386}, {0, 0, 56, 0}, {0, 0, 0, 242}},
};

struct Fixture {
    std::vector<std::unique_ptr<LQ::schar[]>> tables;
    std::vector<std::unique_ptr<CascadedClassifier>> cascades;
    LQ::Image image = sceneImage();
    LQ::SharedPtr<LQ::ImageData> root{new LQ::ImageData()};
    LQ::SharedPtr<LQ::ImagePyramidData> pyramid;
    std::unique_ptr<AdaBoostDetector> detector;

    LQ::schar* table(std::mt19937& random) {
        tables.emplace_back(new LQ::schar[256]);
        for (int i = 0; i < 256; ++i) tables.back()[i] = static_cast<LQ::schar>(static_cast<int>(random() % 33) - 16);
        return tables.back().get();
    }

    CascadedClassifier build(const Shape& shape, std::mt19937& random) {
        CascadedClassifier cascade;
        cascade.setMonoSize(shape.window);
        cascade.setBaseSize(LQ::BaseSize<int>(26, 26));
        cascade.setObjectCenter(shape.center);
        cascade.setAngle(shape.angle);
        cascade.setName("fist");
        const int W = shape.window.width, H = shape.window.height;
        for (size_t s = 0; s < shape.rmct.size(); ++s) {
            StrongClassifier stage;
            for (int k = 0; k < shape.rmct[s]; ++k) {
                WeakClassifierRmct weak(LQ::BasePoint<int>(1 + random() % (W - 2), 1 + random() % (H - 2)));
                weak.setData(table(random));
                stage.addRmctClassifier(weak);
            }
            for (int k = 0; k < shape.haar[s]; ++k) {
                const int w = 4 + random() % (W - 4), h = 4 + random() % (H - 4);
                const int x = random() % (W - w + 1), y = random() % (H - h + 1);
                const int pw = 1 + random() % (w - 1), ph = 1 + random() % (h - 1);
                const int px = x + random() % (w - pw + 1), py = y + random() % (h - ph + 1);
                WeakClassifierHaar weak;
                weak.set(LQ::BaseRect<int>(x, y, x + w, y + h), LQ::BaseRect<int>(px, py, px + pw, py + ph));
                weak.setData(table(random));
                stage.addHaarClassifier(weak);
            }
            for (int k = 0; k < shape.hog[s]; ++k) {
                const int w = 6 + random() % (W - 8), h = 6 + random() % (H - 8);
                const int x = 1 + random() % (W - 1 - w), y = 1 + random() % (H - 1 - h);
                const int cw = 2 + random() % (w - 2), ch = 2 + random() % (h - 2);
                const int cx = x + random() % (w - cw + 1), cy = y + random() % (h - ch + 1);
                WeakClassifierHog weak;
                weak.setBlock(LQ::BaseRect<int>(x, y, x + w, y + h));
                weak.setCell(LQ::BaseRect<int>(cx, cy, cx + cw, cy + ch));
                weak.setSector(random() % 6);
                weak.setData(table(random));
                stage.addHogClassifier(weak);
            }
            cascade.addStrongClassifier(stage);
        }
        return cascade;
    }

    // Thresholds stage by stage from the sums of the windows that reach each stage, on the
    // layer at zoom 1.2 of the scene.
    void calibrate(CascadedClassifier& cascade, double firstPass = 0.05, double laterPass = 0.20) {
        const float zoom = 1.2f;
        const LQ::Image& rmct = pyramid->getByZoom(LQ::COLOR_MODE_RMCT, zoom)->get();
        const LQ::Image& mono = pyramid->getByZoom(LQ::COLOR_MODE_MONO, zoom)->get();
        const LQ::Image& integral = pyramid->getByZoom(LQ::COLOR_MODE_INTEGRAL, 1.f)->get();
        std::vector<StrongClassifier> stages = cascade.stages();
        for (size_t s = 0; s < stages.size(); ++s) {
            CascadedClassifier prefix;
            prefix.setMonoSize(cascade.getMonoSize());
            prefix.setName("calibration");
            for (size_t k = 0; k <= s; ++k) prefix.addStrongClassifier(stages[k]);
            prefix.stages()[s].setThreshold(INT_MIN);
            std::vector<AdaObject> reached;
            prefix.addMatches(rmct, mono, integral, reached, zoom, 2);
            std::vector<int> scores;
            for (const AdaObject& o : reached) scores.push_back(o.score);
            const double pass = s == 0 ? firstPass : laterPass;
            std::nth_element(scores.begin(), scores.begin() + static_cast<long>(scores.size() * (1 - pass)), scores.end());
            stages[s].setThreshold(scores.empty() ? 0 : scores[static_cast<size_t>(scores.size() * (1 - pass))]);
        }
        for (size_t s = 0; s < stages.size(); ++s) cascade.stages()[s].setThreshold(stages[s].getThreshold());
    }

    Fixture() {
        root->set(image);
        pyramid = LQ::SharedPtr<LQ::ImagePyramidData>(new LQ::ImagePyramidData(root, 1));
        std::mt19937 random(11);
        std::vector<CascadedClassifier*> list;
        for (const Shape& shape : kFist) {
            cascades.emplace_back(new CascadedClassifier(build(shape, random)));
            calibrate(*cascades.back());
        }
        // the other hand: what a ring serves for the angles -30 to 30 and both sides
        for (int k = 0; k < 3; ++k) {
            cascades.emplace_back(new CascadedClassifier(*cascades[k]));
            cascades.back()->flipVertically();
        }
        for (auto& c : cascades) list.push_back(c.get());
        detector = makeDetector(list);
    }

    std::unique_ptr<AdaBoostDetector> makeDetector(const std::vector<CascadedClassifier*>& list) const {
        const LQ::DetectRegion region(LQ::BaseRect<int>(0, 0, kWidth, kHeight), LQ::BaseRange<float>(28, 1000),
                                      LQ::AngleRange(), LQ::Side::BOTH);
        return std::unique_ptr<AdaBoostDetector>(new AdaBoostDetector(
            list, pyramid, AdaBoostDetector::StoreTarget::CHILD_STATES, new LQ::DetectRegionSetter(region), 2, 3, 0.3f,
            LQ::SharedPtr<LQ::BaseDetector>(), LQ::SharedPtr<LQ::BaseDetector>(), LQ::SharedPtr<LQ::BaseDetector>(),
            LQ::RelativeLocation(1, LQ::BasePoint<float>(0, 0), 0, 0, 0), 1000));
    }

    // The same cascades cut after their first stages, the last of them refusing every window.
    struct Cut {
        std::vector<std::unique_ptr<CascadedClassifier>> cascades;
        std::unique_ptr<AdaBoostDetector> detector;
    };
    std::map<int, Cut> cuts;
    AdaBoostDetector& cutAfter(int stages) {
        Cut& cut = cuts[stages];
        if (cut.detector) return *cut.detector;
        std::vector<CascadedClassifier*> list;
        for (const auto& whole : cascades) {
            cut.cascades.emplace_back(new CascadedClassifier(*whole));
            CascadedClassifier& c = *cut.cascades.back();
            c.stages().resize(std::min(c.stages().size(), static_cast<size_t>(stages)));
            c.setLastStageThreshold(INT_MAX);
            list.push_back(&c);
        }
        cut.detector = makeDetector(list);
        return *cut.detector;
    }

    // windows the detector's layers hold at its step
    double windows() const {
        double count = 0;
        for (const auto& entry : detector->classifierMap()) {
            const int w = static_cast<int>(kWidth / entry.first * LQ::stableMultiplier<float>());
            const int h = static_cast<int>(kHeight / entry.first * LQ::stableMultiplier<float>());
            for (const CascadedClassifier* c : entry.second) {
                const int nx = w - c->getMonoSize().width, ny = h - c->getMonoSize().height;
                if (nx >= 0 && ny >= 0) count += static_cast<double>(nx / 2 + 1) * (ny / 2 + 1);
            }
        }
        return count;
    }

    void frame(bool fresh, size_t& found) {
        if (fresh) {
            root->resetRecursive();
            root->set(image);
            root->updateRecursive();
        }
        LQ::SharedPtr<LQ::StateAggregator> state = LQ::StateAggregator::newDetectorState();
        detector->detect(state);
        found = state->get<LQ::MultiState>().size();
    }
};

// Every layer the detector scans, each cascade cut after stage s with that stage letting
// everything through: the windows that reach stage s + 1, over all layers and cascades.
std::vector<double> countReaching(AdaBoostDetector& detector, LQ::ImagePyramidData& pyramid) {
    std::vector<double> reaching;
    for (const auto& entry : detector.classifierMap()) {
        const float zoom = entry.first;
        const LQ::Image& rmct = pyramid.getByZoom(LQ::COLOR_MODE_RMCT, zoom)->get();
        const LQ::Image& mono = pyramid.getByZoom(LQ::COLOR_MODE_MONO, zoom)->get();
        const LQ::Image& integral = pyramid.getByZoom(LQ::COLOR_MODE_INTEGRAL, 1.f)->get();
        for (const CascadedClassifier* whole : entry.second) {
            const size_t stages = whole->stages().size();
            if (reaching.size() < stages + 1) reaching.resize(stages + 1);
            for (size_t s = 0; s <= stages; ++s) {
                CascadedClassifier prefix(*whole);
                prefix.stages().resize(std::max<size_t>(s, 1));
                if (s == 0) prefix.setLastStageThreshold(INT_MIN);
                std::vector<AdaObject> reached;
                prefix.addMatches(rmct, mono, integral, reached, zoom, 2);
                reaching[s] += static_cast<double>(reached.size());
            }
        }
    }
    return reaching;
}

// the share of the windows reaching each stage that pass it
void reportPassShares(benchmark::State& state, const std::vector<double>& reaching) {
    state.counters["windows"] = reaching[0];
    for (size_t s = 1; s < reaching.size(); ++s) state.counters["pass" + std::to_string(s)] = reaching[s] / reaching[s - 1];
}

Fixture& fixture() {
    static Fixture f;
    return f;
}

// Everything a trigger frame costs: pyramid layers, census and integral images, the scan
// of six cascades at step 2 from width 28 up, grouping.
void BM_TriggerScanFullFrame(benchmark::State& state) {
    Fixture& f = fixture();
    size_t found = 0;
    for (auto _ : state) f.frame(true, found);
    state.counters["windows/s"] = benchmark::Counter(f.windows(), benchmark::Counter::kIsIterationInvariantRate);
    reportPassShares(state, countReaching(*f.detector, *f.pyramid));
    state.counters["objects"] = static_cast<double>(found);
}
BENCHMARK(BM_TriggerScanFullFrame)->Unit(benchmark::kMicrosecond);

// The scan and grouping alone, the feature images already there.
void BM_TriggerScanFeaturesCached(benchmark::State& state) {
    Fixture& f = fixture();
    size_t found = 0;
    f.frame(true, found);
    for (auto _ : state) f.frame(false, found);
    state.counters["windows/s"] = benchmark::Counter(f.windows(), benchmark::Counter::kIsIterationInvariantRate);
}
BENCHMARK(BM_TriggerScanFeaturesCached)->Unit(benchmark::kMicrosecond);

// The scan with the cascades cut after k stages: the step from k - 1 to k is what stage k
// costs, with the windows that reach it.
void BM_TriggerScanToStage(benchmark::State& state) {
    Fixture& f = fixture();
    size_t found = 0;
    f.frame(true, found);
    AdaBoostDetector& detector = f.cutAfter(static_cast<int>(state.range(0)));
    for (auto _ : state) {
        LQ::SharedPtr<LQ::StateAggregator> aggregator = LQ::StateAggregator::newDetectorState();
        detector.detect(aggregator);
    }
}
BENCHMARK(BM_TriggerScanToStage)->DenseRange(1, 4)->Unit(benchmark::kMicrosecond);

// One layer (zoom 1.2, step 2) scanned by a cascade of two census stages of 7 and 36 tests,
// the first passing the given percentage of windows and the second 1 % of those, with the
// second stage in lists (0) or taken densely for each row (1). Where the two ways cross is
// the share from which the scan takes the dense way.
void BM_CensusRowStages(benchmark::State& state) {
    Fixture& f = fixture();
    const int percent = static_cast<int>(state.range(0));
    static std::map<int, std::unique_ptr<CascadedClassifier>> cascades;
    std::unique_ptr<CascadedClassifier>& cascade = cascades[percent];
    if (!cascade) {
        std::mt19937 random(23);
        const Shape shape{{40, 35}, {20, 18}, 0, {7, 36}, {0, 0}, {0, 0}};
        cascade.reset(new CascadedClassifier(f.build(shape, random)));
        f.calibrate(*cascade, percent / 100.0, 0.01);
    }
    cascade->setDenseRowShare(state.range(1) ? 0.0 : 2.0);
    const float zoom = 1.2f;
    const LQ::Image& rmct = f.pyramid->getByZoom(LQ::COLOR_MODE_RMCT, zoom)->get();
    const LQ::Image& mono = f.pyramid->getByZoom(LQ::COLOR_MODE_MONO, zoom)->get();
    const LQ::Image& integral = f.pyramid->getByZoom(LQ::COLOR_MODE_INTEGRAL, 1.f)->get();
    std::vector<AdaObject> objects;
    for (auto _ : state) {
        objects.clear();
        cascade->addMatches(rmct, mono, integral, objects, zoom, 2);
        benchmark::DoNotOptimize(objects.data());
    }
    state.counters["objects"] = static_cast<double>(objects.size());
}
BENCHMARK(BM_CensusRowStages)
    ->ArgsProduct({{2, 5, 10, 15, 20, 30, 50}, {0, 1}})
    ->ArgNames({"firstPassPercent", "dense"})
    ->Unit(benchmark::kMicrosecond);

// The luma of a generated clip's frame with no hand in it (textures, clutter, faces, arms),
// drawn at twice the size and halved as the engine halves a camera frame: the halving
// smooths the sensor noise, and smooth areas are what the first stages let through most.
LQ::Image generatedBackground() {
    handgen::ClipSetup setup;
    setup.width = 2 * kWidth;
    setup.height = 2 * kHeight;
    setup.frames = 120;
    setup.seed = 5;
    const handgen::ClipMaker maker(setup);
    int frame = 0;
    while (frame + 1 < maker.frames() && maker.truth(frame).present) ++frame;
    std::vector<std::uint8_t> rgb;
    maker.render(frame, rgb);
    const auto luma = [&](int x, int y) {
        const std::uint8_t* p = &rgb[(static_cast<size_t>(y) * setup.width + x) * 3];
        return 77 * p[0] + 150 * p[1] + 29 * p[2];
    };
    LQ::Image image(LQ::BaseSize<int>(kWidth, kHeight), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) {
            const int sum = luma(2 * x, 2 * y) + luma(2 * x + 1, 2 * y) + luma(2 * x, 2 * y + 1) +
                            luma(2 * x + 1, 2 * y + 1);
            image.pixel(x, y)[0] = static_cast<unsigned char>((sum + 512) >> 10);
        }
    return image;
}

// A trained ring's cascades for the angles -30 to 30 and both hands, as a trigger asks for
// them, over the generated background.
struct TrainedFixture {
    LQ::Image image = generatedBackground();
    LQ::SharedPtr<LQ::ImageData> root{new LQ::ImageData()};
    LQ::SharedPtr<LQ::ImagePyramidData> pyramid;
    std::vector<CascadedClassifier*> cascades;
    std::unique_ptr<AdaBoostDetector> detector;
    std::vector<double> reaching;  // windows that reach each stage, over all layers and cascades

    explicit TrainedFixture(ClassifierRing* ring) {
        root->set(image);
        pyramid = LQ::SharedPtr<LQ::ImagePyramidData>(new LQ::ImagePyramidData(root, 1));
        cascades = ring->getClassifiers(LQ::AngleRange(-30, 30), LQ::Side::BOTH);
        const LQ::DetectRegion region(LQ::BaseRect<int>(0, 0, kWidth, kHeight), LQ::BaseRange<float>(28, 1000),
                                      LQ::AngleRange(), LQ::Side::BOTH);
        detector.reset(new AdaBoostDetector(
            cascades, pyramid, AdaBoostDetector::StoreTarget::CHILD_STATES, new LQ::DetectRegionSetter(region), 2, 3,
            0.3f, LQ::SharedPtr<LQ::BaseDetector>(), LQ::SharedPtr<LQ::BaseDetector>(),
            LQ::SharedPtr<LQ::BaseDetector>(), LQ::RelativeLocation(1, LQ::BasePoint<float>(0, 0), 0, 0, 0), 1000));
        frame();
        reaching = countReaching(*detector, *pyramid);
    }

    void frame() {
        root->resetRecursive();
        root->set(image);
        root->updateRecursive();
        LQ::SharedPtr<LQ::StateAggregator> state = LQ::StateAggregator::newDetectorState();
        detector->detect(state);
    }
};

// A compiled ring: what a trigger frame's scan costs with trained tables.
void BM_TrainedRingFullFrame(benchmark::State& state, ClassifierRing* (*ring)()) {
    static std::map<ClassifierRing* (*)(), std::unique_ptr<TrainedFixture>> fixtures;
    std::unique_ptr<TrainedFixture>& f = fixtures[ring];
    if (!f) f.reset(new TrainedFixture(ring()));
    for (auto _ : state) f->frame();
    reportPassShares(state, f->reaching);
}
BENCHMARK_CAPTURE(BM_TrainedRingFullFrame, fist, &ada_Fist_2013_10_02__16_45_30)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_TrainedRingFullFrame, thumbUp, &ada_thumbUp_ada__2017_11_13__20_01_17)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_TrainedRingFullFrame, victory, &ada_mono_ada_staticVictory_2017_11_10__14_34_17)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_TrainedRingFullFrame, pointer, &ada_mono_ada_staticPointer0_2015_06_23__19_25_48)
    ->Unit(benchmark::kMicrosecond);

#if defined(TACTUS_WITH_OPENCV_OBJDETECT)
void BM_OpenCvLbpFaceCascade(benchmark::State& state) {
    const char* path = "/usr/share/opencv4/lbpcascades/lbpcascade_frontalface.xml";
    cv::CascadeClassifier cascade;
    if (!std::ifstream(path) || !cascade.load(path)) {
        state.SkipWithError("opencv-data's lbpcascade_frontalface.xml is not installed");
        return;
    }
    Fixture& f = fixture();
    const cv::Mat mono(kHeight, kWidth, CV_8UC1, const_cast<unsigned char*>(f.image.data()), f.image.stripLength());
    cv::setNumThreads(1);
    std::vector<cv::Rect> faces;
    for (auto _ : state) {
        cascade.detectMultiScale(mono, faces, 1.2, 3, 0, cv::Size(28, 28));
        benchmark::DoNotOptimize(faces.data());
    }
}
BENCHMARK(BM_OpenCvLbpFaceCascade)->Unit(benchmark::kMicrosecond);
#endif

}  // namespace
BENCHMARK_MAIN();
