#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <vector>

#include "LQ_ViInterface.h"
#include "LogCapture.h"
#include "MultiEngine.h"

using LQ::BaseRect;
using LQ::ObjectLocation;
using LQ::SharedPtr;
using LQ::StateAggregator;

namespace {

ObjectLocation at(float left, float top, float width, float angle = 0, LQ::Side::Value side = LQ::Side::RIGHT) {
    return ObjectLocation(LQ::BasePoint<float>(left + width / 2, top + width / 2), LQ::BaseSize<float>(width, width),
                          angle, side);
}

// Proposes the frame's scripted candidates, each scored with its index to tell objects apart.
class ScriptedTrigger : public LQ::BaseDetector {
public:
    void detect(SharedPtr<StateAggregator>& state) override {
        ++calls;
        const int frame = state->get<LQ::FrameNumState>();
        std::vector<SharedPtr<StateAggregator>>& out = state->get<LQ::MultiState>();
        const std::vector<ObjectLocation>& candidates = script[frame];
        for (size_t k = 0; k < candidates.size(); ++k) {
            SharedPtr<StateAggregator> object = StateAggregator::newDetectorState();
            object->get<LQ::LocationState>() = candidates[k];
            object->get<LQ::ScoreState>() = static_cast<float>(k);
            out.push_back(object);
        }
    }
    std::map<int, std::vector<ObjectLocation>> script;
    int calls = 0;
};

// Applies the test's step to each object.
class ScriptedTracker : public LQ::BaseDetector {
public:
    void detect(SharedPtr<StateAggregator>& object) override {
        ++calls;
        if (step) step(object->get<LQ::LocationState>());
    }
    std::function<void(ObjectLocation&)> step;
    int calls = 0;
};

struct Frames {
    explicit Frames(MultiEngine::Parameters parameters, bool tracker = true) {
        parameters.triggerDetector = SharedPtr<LQ::BaseDetector>(trigger = new ScriptedTrigger());
        if (tracker) parameters.trackingDetector = SharedPtr<LQ::BaseDetector>(this->tracker = new ScriptedTracker());
        engine.reset(new MultiEngine(parameters));
    }
    ~Frames() { state->reset(); }

    // runs frame n and returns its result; trackers can read the frame number from `current`
    const LQ::ViResult& frame(int n) {
        LQ::ViResultState::viResult.reset();
        state->get<LQ::FrameNumState>() = current = n;
        engine->detect(state);
        return LQ::ViResultState::viResult;
    }
    std::vector<SharedPtr<StateAggregator>>& objects() {
        return state->get<LQ::GestureStatesMapState>()[engine->parameters().name];
    }
    // the known objects by their script index
    std::vector<float> scores() {
        std::vector<float> result;
        for (const SharedPtr<StateAggregator>& object : objects())
            result.push_back(static_cast<float>(object->get<LQ::ScoreState>()));
        return result;
    }

    SharedPtr<StateAggregator> state = StateAggregator::newDetectorState();
    int current = 0;
    ScriptedTrigger* trigger = nullptr;
    ScriptedTracker* tracker = nullptr;
    std::unique_ptr<MultiEngine> engine;
};

MultiEngine::Parameters parameters(unsigned int historyLength, int minDetects, int triggerPeriod = 1,
                                   int trackingPeriod = 1, unsigned int maxObjects = 1000) {
    MultiEngine::Parameters p;
    p.name = "fist";
    p.historyLength = historyLength;
    p.minDetects = minDetects;
    p.triggerPeriod = triggerPeriod;
    p.trackingPeriod = trackingPeriod;
    p.maxObjects = maxObjects;
    return p;
}

}  // namespace

// Seen on frames 0-2: reported while three flags lie in the window of five, dropped on the
// fifth frame after the last sighting.
TEST(MultiEngine, ReportedAfterEnoughFlagsDroppedWhenNoneLeft) {
    Frames run(parameters(5, 3), false);
    for (int f = 0; f < 3; ++f) run.trigger->script[f] = {at(100, 80, 40, 45.7f, LQ::Side::LEFT)};
    EXPECT_TRUE(run.frame(0).gestures.empty());
    EXPECT_TRUE(run.frame(1).gestures.empty());
    const LQ::ViResult& third = run.frame(2);
    ASSERT_EQ(third.gestures, std::vector<std::string>{"fist"});
    EXPECT_EQ(third.rects[0], BaseRect<float>(100, 80, 140, 120));
    EXPECT_EQ(third.floats[0], 45.f);  // truncated
    EXPECT_EQ(third.parameters[0].at("text"), "3/5");
    EXPECT_EQ(third.parameters[0].at("side"), LQ::toStr(LQ::Side::LEFT));
    EXPECT_EQ(run.objects().size(), 1u);

    EXPECT_EQ(run.frame(3).gestures.size(), 1u);
    EXPECT_EQ(run.frame(4).parameters.at(0).at("text"), "3/5");
    EXPECT_TRUE(run.frame(5).gestures.empty());
    EXPECT_TRUE(run.frame(6).gestures.empty());
    EXPECT_EQ(run.objects().size(), 1u);
    run.frame(7);
    EXPECT_TRUE(run.objects().empty());
}

// Only candidates close in size and place confirm an object; a size jump confirms and makes nothing.
TEST(MultiEngine, MatchingCandidatesAndAngles) {
    Frames run(parameters(10, 1), false);
    run.trigger->script[0] = {at(100, 100, 40, 190)};
    run.trigger->script[1] = {at(104, 102, 42, 10)};
    run.trigger->script[2] = {at(95, 95, 60)};  // covers the object, 1.43 times as wide
    run.trigger->script[3] = {at(300, 100, 40), at(305, 100, 40)};

    const LQ::ViResult& first = run.frame(0);
    ASSERT_EQ(first.floats.size(), 1u);
    EXPECT_EQ(first.floats[0], -170.f);
    EXPECT_EQ(static_cast<const ObjectLocation&>(run.objects()[0]->get<LQ::LocationState>()).angle, -170.f);

    EXPECT_EQ(run.frame(1).rects.at(0), BaseRect<float>(104, 102, 146, 144));
    EXPECT_EQ(run.objects().size(), 1u);

    const LQ::ViResult& jumped = run.frame(2);
    EXPECT_EQ(run.objects().size(), 1u);
    EXPECT_EQ(jumped.rects.at(0), BaseRect<float>(104, 102, 146, 144));
    EXPECT_EQ(jumped.parameters.at(0).at("text"), "2/10");

    // two overlapping candidates in one frame: the second confirms the first
    const LQ::ViResult& pair = run.frame(3);
    EXPECT_EQ(run.objects().size(), 2u);
    EXPECT_EQ(pair.rects.at(1), BaseRect<float>(305, 100, 345, 140));
}

// The trigger runs on its period while below maxObjects; tracking on the other frames of its period.
TEST(MultiEngine, TriggerAndTrackingPeriods) {
    Frames every(parameters(3, 1, 5, 1));
    for (int f = 0; f <= 10; ++f) every.trigger->script[f] = {at(50, 50, 30)};
    std::vector<int> trackedFrames;
    every.tracker->step = [&](ObjectLocation&) { trackedFrames.push_back(every.current); };
    for (int f = 0; f <= 10; ++f) every.frame(f);
    EXPECT_EQ(every.trigger->calls, 3);
    EXPECT_EQ(trackedFrames, (std::vector<int>{1, 2, 3, 4, 6, 7, 8, 9}));

    // one known object fills maxObjects: the trigger never runs again
    Frames full(parameters(3, 1, 1, 2, 1));
    full.trigger->script[0] = {at(50, 50, 30), at(200, 50, 30)};
    for (int f = 0; f < 7; ++f) full.frame(f);
    EXPECT_EQ(full.trigger->calls, 1);
    EXPECT_EQ(full.tracker->calls, 3);  // frames 2, 4, 6
    EXPECT_EQ(full.scores(), std::vector<float>{0});

    // period 0: frame 0 only
    Frames once(parameters(3, 1, 0, 0));
    once.trigger->script[0] = {at(50, 50, 30)};
    for (int f = 0; f < 3; ++f) once.frame(f);
    EXPECT_EQ(once.trigger->calls, 1);
    EXPECT_EQ(once.tracker->calls, 0);
}

// A lost object keeps its place, gets a false flag for the frame, and still ages out.
TEST(MultiEngine, LostObjectKeepsItsPlaceAndAges) {
    Frames run(parameters(3, 2, 0, 1));
    run.trigger->script[0] = {at(60, 60, 30)};
    run.tracker->step = [&](ObjectLocation& location) {
        if (run.current == 1) location = at(64, 60, 30);
        if (run.current >= 2) location.reset();
    };
    EXPECT_TRUE(run.frame(0).gestures.empty());
    EXPECT_EQ(run.frame(1).rects.at(0), BaseRect<float>(64, 60, 94, 90));
    const LQ::ViResult& lost = run.frame(2);
    EXPECT_EQ(lost.rects.at(0), BaseRect<float>(64, 60, 94, 90));
    EXPECT_EQ(lost.parameters.at(0).at("text"), "2/3");
    EXPECT_TRUE(run.frame(3).gestures.empty());
    EXPECT_EQ(run.objects().size(), 1u);
    run.frame(4);
    EXPECT_TRUE(run.objects().empty());
}

// Objects that meet merge one pair per frame; more flags win, on a tie the earlier one.
TEST(MultiEngine, DuplicatesMergeOnePairPerFrame) {
    Frames run(parameters(5, 1, 0, 1));
    run.trigger->script[0] = {at(0, 0, 40), at(200, 0, 40), at(400, 0, 40)};
    run.tracker->step = [](ObjectLocation& location) { location = at(100, 100, 40); };
    run.frame(0);
    EXPECT_EQ(run.scores(), (std::vector<float>{0, 1, 2}));
    run.frame(1);
    EXPECT_EQ(run.scores(), (std::vector<float>{0, 2}));
    run.frame(2);
    EXPECT_EQ(run.scores(), std::vector<float>{0});

    // more flags win over a lower index
    Frames counts(parameters(5, 1, 0, 1));
    counts.trigger->script[0] = {at(0, 0, 40), at(200, 0, 40)};
    counts.tracker->step = [&](ObjectLocation& location) {
        if (counts.current == 1 && location.center.x < 100) location.reset();  // the first one is missed once
        if (counts.current == 2) location = at(100, 100, 40);
    };
    for (int f = 0; f < 3; ++f) counts.frame(f);
    EXPECT_EQ(counts.scores(), std::vector<float>{1});
}

// A 30 -> 40 degree step comes out as the hand-worked Kalman estimate; a candidate without a
// location is a failed check.
TEST(MultiEngine, AngleFilterAndFailedChecks) {
    MultiEngine::Parameters p = parameters(5, 1);
    p.useAngleFilter = true;
    Frames run(p, false);
    run.trigger->script[0] = {at(100, 100, 40, 30)};
    run.trigger->script[1] = {at(100, 100, 40, 40)};
    EXPECT_FLOAT_EQ(run.frame(0).floats.at(0), 30.f);
    // A = (1 0.5; 0 1), H = (1 1), Q = diag(0, 0.1), R = 0.1. After the first step P is
    // diag(0, 0.05); the second predicts P = (0.0125 0.025; 0.025 0.15), so S = 0.3125 and
    // the gain on the position is 0.0375 / 0.3125 = 0.12 of the innovation 10.
    EXPECT_NEAR(run.frame(1).floats.at(0), 31.2f, 1e-4f);

    Frames broken(parameters(5, 1), false);
    broken.trigger->script[0] = {ObjectLocation()};
    const FailedCheck check = catchCheck([&] { broken.frame(0); });
    EXPECT_EQ(check.expression, "newLocationState.isSet()");
    EXPECT_EQ(check.tail.rfind("LQ::LocationState is empty in ", 0), 0u) << check.tail;
}

TEST(MultiEngine, SimilarityByOverlap) {
    using R = BaseRect<float>;
    // 20 x 10 of a 20 x 20 square: exactly half is not enough
    EXPECT_FALSE(MultiEngine::isSimilar(R(0, 0, 20, 20), R(0, 10, 20, 50)));
    EXPECT_TRUE(MultiEngine::isSimilar(R(0, 0, 20, 20), R(0, 9, 20, 50)));
    EXPECT_FALSE(MultiEngine::isSimilar(R(0, 0, 20, 20), R(30, 30, 50, 50)));
    // the location form also takes rectangles alike in width and place
    const LQ::LocationState a = at(0, 0, 40), b = at(15, 0, 40), c = at(21, 0, 40);
    EXPECT_TRUE(MultiEngine::isSimilar(a, b));
    // 21 pixels apart is more than half the width, and 19 of 40 columns overlap
    EXPECT_FALSE(MultiEngine::isSimilar(a, c));
}
