#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <cstdlib>
#include <new>
#include <random>
#include <vector>

#include "CascadedClassifier.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"
#include "LogCapture.h"
#include "TestImages.h"

using LQ::BasePoint;
using LQ::BaseRect;
using LQ::BaseSize;
using LQ::Image;

// Counts every allocation, so a scan can show it makes none.
namespace {
std::atomic<long> allocations{0};
}
void* operator new(std::size_t size) {
    ++allocations;
    if (void* p = std::malloc(size ? size : 1)) return p;
    throw std::bad_alloc();
}
#pragma GCC diagnostic ignored "-Wmismatched-new-delete"
void operator delete(void* p) noexcept { std::free(p); }
void operator delete(void* p, std::size_t) noexcept { std::free(p); }

namespace {

Image flat(int width, int height, unsigned char value) {
    Image image(BaseSize<int>(width, height), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) image.pixel(x, y)[0] = value;
    return image;
}

// A table that scores 1 for one code and -1 for every other.
std::vector<LQ::schar> oneCode(int code) {
    std::vector<LQ::schar> table(256, -1);
    table[code] = 1;
    return table;
}

struct Features {
    Image rmct, integral;
    explicit Features(const Image& mono) {
        LQ::computeRmct(mono, rmct);
        LQ::computeIntegral(mono, integral);
    }
};

WeakClassifierRmct rmctAt(int x, int y, std::vector<LQ::schar>& table) {
    WeakClassifierRmct weak(BasePoint<int>(x, y));
    weak.setData(table.data());
    return weak;
}
WeakClassifierHaar haarOf(const BaseRect<int>& all, const BaseRect<int>& inner, std::vector<LQ::schar>& table) {
    WeakClassifierHaar weak;
    weak.set(all, inner);
    weak.setData(table.data());
    return weak;
}
WeakClassifierHog hogOf(const BaseRect<int>& block, const BaseRect<int>& cell, int sector,
                        std::vector<LQ::schar>& table) {
    WeakClassifierHog weak;
    weak.setBlock(block);
    weak.setCell(cell);
    weak.setSector(sector);
    weak.setData(table.data());
    return weak;
}
void add(StrongClassifier& stage, const WeakClassifierRmct& weak) { stage.addRmctClassifier(weak); }
void add(StrongClassifier& stage, const WeakClassifierHaar& weak) { stage.addHaarClassifier(weak); }
void add(StrongClassifier& stage, const WeakClassifierHog& weak) { stage.addHogClassifier(weak); }

template <class... Weak>
StrongClassifier stageOf(int threshold, const Weak&... weak) {
    StrongClassifier stage;
    (add(stage, weak), ...);
    stage.setThreshold(threshold);
    return stage;
}

CascadedClassifier cascadeOf(int width, int height, const char* name, const std::vector<StrongClassifier>& stages) {
    CascadedClassifier cascade;
    cascade.setMonoSize(BaseSize<int>(width, height));
    cascade.setName(name);
    for (const StrongClassifier& stage : stages) cascade.addStrongClassifier(stage);
    return cascade;
}

// One census test at (3, 2) of a 9 x 7 window.
CascadedClassifier singlePointCascade(std::vector<LQ::schar>& table) {
    return cascadeOf(9, 7, "dot", {stageOf(1, rmctAt(3, 2, table))});
}

}  // namespace

// A bright pixel gives its upper-left neighbour one census code: a classifier on it fires at
// one window, its turned and mirrored copies at the turned and mirrored neighbour.
TEST(CascadeScan, SingleCodeFiresAtItsWindowOnly) {
    Image mono = flat(40, 30, 100);
    mono.pixel(20, 15)[0] = 250;
    Features f(mono);
    const int code = f.rmct.pixel(19, 14)[0];
    ASSERT_NE(code, 0);
    EXPECT_EQ(f.rmct.pixel(5, 5)[0], 0);

    std::vector<LQ::schar> table = oneCode(code);
    CascadedClassifier cascade = singlePointCascade(table);

    std::vector<AdaObject> objects;
    cascade.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 1);
    ASSERT_EQ(objects.size(), 1u);
    // the window's top-left lies at (19 - 3, 14 - 2)
    EXPECT_EQ(objects[0].center, BasePoint<int>(16 + 4, 12 + 3));
    EXPECT_EQ(objects[0].score, 1);
    EXPECT_EQ(objects[0].side, ClassifierProperties::SIDE_SCORE);
    EXPECT_EQ(objects[0].weight, 1);
    EXPECT_STREQ(objects[0].name, "dot");

    // step 2 reaches (16, 12) from the origin, not from x = 1
    objects.clear();
    cascade.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 2);
    EXPECT_EQ(objects.size(), 1u);
    objects.clear();
    cascade.addMatches(f.rmct, mono, f.integral, objects, BaseRect<int>(1, 0, 40, 30), 1.0f, 2);
    EXPECT_TRUE(objects.empty());

    CascadedClassifier turned = singlePointCascade(table);
    turned.rotate();
    EXPECT_EQ(turned.getAngle(), 90);
    EXPECT_EQ(turned.getMonoSize(), BaseSize<int>(7, 9));
    objects.clear();
    turned.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 1);
    ASSERT_EQ(objects.size(), 1u);
    EXPECT_EQ(objects[0].angle, 90);
    EXPECT_EQ(objects[0].center, BasePoint<int>(20, 15));

    CascadedClassifier mirrored = singlePointCascade(table);
    mirrored.flipVertically();
    EXPECT_EQ(mirrored.getSide(), LQ::Side::LEFT);
    objects.clear();
    mirrored.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 1);
    ASSERT_EQ(objects.size(), 1u);
    EXPECT_EQ(objects[0].side, -ClassifierProperties::SIDE_SCORE);
    // the mirrored code belongs to the upper-right neighbour (21, 14); the point moved to (5, 2)
    EXPECT_EQ(objects[0].center, BasePoint<int>(21 - 5 + 4, 14 - 2 + 3));
}

// Windows reach the layer's edge, not beyond; a layer smaller than the window activates nothing.
TEST(CascadeScan, WindowsStayInsideTheLayer) {
    std::vector<LQ::schar> all(256, 1);
    CascadedClassifier cascade = singlePointCascade(all);
    Image mono = flat(12, 9, 80);
    Features f(mono);
    std::vector<AdaObject> objects;
    cascade.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 1);
    // positions 0..3 by 0..2
    ASSERT_EQ(objects.size(), 12u);
    EXPECT_EQ(objects.front().center, BasePoint<int>(4, 3));
    EXPECT_EQ(objects.back().center, BasePoint<int>(3 + 4, 2 + 3));

    Image small = flat(8, 9, 80);
    Features g(small);
    CascadedClassifier fresh = singlePointCascade(all);
    objects.clear();
    fresh.addMatches(g.rmct, small, g.integral, objects, 1.0f, 1);
    EXPECT_TRUE(objects.empty());
    // not activated: a turn is still allowed and the scan of a larger layer works after it
    fresh.rotate();
    Image tall = flat(7, 9, 80);
    Features h(tall);
    fresh.addMatches(h.rmct, tall, h.integral, objects, 1.0f, 1);
    EXPECT_EQ(objects.size(), 1u);
}

// Haar rectangles grow with the zoom against the base integral; zooms of one bucket share
// tables; a lone first Haar stage takes the threshold-range path and reports score 0.
TEST(CascadeScan, HaarAtZoomAndTheRangePath) {
    Image base = flat(80, 60, 20);
    for (int y = 24; y < 36; ++y)
        for (int x = 30; x < 42; ++x) base.pixel(x, y)[0] = 220;
    Image integral;
    LQ::computeIntegral(base, integral);
    // Haar reads the integral: the layer only needs its size
    Image layer = flat(66, 50, 0);
    Image rmct;
    LQ::computeRmct(layer, rmct);

    // the mean of the 10 x 10 middle of a 20 x 20 window at zoom 1: at least 190
    std::vector<LQ::schar> bright(256, -1);
    for (int i = 127 + 95; i < 256; ++i) bright[i] = 1;
    const StrongClassifier stage = stageOf(1, haarOf(BaseRect<int>(5, 5, 15, 15), BaseRect<int>(), bright));
    CascadedClassifier cascade = cascadeOf(20, 20, "square", {stage});

    std::vector<AdaObject> objects;
    cascade.addMatches(rmct, layer, integral, objects, 1.2f, 1);
    ASSERT_FALSE(objects.empty());
    for (const AdaObject& o : objects) {
        EXPECT_EQ(o.score, 0);
        // the square's centre (36, 30) at zoom 1.2 is (30, 25) in the layer
        EXPECT_NEAR(o.center.x, 30, 2);
        EXPECT_NEAR(o.center.y, 25, 2);
    }

    // 1.25 falls in the bucket of 1.2: same rectangles, same shift table, same windows
    std::vector<AdaObject> again;
    cascade.addMatches(rmct, layer, integral, again, 1.25f, 1);
    ASSERT_EQ(again.size(), objects.size());
    for (size_t k = 0; k < objects.size(); ++k) EXPECT_EQ(again[k].center, objects[k].center);

    // the same stage behind an always-passing RMCT stage takes the table path and agrees
    std::vector<LQ::schar> all(256, 1);
    CascadedClassifier twoStages = cascadeOf(20, 20, "square", {stageOf(1, rmctAt(10, 10, all)), stage});
    std::vector<AdaObject> table;
    twoStages.addMatches(rmct, layer, integral, table, 1.2f, 1);
    ASSERT_EQ(table.size(), objects.size());
    for (size_t k = 0; k < objects.size(); ++k) {
        EXPECT_EQ(table[k].center, objects[k].center);
        EXPECT_GT(table[k].score, 0);
    }

    // an integral image too small for the layer at this zoom
    Image smallIntegral;
    LQ::computeIntegral(flat(50, 40, 0), smallIntegral);
    LogCapture log;
    EXPECT_THROW(cascade.addMatches(rmct, layer, smallIntegral, objects, 1.2f, 1), const char*);
    EXPECT_NE(log.text().find("Assertion `pShift[rect.right] < integralImage.width()` failed in "), std::string::npos);
    EXPECT_NE(log.text().find("ShiftX "), std::string::npos);
    EXPECT_NE(log.text().find(" not compatible with integral image "), std::string::npos);
}

// No HOG for windows that fail earlier; a sum equal to the threshold passes; a steady scan
// allocates nothing.
TEST(CascadeScan, HogOnlyWhenReachedAndNoAllocation) {
    Image mono = flat(60, 50, 90);
    for (int y = 10; y < 30; ++y)
        for (int x = 12; x < 26; ++x) mono.pixel(x, y)[0] = static_cast<unsigned char>(90 + 6 * (x - 12));
    Features f(mono);

    std::vector<LQ::schar> one(256, 1), none(256, -1), all(256, 2);
    // the first stage's sum equals its threshold
    auto makeCascade = [&](bool secondPasses) {
        return cascadeOf(16, 16, "hog",
                         {stageOf(1, rmctAt(2, 2, one)), stageOf(1, rmctAt(9, 9, secondPasses ? one : none)),
                          stageOf(2, hogOf(BaseRect<int>(2, 2, 14, 14), BaseRect<int>(4, 4, 8, 8), 2, all))});
    };

    CascadedClassifier failing = makeCascade(false);
    std::vector<AdaObject> objects;
    failing.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 1);
    EXPECT_TRUE(objects.empty());
    EXPECT_EQ(failing.hogComputations(), 0);
    EXPECT_EQ(failing.getFirstHogStage(), 2);
    EXPECT_EQ(failing.getHogRoi(), BaseRect<int>(1, 1, 15, 15));

    CascadedClassifier passing = makeCascade(true);
    passing.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 1);
    const size_t windows = (60 - 16 + 1) * (50 - 16 + 1);
    EXPECT_EQ(objects.size(), windows);
    EXPECT_EQ(passing.hogComputations(), static_cast<long long>(windows));
    EXPECT_EQ(objects.front().score, 2);

    // steady state: the same layer again with room for the hits
    objects.clear();
    objects.reserve(2 * windows);
    const long before = allocations.load();
    passing.addMatches(f.rmct, mono, f.integral, objects, 1.0f, 1);
    EXPECT_EQ(allocations.load() - before, 0);
    EXPECT_EQ(objects.size(), windows);
}

// A cascade comes back after four turns and two mirrors; a turn moves an off-centre object.
TEST(CascadeScan, CascadeTurnsAndMirrorsComeBack) {
    std::vector<LQ::schar> table(256);
    for (int i = 0; i < 256; ++i) table[i] = static_cast<LQ::schar>(i * 7 % 23 - 11);
    CascadedClassifier cascade = cascadeOf(
        40, 35, "fist",
        {stageOf(0, rmctAt(5, 9, table), haarOf(BaseRect<int>(2, 3, 30, 20), BaseRect<int>(4, 5, 10, 12), table),
                 hogOf(BaseRect<int>(3, 3, 20, 30), BaseRect<int>(5, 6, 9, 12), 5, table))});
    cascade.setBaseSize(BaseSize<int>(26, 26));
    cascade.setObjectCenter(BasePoint<int>(20, 18));
    cascade.setAngle(-30);
    EXPECT_EQ(cascade.getObjectRect(), BaseRect<int>(7, 5, 33, 31));

    CascadedClassifier turned = cascade;
    turned.rotate();
    EXPECT_EQ(turned.getMonoSize(), BaseSize<int>(35, 40));
    EXPECT_EQ(turned.getObjectRect(), BaseRect<int>(5, 7, 31, 33));
    EXPECT_EQ(turned.getAngle(), 60);
    EXPECT_FALSE(turned == cascade);
    for (int k = 0; k < 3; ++k) turned.rotate();
    // census offsets are set by activation; before it, turns leave them as they come
    CascadedClassifier reference = cascade;
    reference.activate(64, 64, 260, 1.f, reference.getMonoSize());
    turned.activate(64, 64, 260, 1.f, turned.getMonoSize());
    EXPECT_TRUE(turned == reference);

    CascadedClassifier mirrored = cascade;
    mirrored.flipVertically();
    EXPECT_EQ(mirrored.getAngle(), 30);
    EXPECT_EQ(mirrored.getSide(), LQ::Side::LEFT);
    EXPECT_EQ(mirrored.getObjectRect(), BaseRect<int>(7, 5, 33, 31));
    EXPECT_FALSE(mirrored == cascade);
    mirrored.flipVertically();
    mirrored.activate(64, 64, 260, 1.f, mirrored.getMonoSize());
    EXPECT_TRUE(mirrored == reference);
}

namespace {

// One window's stage sum straight from the classifiers' definitions, none of the scan's
// packed forms or vector kernels.
struct Reference {
    const Image& rmct;
    const Image& integral;
    Image hog;
    float scale;

    Reference(const Image& rmctImage, const Image& mono, const Image& integralImage, float zoom)
        : rmct(rmctImage), integral(integralImage), scale(zoom) {
        LQ::computeIntegralHog(mono, hog, mono.rect(), LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
    }

    unsigned int hogSum(const BaseRect<int>& r, int x, int y, int channel) const {
        const auto at = [&](int u, int v) {
            return reinterpret_cast<const unsigned int*>(hog.row(v + y))[(u + x) * 7 + channel];
        };
        return at(r.right, r.bottom) + at(r.left, r.top) - at(r.right, r.top) - at(r.left, r.bottom);
    }

    int stageSum(const StrongClassifier& stage, int x, int y) const {
        int sum = 0;
        for (const WeakClassifierRmct& c : stage.rmctClassifiers())
            sum += c.table[rmct.pixel(x + c.point.x, y + c.point.y)[0]];
        const int stride = static_cast<int>(integral.stripLength() / 4);
        const unsigned int* origin = reinterpret_cast<const unsigned int*>(integral.data()) +
                                     static_cast<int>(y * scale) * stride + static_cast<int>(x * scale);
        for (const WeakClassifierHaar& h : stage.haarClassifiers()) {
            WeakClassifierHaar scaled;
            scaled.resize(h, scale);
            scaled.setStripLength(stride);
            sum += h.table[scaled.dividedIndex(origin)];
        }
        for (const WeakClassifierHog& g : stage.hogClassifiers()) {
            const unsigned long long c = hogSum(g.cell, x, y, g.getSector());
            const unsigned long long b = hogSum(g.block, x, y, 6) + 1u;
            sum += g.table[(c << 8) / b];
        }
        return sum;
    }
};

BaseRect<int> randomRect(std::mt19937& random, const BaseRect<int>& inside, int minSide) {
    const int w = minSide + random() % (inside.width() - minSide + 1);
    const int h = minSide + random() % (inside.height() - minSide + 1);
    const int x = inside.left + random() % (inside.width() - w + 1);
    const int y = inside.top + random() % (inside.height() - h + 1);
    return BaseRect<int>(x, y, x + w, y + h);
}

// stage kinds: census count, Haar count, HOG count
CascadedClassifier randomCascade(std::mt19937& random, const std::vector<std::array<int, 3>>& kinds,
                                 std::vector<std::vector<LQ::schar>>& tables) {
    const int W = 13 + random() % 9, H = 12 + random() % 9;
    std::vector<StrongClassifier> stages;
    const auto table = [&]() -> std::vector<LQ::schar>& {
        tables.emplace_back(256);
        for (auto& v : tables.back()) v = static_cast<LQ::schar>(static_cast<int>(random() % 41) - 20);
        return tables.back();
    };
    for (const auto& kind : kinds) {
        StrongClassifier& stage = stages.emplace_back();
        for (int k = 0; k < kind[0]; ++k) {
            const BasePoint<int> point(random() % W, random() % H);
            add(stage, rmctAt(point.x, point.y, table()));
        }
        for (int k = 0; k < kind[1]; ++k) {
            const BaseRect<int> all = randomRect(random, BaseRect<int>(0, 0, W, H), 2);
            const BaseRect<int> inner = random() % 5 ? randomRect(random, all, 1) : BaseRect<int>();
            add(stage, haarOf(all, inner, table()));
        }
        for (int k = 0; k < kind[2]; ++k) {
            // blocks one pixel inside the window, as the HOG region needs
            const BaseRect<int> block = randomRect(random, BaseRect<int>(1, 1, W - 1, H - 1), 3);
            const BaseRect<int> cell = randomRect(random, block, 1);
            const int sector = random() % 6;
            add(stage, hogOf(block, cell, sector, table()));
        }
    }
    return cascadeOf(W, H, "random", stages);
}

}  // namespace

// The scan equals window-by-window evaluation (windows, order, scores) over random stage mixes,
// steps 1-3, zooms 1 and 1.2, odd strides, every HOG source and dense/list census path; the
// 300-test stage is beyond the dense kernel. Thresholds let some windows end at every stage.
TEST(CascadeScan, ScanEqualsWindowByWindowEvaluation) {
    const std::vector<std::vector<std::array<int, 3>>> shapes = {
        {{5, 0, 0}, {12, 0, 0}, {6, 5, 0}, {8, 0, 6}, {0, 3, 4}},
        {{1, 0, 0}, {3, 4, 0}, {2, 0, 5}},
        {{4, 3, 0}, {6, 0, 0}, {0, 0, 5}},
        {{2, 0, 3}, {5, 2, 2}},
        {{7, 0, 0}},
        {{6, 0, 0}, {10, 0, 0}, {8, 0, 0}, {3, 2, 0}},
        {{4, 0, 0}, {9, 0, 0}, {300, 0, 0}, {7, 0, 0}, {0, 0, 3}},
    };
    std::mt19937 random(29);
    int hits = 0, hogScans = 0;
    for (size_t shape = 0; shape < shapes.size(); ++shape)
        for (int step = 1; step <= 3; ++step)
            for (float zoom : {1.0f, 1.2f}) {
                std::vector<std::vector<LQ::schar>> tables;
                CascadedClassifier cascade = randomCascade(random, shapes[shape], tables);
                const int layerW = 70 + random() % 60, layerH = 38 + random() % 20;
                Image parent;
                const Image mono = randomView(layerW, layerH, LQ::COLOR_MODE_MONO, random(), parent);
                Image rmct, integral;
                LQ::computeRmct(mono, rmct);
                LQ::computeIntegral(randomImage(static_cast<int>(layerW * zoom) + 2,
                                                static_cast<int>(layerH * zoom) + 2, LQ::COLOR_MODE_MONO, random()),
                                    integral);
                const Reference reference(rmct, mono, integral, zoom);

                const BaseSize<int> window = cascade.getMonoSize();
                std::vector<BasePoint<int>> reached;
                for (int y = 0; y + window.height <= layerH; y += step)
                    for (int x = 0; x + window.width <= layerW; x += step) reached.emplace_back(x, y);
                std::vector<AdaObject> expected;
                for (size_t s = 0; s < cascade.stages().size(); ++s) {
                    StrongClassifier& stage = cascade.stages()[s];
                    std::vector<int> sums;
                    for (const BasePoint<int>& p : reached) sums.push_back(reference.stageSum(stage, p.x, p.y));
                    std::vector<int> sorted = sums;
                    const size_t cut = sorted.size() * (s ? 1 : 2) / (s ? 2 : 3);
                    std::nth_element(sorted.begin(), sorted.begin() + cut, sorted.end());
                    stage.setThreshold(sorted[cut]);
                    std::vector<BasePoint<int>> next;
                    for (size_t k = 0; k < reached.size(); ++k) {
                        if (sums[k] < stage.getThreshold()) continue;
                        next.push_back(reached[k]);
                        if (s + 1 == cascade.stages().size())
                            expected.emplace_back("random", window, cascade.getObjectCenter() + reached[k],
                                                  ClassifierProperties::SIDE_SCORE, 1.f, 0, 1, sums[k]);
                    }
                    reached = next;
                }
                ASSERT_FALSE(expected.empty());
                hits += static_cast<int>(expected.size());

                for (int hogWay : {0, 1, 2})
                for (double denseShare : {2.0, 0.0, denseCensusShare()}) {
                    CascadedClassifier scanned = cascade;
                    scanned.setDenseRowShare(denseShare);
                    LayerHog layerHog;
                    if (hogWay) {
                        layerHog.bind(mono, mono.rect());
                        scanned.setLayerHog(&layerHog);
                        if (hogWay == 1) scanned.setLayerHogShare(0.0);
                    }
                    std::vector<AdaObject> objects;
                    scanned.addMatches(rmct, mono, integral, objects, zoom, step);
                    hogScans += hogWay == 1 && layerHog.computed;
                    SCOPED_TRACE(::testing::Message() << shape << " " << step << " " << zoom << " " << hogWay << " "
                                                      << denseShare);
                    ASSERT_EQ(objects.size(), expected.size());
                    for (size_t k = 0; k < objects.size(); ++k) {
                        ASSERT_EQ(objects[k].center, expected[k].center) << k;
                        ASSERT_EQ(objects[k].score, expected[k].score) << k;
                    }
                }
            }
    EXPECT_GT(hits, 200);
    // five shapes with HOG, three steps, two zooms, three ways
    EXPECT_EQ(hogScans, 5 * 3 * 2 * 3);
}
