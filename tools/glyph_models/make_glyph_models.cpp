// make_glyph_models DIR [--orientation DEGREES] [--back-camera] [--frames N] [--permissive]
//
// Writes the glyph stand-in models into DIR and DIR/sample.y4m, a 1280x720 clip in which
// the F glyph enters, crosses the frame and leaves, drawn upright for the device's
// orientation as the engine turns it, with DIR/sample.jsonl: per frame, in the host
// program's form, the "fist" and the camera box of its window, or an empty list. Until trained tables land this is what the sample
// run detects, as mode "fist".

#include <sys/stat.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>

#include "GlyphModels.h"

namespace {

// the engine's quarter turns for an orientation: a front camera held upright turns a
// quarter, a back camera the other way
int turnsOf(int orientation, bool frontCamera) {
    static const int front[4] = {1, 2, 3, 0};
    const int t = front[((orientation / 90) % 4 + 4) % 4];
    return frontCamera ? t : (4 - t) % 4;
}

void writeY4m(const std::string& path, const std::string& truthPath, int turns, int frames) {
    using glyphModels::kCameraHeight;
    using glyphModels::kCameraWidth;
    std::ofstream out(path, std::ios::binary);
    std::ofstream truth(truthPath);
    out << "YUV4MPEG2 W" << kCameraWidth << " H" << kCameraHeight << " F30:1 Ip A1:1 C420jpeg\n";
    const int luma = kCameraWidth * kCameraHeight, chroma = luma / 4;
    std::string u(chroma, '\0'), v(chroma, '\0');
    // the upright half-size image is 360 wide in portrait and 640 in landscape
    const float across = turns % 2 ? 360 : 640, down = turns % 2 ? 640 : 360;
    for (int n = 0; n < frames; ++n) {
        glyphModels::Frame frame(turns);
        const int enter = frames / 8, leave = frames - frames / 8;
        truth << "{\"frame\":" << n << ",\"gestures\":[";
        if (n >= enter && n < leave) {
            const float t = static_cast<float>(n - enter) / (leave - enter);
            const float left = 0.15f * across + t * 0.35f * across, top = 0.3f * down + t * 0.2f * down;
            const float size = 2.f * glyphs::kWindow;
            frame.draw(glyphs::kF, left, top, 2.f);
            const LQ::BaseRect<float> box = frame.cameraBox(LQ::BaseRect<float>(left, top, left + size, top + size));
            truth << "{\"gesture\":\"fist\",\"rect\":[" << box.left << "," << box.top << "," << box.right << ","
                  << box.bottom << "],\"angle\":0,\"side\":\"RIGHT\"}";
        }
        truth << "]}\n";
        const std::vector<unsigned char>& nv21 = frame.nv21();
        for (int i = 0; i < chroma; ++i) {
            v[i] = static_cast<char>(nv21[luma + 2 * i]);
            u[i] = static_cast<char>(nv21[luma + 2 * i + 1]);
        }
        out << "FRAME\n";
        out.write(reinterpret_cast<const char*>(nv21.data()), luma);
        out << u << v;
    }
    if (!out || !truth) throw std::runtime_error("cannot write " + path + " or " + truthPath);
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 2) {
        std::cerr << "usage: make_glyph_models DIR [--orientation DEGREES] [--back-camera] [--frames N] [--permissive]\n";
        return 2;
    }
    const std::string directory = argv[1];
    int orientation = 0, frames = 48;
    bool front = true, permissive = false;
    for (int i = 2; i < argc; ++i) {
        const std::string arg = argv[i];
        if (arg == "--orientation" && i + 1 < argc) orientation = std::atoi(argv[++i]);
        else if (arg == "--back-camera") front = false;
        else if (arg == "--frames" && i + 1 < argc) frames = std::max(1, std::atoi(argv[++i]));
        else if (arg == "--permissive") permissive = true;
        else {
            std::cerr << "make_glyph_models: unknown option " << arg << "\n";
            return 2;
        }
    }
    for (size_t i = 1; i <= directory.size(); ++i)
        if (i == directory.size() || directory[i] == '/') mkdir(directory.substr(0, i).c_str(), 0777);
    try {
        glyphModels::write(directory, permissive ? glyphModels::permissiveAnswers() : glyphModels::Answers());
        writeY4m(directory + "/sample.y4m", directory + "/sample.jsonl", turnsOf(orientation, front), frames);
    } catch (const std::exception& error) {
        std::cerr << "make_glyph_models: " << error.what() << "\n";
        return 2;
    }
    return 0;
}
