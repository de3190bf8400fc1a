// cascade_train: trains one ring of the engine from generated hands and writes it as a
// ".ring" file, as generated source and with its training log.
//
//   cascade_train --ring fist --out models/rings [--seed 1] [--positives 3000]
//       [--negatives 6000] [--stages 4] [--first 0] [--later 150] [--cascades 0,1,2] [--threads 2]
//       [--heldout-positives 1000] [--heldout-scenes 200] [--mining-rounds 40] [--smoothing 200]
//       [--set name=low,high ...]
//
// The first three stages keep the reference layout's sizes, the first replaced by --first
// where given; stages from the fourth on have --later weak classifiers each.

#include <chrono>
#include <cstdio>
#include <streambuf>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "HandRandom.h"
#include "RingTrainer.h"

namespace {

// writes to two buffers: the console as training goes, and the log kept with the ring
class TeeBuffer : public std::streambuf {
public:
    TeeBuffer(std::streambuf* a, std::streambuf* b) : a_(a), b_(b) {}

protected:
    int overflow(int c) override {
        if (c == EOF) return !EOF;
        const int ra = a_->sputc(static_cast<char>(c)), rb = b_->sputc(static_cast<char>(c));
        return ra == EOF || rb == EOF ? EOF : c;
    }
    int sync() override { return a_->pubsync() | b_->pubsync(); }

private:
    std::streambuf *a_, *b_;
};

[[noreturn]] void fail(const std::string& message) {
    std::cerr << "cascade_train: " << message << "\n";
    std::exit(2);
}

std::vector<int> numbers(const std::string& text) {
    std::vector<int> out;
    std::stringstream in(text);
    std::string part;
    while (std::getline(in, part, ',')) out.push_back(std::atoi(part.c_str()));
    return out;
}

// held-out hands: other ranges of pose, light and camera than training's
handgen::Variation heldOutVariation(const handgen::Variation& base) {
    handgen::Variation v = base;
    for (const char* setting : {"rotation=-15,15", "scale=0.9,1.1", "shift=-0.07,0.07", "noise=2,8",
                                "blur=0,1", "exposure=0.7,1.3", "yaw=-25,25"}) {
        std::string error;
        if (!handgen::setVariation(v, setting, error)) fail(error);
    }
    return v;
}

// The library has no pattern scanner yet, so the unit that is compiled in keeps the ring's
// builder as ClassifierRing::saveHeader writes it, with the headers that builder needs, and
// leaves out the two scanner functions behind it.
std::string libraryUnit(const std::string& generated) {
    const std::string include = "#include \"ClassifierMap.h\"\n";
    const size_t at = generated.find(include);
    const size_t scanners = generated.find("\nLQ::SharedPtr<BaseDetector> ");
    if (at == std::string::npos || scanners == std::string::npos) fail("unexpected generated source");
    const std::string headers =
        "// The ring's builder only: the scanner functions of the generated form wait for the pattern\n"
        "// scanner of the library.\n"
        "#include <map>\n#include <string>\n#include <vector>\n\n#include \"CascadedClassifier.h\"\n"
        "#include \"ClassifierRing.h\"\n#include \"LQ_Point.h\"\n#include \"LQ_Rect.h\"\n#include "
        "\"LQ_Size.h\"\n"
        "#include \"StrongClassifier.h\"\n#include \"WeakClassifier.h\"\n\ntypedef LQ::schar cData;\n";
    return generated.substr(0, at) + headers +
           generated.substr(at + include.size(), scanners - at - include.size()) + "\n";
}

}  // namespace

int main(int argc, char** argv) {
    std::map<std::string, std::string> args;
    std::vector<std::string> settings;
    std::string command = "cascade_train";
    for (int i = 1; i < argc; ++i) {
        const std::string key = argv[i];
        command += " " + key;
        if (key.rfind("--", 0) != 0 || i + 1 >= argc) fail("arguments come as --name value");
        const std::string value = argv[++i];
        command += " " + value;
        if (key == "--set")
            settings.push_back(value);
        else
            args[key.substr(2)] = value;
    }
    auto get = [&](const std::string& key, const std::string& fallback) {
        const auto it = args.find(key);
        return it == args.end() ? fallback : it->second;
    };
    const ctrain::RingPlan* ring = ctrain::findRingPlan(get("ring", ""));
    if (!ring) fail("--ring takes a ring or gesture name (fist, thumbUp, victory, pointer, palm, heart)");
    const std::string out = get("out", ".");

    ctrain::TrainOptions options;
    options.seed = std::stoull(get("seed", "1"));
    options.positives = std::stoi(get("positives", "3000"));
    options.negatives = std::stoi(get("negatives", "6000"));
    options.threads = std::stoi(get("threads", "2"));
    options.haarPool = std::stoi(get("haar-pool", "1500"));
    options.hogPool = std::stoi(get("hog-pool", "1500"));
    options.stage.hitRate = std::stod(get("hit-rate", "0.995"));
    options.maxMiningRounds = std::stoi(get("mining-rounds", "40"));
    options.stage.smoothing = std::stod(get("smoothing", "200"));
    for (const std::string& setting : settings) {
        std::string error;
        if (!handgen::setVariation(options.variation, setting, error)) fail(error);
    }
    const int stageCount = std::stoi(get("stages", "4"));
    const int later = std::stoi(get("later", "150"));
    // A first stage larger than the reference's few tests ends more windows in the vector
    // pass, which costs less than taking the many survivors through the second stage.
    const int first = std::stoi(get("first", "0"));
    if (first < 0 || stageCount < 1) fail("--first takes a count of weak classifiers, --stages at least 1");
    const auto stageSizes = [&](const ctrain::CascadePlan& plan) {
        std::vector<int> sizes;
        for (int s = 0; s < stageCount; ++s)
            sizes.push_back(s < 3 && s < static_cast<int>(plan.stageSizes.size()) ? plan.stageSizes[static_cast<size_t>(s)]
                                                                                   : later);
        if (first > 0) sizes[0] = first;
        return sizes;
    };
    std::vector<int> which = numbers(get("cascades", ""));
    if (which.empty())
        for (size_t i = 0; i < ring->cascades.size(); ++i) which.push_back(static_cast<int>(i));
    const int heldPositives = std::stoi(get("heldout-positives", "1000"));
    const int heldScenes = std::stoi(get("heldout-scenes", "200"));
    const handgen::Variation heldOut = heldOutVariation(options.variation);

    std::ostringstream log;
    log << "command: " << command << "\n";
    const auto start = std::chrono::steady_clock::now();
    std::vector<ctrain::CascadeResult> results;
    std::ostringstream table;
    table << "| cascade | angle | stages | weak classifiers | held-out hit rate | false positives per window "
             "|\n"
          << "|---|---|---|---|---|---|\n";
    for (int index : which) {
        if (index < 0 || index >= static_cast<int>(ring->cascades.size())) fail("no such cascade");
        const ctrain::CascadePlan& plan = ring->cascades[static_cast<size_t>(index)];
        ctrain::TrainOptions cascadeOptions = options;
        cascadeOptions.stageSizes = stageSizes(plan);
        TeeBuffer tee(std::cout.rdbuf(), log.rdbuf());
        std::ostream cascadeLog(&tee);
        results.push_back(
            ctrain::trainCascade(*ring, static_cast<size_t>(index), cascadeOptions, cascadeLog));
        cascadeLog.flush();
        const ctrain::HeldOut held =
            ctrain::measureHeldOut(results.back().cascade, plan, ring->gesture, heldOut,
                                   handgen::mixSeed(options.seed + 1000, static_cast<std::uint64_t>(index)),
                                   heldPositives, heldScenes, options.threads);
        size_t weak = 0;
        for (const StrongClassifier& stage : results.back().cascade.stages()) weak += stage.size();
        std::ostringstream line;
        line << "| r" << index << " | " << plan.angle << " | " << results.back().cascade.stages().size()
             << " | " << weak << " | " << held.hitRate << " (" << held.positives << ") | "
             << held.falsePositivesPerWindow << " (" << held.falsePositives << " of " << held.windows
             << ") |\n";
        table << line.str();
        std::cout << "held-out " << line.str() << std::flush;
    }
    const double total = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    log << "\nheld-out (other seeds and ranges):\n"
        << table.str() << "training and measuring took " << total << " s with " << options.threads
        << " threads\n";
    std::cout << table.str() << "took " << total << " s\n";

    std::vector<CascadedClassifier*> cascades;
    for (ctrain::CascadeResult& r : results) cascades.push_back(&r.cascade);
    ClassifierRing trained(cascades);
    trained.setName(ring->name);
    ctrain::TrainOptions recorded = options;
    recorded.stageSizes = stageSizes(ring->cascades[ring->cascades.size() > 1 ? 1 : 0]);
    trained.setConfig(ctrain::ringConfig(*ring, recorded));
    trained.setLog("log\n" + log.str());
    const std::string stem = out + "/" + ring->name;
    if (!trained.save(stem + ".ring")) fail("cannot write " + stem + ".ring");
    // the writer names the builder after the file's stem
    const std::string generatedPath =
        (std::filesystem::temp_directory_path() / (ring->name + ".cpp")).string();
    if (!trained.saveHeader(generatedPath)) fail("cannot write " + generatedPath);
    {
        std::ifstream in(generatedPath);
        std::stringstream text;
        text << in.rdbuf();
        in.close();
        std::remove(generatedPath.c_str());
        std::ofstream unit(stem + ".cpp");
        unit << libraryUnit(text.str());
        if (!unit) fail("cannot write " + stem + ".cpp");
    }
    std::ofstream logFile(stem + ".log");
    logFile << log.str();
    if (!logFile) fail("cannot write " + stem + ".log");
    return 0;
}
