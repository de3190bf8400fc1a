#include <gtest/gtest.h>

#include <cmath>

#include "ConvolutionLayer.h"
#include "DataLayer.h"
#include "LogCapture.h"
#include "NnTracker.h"

using LQ::BasePoint;
using LQ::BaseSize;
using LQ::ObjectLocation;
using LQ::SharedPtr;
using LQ::StateAggregator;

namespace {

const BaseSize<int> kInput(20, 20);

// A network whose outputs are the given constants whatever the patch: one convolution
// per output blob, with zero filters over the whole input and the values as bias.
SharedPtr<NnDetector> constant(const std::vector<std::vector<float>>& outputs, const std::string& name = "const") {
    SharedPtr<NnDetector> net(new NnDetector());
    net->setName(name);
    SharedPtr<BaseLayer> data(new DataLayer("data"));
    net->addLayer(data);
    for (size_t k = 0; k < outputs.size(); ++k) {
        const int n = static_cast<int>(outputs[k].size());
        Blob filter(n, 1, kInput.height, kInput.width), bias(n, 1, 1, 1);
        for (int i = 0; i < filter.size(); ++i) filter.data()[i] = 0;
        for (int i = 0; i < n; ++i) bias.data()[i] = outputs[k][i];
        SharedPtr<BaseLayer> conv(new ConvolutionLayer(filter, bias, "out" + std::to_string(k), 1, 0));
        conv->addBottomLayer(data);
        net->addLayer(conv);
    }
    net->setSize(kInput);
    return net;
}

struct Scene {
    Scene() {
        LQ::Image frame(BaseSize<int>(200, 160), LQ::COLOR_MODE_MONO);
        for (int y = 0; y < 160; ++y)
            for (int x = 0; x < 200; ++x) frame.pixel(x, y)[0] = static_cast<unsigned char>((x * 7 + y * 3) % 256);
        image->set(frame);
    }
    // one step of a tracker of this type on an object at (100, 80), 40 wide
    SharedPtr<StateAggregator> step(NnTracker::Type::Value type, const SharedPtr<NnDetector>& net,
                                    LQ::Side::Value side = LQ::Side::RIGHT, float threshold = 0.5f,
                                    bool tryFlipped = false, float angle = 0) {
        NnTracker tracker(NnTracker::Parameters(type, net, image, LQ::RelativeLocation(1, BasePoint<float>(0, 0), 0, 0, 0),
                                                threshold, false, tryFlipped));
        SharedPtr<StateAggregator> object = StateAggregator::newDetectorState();
        object->get<LQ::LocationState>() = ObjectLocation(BasePoint<float>(100, 80), BaseSize<float>(40, 40), angle, side);
        tracker.detect(object);
        return object;
    }
    SharedPtr<LQ::ImageData> image{new LQ::ImageData()};
};

const ObjectLocation& locationOf(SharedPtr<StateAggregator>& object) { return object->get<LQ::LocationState>(); }
float scoreOf(SharedPtr<StateAggregator>& object) { return object->get<LQ::ScoreState>(); }
bool verifiedOf(SharedPtr<StateAggregator>& object) { return object->get<LQ::VerifiedState>(); }

}  // namespace

// The readers that change size, angle and side, and the scores they give.
TEST(NnTracker, ZoomAngleAndSide) {
    Scene scene;
    SharedPtr<StateAggregator> zoom = scene.step(NnTracker::Type::ZOOM, constant({{0.5f, 51}}));
    EXPECT_FLOAT_EQ(locationOf(zoom).size.width, 44.f);  // limited to a tenth
    EXPECT_FLOAT_EQ(scoreOf(zoom), 0.2f);
    SharedPtr<StateAggregator> zoomAngle = scene.step(NnTracker::Type::ZOOM_ANGLE, constant({{0.5f, 12, 102}}));
    EXPECT_FLOAT_EQ(locationOf(zoomAngle).size.width, 60.f);
    EXPECT_FLOAT_EQ(locationOf(zoomAngle).angle, 12.f);
    EXPECT_FLOAT_EQ(scoreOf(zoomAngle), 0.4f);

    SharedPtr<StateAggregator> flips = scene.step(NnTracker::Type::SIDE, constant({{1, 52}}));
    EXPECT_EQ(locationOf(flips).side, LQ::Side::LEFT);
    EXPECT_FLOAT_EQ(scoreOf(flips), 0.2f);
    SharedPtr<StateAggregator> keeps = scene.step(NnTracker::Type::SIDE, constant({{52, 1}}));
    EXPECT_EQ(locationOf(keeps).side, LQ::Side::RIGHT);
    EXPECT_FLOAT_EQ(scoreOf(keeps), 0.2f);
    EXPECT_EQ(locationOf(keeps).center, BasePoint<float>(100, 80));

    // two equal points: no angle, no size; a left hand still has its angle mirrored
    SharedPtr<StateAggregator> same =
        scene.step(NnTracker::Type::LOCATION_ANGLE, constant({{5, 5, 100, 5, 5, 155}}), LQ::Side::LEFT, 0.5f, false, 30);
    EXPECT_FLOAT_EQ(locationOf(same).angle, 150.f);
    EXPECT_EQ(locationOf(same).size.width, 0.f);
    EXPECT_FLOAT_EQ(scoreOf(same), 0.5f);
    // two points along the patch's x axis: the object keeps its upright angle
    SharedPtr<StateAggregator> level = scene.step(NnTracker::Type::LOCATION_ANGLE, constant({{0, 9.5f, 0, 19, 9.5f, 0}}));
    EXPECT_NEAR(locationOf(level).angle, 0.f, 1e-4f);
    EXPECT_NEAR(locationOf(level).size.width, 38.f, 1e-3f);
}

// The verdict: strict threshold, one-value networks compared as they are, the mirrored
// second try, and no network run at all without a location.
TEST(NnTracker, VerifierAndStates) {
    Scene scene;
    const float odds9 = std::log(9.f);  // p = 0.9 for the second class
    SharedPtr<StateAggregator> strict = scene.step(NnTracker::Type::VERIFIER, constant({{0, odds9}}), LQ::Side::RIGHT, 0.9f);
    EXPECT_FALSE(verifiedOf(strict));
    EXPECT_NEAR(scoreOf(strict), 0.9f, 1e-6f);
    SharedPtr<StateAggregator> passes = scene.step(NnTracker::Type::VERIFIER, constant({{0, odds9}}), LQ::Side::RIGHT, 0.85f);
    EXPECT_TRUE(verifiedOf(passes));
    // a refusal unsets the object, so the detector that asked drops it; a pass keeps it
    EXPECT_FALSE(locationOf(strict).isSet());
    EXPECT_TRUE(locationOf(passes).isSet());
    SharedPtr<StateAggregator> single = scene.step(NnTracker::Type::VERIFIER, constant({{0.7f}}));
    EXPECT_TRUE(verifiedOf(single));
    EXPECT_FLOAT_EQ(scoreOf(single), 0.7f);
    SharedPtr<StateAggregator> retried =
        scene.step(NnTracker::Type::VERIFIER, constant({{0, odds9}}), LQ::Side::RIGHT, 0.95f, true);
    EXPECT_FALSE(verifiedOf(retried));
    EXPECT_NEAR(scoreOf(retried), 0.9f, 1e-6f);
    // a zoom tracker writes no verdict
    SharedPtr<StateAggregator> zoom = scene.step(NnTracker::Type::ZOOM, constant({{0.f}}));
    EXPECT_EQ(zoom->find<LQ::VerifiedState>(), nullptr);

    SharedPtr<NnDetector> net = constant({{0.7f}});
    NnTracker tracker(NnTracker::Parameters(NnTracker::Type::VERIFIER, net, scene.image, LQ::RelativeLocation()));
    SharedPtr<StateAggregator> nowhere = StateAggregator::newDetectorState();
    tracker.detect(nowhere);
    EXPECT_EQ(scoreOf(nowhere), 0.f);
    EXPECT_FALSE(verifiedOf(nowhere));
    EXPECT_EQ(net->getNetwork().back()->getBlob().size(), 0);  // never ran
    EXPECT_EQ(tracker.name(), "NnTracker const");
    EXPECT_EQ(catchCheck([&] { NnTracker(NnTracker::Parameters(NnTracker::Type::ZOOM, constant({{0}}, ""), scene.image,
                                                                LQ::RelativeLocation()))
                                   .name(); })
                  .tail,
              "nnDetector_: empty name");
    const FailedCheck type = catchCheck([&] { scene.step(NnTracker::Type::UNDEFINED, constant({{0}})); });
    EXPECT_EQ(type.expression, "0");
    EXPECT_EQ(type.tail, "wrong type: UNDEFINED");
}

// Skeletons and the three-output form: points from the patch to the frame, the mean
// score, and alignment points written even when the verdict keeps the location.
TEST(NnTracker, SkeletonAndMtCnn) {
    Scene scene;
    SharedPtr<StateAggregator> skeleton = scene.step(NnTracker::Type::SKELETON, constant({{9.5f, 9.5f, 0.2f, 0, 0, 0.6f}}));
    const std::vector<BasePoint<float>>& points = skeleton->get<LQ::SkeletonState>();
    ASSERT_EQ(points.size(), 2u);
    EXPECT_NEAR(points[0].x, 100.f, 1e-3f);  // the patch centre is the object's centre
    EXPECT_NEAR(points[0].y, 80.f, 1e-3f);
    EXPECT_LT(points[1].x, 82.f);
    EXPECT_NEAR(scoreOf(skeleton), 0.4f, 1e-6f);
    EXPECT_EQ(catchCheck([&] { scene.step(NnTracker::Type::SKELETON, constant({{1, 2}})); }).expression,
              "(nnResults.size() % 3) == (0)");

    const std::vector<float> alignment = {0, 0.25f, 0.5f, 0.75f, 1, 0, 0, 0.5f, 0.5f, 1};
    SharedPtr<StateAggregator> kept =
        scene.step(NnTracker::Type::MT_CNN, constant({{0.5f, 0, 0.1f, 0.2f}, alignment, {2, 1}}));
    EXPECT_FALSE(verifiedOf(kept));
    EXPECT_EQ(locationOf(kept).center, BasePoint<float>(100, 80));
    const std::vector<BasePoint<float>>& marks = kept->get<LQ::MtCnnAlignment>();
    ASSERT_EQ(marks.size(), 5u);
    EXPECT_EQ(marks[1], BasePoint<float>(90, 60));  // left 80 + 0.25 x 40, top 60 + 0
    SharedPtr<StateAggregator> moved =
        scene.step(NnTracker::Type::MT_CNN, constant({{0.5f, 0, 0.1f, 0.2f}, alignment, {1, 2}}));
    EXPECT_TRUE(verifiedOf(moved));
    EXPECT_FLOAT_EQ(scoreOf(moved), 2.f);
    EXPECT_FLOAT_EQ(locationOf(moved).center.x, 120.f);
    EXPECT_FLOAT_EQ(locationOf(moved).size.width, 48.f);
}
