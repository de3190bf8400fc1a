// tactus_run: drives libTactusEngine through its exported C functions only, as a
// camera application would, and prints one JSON line per frame.
//
//   tactus_run --sample 30                       a generated 1280x720 clip
//   tactus_run --nv21 clip.nv21 --width 1280 --height 720
//   tactus_run --y4m clip.y4m
// Options: --mode NAME, --nn-path DIR, --orientation DEGREES, --flip, --frames N.

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>
#include <vector>

#include "VI_Tactus_Interface.h"

namespace {

struct Options {
    std::string nv21Path, y4mPath;
    int sampleFrames = 0;
    int width = 0, height = 0;
    std::string mode = "fist";
    std::string nnPath;
    std::string orientation = "0";
    bool flip = false;
    int maxFrames = -1;
};

[[noreturn]] void usage(const char* message) {
    std::fprintf(stderr,
                 "%s\nusage: tactus_run (--sample N | --nv21 FILE --width W --height H | --y4m FILE)\n"
                 "                  [--mode NAME] [--nn-path DIR] [--orientation DEGREES] [--flip] [--frames N]\n",
                 message);
    std::exit(2);
}

int toInt(const char* text, const char* option) {
    char* end = nullptr;
    const long value = std::strtol(text, &end, 10);
    if (!*text || *end || value < 0 || value > 1 << 20) usage((std::string("bad number for ") + option).c_str());
    return static_cast<int>(value);
}

Options parse(int argc, char** argv) {
    Options options;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        auto next = [&]() -> const char* {
            if (i + 1 >= argc) usage(("missing value after " + arg).c_str());
            return argv[++i];
        };
        if (arg == "--sample") options.sampleFrames = toInt(next(), "--sample");
        else if (arg == "--nv21") options.nv21Path = next();
        else if (arg == "--y4m") options.y4mPath = next();
        else if (arg == "--width") options.width = toInt(next(), "--width");
        else if (arg == "--height") options.height = toInt(next(), "--height");
        else if (arg == "--mode") options.mode = next();
        else if (arg == "--nn-path") options.nnPath = next();
        else if (arg == "--orientation") options.orientation = next();
        else if (arg == "--flip") options.flip = true;
        else if (arg == "--frames") options.maxFrames = toInt(next(), "--frames");
        else usage(("unknown option " + arg).c_str());
    }
    const int sources = !options.nv21Path.empty() + !options.y4mPath.empty() + (options.sampleFrames > 0);
    if (sources != 1) usage("give exactly one clip");
    if (!options.nv21Path.empty() && (options.width < 2 || options.height < 2 || options.width % 2 || options.height % 2))
        usage("--nv21 needs an even --width and --height");
    return options;
}

// A source of NV21 frames: luma rows, then rows of V, U pairs.
class Clip {
public:
    virtual ~Clip() = default;
    virtual bool next(std::vector<unsigned char>& frame) = 0;
    int width = 0, height = 0;
};

class RawClip : public Clip {
public:
    RawClip(const std::string& path, int w, int h) : file_(path, std::ios::binary) {
        if (!file_) usage(("cannot open " + path).c_str());
        width = w;
        height = h;
    }
    bool next(std::vector<unsigned char>& frame) override {
        frame.resize(static_cast<size_t>(width) * height * 3 / 2);
        return static_cast<bool>(file_.read(reinterpret_cast<char*>(frame.data()), frame.size()));
    }

private:
    std::ifstream file_;
};

// YUV4MPEG2 with 4:2:0 planes; the chroma planes are interleaved into V, U pairs.
class Y4mClip : public Clip {
public:
    explicit Y4mClip(const std::string& path) : file_(path, std::ios::binary) {
        if (!file_) usage(("cannot open " + path).c_str());
        std::string header;
        std::getline(file_, header);
        if (header.compare(0, 10, "YUV4MPEG2 ") != 0) usage("not a YUV4MPEG2 file");
        std::istringstream fields(header.substr(10));
        std::string field;
        while (fields >> field) {
            if (field[0] == 'W') width = std::atoi(field.c_str() + 1);
            if (field[0] == 'H') height = std::atoi(field.c_str() + 1);
            if (field[0] == 'C' && field.compare(0, 4, "C420") != 0) usage("only 4:2:0 Y4M clips are read");
        }
        if (width < 2 || height < 2 || width % 2 || height % 2 || width > 8192 || height > 8192)
            usage("unsupported Y4M frame size");
    }
    bool next(std::vector<unsigned char>& frame) override {
        std::string marker;
        if (!std::getline(file_, marker) || marker.compare(0, 5, "FRAME") != 0) return false;
        const size_t luma = static_cast<size_t>(width) * height, quarter = luma / 4;
        planes_.resize(luma + 2 * quarter);
        if (!file_.read(reinterpret_cast<char*>(planes_.data()), planes_.size())) return false;
        frame.resize(luma + 2 * quarter);
        std::memcpy(frame.data(), planes_.data(), luma);
        const unsigned char* u = planes_.data() + luma;
        const unsigned char* v = u + quarter;
        for (size_t i = 0; i < quarter; ++i) {
            frame[luma + 2 * i] = v[i];
            frame[luma + 2 * i + 1] = u[i];
        }
        return true;
    }

private:
    std::ifstream file_;
    std::vector<unsigned char> planes_;
};

// A generated clip: a skin-toned disc drifting over a graded background.
class SampleClip : public Clip {
public:
    explicit SampleClip(int frames) : frames_(frames) {
        width = 1280;
        height = 720;
    }
    bool next(std::vector<unsigned char>& frame) override {
        if (index_ >= frames_) return false;
        frame.resize(static_cast<size_t>(width) * height * 3 / 2);
        const float cx = width * (0.25f + 0.5f * index_ / std::max(1, frames_ - 1));
        const float cy = height * (0.5f + 0.2f * std::sin(index_ * 0.3f));
        const float radius = height * 0.15f;
        for (int y = 0; y < height; ++y)
            for (int x = 0; x < width; ++x) {
                const float dx = x - cx, dy = y - cy;
                const bool inside = dx * dx + dy * dy < radius * radius;
                frame[static_cast<size_t>(y) * width + x] =
                    static_cast<unsigned char>(inside ? 170 : 40 + (x + y) * 100 / (width + height));
            }
        unsigned char* chroma = frame.data() + static_cast<size_t>(width) * height;
        for (int y = 0; y < height / 2; ++y)
            for (int x = 0; x < width / 2; ++x) {
                const float dx = 2 * x - cx, dy = 2 * y - cy;
                const bool inside = dx * dx + dy * dy < radius * radius;
                chroma[y * width + 2 * x] = inside ? 150 : 128;     // V
                chroma[y * width + 2 * x + 1] = inside ? 110 : 128;  // U
            }
        ++index_;
        return true;
    }

private:
    int frames_;
    int index_ = 0;
};

std::string jsonString(const char* text) {
    std::string out = "\"";
    for (const char* p = text; *p; ++p) {
        const unsigned char c = static_cast<unsigned char>(*p);
        if (c == '"' || c == '\\') {
            out += '\\';
            out += *p;
        } else if (c < 0x20) {
            char escaped[8];
            std::snprintf(escaped, sizeof(escaped), "\\u%04x", c);
            out += escaped;
        } else {
            out += *p;
        }
    }
    return out + "\"";
}

// Everything the engine reports for the last frame, read by index until a Get says 0.
std::string describeResult(int frameIndex) {
    std::ostringstream line;
    line << "{\"frame\":" << frameIndex << ",\"gestures\":[";
    const char* gesture = nullptr;
    for (int i = 0; VI_Tactus_GetGesture(gesture, i); ++i) {
        if (i) line << ",";
        line << "{\"gesture\":" << jsonString(gesture);
        float l, t, r, b;
        if (VI_Tactus_GetRect(l, t, r, b, i)) line << ",\"rect\":[" << l << "," << t << "," << r << "," << b << "]";
        float angle;
        if (VI_Tactus_GetFloat(angle, i)) line << ",\"angle\":" << angle;
        float x, y;
        if (VI_Tactus_GetPoint(x, y, i)) line << ",\"point\":[" << x << "," << y << "]";
        const char* keys = nullptr;
        if (VI_Tactus_GetParameter("key-ring", keys, i) && keys) {
            line << ",\"parameters\":{";
            std::istringstream names(keys);
            std::string key;
            bool first = true;
            while (names >> key) {
                const char* value = nullptr;
                VI_Tactus_GetParameter(key.c_str(), value, i);
                line << (first ? "" : ",") << jsonString(key.c_str()) << ":" << jsonString(value ? value : "");
                first = false;
            }
            line << "}";
        }
        line << "}";
    }
    line << "]}";
    return line.str();
}

}  // namespace

int main(int argc, char** argv) {
    const Options options = parse(argc, argv);
    Clip* clip = nullptr;
    if (options.sampleFrames > 0) clip = new SampleClip(options.sampleFrames);
    else if (!options.y4mPath.empty()) clip = new Y4mClip(options.y4mPath);
    else clip = new RawClip(options.nv21Path, options.width, options.height);

    VI_Tactus_SetParameter("mode", options.mode.c_str());
    if (!options.nnPath.empty()) VI_Tactus_SetParameter("nn-path", options.nnPath.c_str());
    VI_Tactus_SetParameter("is-flip", options.flip ? "true" : "false");
    VI_Tactus_Init();

    std::vector<unsigned char> frame;
    int index = 0;
    int failures = 0;
    while ((options.maxFrames < 0 || index < options.maxFrames) && clip->next(frame)) {
        try {
            // the engine takes the whole buffer: luma rows plus half as many chroma rows
            VI_Tactus_SetFrame(frame.data(), clip->width, clip->height * 3 / 2, 0);
            VI_Tactus_SetFrameParameter("orientation", options.orientation.c_str());
            VI_Tactus_ProcessFrame();
            std::cout << describeResult(index) << "\n";
        } catch (const char* what) {
            // a failed check that reached the host: the next frame tries again
            ++failures;
            std::cout << "{\"frame\":" << index << ",\"error\":" << jsonString(what) << "}\n";
        }
        ++index;
    }
    delete clip;
    VI_Tactus_Release();
    std::cerr << "tactus_run: " << index << " frames, " << failures << " failed\n";
    return failures == index && index > 0 ? 1 : 0;
}
