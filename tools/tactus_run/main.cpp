// tactus_run: drives libTactusEngine through its exported C functions only, as a
// camera application would, and prints one JSON line per frame.
//
//   tactus_run --sample 30                       a generated 1280x720 clip
//   tactus_run --nv21 clip.nv21 --width 1280 --height 720
//   tactus_run --y4m clip.y4m
//   tactus_run --images DIR                      the folder's images in name order
//   tactus_run --video clip.mp4                  any video FFmpeg decodes
// Options: --mode NAME, --nn-path DIR, --orientation DEGREES, --accel X,Y,Z, --flip,
// --is-flip true|false, --frames N.
// Exit codes: 0 done, 1 every frame failed in the engine, 2 bad options or unreadable clip.

#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "VI_Tactus_Interface.h"
#include "clips.h"
#include "frame_json.h"

namespace {

struct Options {
    std::string nv21Path, y4mPath, imagesPath, videoPath;
    int sampleFrames = 0;
    int width = 0, height = 0;
    std::string mode = "fist";
    std::string nnPath;
    std::string orientation = "0";
    std::vector<std::string> accel;  // x, y, z as given; replaces the orientation when set
    std::string isFlip;  // empty: the engine's default, a front camera
    bool flip = false;
    int maxFrames = -1;
};

[[noreturn]] void usage(const std::string& message) {
    std::fprintf(stderr,
                 "%s\nusage: tactus_run (--sample N | --nv21 FILE --width W --height H | --y4m FILE |\n"
                 "                   --images DIR | --video FILE)\n"
                 "                  [--mode NAME] [--nn-path DIR] [--orientation DEGREES | --accel X,Y,Z]\n"
                 "                  [--flip | --is-flip true|false] [--frames N]\n",
                 message.c_str());
    std::exit(2);
}

int toInt(const char* text, const char* option) {
    char* end = nullptr;
    const long value = std::strtol(text, &end, 10);
    if (!*text || *end || value < 0 || value > 1 << 20) usage(std::string("bad number for ") + option);
    return static_cast<int>(value);
}

std::vector<std::string> toAccel(const std::string& text) {
    std::vector<std::string> values;
    std::istringstream fields(text);
    std::string field;
    while (std::getline(fields, field, ',')) {
        char* end = nullptr;
        std::strtod(field.c_str(), &end);
        if (field.empty() || *end) usage("bad number '" + field + "' in --accel");
        values.push_back(field);
    }
    if (values.size() != 3 || text.back() == ',') usage("--accel takes three numbers: X,Y,Z");
    return values;
}

Options parse(int argc, char** argv) {
    Options options;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        auto next = [&]() -> const char* {
            if (i + 1 >= argc) usage("missing value after " + arg);
            return argv[++i];
        };
        if (arg == "--sample") options.sampleFrames = toInt(next(), "--sample");
        else if (arg == "--nv21") options.nv21Path = next();
        else if (arg == "--y4m") options.y4mPath = next();
        else if (arg == "--images") options.imagesPath = next();
        else if (arg == "--video") options.videoPath = next();
        else if (arg == "--width") options.width = toInt(next(), "--width");
        else if (arg == "--height") options.height = toInt(next(), "--height");
        else if (arg == "--mode") options.mode = next();
        else if (arg == "--nn-path") options.nnPath = next();
        else if (arg == "--orientation") options.orientation = next();
        else if (arg == "--accel") options.accel = toAccel(next());
        else if (arg == "--flip") options.flip = true;
        else if (arg == "--is-flip") {
            options.isFlip = next();
            if (options.isFlip != "true" && options.isFlip != "false") usage("--is-flip takes true or false");
        } else if (arg == "--frames") options.maxFrames = toInt(next(), "--frames");
        else usage("unknown option " + arg);
    }
    const int sources = !options.nv21Path.empty() + !options.y4mPath.empty() + !options.imagesPath.empty() +
                        !options.videoPath.empty() + (options.sampleFrames > 0);
    if (sources != 1) usage("give exactly one clip");
    if (!options.nv21Path.empty() && (options.width < 2 || options.height < 2 || options.width % 2 || options.height % 2))
        usage("--nv21 needs an even --width and --height");
    return options;
}

std::unique_ptr<Clip> openClip(const Options& options) {
    if (options.sampleFrames > 0) return std::make_unique<SampleClip>(options.sampleFrames);
    if (!options.y4mPath.empty()) return std::make_unique<Y4mClip>(options.y4mPath);
    if (!options.imagesPath.empty()) return openImageFolder(options.imagesPath);
    if (!options.videoPath.empty()) return openVideo(options.videoPath);
    return std::make_unique<RawClip>(options.nv21Path, options.width, options.height);
}

std::string parameter(const char* name, int i) {
    const char* value = nullptr;
    return VI_Tactus_GetParameter(name, value, i) && value ? value : "";
}

// Everything the engine reports for the last frame, read by index until a Get says 0.
std::vector<GestureResult> readResults() {
    std::vector<GestureResult> results;
    const char* gesture = nullptr;
    for (int i = 0; VI_Tactus_GetGesture(gesture, i); ++i) {
        GestureResult result;
        result.gesture = gesture ? gesture : "";
        float l, t, r, b;
        if (VI_Tactus_GetRect(l, t, r, b, i)) result.rect = {l, t, r, b};
        float angle;
        if (VI_Tactus_GetFloat(angle, i)) result.angle = angle;
        float x, y, z;
        if (VI_Tactus_GetPoint(x, y, i)) result.point = {x, y};
        if (VI_Tactus_GetPoint3d(x, y, z, i)) result.point3d = {x, y, z};
        const std::string keyRing = parameter("key-ring", i);
        result.parameters = {{"text", parameter("text", i)}, {"side", parameter("side", i)}, {"key-ring", keyRing}};
        std::istringstream keys(keyRing);
        std::string key;
        while (keys >> key)
            if (key != "text" && key != "side" && key != "key-ring")
                result.parameters.emplace_back(key, parameter(key.c_str(), i));
        results.push_back(std::move(result));
    }
    return results;
}

}  // namespace

int main(int argc, char** argv) {
    const Options options = parse(argc, argv);
    std::unique_ptr<Clip> clip;
    try {
        clip = openClip(options);
    } catch (const std::exception& error) {
        std::cerr << "tactus_run: " << error.what() << "\n";
        return 2;
    }

    VI_Tactus_SetParameter("mode", options.mode.c_str());
    if (!options.nnPath.empty()) VI_Tactus_SetParameter("nn-path", options.nnPath.c_str());
    if (!options.isFlip.empty()) VI_Tactus_SetParameter("is-flip", options.isFlip.c_str());
    // the frame driver's own mirror, after the engine's
    if (options.flip) VI_Tactus_SetParameter("flip", "true");
    VI_Tactus_Init();

    std::vector<unsigned char> frame;
    int index = 0;
    int failures = 0;
    int status = 0;
    for (; options.maxFrames < 0 || index < options.maxFrames; ++index) {
        try {
            if (!clip->next(frame)) break;
        } catch (const std::exception& error) {
            // a clip that goes bad part-way: what came before has been printed
            std::cerr << "tactus_run: " << error.what() << "\n";
            status = 2;
            break;
        }
        try {
            // the engine takes the whole buffer: luma rows plus half as many chroma rows
            VI_Tactus_SetFrame(frame.data(), clip->width, clip->height * 3 / 2, 0);
            if (options.accel.empty()) {
                VI_Tactus_SetFrameParameter("orientation", options.orientation.c_str());
            } else {
                VI_Tactus_SetFrameParameter("accelx", options.accel[0].c_str());
                VI_Tactus_SetFrameParameter("accely", options.accel[1].c_str());
                VI_Tactus_SetFrameParameter("accelz", options.accel[2].c_str());
            }
            VI_Tactus_ProcessFrame();
            std::cout << frameJson(index, readResults()) << "\n";
        } catch (const char* what) {
            // a failed check that reached the host: the next frame tries again
            ++failures;
            std::cout << frameErrorJson(index, what ? what : "") << "\n";
        }
    }
    clip.reset();
    VI_Tactus_Release();
    std::cerr << "tactus_run: " << index << " frames, " << failures << " failed\n";
    if (status) return status;
    return failures == index && index > 0 ? 1 : 0;
}
