#pragma once
// Scoring of the engine's reports against a clip's ground truth, for one gesture at a
// time: how many frames that show the gesture report it once the engine's own warm-up is
// over, how many reports have no hand of that gesture under them, how long a new hand
// waits for its first report, how well the rectangles overlap, and how long frames take.

#include <array>
#include <istream>
#include <ostream>
#include <string>
#include <vector>

namespace evaluation {

using Rect = std::array<float, 4>;  // left, top, right, bottom

// intersection over union; 0 for empty rectangles
float overlap(const Rect& a, const Rect& b);

struct TruthFrame {
    std::string gesture;  // empty: no gesture in view
    Rect rect{};
    float angle = 0;
    std::string side;
};

struct Report {
    std::string gesture;
    Rect rect{};
};

// One line per frame in the host program's own form, {"frame":N,"gestures":[{"gesture":
// "fist","rect":[l,t,r,b],"angle":A,"side":"RIGHT"}]}, of which the first gesture counts,
// or flat, {"frame":N,"gesture":"fist","rect":...}. An empty list, a missing or null
// gesture, or "none" means no gesture in view. Frames come in order from 0; a line that
// can't be read throws std::runtime_error naming its number.
std::vector<TruthFrame> readTruth(std::istream& lines);

struct Summary {
    std::string gesture;
    int frames = 0;
    int presentFrames = 0;   // frames whose truth is the gesture
    int countedFrames = 0;   // of those, the ones after the warm-up of their appearance
    int detectedFrames = 0;  // of those, the ones with a matching report
    int falseReports = 0;    // reports of the gesture with no such hand under them
    int appearances = 0;
    int missedAppearances = 0;  // appearances never reported
    double meanFirstReport = 0;  // frames from appearance to first report, over reported appearances
    double meanOverlap = 0;      // over matched reports
    double medianMicros = 0, p95Micros = 0;

    double detectedShare() const { return countedFrames ? double(detectedFrames) / countedFrames : 0; }
    double falsePerThousand() const { return frames ? 1000.0 * falseReports / frames : 0; }
};

class Evaluator {
public:
    // warmUp: the frames after an appearance that aren't counted, the engine's minimum
    // detections less one; minOverlap: what a report needs to match its hand
    Evaluator(std::string gesture, int warmUp, float minOverlap = 0.3f);

    void add(const TruthFrame& truth, const std::vector<Report>& reports, double micros);
    Summary summary() const;

private:
    std::string gesture_;
    int warmUp_;
    float minOverlap_;
    Summary sums_;
    int sinceAppearance_ = -1;  // -1: the gesture isn't in view
    bool reportedThisAppearance_ = false;
    int reportedAppearances_ = 0;
    double firstReportSum_ = 0;
    double overlapSum_ = 0;
    int matched_ = 0;
    std::vector<double> micros_;
};

void writeJson(std::ostream& out, const Summary& summary);
void writeTable(std::ostream& out, const std::vector<Summary>& summaries);

}  // namespace evaluation
