#include "LQ_ViInterface.h"

#include "LQ_Stream.h"

namespace LQ {

ViResult ViResultState::viResult;
std::vector<std::pair<std::string, Image>> DebugImages::debugImages_;

void ViResult::reset() {
    gestures.clear();
    floats.clear();
    rects.clear();
    points.clear();
    points3d.clear();
    parameters.clear();
    images.clear();
}

std::ostream& operator<<(std::ostream& stream, const ViResult& result) {
    StreamO out(stream);
    out << "ViResult(\n\tgestures=" << result.gestures << "\n\tfloats=" << result.floats << "\n\trects=" << result.rects
        << "\n\tpoints=" << result.points << "\n\tpoints3d=" << result.points3d << "\n\tparameters=" << result.parameters
        << "\n\timages=" << result.images << "\n)";
    return stream;
}

void ViResultState::print(std::ostream& stream) const { stream << "ViResultState(" << viResult << ")"; }

namespace {
template <class T>
void writeDotCell(std::ostream& stream, const T& value) {
    stream << value;
}

void writeDotCell(std::ostream& stream, const std::map<std::string, std::string>& values) {
    for (const auto& entry : values)
        stream << "<tr><td border=\"1\">" << entry.first << "</td>\n" << "<td border=\"1\">" << entry.second
               << "</td></tr>";
}

template <class T>
void writeDotField(std::ostream& stream, const char* name, const std::vector<T>& values) {
    if (values.empty()) return;
    stream << "  <tr><td border=\"1\">" << name << "</td><td border=\"1\">" << "<table border=\"0\" cellspacing=\"0\">";
    for (const T& value : values) {
        stream << "<tr><td border=\"1\">";
        writeDotCell(stream, value);
        stream << "</td></tr>";
    }
    stream << "</table>" << "</td></tr>\n";
}
}  // namespace

void ViResultState::saveToDot(std::ostream& stream, StateAggregator* owner) {
    const ViResult& r = viResult;
    stream << "<tr><td border=\"1\">ViResultState</td><td align=\"left\" border=\"1\">";
    if (r.gestures.empty() && r.floats.empty() && r.rects.empty() && r.points.empty() && r.points3d.empty() &&
        r.parameters.empty()) {
        stream << "</td></tr>\n";
        return;
    }
    stream << "<table border=\"0\" cellspacing=\"0\">\n";
    writeDotField(stream, "gestures", r.gestures);
    writeDotField(stream, "floats", r.floats);
    writeDotField(stream, "rects", r.rects);
    writeDotField(stream, "points", r.points);
    writeDotField(stream, "points3d", r.points3d);
    writeDotField(stream, "parameters", r.parameters);
    stream << "</table></td></tr>\n";
}

ColorMode ViInterface::parseImageName(const std::string& name) {
    // longer words stand before their prefixes
    static const std::pair<const char*, ColorMode> words[] = {
        {"mono16", COLOR_MODE_MONO16}, {"mono", COLOR_MODE_MONO},         {"bgr", COLOR_MODE_BGR},
        {"yuv", COLOR_MODE_YUV},       {"rgba", COLOR_MODE_RGBA},         {"rgb", COLOR_MODE_RGB},
        {"depth", COLOR_MODE_DEPTH},   {"gradient", COLOR_MODE_GRADIENT}, {"rmct", COLOR_MODE_RMCT},
        {"float2", COLOR_MODE_FLOAT2}, {"float", COLOR_MODE_FLOAT},       {"ushort2", COLOR_MODE_USHORT2},
        {"integral", COLOR_MODE_INTEGRAL}};
    for (const auto& word : words) {
        if (name.compare(0, std::char_traits<char>::length(word.first), word.first) == 0) return word.second;
    }
    LQ_FAIL("cannot parse color mode from " << name);
}

}  // namespace LQ
