#pragma once
// The training loop of the verifier networks and their scores on held-out patches.

#include <cstdint>
#include <ostream>
#include <vector>

#include "PatchData.h"
#include "TrainNet.h"

namespace nntrain {

struct TrainOptions {
    int epochs = 10;
    int batch = 32;
    int warmup = 500;  // steps over which the rate rises to its value
    float rate = 0.02f, momentum = 0.9f, decay = 1e-4f;
    std::uint64_t seed = 1;  // initial weights and the order of the samples
};

struct Evaluation {
    int positives = 0, negatives = 0;
    int correct = 0;                          // the larger score names the label
    int truePositives = 0, falsePositives = 0;  // probability of class 1 above the threshold
    double loss = 0;
    double accuracy() const { return (positives + negatives) ? double(correct) / (positives + negatives) : 0; }
    double truePositiveRate() const { return positives ? double(truePositives) / positives : 0; }
    double falsePositiveRate() const { return negatives ? double(falsePositives) / negatives : 0; }
};

// the network of a recipe, not yet initialised
Net makeNet(const Recipe& recipe);

// mini-batch SGD with momentum; classes weighted to equal shares; the rate rises over the
// warm-up steps and drops tenfold at 60% and again at 85% of the epochs. Logs one line per epoch, with the held-out scores
// when a held-out set is given.
void train(Net& net, const PatchSet& data, const TrainOptions& options, std::ostream& log,
           const PatchSet* heldOut = nullptr, float threshold = 0.5f);

Evaluation evaluate(Net& net, const PatchSet& data, float threshold);

// the probability of class 1 for every sample, as the verifier step computes it
std::vector<float> probabilities(Net& net, const PatchSet& data);

}  // namespace nntrain
