#include <gtest/gtest.h>

#include <cmath>
#include <sstream>

#include "LQ_BaseDetector.h"
#include "LQ_States.h"

using LQ::AngleRange;
using LQ::DetectRegion;
using LQ::DetectRegionState;
using LQ::SharedPtr;
using LQ::StateAggregator;

namespace {
// Appends its mark to the location's angle, so the order of the chain shows.
class MarkDetector : public LQ::BaseDetector {
public:
    explicit MarkDetector(int mark) : mark_(mark) {}
    void detect(SharedPtr<StateAggregator>& state) override {
        float& angle = state->get<LQ::LocationState>().angle;
        angle = angle * 10 + mark_;
    }

private:
    int mark_;
};
}  // namespace

TEST(DetectorComposition, AggregatorRunsEveryDetectorInOrder) {
    SharedPtr<StateAggregator> state = StateAggregator::newDetectorState();
    LQ::DetectorAggregator empty;
    empty.detect(state);
    EXPECT_EQ(state->find<LQ::LocationState>(), nullptr);

    SharedPtr<LQ::BaseDetector> shared(new MarkDetector(3));
    LQ::DetectorAggregator chain(new MarkDetector(1), new MarkDetector(2));
    chain.addDetector(shared);
    chain.addDetector(new LQ::DetectorAggregator(shared, SharedPtr<LQ::BaseDetector>(new MarkDetector(4))));
    chain.detect(state);
    EXPECT_FLOAT_EQ(state->get<LQ::LocationState>().angle, 12334);
    EXPECT_EQ(shared.useCount(), 3);
    chain.reset();
    EXPECT_TRUE(chain.detectors().empty());
    EXPECT_EQ(shared.useCount(), 1);
}

TEST(DetectorComposition, RegionSetterGoesRoundRobinPerState) {
    const DetectRegion a(LQ::Rect(0, 0, 10, 10), LQ::RangeF(), AngleRange(), LQ::Side::RIGHT);
    const DetectRegion b(LQ::Rect(5, 5, 10, 10), LQ::RangeF(1, 2), AngleRange(), LQ::Side::LEFT);
    const DetectRegion c(LQ::Rect(1, 2, 3, 4), LQ::RangeF(), AngleRange(10, 20), LQ::Side::BOTH);
    LQ::DetectRegionSetter setter(std::vector<DetectRegion>{a, b, c}, LQ::RelativeLocation());
    SharedPtr<StateAggregator> state = StateAggregator::newDetectorState();
    std::vector<DetectRegion> seen;
    for (int frame = 0; frame < 5; ++frame) {
        setter.detect(state);
        seen.push_back(state->get<DetectRegionState>());
    }
    EXPECT_EQ(seen, (std::vector<DetectRegion>{a, b, c, a, b}));
    SharedPtr<StateAggregator> fresh = StateAggregator::newDetectorState();
    setter.detect(fresh);
    EXPECT_EQ(static_cast<const DetectRegion&>(fresh->get<DetectRegionState>()), a);
    state->reset();  // the counter is a state: back to the first region
    setter.detect(state);
    EXPECT_EQ(static_cast<const DetectRegion&>(state->get<DetectRegionState>()), a);

    std::ostringstream text;
    text << b;
    EXPECT_EQ(text.str(), "DetectRegion(Rect(5, 5, 10, 10), AngleRange(-180, 179), RangeF(1, 2), LEFT)");
}

TEST(DetectorComposition, RelativeRegionFollowsTheLocation) {
    // twice as wide, one width to the right; widths 0.5 to 2 times; angles -30 to +30
    LQ::RelativeDetectRegion relative(LQ::RelativeLocation(2, LQ::PointF(1, 0), 0, 0, 0), LQ::RangeF(0.5f, 2),
                                      true, AngleRange(-30, 30));
    SharedPtr<StateAggregator> state = StateAggregator::newDetectorState();
    state->get<DetectRegionState>().rect = LQ::Rect(1, 1, 2, 2);
    relative.detect(state);  // no location: the defaults
    EXPECT_EQ(static_cast<const DetectRegion&>(state->get<DetectRegionState>()), DetectRegion());
    EXPECT_EQ(state->get<DetectRegionState>().widthRange, LQ::RangeF(-3.4028235e+38f, 3.4028235e+38f));

    state->get<LQ::LocationState>() = LQ::ObjectLocation(LQ::PointF(100, 50), LQ::SizeF(20, 10), 170, LQ::Side::LEFT);
    relative.detect(state);
    const DetectRegion& region = state->get<DetectRegionState>();
    EXPECT_EQ(region.widthRange, LQ::RangeF(10, 40));
    EXPECT_EQ(region.angleRange, AngleRange(140, -160));  // through the half turn
    EXPECT_TRUE(region.angleRange.contains(-175));
    EXPECT_EQ(region.side, LQ::Side::LEFT);
    // LEFT mirrors the shift, turned by the location's angle: about 20 to the right
    EXPECT_NEAR((region.rect.left + region.rect.right) / 2.0, 100 - 20 * std::cos(170 * M_PI / 180), 1.0);
    EXPECT_EQ(region.rect.width(), 40);
}
