#include <gtest/gtest.h>

#include <sstream>

#include "Evaluation.h"

using evaluation::Evaluator;
using evaluation::Report;
using evaluation::TruthFrame;

namespace {

TruthFrame fist(float left) { return TruthFrame{"fist", {left, 10, left + 20, 30}, 0, "RIGHT"}; }
const TruthFrame nothing;
Report report(const char* gesture, float left) { return Report{gesture, {left, 10, left + 20, 30}}; }

}  // namespace

TEST(Evaluation, Overlap) {
    EXPECT_FLOAT_EQ(evaluation::overlap({0, 0, 10, 10}, {0, 0, 10, 10}), 1);
    EXPECT_FLOAT_EQ(evaluation::overlap({0, 0, 10, 10}, {5, 0, 15, 10}), 50.f / 150);
    EXPECT_EQ(evaluation::overlap({0, 0, 10, 10}, {10, 0, 20, 10}), 0);  // touching edges
    EXPECT_EQ(evaluation::overlap({0, 0, 0, 10}, {0, 0, 0, 10}), 0);     // empty
}

// Two appearances of a fist; the first is reported from its third frame, which the warm-up
// of two frames doesn't count against; the second is never reported. Reports elsewhere,
// of the wrong place and beside a matched one are false; other gestures are ignored.
TEST(Evaluation, CountsFramesAppearancesAndFalseReports) {
    Evaluator e("fist", 2);
    e.add(nothing, {report("fist", 100)}, 10);           // false: nothing there
    e.add(fist(0), {}, 20);                              // appearance 1, warm-up
    e.add(fist(2), {report("victory", 2)}, 30);          // warm-up; another gesture
    e.add(fist(4), {report("fist", 4)}, 40);             // counted, matched, first report after 2 frames
    e.add(fist(6), {report("fist", 6), report("fist", 200)}, 50);  // matched, plus one false
    e.add(fist(8), {report("fist", 30)}, 60);            // counted, off the hand: false, not detected
    e.add(nothing, {}, 70);
    e.add(fist(50), {}, 80);                             // appearance 2, never reported
    e.add(fist(50), {}, 90);
    e.add(fist(50), {}, 100);                            // counted, missed
    const evaluation::Summary s = e.summary();
    EXPECT_EQ(s.frames, 10);
    EXPECT_EQ(s.presentFrames, 8);
    EXPECT_EQ(s.countedFrames, 4);
    EXPECT_EQ(s.detectedFrames, 2);
    EXPECT_DOUBLE_EQ(s.detectedShare(), 0.5);
    EXPECT_EQ(s.falseReports, 3);
    EXPECT_DOUBLE_EQ(s.falsePerThousand(), 300);
    EXPECT_EQ(s.appearances, 2);
    EXPECT_EQ(s.missedAppearances, 1);
    EXPECT_DOUBLE_EQ(s.meanFirstReport, 2);
    EXPECT_DOUBLE_EQ(s.meanOverlap, 1);
    EXPECT_DOUBLE_EQ(s.medianMicros, 60);
    EXPECT_DOUBLE_EQ(s.p95Micros, 100);
}

TEST(Evaluation, ReadsTruthLinesAndNamesTheBadOne) {
    std::istringstream good(
        "{\"frame\":0,\"gesture\":null}\n"
        "{\"frame\":1,\"gesture\":\"thumbUp\",\"rect\":[1.5, 2,3,4],\"angle\":-30,\"side\":\"LEFT\"}\n\n"
        "{\"frame\":2}\n"
        "{\"frame\":3,\"gestures\":[{\"gesture\":\"fist\",\"rect\":[5,6,7,8],\"angle\":2,\"side\":\"RIGHT\"}]}\n"
        "{\"frame\":4,\"gestures\":[{\"gesture\":\"none\",\"rect\":[5,6,7,8]}]}\n"
        "{\"frame\":5,\"gestures\":[]}\n");
    const std::vector<TruthFrame> frames = evaluation::readTruth(good);
    ASSERT_EQ(frames.size(), 6u);
    EXPECT_EQ(frames[3].gesture, "fist");
    EXPECT_EQ(frames[3].rect, (evaluation::Rect{5, 6, 7, 8}));
    EXPECT_EQ(frames[4].gesture, "");
    EXPECT_EQ(frames[5].gesture, "");
    EXPECT_EQ(frames[0].gesture, "");
    EXPECT_EQ(frames[1].gesture, "thumbUp");
    EXPECT_EQ(frames[1].rect, (evaluation::Rect{1.5f, 2, 3, 4}));
    EXPECT_EQ(frames[1].angle, -30);
    EXPECT_EQ(frames[1].side, "LEFT");
    EXPECT_EQ(frames[2].gesture, "");

    for (const char* bad : {"{\"frame\":0,\"gesture\":\"fist\"}", "{\"frame\":1,\"gesture\":null}",
                            "{\"frame\":0,\"gesture\":\"fist\",\"rect\":[1,2,x,4]}", "{\"gesture\":null}"}) {
        std::istringstream in(bad);
        try {
            evaluation::readTruth(in);
            ADD_FAILURE() << bad;
        } catch (const std::runtime_error& error) {
            EXPECT_EQ(std::string(error.what()).rfind("truth line 1: ", 0), 0u) << error.what();
        }
    }
}
