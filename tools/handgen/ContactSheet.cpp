#include "ContactSheet.h"

#include <algorithm>
#include <fstream>
#include <stdexcept>

#ifdef HANDGEN_WITH_OPENCV
#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace handgen {

namespace {

#ifdef HANDGEN_WITH_OPENCV
constexpr int kMargin = 74;
#else
constexpr int kMargin = 0;
#endif

bool endsWith(const std::string& text, const std::string& end) {
    return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

}  // namespace

std::vector<std::uint8_t> makeSheet(const SheetSetup& setup, int& width, int& height) {
    std::vector<Gesture> rows = setup.rows;
    if (rows.empty())
        for (int g = 0; g < kGestureCount; ++g) rows.push_back(static_cast<Gesture>(g));
    const int cell = setup.cell, gap = 2;
    width = kMargin + setup.columns * (cell + gap) + gap;
    height = static_cast<int>(rows.size()) * (cell + gap) + gap;
    std::vector<std::uint8_t> sheet(static_cast<size_t>(width) * height * 3, 40);

    SampleSet set;
    set.variation = setup.variation;
    set.seed = setup.seed;
    if (setup.mono) {
        set.window = setup.window;
    } else {
        set.window.width = set.window.height = cell;
        set.window.objectX = set.window.objectY = cell * 0.1f;
        set.window.objectWidth = set.window.objectHeight = cell * 0.8f;
        set.supersample = 3;
    }
    const int w = set.window.width, h = set.window.height;
    const int zoom = std::max(1, std::min(cell / w, cell / h));
    Canvas canvas;
    std::vector<std::uint8_t> pixels(static_cast<size_t>(w) * h * 3), mono(static_cast<size_t>(w) * h);
    for (size_t r = 0; r < rows.size(); ++r) {
        set.gesture = rows[r];
        for (int c = 0; c < setup.columns; ++c) {
            renderSample(set, static_cast<std::uint64_t>(c), canvas);
            toRgb8(canvas, pixels);
            toMono(canvas, mono.data());
            const int x0 = kMargin + gap + c * (cell + gap), y0 = gap + static_cast<int>(r) * (cell + gap);
            for (int y = 0; y < std::min(cell, h * zoom); ++y)
                for (int x = 0; x < std::min(cell, w * zoom); ++x) {
                    const size_t from = static_cast<size_t>(y / zoom) * w + x / zoom;
                    std::uint8_t* to = sheet.data() + (static_cast<size_t>(y0 + y) * width + x0 + x) * 3;
                    for (int k = 0; k < 3; ++k) to[k] = setup.mono ? mono[from] : pixels[3 * from + k];
                }
        }
    }
#ifdef HANDGEN_WITH_OPENCV
    cv::Mat image(height, width, CV_8UC3, sheet.data());
    for (size_t r = 0; r < rows.size(); ++r)
        cv::putText(image, gestureName(rows[r]), cv::Point(4, static_cast<int>(r) * (cell + gap) + cell / 2 + 6),
                    cv::FONT_HERSHEY_SIMPLEX, 0.5, cv::Scalar(235, 235, 235), 1, cv::LINE_AA);
#endif
    return sheet;
}

void writeImage(const std::string& path, const std::vector<std::uint8_t>& rgb, int width, int height) {
    if (endsWith(path, ".ppm")) {
        std::ofstream out(path, std::ios::binary);
        out << "P6\n" << width << ' ' << height << "\n255\n";
        out.write(reinterpret_cast<const char*>(rgb.data()), static_cast<std::streamsize>(rgb.size()));
        if (!out) throw std::runtime_error("cannot write " + path);
        return;
    }
    if (!endsWith(path, ".png")) throw std::runtime_error("images are written as .png or .ppm, not " + path);
#ifdef HANDGEN_WITH_OPENCV
    cv::Mat image(height, width, CV_8UC3, const_cast<std::uint8_t*>(rgb.data())), bgr;
    cv::cvtColor(image, bgr, cv::COLOR_RGB2BGR);
    if (!cv::imwrite(path, bgr, {cv::IMWRITE_PNG_COMPRESSION, 9})) throw std::runtime_error("cannot write " + path);
#else
    throw std::runtime_error("this handgen was built without OpenCV: write a .ppm instead of " + path);
#endif
}

}  // namespace handgen
