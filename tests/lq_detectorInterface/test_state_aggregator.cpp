#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

#include "LQ_States.h"
#include "LogCapture.h"

using LQ::SharedPtr;
using LQ::StateAggregator;

namespace {
// types that no other test touches, so their numbers are handed out inside the test
LQ_DECLARE_STATE(LateCountState, LQ::NumericState, int);
LQ_DECLARE_STATE(LateNameState, LQ::InheritedState, std::string);
LQ_DECLARE_STATE(LateFlagState, LQ::NumericState, bool);

template <class T>
std::string printed(const T& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}
}  // namespace

TEST(StateAggregator, StatesAreMadeOnDemandAndKeptThroughReset) {
    SharedPtr<StateAggregator> early = StateAggregator::newDetectorState();
    EXPECT_EQ(printed(*early), "StateAggregator()");

    // a type first touched after the aggregator was made still has its slot
    const int before = StateAggregator::numBaseStates();
    LateCountState& count = early->get<LateCountState>();
    EXPECT_EQ(StateAggregator::numBaseStates(), before + 1);
    EXPECT_EQ(LateCountState::id(), before);
    count = 7;
    EXPECT_EQ(&early->get<LateCountState>(), &count);

    early->get<LateNameState>() = std::string("palm");
    EXPECT_EQ(early->find<LateFlagState>(), nullptr);
    EXPECT_EQ(printed(*early), "StateAggregator(LateCountState(7), LateNameState(\"palm\"))");

    early->reset();
    EXPECT_EQ(&early->get<LateCountState>(), &count);
    EXPECT_EQ(static_cast<int>(count), 0);
    EXPECT_EQ(printed(*early), "StateAggregator(LateCountState(0), LateNameState(\"\"))");

    // the template assignment goes through get
    *early = LateFlagState(true);
    EXPECT_TRUE(static_cast<bool>(early->get<LateFlagState>()));
}

TEST(StateAggregator, RegistryHoldsOnlyLiveAggregators) {
    const size_t live = StateAggregator::liveCount();
    {
        std::vector<SharedPtr<StateAggregator>> objects;
        for (int i = 0; i < 50; ++i) objects.push_back(StateAggregator::newDetectorState());
        EXPECT_EQ(StateAggregator::liveCount(), live + 50);
        // dropping from the middle keeps the others reachable when a new type appears
        objects.erase(objects.begin() + 10, objects.begin() + 20);
        EXPECT_EQ(StateAggregator::liveCount(), live + 40);
        LQ_DECLARE_STATE(LocalState, LQ::NumericState, float);
        for (auto& object : objects) object->get<LocalState>() = 1.5f;
        EXPECT_EQ(static_cast<float>(objects.back()->get<LocalState>()), 1.5f);
    }
    EXPECT_EQ(StateAggregator::liveCount(), live);
}

TEST(StateAggregator, NamedStatesPrintTheirValues) {
    SharedPtr<StateAggregator> engine = StateAggregator::newDetectorState();
    SharedPtr<StateAggregator> object = StateAggregator::newDetectorState();
    object->get<LQ::ParentSharedStateAggregator>() = engine;
    engine->get<LQ::FrameNumState>() = 3;
    object->get<LQ::LocationState>() =
        LQ::ObjectLocation(LQ::PointF(1, 2), LQ::SizeF(3, 4), 5, LQ::Side::LEFT);
    // the link to the engine prints by name only
    EXPECT_EQ(printed(object->get<LQ::ParentSharedStateAggregator>()), "ParentSharedStateAggregator()");
    EXPECT_EQ(printed(object->get<LQ::LocationState>()),
              "LocationState(ObjectLocation(PointF(1, 2), Size(3, 4), 5, LEFT))");
    engine->get<LQ::MultiState>().push_back(object);
    EXPECT_EQ(object.useCount(), 2);
    engine->reset();  // objects and the engine hold each other: a reset breaks the ring
    EXPECT_EQ(object.useCount(), 1);
}

TEST(StateAggregator, GraphDumpFollowsChildAggregators) {
    SharedPtr<StateAggregator> engine = StateAggregator::newDetectorState();
    SharedPtr<StateAggregator> first = StateAggregator::newDetectorState();
    SharedPtr<StateAggregator> second = StateAggregator::newDetectorState();
    engine->get<LQ::FrameNumState>() = 12;
    engine->get<LQ::MultiState>() = std::vector<SharedPtr<StateAggregator>>{first};
    engine->get<LQ::GestureStatesMapState>()["fist"].push_back(second);
    first->get<LQ::ScoreState>() = 0.5f;

    const std::string path = ::testing::TempDir() + "tactus_dot/graph.dot";
    engine->saveToDot(path);
    std::ifstream file(path);
    std::stringstream text;
    text << file.rdbuf();
    const std::string dot = text.str();
    const std::string e = printed(static_cast<const void*>(engine.get()));
    const std::string f = printed(static_cast<const void*>(first.get()));
    const std::string s = printed(static_cast<const void*>(second.get()));

    EXPECT_EQ(dot.rfind("digraph {\nrankdir=LR\nnode[fontname=\"monospace\"]\n", 0), 0u);
    EXPECT_EQ(dot.substr(dot.size() - 3), "}\n\n");
    EXPECT_NE(dot.find("<tr><td border=\"1\">FrameNumState</td><td align=\"left\" border=\"1\">12<br align=\"left\"/>"
                       "</td></tr>\n"),
              std::string::npos);
    EXPECT_NE(dot.find("<td align=\"left\" border=\"1\" port=\"MultiState\">vector[1]"), std::string::npos);
    EXPECT_NE(dot.find("\"" + e + "\":MultiState -> \"" + f + "\"\n"), std::string::npos);
    EXPECT_NE(dot.find("\"" + e + "\":GestureStatesMapState -> fist\nfist -> \"" + s + "\"\n"), std::string::npos);
    EXPECT_NE(dot.find("\"" + f + "\"[shape=plaintext label = <<table border=\"0\" cellspacing=\"0\">"
                       "<tr><td border=\"1\">ScoreState</td>"),
              std::string::npos);
    // every node's label is whole: no edge inside a table
    size_t open = 0;
    while ((open = dot.find("<<table", open)) != std::string::npos) {
        const size_t close = dot.find("</table>>]\n", open);
        ASSERT_NE(close, std::string::npos);
        EXPECT_EQ(dot.substr(open, close - open).find("->"), std::string::npos);
        open = close;
    }

    FailedCheck check = catchCheck([&] { engine->saveToDot("/proc/tactus/none.dot"); });
    EXPECT_EQ(check.expression, "dotFile_.is_open()");
    EXPECT_EQ(check.tail, "/proc/tactus/none.dot");
}
