#include "Evaluation.h"

#include <algorithm>
#include <cstdlib>
#include <iomanip>
#include <stdexcept>

namespace evaluation {

float overlap(const Rect& a, const Rect& b) {
    const float w = std::min(a[2], b[2]) - std::max(a[0], b[0]);
    const float h = std::min(a[3], b[3]) - std::max(a[1], b[1]);
    const float areaA = (a[2] - a[0]) * (a[3] - a[1]), areaB = (b[2] - b[0]) * (b[3] - b[1]);
    if (w <= 0 || h <= 0 || areaA <= 0 || areaB <= 0) return 0;
    return w * h / (areaA + areaB - w * h);
}

namespace {

// the text after "key": in a flat JSON object, or npos
size_t valueAt(const std::string& line, const char* key) {
    const std::string quoted = std::string("\"") + key + "\"";
    size_t at = line.find(quoted);
    if (at == std::string::npos) return at;
    at = line.find(':', at + quoted.size());
    if (at == std::string::npos) return at;
    return line.find_first_not_of(" \t", at + 1);
}

std::string stringAt(const std::string& line, size_t at) {
    if (at == std::string::npos || line.compare(at, 4, "null") == 0) return "";
    if (line[at] != '"') throw std::runtime_error("a string was expected");
    const size_t end = line.find('"', at + 1);
    if (end == std::string::npos) throw std::runtime_error("an unterminated string");
    return line.substr(at + 1, end - at - 1);
}

float numberAt(const std::string& line, size_t at) {
    char* end = nullptr;
    const float value = std::strtof(line.c_str() + at, &end);
    if (end == line.c_str() + at) throw std::runtime_error("a number was expected");
    return value;
}

}  // namespace

std::vector<TruthFrame> readTruth(std::istream& lines) {
    std::vector<TruthFrame> frames;
    std::string line;
    for (int number = 1; std::getline(lines, line); ++number) {
        if (line.find_first_not_of(" \t\r") == std::string::npos) continue;
        try {
            const size_t frameAt = valueAt(line, "frame");
            if (frameAt == std::string::npos) throw std::runtime_error("no \"frame\"");
            if (static_cast<size_t>(numberAt(line, frameAt)) != frames.size())
                throw std::runtime_error("frames out of order");
            TruthFrame truth;
            truth.gesture = stringAt(line, valueAt(line, "gesture"));
            if (truth.gesture == "none") truth.gesture.clear();
            if (!truth.gesture.empty()) {
                size_t at = valueAt(line, "rect");
                if (at == std::string::npos || line[at] != '[') throw std::runtime_error("no \"rect\"");
                for (float& v : truth.rect) {
                    at = line.find_first_not_of(" [,", at);
                    v = numberAt(line, at);
                    at = line.find_first_of(",]", at);
                }
                const size_t angleAt = valueAt(line, "angle");
                if (angleAt != std::string::npos) truth.angle = numberAt(line, angleAt);
                truth.side = stringAt(line, valueAt(line, "side"));
            }
            frames.push_back(truth);
        } catch (const std::runtime_error& error) {
            throw std::runtime_error("truth line " + std::to_string(number) + ": " + error.what());
        }
    }
    return frames;
}

Evaluator::Evaluator(std::string gesture, int warmUp, float minOverlap)
    : gesture_(std::move(gesture)), warmUp_(warmUp), minOverlap_(minOverlap) {
    sums_.gesture = gesture_;
}

void Evaluator::add(const TruthFrame& truth, const std::vector<Report>& reports, double micros) {
    ++sums_.frames;
    micros_.push_back(micros);
    const bool present = truth.gesture == gesture_;
    if (!present) {
        sinceAppearance_ = -1;
    } else if (++sinceAppearance_ == 0) {
        ++sums_.appearances;
        reportedThisAppearance_ = false;
    }
    // the best report of the gesture matches the hand; every other report of it is false
    float best = 0;
    int ours = 0;
    for (const Report& report : reports) {
        if (report.gesture != gesture_) continue;
        ++ours;
        if (present) best = std::max(best, overlap(report.rect, truth.rect));
    }
    const bool matched = present && best >= minOverlap_;
    sums_.falseReports += ours - (matched ? 1 : 0);
    if (!present) return;
    ++sums_.presentFrames;
    if (matched) {
        overlapSum_ += best;
        ++matched_;
        if (!reportedThisAppearance_) {
            reportedThisAppearance_ = true;
            ++reportedAppearances_;
            firstReportSum_ += sinceAppearance_;
        }
    }
    if (sinceAppearance_ >= warmUp_) {
        ++sums_.countedFrames;
        if (matched) ++sums_.detectedFrames;
    }
}

Summary Evaluator::summary() const {
    Summary s = sums_;
    s.missedAppearances = s.appearances - reportedAppearances_;
    s.meanFirstReport = reportedAppearances_ ? firstReportSum_ / reportedAppearances_ : 0;
    s.meanOverlap = matched_ ? overlapSum_ / matched_ : 0;
    if (!micros_.empty()) {
        std::vector<double> sorted = micros_;
        std::sort(sorted.begin(), sorted.end());
        s.medianMicros = sorted[sorted.size() / 2];
        s.p95Micros = sorted[std::min(sorted.size() - 1, sorted.size() * 95 / 100)];
    }
    return s;
}

void writeJson(std::ostream& out, const Summary& s) {
    out << std::setprecision(6) << "{\"gesture\":\"" << s.gesture << "\",\"frames\":" << s.frames
        << ",\"present_frames\":" << s.presentFrames << ",\"counted_frames\":" << s.countedFrames
        << ",\"detected_frames\":" << s.detectedFrames << ",\"detected_share\":" << s.detectedShare()
        << ",\"false_reports\":" << s.falseReports << ",\"false_per_1000_frames\":" << s.falsePerThousand()
        << ",\"appearances\":" << s.appearances << ",\"missed_appearances\":" << s.missedAppearances
        << ",\"mean_frames_to_first_report\":" << s.meanFirstReport << ",\"mean_overlap\":" << s.meanOverlap
        << ",\"median_us\":" << s.medianMicros << ",\"p95_us\":" << s.p95Micros << "}\n";
}

void writeTable(std::ostream& out, const std::vector<Summary>& summaries) {
    out << "gesture    frames  detected  false/1000  first report  missed  overlap  median us  p95 us\n";
    for (const Summary& s : summaries) {
        out << std::left << std::setw(10) << s.gesture << std::right << std::setw(7) << s.frames << std::fixed
            << std::setprecision(1) << std::setw(9) << 100 * s.detectedShare() << "%" << std::setw(12)
            << s.falsePerThousand() << std::setw(14) << s.meanFirstReport << std::setw(8) << s.missedAppearances
            << std::setprecision(2) << std::setw(9) << s.meanOverlap << std::setprecision(0) << std::setw(11)
            << s.medianMicros << std::setw(8) << s.p95Micros << "\n";
        out.unsetf(std::ios::fixed);
    }
}

}  // namespace evaluation
