#include "Trainer.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <numeric>
#include <random>

namespace nntrain {

Net makeNet(const Recipe& recipe) {
    if (recipe.shape == Shape::Palm35x33) return palmChain(kPalm35x33, recipe.height, recipe.width);
    if (recipe.shape == Shape::Palm50x60) return palmChain(kPalm50x60, recipe.height, recipe.width);
    // three small convolutions with pooling, then two inner products
    Net net(LQ::depth(recipe.mode), recipe.height, recipe.width);
    net.add(std::make_unique<Conv>("conv1", 8, net.channels(), 3, 3));
    net.add(std::make_unique<PRelu>("PReLU1", 8));
    net.add(std::make_unique<MaxPool>("pool1", 2, 2));
    net.add(std::make_unique<Conv>("conv2", 16, 8, 3, 3));
    net.add(std::make_unique<PRelu>("PReLU2", 16));
    net.add(std::make_unique<MaxPool>("pool2", 2, 2));
    net.add(std::make_unique<Conv>("conv3", 24, 16, 3, 3));
    net.add(std::make_unique<PRelu>("PReLU3", 24));
    int c, h, w;
    net.outputShape(c, h, w);
    net.add(std::make_unique<InnerProduct>("fc1", 48, c * h * w));
    net.add(std::make_unique<PRelu>("PReLU4", 48));
    net.add(std::make_unique<InnerProduct>("final", 2, 48));
    return net;
}

namespace {

void gather(const PatchSet& data, const std::vector<int>& order, size_t begin, size_t end, Tensor& batch,
            std::vector<int>& labels) {
    const Tensor& all = data.inputs;
    batch.resize(static_cast<int>(end - begin), all.c, all.h, all.w);
    labels.resize(end - begin);
    for (size_t i = begin; i < end; ++i) {
        std::copy(all.sample(order[i]), all.sample(order[i]) + all.volume(), batch.sample(static_cast<int>(i - begin)));
        labels[i - begin] = data.labels[order[i]];
    }
}

}  // namespace

void train(Net& net, const PatchSet& data, const TrainOptions& options, std::ostream& log, const PatchSet* heldOut,
           float threshold) {
    const size_t count = data.labels.size();
    const int positives = static_cast<int>(std::count(data.labels.begin(), data.labels.end(), 1));
    const int negatives = static_cast<int>(count) - positives;
    // each class weighs as much as the other in the loss
    const float positiveWeight = positives ? 0.5f * count / positives : 0, negativeWeight = negatives ? 0.5f * count / negatives : 0;
    std::vector<int> order(count);
    std::iota(order.begin(), order.end(), 0);
    std::mt19937_64 random(options.seed ^ 0x5DEECE66Dull);
    Tensor batch, gradient;
    std::vector<int> labels;
    std::vector<float> weights;
    const auto start = std::chrono::steady_clock::now();
    long steps = 0;
    for (int epoch = 0; epoch < options.epochs; ++epoch) {
        Sgd sgd{options.rate, options.momentum, options.decay};
        if (epoch >= options.epochs * 0.6) sgd.rate *= 0.1f;
        if (epoch >= options.epochs * 0.85) sgd.rate *= 0.1f;
        // Fisher-Yates from raw words: the same order on every library
        for (size_t i = count; i > 1; --i) std::swap(order[i - 1], order[random() % i]);
        double lossSum = 0;
        int batches = 0;
        for (size_t begin = 0; begin < count; begin += options.batch) {
            const size_t end = std::min(count, begin + options.batch);
            gather(data, order, begin, end, batch, labels);
            weights.resize(labels.size());
            for (size_t i = 0; i < labels.size(); ++i) weights[i] = labels[i] ? positiveWeight : negativeWeight;
            net.zeroGradients();
            const Tensor& scores = net.forward(batch);
            const float loss = softmaxCrossEntropy(scores, labels, weights, gradient);
            if (!std::isfinite(loss)) throw std::runtime_error("training diverged");
            net.backward(gradient);
            Sgd warm = sgd;
            ++steps;
            if (steps < options.warmup) warm.rate *= static_cast<float>(steps) / static_cast<float>(options.warmup);
            warm.step(net, static_cast<int>(labels.size()));
            lossSum += loss;
            ++batches;
        }
        const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
        log << "epoch " << epoch + 1 << " rate " << sgd.rate << " loss " << lossSum / std::max(1, batches);
        if (heldOut) {
            const Evaluation e = evaluate(net, *heldOut, threshold);
            log << " held-out loss " << e.loss << " accuracy " << e.accuracy() << " tpr " << e.truePositiveRate() << " fpr "
                << e.falsePositiveRate();
        }
        log << " time " << seconds << " s" << std::endl;
    }
}

Evaluation evaluate(Net& net, const PatchSet& data, float threshold) {
    Evaluation e;
    const size_t count = data.labels.size();
    std::vector<int> order(count);
    std::iota(order.begin(), order.end(), 0);
    Tensor batch, gradient;
    std::vector<int> labels;
    double lossSum = 0;
    for (size_t begin = 0; begin < count; begin += 64) {
        const size_t end = std::min(count, begin + 64);
        gather(data, order, begin, end, batch, labels);
        const Tensor& scores = net.forward(batch);
        std::vector<float> ones(labels.size(), 1.0f);
        lossSum += softmaxCrossEntropy(scores, labels, ones, gradient) * labels.size();
        for (size_t i = 0; i < labels.size(); ++i) {
            const float* o = scores.sample(static_cast<int>(i));
            const int label = labels[i];
            (label ? e.positives : e.negatives)++;
            if ((o[1] > o[0]) == (label == 1)) ++e.correct;
            if (secondClassProbability(o) > threshold) (label ? e.truePositives : e.falsePositives)++;
        }
    }
    e.loss = count ? lossSum / count : 0;
    return e;
}

}  // namespace nntrain

namespace nntrain {

std::vector<float> probabilities(Net& net, const PatchSet& data) {
    const size_t count = data.labels.size();
    std::vector<int> order(count), labels;
    std::iota(order.begin(), order.end(), 0);
    std::vector<float> out(count);
    Tensor batch;
    for (size_t begin = 0; begin < count; begin += 64) {
        const size_t end = std::min(count, begin + 64);
        gather(data, order, begin, end, batch, labels);
        const Tensor& scores = net.forward(batch);
        for (size_t i = begin; i < end; ++i) out[i] = secondClassProbability(scores.sample(static_cast<int>(i - begin)));
    }
    return out;
}

}  // namespace nntrain
