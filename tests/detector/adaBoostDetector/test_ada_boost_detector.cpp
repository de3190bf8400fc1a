#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <vector>

#include "AdaBoostDetector.h"
#include "ClassifierRing.h"
#include "Glyphs.h"
#include "LQ_BaseDetector.h"
#include "LQ_ImageData.h"
#include "LQ_States.h"

using LQ::BasePoint;
using LQ::BaseRect;
using LQ::BaseSize;
using LQ::Image;
using LQ::SharedPtr;
using LQ::StateAggregator;

namespace {

using glyphs::kBright;
using glyphs::kDark;
using glyphs::kWindow;
using glyphs::Pose;

CascadedClassifier fCascade(glyphs::Tables& tables) { return glyphs::cascade(glyphs::kF, tables, "F"); }
void drawF(Image& image, int ox, int oy, float s, Pose pose) { glyphs::draw(glyphs::kF, image, ox, oy, s, pose); }

// Counts its calls and resets the location on the listed call numbers.
class Scripted : public LQ::BaseDetector {
public:
    explicit Scripted(std::vector<int> refuse = {}) : refuse_(std::move(refuse)) {}
    void detect(SharedPtr<StateAggregator>& state) override {
        ++calls;
        if (std::find(refuse_.begin(), refuse_.end(), calls) != refuse_.end()) state->get<LQ::LocationState>().reset();
    }
    int calls = 0;

private:
    std::vector<int> refuse_;
};

AdaObject hit(int x, int score) {
    static const char* name = "hit";
    return AdaObject(name, BaseSize<int>(24, 24), BasePoint<int>(x, 50), 100, 1.f, 0, 1, score);
}

}  // namespace

// Four Fs in four poses and sizes give exactly four objects with their centre, size, angle
// and hand; the base cascade is labelled 30 degrees, so variants carry derived angles.
TEST(AdaBoostDetector, FindsEachPoseAtItsPlaceAngleSideAndSize) {
    glyphs::Tables tables;
    CascadedClassifier base = fCascade(tables);
    base.setAngle(30);
    ClassifierRing ring(std::vector<CascadedClassifier*>{&base});
    ring.setName("F");
    const std::vector<CascadedClassifier*> cascades = ring.getClassifiers(LQ::AngleRange(), LQ::Side::BOTH);
    ASSERT_EQ(cascades.size(), 8u);

    Image scene(BaseSize<int>(320, 240), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < 240; ++y)
        for (int x = 0; x < 320; ++x) scene.pixel(x, y)[0] = kDark;
    struct Expected {
        int ox, oy;
        float scale;
        Pose pose;
        int angle, side;
    };
    const float z2 = 1.2f * 1.2f;
    const Expected expected[] = {{30, 30, 1.f, {false, 0}, 30, 1},
                                 {150, 40, z2, {false, 1}, 120, 1},
                                 {60, 140, 1.2f, {true, 0}, -30, -1},
                                 {200, 130, z2 * 1.2f, {true, 2}, 150, -1}};
    for (const Expected& e : expected) drawF(scene, e.ox, e.oy, e.scale, e.pose);

    SharedPtr<LQ::ImageData> root(new LQ::ImageData());
    root->set(scene);
    SharedPtr<LQ::ImagePyramidData> pyramid(new LQ::ImagePyramidData(root, 1));
    AdaBoostDetector detector(cascades, pyramid, AdaBoostDetector::StoreTarget::CHILD_STATES, nullptr, 1, 2, 0.3f,
                              SharedPtr<LQ::BaseDetector>(), SharedPtr<LQ::BaseDetector>(),
                              SharedPtr<LQ::BaseDetector>(), LQ::RelativeLocation(1, BasePoint<float>(0, 0), 0, 0, 0),
                              1000);
    SharedPtr<StateAggregator> state = StateAggregator::newDetectorState();
    detector.detect(state);

    EXPECT_GT(detector.maxZoom(), 5.f);
    const std::vector<SharedPtr<StateAggregator>>& found = state->get<LQ::MultiState>();
    ASSERT_EQ(found.size(), 4u);
    for (const Expected& e : expected) {
        const float half = kWindow * e.scale / 2;
        int matches = 0;
        for (const SharedPtr<StateAggregator>& child : found) {
            const AdaObject& object = child->get<AdaObjectState>();
            if (std::abs(object.center.x - (e.ox + half)) > 2 + e.scale ||
                std::abs(object.center.y - (e.oy + half)) > 2 + e.scale)
                continue;
            ++matches;
            EXPECT_EQ(object.angle, e.angle) << e.ox;
            EXPECT_EQ(object.side > 0 ? 1 : -1, e.side) << e.ox;
            EXPECT_NEAR(object.zoom, e.scale, 0.15f * e.scale) << e.ox;
            EXPECT_GE(object.weight, 2);
            const LQ::ObjectLocation& location = child->get<LQ::LocationState>();
            EXPECT_EQ(location.side, e.side > 0 ? LQ::Side::RIGHT : LQ::Side::LEFT);
            EXPECT_NEAR(location.size.width, kWindow * e.scale, 0.15f * kWindow * e.scale);
            EXPECT_TRUE(child->get<LQ::ParentSharedStateAggregator>() == state);
        }
        EXPECT_EQ(matches, 1) << "F at " << e.ox << ", " << e.oy;
    }
    // with this store target the frame's own object stays unset
    EXPECT_FALSE(static_cast<const AdaObject&>(state->get<AdaObjectState>()).isSet());
    state->reset();  // children point back at the frame: the reset ends the cycle
}

TEST(AdaBoostDetector, ZoomsFollowTheWidthRange) {
    glyphs::Tables tables;
    CascadedClassifier cascade = fCascade(tables);
    AdaBoostDetector::Parameters parameters;
    parameters.pCascadedClassifiers = {&cascade};
    AdaBoostDetector detector(parameters);

    LQ::DetectRegion region(BaseRect<int>(0, 0, 1000, 1000), LQ::BaseRange<float>(100, 150), LQ::AngleRange(),
                            LQ::Side::BOTH);
    detector.computeClassifierMap(region);
    std::vector<float> widths;
    for (const auto& entry : detector.classifierMap()) widths.push_back(24 * entry.first);
    ASSERT_EQ(widths.size(), 3u);
    EXPECT_NEAR(widths[0], 103.2f, 0.05f);
    EXPECT_NEAR(widths[1], 123.8f, 0.05f);
    EXPECT_NEAR(widths[2], 148.6f, 0.05f);

    // the default region: every zoom at which the object still fits, and no other
    region = LQ::DetectRegion(BaseRect<int>(0, 0, 300, 200), LQ::BaseRange<float>(), LQ::AngleRange(), LQ::Side::BOTH);
    detector.computeClassifierMap(region);
    EXPECT_EQ(detector.classifierMap().size(), 12u);  // 24 * 1.2^11 = 178 < 200 < 24 * 1.2^12
    region.side = LQ::Side::LEFT;
    detector.computeClassifierMap(region);
    EXPECT_TRUE(detector.classifierMap().empty());

    // rectangles: the layers' union, grown and brought to base pixels, and the integral's
    region.side = LQ::Side::BOTH;
    region.rect = BaseRect<int>(10, 20, 110, 90);
    region.widthRange = LQ::BaseRange<float>(20, 30);
    detector.computeClassifierMap(region);
    detector.prepareRois(region);
    ASSERT_EQ(detector.layerRois().size(), 2u);
    EXPECT_EQ(detector.layerRois().begin()->second, BaseRect<int>(10, 20, 110, 90));
    EXPECT_EQ(detector.integralRoi(), BaseRect<int>(10, 20, 110, 90));
    EXPECT_FLOAT_EQ(detector.maxZoom(), 1.2f);
    // zoom 1 gives (7, 17, 113, 93); zoom 1.2 gives (8, 16, 91, 75) grown by 3, times 1.2
    EXPECT_EQ(detector.monoRoi(), BaseRect<int>(6, 15, 113, 93));
}

// What the verifier and the store target make of the hits, and the paths of nothing found.
TEST(AdaBoostDetector, StoreTargetsVerifierAndLostPath) {
    glyphs::Tables tables;
    CascadedClassifier cascade = fCascade(tables);
    AdaBoostDetector::Parameters parameters;
    parameters.pCascadedClassifiers = {&cascade};
    Scripted* verifier = new Scripted({1});
    parameters.verifier = SharedPtr<LQ::BaseDetector>(verifier);
    parameters.storeTarget = AdaBoostDetector::StoreTarget::FIRST_OBJECT;
    AdaBoostDetector tracker(parameters);

    SharedPtr<StateAggregator> state = StateAggregator::newDetectorState();
    EXPECT_TRUE(tracker.processAdaObjects(state, {hit(10, 1), hit(20, 2), hit(30, 3)}));
    EXPECT_EQ(verifier->calls, 2);
    EXPECT_EQ(static_cast<const AdaObject&>(state->get<AdaObjectState>()).center.x, 20);
    EXPECT_FLOAT_EQ(static_cast<const LQ::ObjectLocation&>(state->get<LQ::LocationState>()).center.x, 20.f);

    tracker.processDetectedState(state, false);
    EXPECT_FALSE(static_cast<const AdaObject&>(state->get<AdaObjectState>()).isSet());
    EXPECT_FALSE(static_cast<const LQ::ObjectLocation&>(state->get<LQ::LocationState>()).isSet());

    // a trigger lists every survivor; nothing found keeps the frame's location
    Scripted* lost = new Scripted();
    parameters.verifier = SharedPtr<LQ::BaseDetector>();
    parameters.onLost = SharedPtr<LQ::BaseDetector>(lost);
    parameters.storeTarget = AdaBoostDetector::StoreTarget::CHILD_STATES;
    parameters.maxObjects = 1000;
    AdaBoostDetector trigger(parameters);
    SharedPtr<StateAggregator> frame = StateAggregator::newDetectorState();
    EXPECT_TRUE(trigger.processAdaObjects(frame, {hit(10, 1), hit(60, 2)}));
    EXPECT_EQ(frame->get<LQ::MultiState>().size(), 2u);
    trigger.parameters().maxObjects = 3;
    EXPECT_TRUE(trigger.processAdaObjects(frame, {hit(10, 1), hit(60, 2)}));
    EXPECT_EQ(frame->get<LQ::MultiState>().size(), 3u);

    static_cast<LQ::ObjectLocation&>(frame->get<LQ::LocationState>()) = hit(5, 1).toLocationState();
    static_cast<AdaObject&>(frame->get<AdaObjectState>()) = hit(5, 1);
    trigger.processDetectedState(frame, false);
    EXPECT_FALSE(static_cast<const AdaObject&>(frame->get<AdaObjectState>()).isSet());
    EXPECT_TRUE(static_cast<const LQ::ObjectLocation&>(frame->get<LQ::LocationState>()).isSet());
    EXPECT_EQ(lost->calls, 1);

    // widths no larger than the cascade's: no zoom, no scan, the lost path
    Image scene(BaseSize<int>(64, 48), LQ::COLOR_MODE_MONO);
    SharedPtr<LQ::ImageData> root(new LQ::ImageData());
    root->set(scene);
    trigger.parameters().pyramid = SharedPtr<LQ::ImagePyramidData>(new LQ::ImagePyramidData(root, 1));
    trigger.parameters().regionDetector = SharedPtr<LQ::BaseDetector>(new LQ::DetectRegionSetter(
        LQ::DetectRegion(BaseRect<int>(0, 0, 64, 48), LQ::BaseRange<float>(0, 24), LQ::AngleRange(), LQ::Side::BOTH)));
    trigger.detect(frame);
    EXPECT_TRUE(trigger.classifierMap().empty());
    EXPECT_EQ(lost->calls, 2);
    frame->reset();
}
