#include <gtest/gtest.h>

#include <sstream>
#include <vector>

#include "AdaObjectGrouping.h"

using LQ::BasePoint;
using LQ::BaseSize;

namespace {

// Two arrays with the same text: equal names, different rings.
const char kRingA[] = "ring";
const char kRingB[] = "ring";

AdaObject at(int x, int y, int width = 24, float zoom = 1.f, int angle = 0, int weight = 1, int score = 0,
             const char* name = kRingA, int side = 100) {
    return AdaObject(name, BaseSize<int>(width, width), BasePoint<int>(x, y), side, zoom, angle, weight,
                     score);
}

std::vector<int> labelsOf(const std::vector<AdaObject>& objects, float similarity, int* classes = nullptr) {
    std::vector<int> labels(7, 42);  // stale content must not survive
    const int n =
        LQ::partition<AdaObject, std::pair<float, int>>(objects, labels, std::make_pair(similarity, 30));
    if (classes) *classes = n;
    return labels;
}

std::string printed(const std::vector<AdaObject>& objects) {
    std::ostringstream text;
    text << objects;
    return text.str();
}

}  // namespace

// Manhattan distance strictly inside the first object's width share; zoom and angle close too.
TEST(AdaObjectGrouping, SimilarityBounds) {
    // width 20, similarity 0.25, zooms 1 + 1: the reach is exactly 10
    const AdaObject a = at(0, 0, 20);
    EXPECT_TRUE(Similar(a, at(9, 0, 20), 0.25f, 30));
    EXPECT_FALSE(Similar(a, at(10, 0, 20), 0.25f, 30));
    EXPECT_FALSE(Similar(a, at(5, 5, 20), 0.25f, 30));  // 7.1 apart on a straight line
    EXPECT_TRUE(Similar(a, at(4, -5, 20), 0.25f, 30));

    // zooms 1 and z: |1 - z| < (1 + z) / 4
    EXPECT_TRUE(Similar(a, at(0, 0, 20, 1.5f), 0.25f, 30));
    EXPECT_FALSE(Similar(a, at(0, 0, 20, 1.7f), 0.25f, 30));

    // a large window reaches a small one that doesn't reach back
    const AdaObject large = at(0, 0, 100), small = at(30, 0, 10);
    EXPECT_TRUE(Similar(large, small, 0.2f, 30));
    EXPECT_FALSE(Similar(small, large, 0.2f, 30));

    EXPECT_TRUE(Similar(at(0, 0, 24, 1.f, -15), at(0, 0, 24, 1.f, 15), 0.2f, 30));
    EXPECT_FALSE(Similar(at(0, 0, 24, 1.f, -15), at(0, 0, 24, 1.f, 16), 0.2f, 30));
}

TEST(AdaObjectGrouping, PartitionClasses) {
    int classes = -1;
    EXPECT_TRUE(labelsOf({}, 0.2f, &classes).empty());
    EXPECT_EQ(classes, 0);

    // a chain: the first and the third are too far apart, the middle one joins them
    EXPECT_EQ(labelsOf({at(0, 0), at(8, 0), at(16, 0)}, 0.2f, &classes), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(classes, 1);
    EXPECT_FALSE(Similar(at(0, 0), at(16, 0), 0.2f, 30));

    // classes follow the first appearance of each group, not where its root ended up
    const std::vector<AdaObject> two = {at(0, 0), at(100, 0), at(104, 0), at(4, 0), at(300, 0)};
    EXPECT_EQ(labelsOf(two, 0.2f, &classes), (std::vector<int>{0, 1, 1, 0, 2}));
    EXPECT_EQ(classes, 3);

    // only the large window reaches: one class whichever comes first
    const AdaObject large = at(0, 0, 100), small = at(30, 0, 10);
    EXPECT_EQ(labelsOf({large, small}, 0.2f, &classes), (std::vector<int>{0, 0}));
    EXPECT_EQ(labelsOf({small, large}, 0.2f, &classes), (std::vector<int>{0, 0}));
    EXPECT_EQ(classes, 1);
}

// Minimum weight, the angle bound, the order of groups and reading a history ring.
TEST(AdaObjectGrouping, MinWeightAnglesOrderAndHistory) {
    const std::vector<AdaObject> twins = {at(50, 50), at(50, 50)};
    for (int minWeight : {0, -3}) {
        const std::vector<AdaObject> same = groupAdaObjects(twins, minWeight, 0.2f);
        EXPECT_EQ(printed(same), printed(twins));
    }
    EXPECT_TRUE(groupAdaObjects(std::vector<AdaObject>(), 1, 0.2f).empty());

    const std::vector<AdaObject> single = {at(50, 50)};
    EXPECT_TRUE(groupAdaObjects(single, 2, 0.2f).empty());
    const std::vector<AdaObject> pair = groupAdaObjects(twins, 2, 0.2f);
    ASSERT_EQ(pair.size(), 1u);
    EXPECT_EQ(pair[0].weight, 2);

    // the angle bound inside grouping is 30 degrees
    EXPECT_EQ(groupAdaObjects({at(50, 50, 24, 1.f, 0), at(50, 50, 24, 1.f, 30)}, 1, 0.2f).size(), 1u);
    EXPECT_EQ(groupAdaObjects({at(50, 50, 24, 1.f, 0), at(50, 50, 24, 1.f, 31)}, 1, 0.2f).size(), 2u);

    // heaviest group first; weight 1 passes minWeight 1
    const std::vector<AdaObject> hits = {at(0, 0),   at(200, 0), at(200, 0),
                                         at(200, 0), at(400, 0), at(400, 0)};
    std::vector<int> weights;
    for (const AdaObject& o : groupAdaObjects(hits, 1, 0.2f)) weights.push_back(o.weight);
    EXPECT_EQ(weights, (std::vector<int>{3, 2, 1}));

    // only what the ring still holds counts: with the overwritten hit there would be three groups
    LQ::History<AdaObject> history;
    history.init(4);
    history.add(at(600, 0));
    for (int x : {0, 2, 200, 202}) history.add(at(x, 0));
    const std::vector<AdaObject> grouped = groupAdaObjects(history, 1, 0.2f);
    ASSERT_EQ(grouped.size(), 2u);
    EXPECT_EQ(grouped[0].weight + grouped[1].weight, 4);
}

// Weighted means in integers truncating toward zero, the zoom in float, the largest score,
// the most frequent name by pointer.
TEST(AdaObjectGrouping, MergedObject) {
    AdaObject heavy(kRingA, BaseSize<int>(24, 30), BasePoint<int>(10, 20), -100, 1.f, 0, 3, -7);
    AdaObject light(kRingB, BaseSize<int>(29, 33), BasePoint<int>(14, 22), 100, 1.44f, 30, 1, -3);
    const std::vector<AdaObject> merged = groupAdaObjects({heavy, light}, 1, 0.2f);
    ASSERT_EQ(merged.size(), 1u);
    const AdaObject& m = merged[0];
    EXPECT_EQ(m.size, BaseSize<int>(25, 30));     // 101 / 4, 123 / 4
    EXPECT_EQ(m.center, BasePoint<int>(11, 20));  // 44 / 4, 82 / 4
    EXPECT_EQ(m.side, -50);
    EXPECT_EQ(m.angle, 7);  // 30 / 4
    EXPECT_FLOAT_EQ(m.zoom, 1.11f);
    EXPECT_EQ(m.weight, 4);
    EXPECT_EQ(m.score, -3);     // both below 0: the largest, not a zero start
    EXPECT_EQ(m.name, kRingA);  // one hit each: the name seen first

    // a negative mean truncates toward zero: -100 / 3 is -33
    const std::vector<AdaObject> sides = {at(0, 0, 24, 1.f, 0, 1, 0, kRingA, 100),
                                          at(0, 0, 24, 1.f, 0, 1, 0, kRingA, -100),
                                          at(0, 0, 24, 1.f, 0, 1, 0, kRingA, -100)};
    EXPECT_EQ(groupAdaObjects(sides, 1, 0.2f)[0].side, -33);

    // names count hits, not weight; equal texts are different names
    const std::vector<AdaObject> names = {at(0, 0, 24, 1.f, 0, 5, 0, kRingA),
                                          at(0, 0, 24, 1.f, 0, 1, 0, kRingB),
                                          at(0, 0, 24, 1.f, 0, 1, 0, kRingB)};
    EXPECT_EQ(groupAdaObjects(names, 1, 0.2f)[0].name, kRingB);
}

TEST(AdaObject, BaseRectLocationAndText) {
    AdaObject o(kRingA, BaseSize<int>(24, 29), BasePoint<int>(100, 50), 0, 1.0f * 1.2f, 30, 2, -7);
    EXPECT_EQ(o.getBaseRect(), LQ::BaseRect<int>(86, 33, 114, 67));  // 28 x 34

    // an odd width keeps its size: the left half is the shorter one
    o.zoom = 1.f;
    o.size = BaseSize<int>(25, 29);
    EXPECT_EQ(o.getBaseRect(), LQ::BaseRect<int>(88, 36, 113, 65));
    // 2.1f * 30 lands just below 63 in float
    o.zoom = 2.1f;
    o.size = BaseSize<int>(30, 30);
    EXPECT_EQ(o.getBaseRect().width(), 63);

    o.zoom = 1.2f;
    o.size = BaseSize<int>(24, 29);
    const LQ::ObjectLocation left = o.toLocationState();
    EXPECT_EQ(left, LQ::ObjectLocation(LQ::BasePoint<float>(100, 50), BaseSize<float>(28, 34), 30.f,
                                       LQ::Side::LEFT));
    o.side = 1;
    EXPECT_EQ(o.toLocationState().side, LQ::Side::RIGHT);

    o.side = -100;
    EXPECT_EQ(printed({}), "vector[0]()");
    EXPECT_EQ(printed({o, at(3, 4)}),
              "vector[2](AdaObject(Size(24, 29), PointI(100, 50), -100, 1.2, 30, 2, -7), "
              "AdaObject(Size(24, 24), PointI(3, 4), 100, 1, 0, 1, 0))");

    EXPECT_TRUE(adaObjectsWeightCompare(at(0, 0, 24, 1.f, 0, 2), at(0, 0, 24, 1.f, 0, 1)));
    EXPECT_FALSE(adaObjectsWeightCompare(at(0, 0, 24, 1.f, 0, 2), at(0, 0, 24, 1.f, 0, 2)));
    EXPECT_TRUE(adaObjectsScoresCompare(at(0, 0, 24, 1.f, 0, 1, 5), at(0, 0, 24, 1.f, 0, 1, -5)));
    EXPECT_FALSE(adaObjectsScoresCompare(at(0, 0, 24, 1.f, 0, 1, -5), at(0, 0, 24, 1.f, 0, 1, 5)));
}
