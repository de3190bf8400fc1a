// nn_train: trains one of the engine's verifier networks on generated patches and writes
// it as a ".nn" model (and, for the palm verifiers, as generated source), with its log.
//
//   nn_train --network NAME --out DIR [--seed S] [--positives N] [--negatives N]
//            [--heldout-seed S] [--heldout-positives N] [--heldout-negatives N]
//            [--epochs E] [--batch B] [--rate R] [--threads T] [--set name=low,high]...
//            [--heldout-set name=low,high]... [--oversample F] [--dump DIR] [--list]
//            [--mine-clips N] [--mine-seed S] [--mine-frames F] [--mine-step K] [--mine-jitter J]
//            [--heldout-mine-clips N] [--heldout-mine-seed S] [--ring-dir DIR] [--mined-cache DIR]
//            [--mined-repeat R]
//   nn_train --network NAME --out DIR --evaluate [held-out options]   scores DIR/NAME.nn
//
// With --mine-clips, patches are also cut from the chain's trigger hits on generated clips
// (MinedPatches.h) and the held-out figures come from hits mined with another seed.
#include <chrono>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

#include "HandSamples.h"
#include "LQ_ArchiveI.h"
#include "GestureRings.h"
#include "LQ_ArchiveO.h"
#include "MinedPatches.h"
#include "Trainer.h"

namespace {

// the epochs go to the terminal and the log as they come
class Tee : public std::streambuf {
public:
    Tee(std::streambuf* a, std::streambuf* b) : a_(a), b_(b) {}

protected:
    int overflow(int c) override {
        if (c == EOF) return !EOF;
        return a_->sputc(static_cast<char>(c)) == EOF || b_->sputc(static_cast<char>(c)) == EOF ? EOF : c;
    }
    int sync() override { return a_->pubsync() | b_->pubsync(); }

private:
    std::streambuf *a_, *b_;
};

int usage(const char* message) {
    std::fprintf(stderr, "nn_train: %s\nusage: nn_train --network NAME --out DIR [options]; --list names the networks\n",
                 message);
    return 2;
}

void dumpPatches(const nntrain::Recipe& recipe, const nntrain::DataOptions& options, const std::string& dir, int count) {
    for (int i = 0; i < count; ++i) {
        // half from the start (positives), half from the end (negatives)
        const int index = i < count / 2 ? i : options.positives + options.negatives - 1 - (i - count / 2);
        int label;
        std::uint8_t kind;
        const LQ::Image patch = nntrain::makePatch(recipe, options, index, label, kind);
        std::vector<std::uint8_t> mono(static_cast<size_t>(patch.width()) * patch.height());
        for (int y = 0; y < patch.height(); ++y)
            for (int x = 0; x < patch.width(); ++x) {
                const unsigned char* p = patch.pixel(x, y);
                mono[static_cast<size_t>(y) * patch.width() + x] =
                    patch.depth() == 1 ? p[0] : static_cast<std::uint8_t>((p[0] + 2 * p[1] + p[2]) / 4);
            }
        char name[64];
        std::snprintf(name, sizeof(name), "/%05d_label%d_%s.pgm", index, label,
                      handgen::sampleKindName(static_cast<handgen::SampleKind>(kind)));
        handgen::writePgm(dir + name, patch.width(), patch.height(), mono.data());
    }
}

std::string describe(const nntrain::Evaluation& e, float threshold) {
    std::ostringstream out;
    out << "positives " << e.positives << " negatives " << e.negatives << " accuracy " << e.accuracy() << " threshold "
        << threshold << " tpr " << e.truePositiveRate() << " fpr " << e.falsePositiveRate() << " loss " << e.loss;
    return out.str();
}

// operating points on a held-out set, and which negatives pass at the chain's threshold
template <class Log>
void report(const nntrain::Recipe& recipe, const nntrain::PatchSet& heldOutSet, const std::vector<float>& p, Log& log) {
    for (float t : {0.05f, 0.1f, 0.2f, 0.3f, 0.5f, 0.8f, 0.9f}) {
        int tp = 0, fp = 0, pos = 0, neg = 0;
        for (size_t i = 0; i < p.size(); ++i) {
            (heldOutSet.labels[i] ? pos : neg)++;
            if (p[i] > t) (heldOutSet.labels[i] ? tp : fp)++;
        }
        std::ostringstream line;
        line << "held-out at threshold " << t << ": tpr " << double(tp) / std::max(1, pos) << " fpr "
             << double(fp) / std::max(1, neg) << (t == recipe.threshold ? "  <- the chain's threshold" : "");
        log(line.str());
    }
    if (recipe.task != nntrain::Task::Verify) return;
    for (int kind = 1; kind < 4; ++kind) {
        int n = 0, passed = 0;
        for (size_t i = 0; i < p.size(); ++i)
            if (!heldOutSet.labels[i] && heldOutSet.kinds[i] == kind) ++n, passed += p[i] > recipe.threshold;
        std::ostringstream line;
        line << "held-out " << handgen::sampleKindName(static_cast<handgen::SampleKind>(kind)) << " negatives: " << n
             << ", passing " << double(passed) / std::max(1, n);
        log(line.str());
    }
}

}  // namespace

int main(int argc, char** argv) {
    std::string network, out, dump, minedCache;
    int minedRepeat = 1;
    bool evaluateOnly = false;
    nntrain::DataOptions data, heldOut;
    heldOut.seed = 1001;
    heldOut.positives = 1000;
    heldOut.negatives = 2000;
    nntrain::TrainOptions train;
    nntrain::MiningOptions mine, heldOutMine;
    mine.clips = heldOutMine.clips = 0;
    heldOutMine.seed = 9101;
    bool positivesGiven = false, negativesGiven = false;
    std::ostringstream command;
    for (int i = 0; i < argc; ++i) command << (i ? " " : "") << argv[i];
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        auto value = [&]() -> std::string {
            if (i + 1 >= argc) throw std::runtime_error(arg + " needs a value");
            return argv[++i];
        };
        std::string error;
        if (arg == "--list") {
            for (const auto& r : nntrain::recipes()) std::cout << r.name << "\n";
            return 0;
        } else if (arg == "--network") network = value();
        else if (arg == "--out") out = value();
        else if (arg == "--seed") data.seed = std::stoull(value());
        else if (arg == "--positives") data.positives = std::stoi(value()), positivesGiven = true;
        else if (arg == "--negatives") data.negatives = std::stoi(value()), negativesGiven = true;
        else if (arg == "--heldout-seed") heldOut.seed = std::stoull(value());
        else if (arg == "--heldout-positives") heldOut.positives = std::stoi(value());
        else if (arg == "--heldout-negatives") heldOut.negatives = std::stoi(value());
        else if (arg == "--epochs") train.epochs = std::stoi(value());
        else if (arg == "--batch") train.batch = std::stoi(value());
        else if (arg == "--rate") train.rate = std::stof(value());
        else if (arg == "--threads") data.threads = heldOut.threads = std::stoi(value());
        else if (arg == "--oversample") data.oversample = heldOut.oversample = std::stof(value());
        else if (arg == "--dump") dump = value();
        else if (arg == "--mine-clips") mine.clips = std::stoi(value());
        else if (arg == "--mine-seed") mine.seed = std::stoull(value());
        else if (arg == "--mine-frames") mine.frames = heldOutMine.frames = std::stoi(value());
        else if (arg == "--mine-step") mine.frameStep = heldOutMine.frameStep = std::stoi(value());
        else if (arg == "--mine-jitter") mine.jitter = std::stoi(value());
        else if (arg == "--heldout-mine-clips") heldOutMine.clips = std::stoi(value());
        else if (arg == "--heldout-mine-seed") heldOutMine.seed = std::stoull(value());
        else if (arg == "--mined-cache") minedCache = value();
        else if (arg == "--mined-repeat") minedRepeat = std::stoi(value());
        else if (arg == "--ring-dir") setRingDirectory(value() + "/");
        else if (arg == "--evaluate") evaluateOnly = true;
        else if (arg == "--set") {
            if (!handgen::setVariation(data.variation, value(), error)) return usage(error.c_str());
        } else if (arg == "--heldout-set") {
            if (!handgen::setVariation(heldOut.variation, value(), error)) return usage(error.c_str());
        } else
            return usage(("unknown option " + arg).c_str());
    }
    (void)positivesGiven, (void)negativesGiven;
    const nntrain::Recipe* recipe = nntrain::findRecipe(network);
    if (!recipe) return usage(("no network named '" + network + "'").c_str());
    if (!dump.empty()) {
        dumpPatches(*recipe, data, dump, 16);
        return 0;
    }
    if (out.empty()) return usage("--out is required");
    train.seed = data.seed;
    mine.threads = heldOutMine.threads = data.threads;
    // held-out hits are scored as they are, without the tracker-like copies
    heldOutMine.jitter = 0;
    heldOutMine.maxNegativesPerFrame = 1000;
    heldOutMine.variation = heldOut.variation;
    // a mined set is read back from the cache when the same hits were mined before
    auto mined = [&](const nntrain::MiningOptions& options, bool heldOutRanges, nntrain::MiningStats& stats) {
        if (options.clips <= 0) return nntrain::PatchSet();
        std::string path;
        if (!minedCache.empty()) {
            std::ostringstream name;
            name << minedCache << "/" << recipe->name << "_s" << options.seed << "_c" << options.clips << "_f"
                 << options.frames << "_k" << options.frameStep << "_j" << options.jitter << "_n"
                 << options.maxNegativesPerFrame << (heldOutRanges ? "_heldout" : "") << ".bin";
            path = name.str();
            nntrain::PatchSet set;
            if (nntrain::loadPatches(path, set, stats)) return set;
        }
        nntrain::PatchSet set = nntrain::minePatches(*recipe, options, stats);
        if (!path.empty()) nntrain::savePatches(path, set, stats);
        return set;
    };
    nntrain::MiningStats heldOutMineStats;
    auto mineHeldOut = [&] { return mined(heldOutMine, true, heldOutMineStats); };

    if (evaluateOnly) {
        // the written model through the runtime's reader and its own forward pass
        NnDetector loaded;
        LQ::ArchiveI::load(out + "/" + recipe->name + ".nn", loaded);
        loaded.setInputColorMode(recipe->mode);
        const nntrain::PatchSet heldOutSet = nntrain::makePatches(*recipe, heldOut);
        Blob input(1, heldOutSet.inputs.c, heldOutSet.inputs.h, heldOutSet.inputs.w);
        // the loaded file's second-class probabilities on a set, and the share it gets right
        const auto score = [&](const nntrain::PatchSet& set, double& accuracy) {
            std::vector<float> probabilities(set.labels.size());
            int correct = 0;
            for (size_t i = 0; i < probabilities.size(); ++i) {
                const float* sample = set.inputs.sample(static_cast<int>(i));
                std::copy(sample, sample + set.inputs.volume(), input.data());
                const std::vector<float> o = loaded.detect(input);
                probabilities[i] = nntrain::secondClassProbability(o.data());
                correct += (o[1] > o[0]) == (set.labels[i] == 1);
            }
            accuracy = double(correct) / std::max<size_t>(1, probabilities.size());
            return probabilities;
        };
        double accuracy = 0;
        const std::vector<float> p = score(heldOutSet, accuracy);
        auto print = [](const std::string& line) { std::cout << line << std::endl; };
        print("command: " + command.str());
        print("runtime accuracy " + std::to_string(accuracy) + " on " +
              std::to_string(p.size()) + " held-out patches");
        report(*recipe, heldOutSet, p, print);
        const nntrain::PatchSet minedSet = mineHeldOut();
        if (!minedSet.labels.empty()) {
            print("mined held-out hits: " + heldOutMineStats.describe());
            const std::vector<float> q = score(minedSet, accuracy);
            print("runtime accuracy on mined held-out hits " + std::to_string(accuracy));
            report(*recipe, minedSet, q, print);
        }
        return 0;
    }
    std::ofstream logFile(out + "/" + recipe->name + ".log");
    auto log = [&](const std::string& line) {
        std::cout << line << std::endl;
        logFile << line << std::endl;
    };
    log("command: " + command.str());
    const auto t0 = std::chrono::steady_clock::now();
    const nntrain::PatchSet synthetic = nntrain::makePatches(*recipe, data);
    const nntrain::PatchSet heldOutSet = nntrain::makePatches(*recipe, heldOut);
    nntrain::MiningStats mineStats;
    const nntrain::PatchSet minedTraining = mined(mine, false, mineStats);
    const nntrain::PatchSet minedHeldOut = mineHeldOut();
    // the hits count minedRepeat times against the synthetic patches
    nntrain::PatchSet trainSet = synthetic;
    for (int r = 0; r < minedRepeat; ++r) trainSet = nntrain::concatenate(trainSet, minedTraining);
    const double dataSeconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
    log("patches: " + std::to_string(synthetic.labels.size()) + " synthetic and " + std::to_string(minedTraining.labels.size()) +
        " mined (counted " + std::to_string(minedRepeat) + " times) for training, " + std::to_string(heldOutSet.labels.size()) + " synthetic and " +
        std::to_string(minedHeldOut.labels.size()) + " mined held out, " + std::to_string(dataSeconds) + " s");
    if (mine.clips > 0) log("mined training hits (seed " + std::to_string(mine.seed) + "): " + mineStats.describe());
    if (heldOutMine.clips > 0)
        log("mined held-out hits (seed " + std::to_string(heldOutMine.seed) + "): " + heldOutMineStats.describe());
    std::ostringstream variation;
    variation << "held-out variation:\n" << handgen::describeVariation(heldOut.variation);
    logFile << variation.str();

    nntrain::Net net = nntrain::makeNet(*recipe);
    net.initialise(train.seed);
    Tee tee(std::cout.rdbuf(), logFile.rdbuf());
    std::ostream trainLog(&tee);
    const auto t1 = std::chrono::steady_clock::now();
    // the epochs are followed on the hits the chain will see, when there are any
    const nntrain::PatchSet& watched = minedHeldOut.labels.empty() ? heldOutSet : minedHeldOut;
    nntrain::train(net, trainSet, train, trainLog, &watched, recipe->threshold);
    const double trainSeconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - t1).count();
    log("training time " + std::to_string(trainSeconds) + " s");
    const nntrain::Evaluation trainScore = nntrain::evaluate(net, trainSet, recipe->threshold);
    const nntrain::Evaluation heldScore = nntrain::evaluate(net, heldOutSet, recipe->threshold);
    log("training set: " + describe(trainScore, recipe->threshold));
    log("held-out set: " + describe(heldScore, recipe->threshold));

    report(*recipe, heldOutSet, nntrain::probabilities(net, heldOutSet), log);
    if (!minedHeldOut.labels.empty()) {
        log("mined held-out hits: " + describe(nntrain::evaluate(net, minedHeldOut, recipe->threshold), recipe->threshold));
        report(*recipe, minedHeldOut, nntrain::probabilities(net, minedHeldOut), log);
    }

    NnDetector exported = nntrain::exportNetwork(net, recipe->name, recipe->mode);
    exported.setTrainLog(command.str() + "\nheld-out: " + describe(heldScore, recipe->threshold));
    const std::string nnPath = out + "/" + recipe->name + ".nn";
    {
        std::ofstream file(nnPath, std::ios::binary);
        LQ::ArchiveO archive(file);
        archive & exported;
        if (!file) return usage(("cannot write " + nnPath).c_str());
    }
    // the file as the engine reads it must give the trainer's scores
    NnDetector loaded;
    LQ::ArchiveI::load(nnPath, loaded);
    loaded.setInputColorMode(recipe->mode);
    nntrain::Tensor one(1, heldOutSet.inputs.c, heldOutSet.inputs.h, heldOutSet.inputs.w);
    double worst = 0;
    int compared = 0;
    for (const nntrain::PatchSet* set : {&heldOutSet, &minedHeldOut})
        for (int i = 0; i < std::min<int>(200, static_cast<int>(set->labels.size())); ++i, ++compared) {
            std::copy(set->inputs.sample(i), set->inputs.sample(i) + one.volume(), one.v.begin());
            const nntrain::Tensor& ours = net.forward(one);
            Blob input(1, one.c, one.h, one.w);
            std::copy(one.v.begin(), one.v.end(), input.data());
            const std::vector<float> theirs = loaded.detect(input);
            for (int k = 0; k < 2; ++k) worst = std::max(worst, std::fabs(static_cast<double>(theirs[k]) - ours.v[k]));
        }
    std::ostringstream difference;
    difference << worst;
    log("largest score difference between trainer and loaded model over " + std::to_string(compared) +
        " held-out patches: " + difference.str());
    if (recipe->shape != nntrain::Shape::Small && !exported.saveToCpp(out + "/" + recipe->name + ".cpp"))
        return usage("cannot write the generated source");
    return 0;
}
