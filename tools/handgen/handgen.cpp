// handgen: synthetic hands for training and evaluating the gesture engine.
//
//   handgen samples   --gesture G [--count N] [--window WxH] [--object X,Y,W,H] [--angle A]
//                     [--seed S] [--first I] [--threads T] (--out FILE.crops | --pgm DIR) [--labels FILE]
//   handgen negatives (the same; G is the gesture they are negatives for)
//                     [--other-share P] [--misplaced-share P]
//   handgen clip      [--seed S] [--frames N] [--size WxH] [--fps F] [--gestures a,b] [--hand-size LO,HI]
//                     [--threads T] --out FILE.y4m|FILE.nv21 [--truth FILE.jsonl]
//   handgen sheet     --out FILE.png|FILE.ppm [--columns N] [--cell PX] [--seed S] [--gestures a,b]
//                     [--mono --window WxH --object X,Y,W,H]
//   handgen params    the variation's settings, as --set reads them
//   handgen boxes     each gesture's reference box at the neutral build, millimetres
// Every command takes --set name=low,high (repeatable) to change the variation.

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <stdexcept>
#include <string>
#include <vector>

#include "ContactSheet.h"
#include "HandClip.h"
#include "HandSamples.h"

using namespace handgen;

namespace {

struct Arguments {
    std::string command;
    std::map<std::string, std::string> values;
    std::vector<std::string> settings;
    bool has(const std::string& name) const { return values.count(name) != 0; }
    std::string get(const std::string& name, const std::string& fallback = "") const {
        const auto it = values.find(name);
        return it == values.end() ? fallback : it->second;
    }
};

[[noreturn]] void fail(const std::string& message) { throw std::runtime_error(message); }

Arguments parse(int argc, char** argv) {
    Arguments args;
    if (argc < 2) fail("no command: samples, negatives, clip, sheet, params or boxes");
    args.command = argv[1];
    for (int i = 2; i < argc; ++i) {
        const std::string name = argv[i];
        if (name.compare(0, 2, "--") != 0) fail("unexpected argument \"" + name + "\"");
        if (name == "--mono") {
            args.values["mono"] = "1";
            continue;
        }
        if (i + 1 >= argc) fail(name + " needs a value");
        if (name == "--set")
            args.settings.push_back(argv[++i]);
        else
            args.values[name.substr(2)] = argv[++i];
    }
    return args;
}

long long integer(const Arguments& args, const std::string& name, long long fallback, long long low, long long high) {
    if (!args.has(name)) return fallback;
    const std::string text = args.get(name);
    char* end = nullptr;
    const long long value = std::strtoll(text.c_str(), &end, 10);
    if (text.empty() || *end || value < low || value > high)
        fail("--" + name + " takes a whole number from " + std::to_string(low) + " to " + std::to_string(high));
    return value;
}

std::vector<float> numbers(const std::string& text, char separator, const std::string& what) {
    std::vector<float> out;
    size_t from = 0;
    while (from <= text.size()) {
        const size_t to = std::min(text.find(separator, from), text.size());
        const std::string part = text.substr(from, to - from);
        char* end = nullptr;
        const float value = std::strtof(part.c_str(), &end);
        if (part.empty() || *end) fail("bad " + what + ": \"" + text + "\"");
        out.push_back(value);
        from = to + 1;
    }
    return out;
}

void size(const std::string& text, int& width, int& height, const std::string& what) {
    const std::vector<float> wh = numbers(text, 'x', what);
    if (wh.size() != 2 || wh[0] < 2 || wh[1] < 2 || wh[0] > 8192 || wh[1] > 8192 || wh[0] != static_cast<int>(wh[0]) ||
        wh[1] != static_cast<int>(wh[1]))
        fail("bad " + what + ": \"" + text + "\" (WxH)");
    width = static_cast<int>(wh[0]);
    height = static_cast<int>(wh[1]);
}

Variation variation(const Arguments& args) {
    Variation v;
    for (const std::string& setting : args.settings) {
        std::string error;
        if (!setVariation(v, setting, error)) fail(error);
    }
    return v;
}

std::vector<Gesture> gestures(const std::string& text) {
    std::vector<Gesture> out;
    if (text.empty()) return out;
    size_t from = 0;
    while (from <= text.size()) {
        const size_t to = std::min(text.find(',', from), text.size());
        const auto g = gestureFromName(text.substr(from, to - from));
        if (!g) fail("unknown gesture \"" + text.substr(from, to - from) + "\" (fist, thumbUp, victory, pointer, palm, heart)");
        out.push_back(*g);
        from = to + 1;
    }
    return out;
}

SampleWindow window(const Arguments& args) {
    SampleWindow w;
    size(args.get("window", "24x24"), w.width, w.height, "--window");
    // by default the object fills the window less an eighth on every side
    w.objectX = w.width / 8.f;
    w.objectY = w.height / 8.f;
    w.objectWidth = w.width - 2 * w.objectX;
    w.objectHeight = w.height - 2 * w.objectY;
    if (args.has("object")) {
        const std::vector<float> r = numbers(args.get("object"), ',', "--object");
        if (r.size() != 4 || r[2] <= 0 || r[3] <= 0) fail("--object takes X,Y,W,H");
        w.objectX = r[0];
        w.objectY = r[1];
        w.objectWidth = r[2];
        w.objectHeight = r[3];
    }
    const std::vector<float> angle = numbers(args.get("angle", "0"), ',', "--angle");
    if (angle.size() != 1) fail("--angle takes one number of degrees");
    w.angle = angle[0];
    return w;
}

int samples(const Arguments& args, bool negatives) {
    SampleSet set;
    const auto g = gestures(args.get("gesture"));
    if (g.size() != 1) fail("--gesture takes one gesture");
    set.gesture = g[0];
    set.window = window(args);
    set.variation = variation(args);
    set.seed = static_cast<std::uint64_t>(integer(args, "seed", 1, 0, 1LL << 62));
    set.negatives = negatives;
    set.supersample = static_cast<int>(integer(args, "supersample", 4, 1, 8));
    if (args.has("other-share")) set.otherGestureShare = std::strtof(args.get("other-share").c_str(), nullptr);
    if (args.has("misplaced-share")) set.misplacedShare = std::strtof(args.get("misplaced-share").c_str(), nullptr);
    const int count = static_cast<int>(integer(args, "count", 1000, 1, 100000000));
    const auto first = static_cast<std::uint64_t>(integer(args, "first", 0, 0, 1LL << 40));
    const int threads = static_cast<int>(integer(args, "threads", 2, 1, 64));
    if (!args.has("out") && !args.has("pgm")) fail("--out FILE or --pgm DIR is needed");

    std::vector<SampleLabel> labels;
    const auto start = std::chrono::steady_clock::now();
    const std::vector<std::uint8_t> windows = generateSamples(set, first, count, threads, &labels);
    const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();

    const size_t bytes = static_cast<size_t>(set.window.width) * set.window.height;
    if (args.has("out")) writeCrops(args.get("out"), set.window.width, set.window.height, windows);
    if (args.has("pgm")) {
        const std::filesystem::path dir = args.get("pgm");
        std::filesystem::create_directories(dir);
        for (int i = 0; i < count; ++i) {
            char name[32];
            std::snprintf(name, sizeof(name), "%08llu.pgm", static_cast<unsigned long long>(first + i));
            writePgm((dir / name).string(), set.window.width, set.window.height, windows.data() + bytes * i);
        }
    }
    if (args.has("labels")) {
        std::ofstream out(args.get("labels"));
        for (int i = 0; i < count; ++i) out << labelJson(first + i, labels[i]) << '\n';
        if (!out) fail("cannot write " + args.get("labels"));
    }
    std::fprintf(stderr, "%d %s windows of %dx%d in %.2f s: %.0f per second on %d threads\n", count,
                 negatives ? "negative" : "positive", set.window.width, set.window.height, seconds, count / seconds,
                 threads);
    return 0;
}

int clip(const Arguments& args) {
    ClipSetup setup;
    size(args.get("size", "1280x720"), setup.width, setup.height, "--size");
    setup.frames = static_cast<int>(integer(args, "frames", 300, 1, 1000000));
    setup.fps = static_cast<int>(integer(args, "fps", 30, 1, 240));
    setup.seed = static_cast<std::uint64_t>(integer(args, "seed", 1, 0, 1LL << 62));
    setup.variation = variation(args);
    setup.gestures = gestures(args.get("gestures"));
    if (args.has("hand-size")) {
        const std::vector<float> r = numbers(args.get("hand-size"), ',', "--hand-size");
        if (r.size() != 2 || r[0] <= 0 || r[1] < r[0]) fail("--hand-size takes LOW,HIGH shares of the frame height");
        setup.handSize = {r[0], r[1]};
    }
    if (!args.has("out")) fail("--out FILE is needed");
    const int threads = static_cast<int>(integer(args, "threads", 2, 1, 64));
    const auto start = std::chrono::steady_clock::now();
    writeClip(setup, args.get("out"), args.get("truth"), threads);
    const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    std::fprintf(stderr, "%d frames of %dx%d in %.2f s: %.1f per second on %d threads\n", setup.frames, setup.width,
                 setup.height, seconds, setup.frames / seconds, threads);
    return 0;
}

int sheet(const Arguments& args) {
    SheetSetup setup;
    setup.rows = gestures(args.get("gestures"));
    setup.columns = static_cast<int>(integer(args, "columns", 10, 1, 100));
    setup.cell = static_cast<int>(integer(args, "cell", 96, 8, 1024));
    setup.seed = static_cast<std::uint64_t>(integer(args, "seed", 1, 0, 1LL << 62));
    setup.variation = variation(args);
    setup.mono = args.has("mono");
    setup.window = window(args);
    if (!args.has("out")) fail("--out FILE is needed");
    int width, height;
    const std::vector<std::uint8_t> rgb = makeSheet(setup, width, height);
    writeImage(args.get("out"), rgb, width, height);
    return 0;
}

int boxes() {
    std::printf("gesture   width  height  aspect(w/h)   millimetres, neutral build, right hand\n");
    for (int g = 0; g < kGestureCount; ++g) {
        const UprightHand hand = buildHand(gesturePose(static_cast<Gesture>(g)), HandBuild{}, HandSide::Right);
        const float w = hand.right - hand.left, h = hand.top - hand.bottom;
        std::printf("%-8s %6.1f %7.1f %8.2f\n", gestureName(static_cast<Gesture>(g)), w, h, w / h);
    }
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        const Arguments args = parse(argc, argv);
        if (args.command == "samples") return samples(args, false);
        if (args.command == "negatives") return samples(args, true);
        if (args.command == "clip") return clip(args);
        if (args.command == "sheet") return sheet(args);
        if (args.command == "params") {
            std::cout << describeVariation(variation(args));
            return 0;
        }
        if (args.command == "boxes") return boxes();
        fail("unknown command \"" + args.command + "\": samples, negatives, clip, sheet, params or boxes");
    } catch (const std::exception& error) {
        std::fprintf(stderr, "handgen: %s\n", error.what());
        return 2;
    }
}
