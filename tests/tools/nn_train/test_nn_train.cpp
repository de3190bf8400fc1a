// The verifier trainer: each layer's backward pass against finite differences, a small
// problem learnt, trained networks exported and read back through the model reader
// giving the trainer's scores, and patches mined from cascade hits: their labels against
// the ground truth and their cut against the chain's own network step.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <random>
#include <sstream>

#include "LQ_ArchiveI.h"
#include "LQ_ArchiveO.h"
#include "LQ_ColorModeData.h"
#include "MinedPatches.h"
#include "NnTracker.h"
#include "Trainer.h"

using namespace nntrain;

namespace {

Tensor randomTensor(int n, int c, int h, int w, unsigned seed, float margin = 0) {
    std::mt19937 random(seed);
    std::uniform_real_distribution<float> value(-1, 1);
    Tensor t(n, c, h, w);
    for (float& x : t.v) {
        do x = value(random);
        while (std::fabs(x) < margin);  // keep clear of the kinks of ReLU and PReLU
    }
    return t;
}

// a shuffle of values 0.05 apart
Tensor spreadTensor(int n, int c, int h, int w, unsigned seed) {
    Tensor t(n, c, h, w);
    for (size_t i = 0; i < t.size(); ++i) t.v[i] = 0.05f * static_cast<float>(i) - 1;
    std::shuffle(t.v.begin(), t.v.end(), std::mt19937(seed));
    return t;
}

// each value of x moved by +-eps: the central difference of the loss against the gradient
template <class Loss>
void expectGradient(std::vector<float>& x, const std::vector<float>& gradient, Loss loss, double absolute,
                    double relative) {
    const float eps = 1e-2f;
    for (size_t i = 0; i < x.size(); ++i) {
        const float keep = x[i];
        x[i] = keep + eps;
        const double up = loss();
        x[i] = keep - eps;
        const double down = loss();
        x[i] = keep;
        EXPECT_NEAR((up - down) / (2 * eps), gradient[i], absolute + relative * std::fabs(gradient[i])) << i;
    }
}

// L = sum of out * r; checks dL/din and dL/dparams of one layer
void checkLayer(Layer& layer, Tensor input, unsigned seed) {
    SCOPED_TRACE(layer.name());
    Tensor out;
    layer.forward(input, out);
    const Tensor r = randomTensor(out.n, out.c, out.h, out.w, seed + 1);
    auto loss = [&]() {
        Tensor o;
        layer.forward(input, o);
        double sum = 0;
        for (size_t i = 0; i < o.size(); ++i) sum += double(o.v[i]) * r.v[i];
        return sum;
    };
    for (Param* p : layer.params()) std::fill(p->grad.begin(), p->grad.end(), 0.0f);
    Tensor din;
    layer.backward(input, out, r, &din);
    expectGradient(input.v, din.v, loss, 2e-3, 2e-3);
    for (Param* p : layer.params()) expectGradient(p->value, p->grad, loss, 2e-3, 2e-3);
}

Blob toBlob(const Tensor& t, int i) {
    Blob blob(1, t.c, t.h, t.w);
    std::copy(t.sample(i), t.sample(i) + t.volume(), blob.data());
    return blob;
}

}  // namespace

TEST(NnTrain, BackwardPassesMatchFiniteDifferences) {
    Conv strided("conv", 3, 2, 3, 3, 2, 1);
    strided.initialise(3);
    for (size_t i = 0; i < strided.bias.value.size(); ++i) strided.bias.value[i] = 0.1f * float(i);
    checkLayer(strided, randomTensor(2, 2, 7, 6, 10), 11);
    Conv wide("conv_2x3", 4, 3, 2, 3);
    wide.initialise(4);
    checkLayer(wide, randomTensor(2, 3, 4, 5, 12), 13);

    PRelu prelu("prelu", 3);
    prelu.slope.value = {0.1f, -0.3f, 0.6f};
    checkLayer(prelu, randomTensor(2, 3, 3, 4, 14, 0.05f), 15);
    Relu relu("relu");
    checkLayer(relu, randomTensor(2, 2, 3, 3, 16, 0.05f), 17);

    // odd sizes: the clipped last windows must route their gradient too; distinct values
    // far apart, so that no step of the differences changes a window's maximum
    MaxPool pool("pool", 2, 2);
    checkLayer(pool, spreadTensor(2, 2, 5, 7, 18), 19);
    MaxPool overlapping("pool_3_2", 3, 2);
    checkLayer(overlapping, spreadTensor(1, 2, 6, 8, 20), 21);

    InnerProduct inner("fc", 3, 2 * 3 * 2);
    inner.initialise(5);
    checkLayer(inner, randomTensor(3, 2, 3, 2, 22), 23);

    // the loss: gradient by the scores, weighted
    Tensor scores = randomTensor(3, 2, 1, 1, 24);
    const std::vector<int> labels = {1, 0, 1};
    const std::vector<float> weights = {1, 2, 0.5f};
    Tensor gradient, unused;
    softmaxCrossEntropy(scores, labels, weights, gradient);
    const auto loss = [&] { return softmaxCrossEntropy(scores, labels, weights, unused); };
    expectGradient(scores.v, gradient.v, loss, 1e-3, 0);
}

TEST(NnTrain, ShapesFollowTheRuntimesRounding) {
    // convolution drops the last window, pooling keeps a clipped one
    Conv conv("c", 1, 1, 3, 3, 2);
    int c, h, w;
    conv.outputShape(1, 60, 35, c, h, w);
    EXPECT_EQ(h, 29);
    EXPECT_EQ(w, 17);
    EXPECT_EQ(pooledSize(5, 2, 2), 3);
    EXPECT_EQ(pooledSize(7, 3, 2), 3);
    EXPECT_EQ(pooledSize(8, 3, 2), 4);
    // the palm chains end in two scores at 1 x 1
    Net small = palmChain(kPalm35x33, 33, 35), large = palmChain(kPalm50x60, 60, 50);
    small.outputShape(c, h, w);
    EXPECT_EQ(c * h * w, 2);
    large.outputShape(c, h, w);
    EXPECT_EQ(c * h * w, 2);
    EXPECT_THROW(Net(1, 33, 35).add(std::make_unique<Conv>("x", 2, 3, 3, 3)), std::invalid_argument);
}

TEST(NnTrain, LearnsASeparableProblem) {
    // class 1: a bright bar in the left half of an 8 x 8 noise patch; class 0: on the right
    const int count = 400;
    PatchSet data;
    data.inputs.resize(count, 1, 8, 8);
    data.labels.resize(count);
    std::mt19937 random(5);
    std::uniform_real_distribution<float> noise(0, 0.4f);
    for (int i = 0; i < count; ++i) {
        data.labels[i] = i % 2;
        float* x = data.inputs.sample(i);
        for (int k = 0; k < 64; ++k) x[k] = noise(random);
        const int column = (i % 2 ? 0 : 4) + static_cast<int>(random() % 4);
        for (int y = 0; y < 8; ++y) x[y * 8 + column] += 0.6f;
    }
    Net net(1, 8, 8);
    net.add(std::make_unique<Conv>("conv1", 4, 1, 3, 3));
    net.add(std::make_unique<PRelu>("PReLU1", 4));
    net.add(std::make_unique<MaxPool>("pool1", 2, 2));
    net.add(std::make_unique<InnerProduct>("final", 2, 4 * 3 * 3));
    net.initialise(1);
    const Evaluation before = evaluate(net, data, 0.5f);
    TrainOptions options;
    options.epochs = 8;
    options.rate = 0.05f;
    options.warmup = 0;
    std::ostringstream log;
    train(net, data, options, log);
    const Evaluation after = evaluate(net, data, 0.5f);
    EXPECT_GT(after.accuracy(), 0.97) << log.str();
    EXPECT_LT(after.loss, before.loss * 0.3);
    EXPECT_EQ(after.positives, count / 2);
}

TEST(NnTrain, ExportedNetworksGiveTheTrainersScores) {
    // every recipe's shape: palm chains, and the small ones with pooling on odd sizes,
    // inner products and a colour input
    for (const Recipe& recipe : recipes()) {
        SCOPED_TRACE(recipe.name);
        Net net = makeNet(recipe);
        net.initialise(7);
        // a few steps, so that slopes and biases leave their starting values
        Tensor batch = randomTensor(4, net.channels(), net.height(), net.width(), 30);
        for (float& x : batch.v) x = 0.5f + 0.5f * x;
        const std::vector<int> labels = {1, 0, 1, 0};
        Tensor gradient;
        for (int step = 0; step < 3; ++step) {
            net.zeroGradients();
            softmaxCrossEntropy(net.forward(batch), labels, std::vector<float>(4, 1.0f), gradient);
            net.backward(gradient);
            Sgd{0.05f, 0.9f, 1e-4f}.step(net, 4);
        }
        NnDetector exported = exportNetwork(net, recipe.name, recipe.mode);
        std::stringstream file;
        LQ::ArchiveO writer(file);
        writer & exported;
        NnDetector loaded;
        LQ::ArchiveI reader(file);
        reader & loaded;
        EXPECT_EQ(loaded.getName(), recipe.name);
        EXPECT_EQ(loaded.getInputColorMode(), recipe.mode);
        EXPECT_EQ(loaded.getSize(), LQ::BaseSize<int>(recipe.width, recipe.height));
        const Tensor& scores = net.forward(batch);
        for (int i = 0; i < batch.n; ++i) {
            Blob input = toBlob(batch, i);
            const std::vector<float> theirs = loaded.detect(input);
            ASSERT_EQ(theirs.size(), 2u);
            for (int k = 0; k < 2; ++k)
                EXPECT_NEAR(theirs[k], scores.sample(i)[k], 1e-4f + 1e-4f * std::fabs(scores.sample(i)[k]));
        }
        // an image through the runtime's own conversion, colour planes included
        LQ::Image image(LQ::BaseSize<int>(recipe.width, recipe.height), recipe.mode);
        std::mt19937 random(9);
        for (int y = 0; y < image.height(); ++y)
            for (int x = 0; x < image.width() * image.depth(); ++x) image.row(y)[x] = static_cast<unsigned char>(random());
        Tensor one(1, net.channels(), net.height(), net.width());
        for (int k = 0; k < image.depth(); ++k)
            for (int y = 0; y < image.height(); ++y)
                for (int x = 0; x < image.width(); ++x)
                    one.v[(static_cast<size_t>(k) * image.height() + y) * image.width() + x] = image.pixel(x, y)[k] / 256.0f;
        const std::vector<float> fromImage = loaded.detect(image);
        const Tensor& mine = net.forward(one);
        for (int k = 0; k < 2; ++k) EXPECT_NEAR(fromImage[k], mine.v[k], 1e-4f + 1e-4f * std::fabs(mine.v[k]));
    }
}

TEST(NnTrain, PatchesAreRepeatableAndLabelled) {
    DataOptions options;
    options.positives = 3;
    options.negatives = 5;
    options.seed = 4;
    const Recipe& fist = *findRecipe("fist_verifier_iter_135000");
    const PatchSet a = makePatches(fist, options);
    options.threads = 2;
    const PatchSet b = makePatches(fist, options);
    EXPECT_EQ(a.inputs.v, b.inputs.v);
    EXPECT_EQ(a.labels, (std::vector<int>{1, 1, 1, 0, 0, 0, 0, 0}));
    EXPECT_EQ(a.inputs.c, 1);
    EXPECT_EQ(a.inputs.h, 32);
    // the side network's label is whether the hit's side is wrong: about half of them
    const Recipe& side = *findRecipe("pointer_hand_side__iter_7500");
    options.threads = 1;
    const PatchSet s = makePatches(side, options);
    int wrong = 0;
    for (int l : s.labels) wrong += l;
    EXPECT_GT(wrong, 0);
    EXPECT_LT(wrong, 8);
    const Recipe& victory = *findRecipe("victory_verifier_face_pos_color_2017_12_14__iter_39000");
    EXPECT_EQ(makePatches(victory, options).inputs.c, 3);
    EXPECT_EQ(findRecipe("no such network"), nullptr);
}

TEST(NnTrain, MinedHitsAreLabelledAgainstTheTruth) {
    EXPECT_FLOAT_EQ(overlap({0, 0, 10, 10}, {5, 0, 15, 10}), 50.f / 150.f);
    EXPECT_EQ(overlap({0, 0, 10, 10}, {10, 0, 20, 10}), 0.f);
    using handgen::Gesture;
    const std::vector<TruthHand> hands = {{Gesture::Fist, {100, 100, 180, 190}},
                                          {Gesture::Pointer, {300, 40, 380, 240}},
                                          {std::nullopt, {450, 100, 530, 200}}};
    const struct {
        Rect hit;
        Gesture gesture;
        HitLabel label;
        const char* why;
    } cases[] = {
        {{104, 110, 176, 186}, Gesture::Fist, HitLabel::Positive, "on the fist, a little off and smaller"},
        {{300, 150, 380, 240}, Gesture::Fist, HitLabel::Negative, "the pointer hand's curled lower part"},
        {{10, 10, 60, 60}, Gesture::Fist, HitLabel::Negative, "the background"},
        {{150, 100, 230, 190}, Gesture::Fist, HitLabel::Dropped, "overlap 0.23: neither its hand nor clear"},
        {{140, 100, 220, 190}, Gesture::Fist, HitLabel::Positive, "overlap 1/3, found for the evaluation"},
        {{450, 100, 530, 200}, Gesture::Fist, HitLabel::Dropped, "a hand of unknown shape may be a fist"},
        {{300, 40, 380, 240}, Gesture::Pointer, HitLabel::Positive, "the pointer's own hand"},
        {{104, 110, 176, 186}, Gesture::Pointer, HitLabel::Negative, "the fist, for the pointer"},
    };
    for (const auto& c : cases) EXPECT_EQ(labelHit(c.hit, hands, c.gesture), c.label) << c.why;
    // the thresholds are the overlaps themselves
    EXPECT_EQ(labelHit({150, 100, 230, 190}, hands, Gesture::Fist, 0.2f), HitLabel::Positive);
    EXPECT_EQ(labelHit({150, 100, 230, 190}, hands, Gesture::Fist, 0.4f, 0.3f), HitLabel::Negative);
}

TEST(NnTrain, MinedPatchesAreCutAsTheChainCutsThem) {
    // a fist clip frame through the camera's conversion and the fist ring; every hit's
    // mined input must give the score the chain's network step gives on the same frame
    handgen::ClipSetup setup;
    setup.width = 640, setup.height = 360, setup.frames = 60, setup.seed = 5;
    setup.gestures = {handgen::Gesture::Fist};
    const handgen::ClipMaker maker(setup);
    // the first frame in which the fist ring finds the fist
    const Recipe& fist = *findRecipe("fist_verifier_iter_135000");
    LQ::Image bgr;
    std::vector<TruthHand> truth;
    for (int frame = 0; frame < setup.frames; ++frame) {
        const handgen::FrameTruth t = maker.truth(frame);
        if (!t.gesture) continue;
        std::vector<std::uint8_t> rgb;
        maker.render(frame, rgb);
        bgr = workingImage(rgb, setup.width, setup.height);
        truth = {{t.gesture, {t.rect[0] / 2, t.rect[1] / 2, t.rect[2] / 2, t.rect[3] / 2}}};
        LQ::Image unused;
        const std::vector<Hit> hits = mineFrame(fist, *triggerFor(fist), bgr, truth, unused);
        if (std::any_of(hits.begin(), hits.end(), [](const Hit& h) { return h.label == HitLabel::Positive; })) break;
        truth.clear();
    }
    ASSERT_FALSE(truth.empty());
    ASSERT_EQ(bgr.size(), LQ::BaseSize<int>(320, 180));

    for (const char* name : {"fist_verifier_iter_135000", "victory_verifier_face_pos_color_2017_12_14__iter_39000"}) {
        SCOPED_TRACE(name);
        const Recipe& recipe = *findRecipe(name);
        const TriggerSetup* trigger = triggerFor(recipe);
        ASSERT_NE(trigger, nullptr);
        LQ::Image chainImage;
        std::vector<Hit> hits = mineFrame(recipe, *trigger, bgr, truth, chainImage);
        if (recipe.gesture == handgen::Gesture::Fist) {
            ASSERT_FALSE(hits.empty());
        }
        for (const Hit& hit : hits) EXPECT_EQ(hit.label, labelHit(hit.reported, truth, recipe.gesture));
        // a hit of our own too, turned and near the border, so that the patch leaves the image
        Hit own;
        own.location = LQ::ObjectLocation(LQ::BasePoint<float>(20, 30), LQ::BaseSize<float>(40, 40), 30, LQ::Side::LEFT);
        hits.push_back(own);

        Net net = makeNet(recipe);
        net.initialise(3);
        NnDetector network = exportNetwork(net, recipe.name, recipe.mode);
        network.setInputColorMode(recipe.mode);
        // the engine's nodes: the BGR frame, its mono for the mono networks
        LQ::SharedPtr<LQ::ImageData> source(new LQ::ImageData());
        source->set(bgr);
        LQ::SharedPtr<LQ::ImageData> image = source;
        if (recipe.mode == LQ::COLOR_MODE_MONO) image = LQ::SharedPtr<LQ::ImageData>(new LQ::ColorModeData(source, LQ::COLOR_MODE_MONO));
        NnTracker step(NnTracker::Parameters(NnTracker::Type::VERIFIER, LQ::SharedPtr<NnDetector>(&network, false), image,
                                             recipe.relative(), recipe.threshold));
        Blob blob;
        for (const Hit& hit : hits) {
            LQ::SharedPtr<LQ::StateAggregator> state = LQ::StateAggregator::newDetectorState();
            static_cast<LQ::ObjectLocation&>(state->get<LQ::LocationState>()) = hit.location;
            step.detect(state);
            const float chainScore = state->get<LQ::ScoreState>();
            network.convert(cutPatch(recipe, chainImage, hit.location), blob, 0, 1);
            const std::vector<float> o = network.detect(blob);
            EXPECT_EQ(secondClassProbability(o.data()), chainScore);
        }
    }

    // the mined set follows from the seed, whatever the number of workers
    MiningOptions options;
    options.clips = 2, options.frames = 40, options.frameStep = 10, options.width = 640, options.height = 360;
    options.jitter = 1;
    options.maxNegativesPerFrame = 1000;
    options.seed = 8;
    MiningStats one, two;
    const PatchSet a = minePatches(fist, options, one);
    options.threads = 2;
    const PatchSet b = minePatches(fist, options, two);
    EXPECT_EQ(a.inputs.v, b.inputs.v);
    EXPECT_EQ(a.labels, b.labels);
    EXPECT_EQ(one.frames, 8);
    // each kept hit and its one moved copy
    EXPECT_EQ(static_cast<long>(a.labels.size()), 2 * (one.positives + one.negatives));
    EXPECT_EQ(one.hits, one.positives + one.negatives + one.dropped);
    // the cache gives the set and its figures back
    const std::string path = ::testing::TempDir() + "mined_fist.bin";
    savePatches(path, a, one);
    PatchSet back;
    MiningStats again;
    ASSERT_TRUE(loadPatches(path, back, again));
    EXPECT_EQ(back.inputs.v, a.inputs.v);
    EXPECT_EQ(back.labels, a.labels);
    EXPECT_EQ(back.kinds, a.kinds);
    EXPECT_EQ(again.describe(), one.describe());
    EXPECT_FALSE(loadPatches(path + ".missing", back, again));
    std::remove(path.c_str());
    DataOptions few;
    few.positives = few.negatives = 2;
    const PatchSet both = concatenate(a, makePatches(fist, few));
    EXPECT_EQ(both.inputs.n, a.inputs.n + 4);
    EXPECT_EQ(both.labels.size(), a.labels.size() + 4);
    EXPECT_TRUE(std::equal(a.inputs.v.begin(), a.inputs.v.end(), both.inputs.v.begin()));
}
