// tactus_evaluate: runs the engine through its exported C functions over a clip with
// ground truth and scores each gesture asked for.
//
//   tactus_evaluate --y4m clip.y4m --truth clip.jsonl --modes fist,victory --nn-path DIR
//   tactus_evaluate --nv21 clip.nv21 --width W --height H --truth clip.jsonl ...
// Options: --orientation DEGREES (default 270: the frame is upright as it is) and
// --is-flip true|false (default false: no mirror), so that the engine's rectangles are in
// the clip's own coordinates. One JSON line per gesture on stdout, a table on stderr.

#include <chrono>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <map>
#include <memory>
#include <sstream>
#include <stdexcept>

#include "Evaluation.h"
#include "VI_Tactus_Interface.h"
#include "clips.h"

namespace {

struct Options {
    std::string y4m, nv21, truth, nnPath, orientation = "270", isFlip = "false";
    std::vector<std::string> modes;
    int width = 0, height = 0;
};

[[noreturn]] void usage(const std::string& message) {
    std::cerr << "tactus_evaluate: " << message
              << "\nusage: tactus_evaluate (--y4m FILE | --nv21 FILE --width W --height H) --truth FILE\n"
                 "                       --modes a,b --nn-path DIR [--orientation DEG] [--is-flip true|false]\n";
    std::exit(2);
}

Options parse(int argc, char** argv) {
    Options o;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        if (i + 1 >= argc) usage("missing value after " + arg);
        const std::string value = argv[++i];
        if (arg == "--y4m") o.y4m = value;
        else if (arg == "--nv21") o.nv21 = value;
        else if (arg == "--width") o.width = std::atoi(value.c_str());
        else if (arg == "--height") o.height = std::atoi(value.c_str());
        else if (arg == "--truth") o.truth = value;
        else if (arg == "--nn-path") o.nnPath = value;
        else if (arg == "--orientation") o.orientation = value;
        else if (arg == "--is-flip") o.isFlip = value;
        else if (arg == "--modes") {
            std::stringstream list(value);
            for (std::string mode; std::getline(list, mode, ',');)
                if (!mode.empty()) o.modes.push_back(mode);
        } else usage("unknown option " + arg);
    }
    if (o.y4m.empty() == o.nv21.empty()) usage("give one clip");
    if (o.truth.empty() || o.modes.empty()) usage("--truth and --modes are needed");
    return o;
}

// the frames after an appearance before a gesture can be reported: its minimum
// detections less one
int warmUpOf(const std::string& mode) {
    static const std::map<std::string, int> warmUps = {{"fist", 2}, {"thumbUp", 1}, {"victory", 1}, {"pointer", 1},
                                                       {"heart", 3}};
    const auto it = warmUps.find(mode);
    return it == warmUps.end() ? 0 : it->second;
}

std::vector<evaluation::Report> reports() {
    std::vector<evaluation::Report> out;
    const char* gesture = nullptr;
    for (int i = 0; VI_Tactus_GetGesture(gesture, i); ++i) {
        evaluation::Report r;
        r.gesture = gesture;
        VI_Tactus_GetRect(r.rect[0], r.rect[1], r.rect[2], r.rect[3], i);
        out.push_back(r);
    }
    return out;
}

evaluation::Summary evaluate(const Options& o, const std::string& mode, const std::vector<evaluation::TruthFrame>& truth) {
    std::unique_ptr<Clip> clip;
    if (!o.y4m.empty()) clip.reset(new Y4mClip(o.y4m));
    else clip.reset(new RawClip(o.nv21, o.width, o.height));
    VI_Tactus_SetParameter("mode", mode.c_str());
    if (!o.nnPath.empty()) VI_Tactus_SetParameter("nn-path", o.nnPath.c_str());
    VI_Tactus_SetParameter("is-flip", o.isFlip.c_str());
    VI_Tactus_Init();
    VI_Tactus_Reset();
    evaluation::Evaluator evaluator(mode, warmUpOf(mode));
    std::vector<unsigned char> frame;
    for (size_t n = 0; clip->next(frame); ++n) {
        if (n >= truth.size()) throw std::runtime_error("the clip has more frames than its truth");
        const auto start = std::chrono::steady_clock::now();
        VI_Tactus_SetFrame(frame.data(), clip->width, clip->height * 3 / 2, 0);
        VI_Tactus_SetFrameParameter("orientation", o.orientation.c_str());
        VI_Tactus_ProcessFrame();
        const double micros =
            std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - start).count();
        evaluator.add(truth[n], reports(), micros);
    }
    return evaluator.summary();
}

}  // namespace

int main(int argc, char** argv) {
    const Options o = parse(argc, argv);
    try {
        std::ifstream truthFile(o.truth);
        if (!truthFile) throw std::runtime_error("cannot open " + o.truth);
        const std::vector<evaluation::TruthFrame> truth = evaluation::readTruth(truthFile);
        std::vector<evaluation::Summary> summaries;
        for (const std::string& mode : o.modes) {
            summaries.push_back(evaluate(o, mode, truth));
            evaluation::writeJson(std::cout, summaries.back());
        }
        evaluation::writeTable(std::cerr, summaries);
    } catch (const std::runtime_error& error) {
        std::cerr << "tactus_evaluate: " << error.what() << "\n";
        return 2;
    } catch (const char* failed) {
        // a failed check in the engine's set-up reaches the host as this
        std::cerr << "tactus_evaluate: the engine failed: " << failed << "\n";
        return 1;
    }
    return 0;
}
