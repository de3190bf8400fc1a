#include "RandomRing.h"

#include <random>
#include <sstream>

namespace {

struct Random {
    explicit Random(unsigned int seed) : engine(seed) {}
    int operator()(int lower, int upper) { return std::uniform_int_distribution<int>(lower, upper)(engine); }
    std::mt19937 engine;
};

// a rectangle of at least 2 x 2 inside [0, w] x [0, h]
LQ::BaseRect<int> randomRect(Random& random, int w, int h) {
    const int left = random(0, w - 2), top = random(0, h - 2);
    return LQ::BaseRect<int>(left, top, random(left + 2, w), random(top + 2, h));
}

std::string tableText(Random& random) {
    std::string text;
    for (int i = 0; i < 256; ++i) text += std::to_string(random(-128, 127)) + " ";
    return text;
}

// Classifiers own their tables when read from text, so each one is made through its
// text form.
template <class Classifier>
Classifier fromText(const std::string& text) {
    std::istringstream stream(text);
    Classifier classifier;
    classifier.basicLoad(stream);
    return classifier;
}

CascadedClassifier* randomCascade(Random& random, int angle, LQ::BaseSize<int> window, LQ::BaseSize<int> object) {
    CascadedClassifier* cascade = new CascadedClassifier();
    cascade->setMonoSize(window);
    cascade->setBaseSize(object);
    cascade->setObjectCenter(LQ::BasePoint<int>(window.width / 2, window.height / 2));
    cascade->setAngle(angle);
    const int w = window.width, h = window.height;
    // census only first, Haar from the second stage, HOG from the third, and one
    // stage without Haar rows
    const int kinds[4][3] = {{5, 0, 0}, {3, 2, 0}, {4, 0, 3}, {2, 3, 2}};
    for (const auto& counts : kinds) {
        StrongClassifier stage;
        for (int k = 0; k < counts[0]; ++k)
            stage.addRmctClassifier(fromText<WeakClassifierRmct>(std::to_string(random(1, w - 2)) + " " +
                                                                 std::to_string(random(1, h - 2)) + " " +
                                                                 tableText(random)));
        for (int k = 0; k < counts[1]; ++k) {
            const LQ::BaseRect<int> a = randomRect(random, w, h), b = randomRect(random, w, h);
            stage.addHaarClassifier(fromText<WeakClassifierHaar>(
                std::to_string(a.top) + " " + std::to_string(a.left) + " " + std::to_string(a.right) + " " +
                std::to_string(a.bottom) + " " + std::to_string(b.top) + " " + std::to_string(b.left) + " " +
                std::to_string(b.right) + " " + std::to_string(b.bottom) + " " + tableText(random)));
        }
        for (int k = 0; k < counts[2]; ++k) {
            // blocks one pixel inside the window, cells inside their block
            LQ::BaseRect<int> block = randomRect(random, w - 2, h - 2);
            block = LQ::BaseRect<int>(block.left + 1, block.top + 1, block.right + 1, block.bottom + 1);
            const int cl = random(block.left, block.right - 1), ct = random(block.top, block.bottom - 1);
            const LQ::BaseRect<int> cell(cl, ct, random(cl + 1, block.right), random(ct + 1, block.bottom));
            stage.addHogClassifier(fromText<WeakClassifierHog>(
                std::to_string(block.top) + " " + std::to_string(block.left) + " " + std::to_string(block.right) +
                " " + std::to_string(block.bottom) + " " + std::to_string(cell.top) + " " +
                std::to_string(cell.left) + " " + std::to_string(cell.right) + " " + std::to_string(cell.bottom) +
                " " + std::to_string(random(0, 5)) + " " + tableText(random)));
        }
        stage.setThreshold(random(-300, 300));
        cascade->addStrongClassifier(stage);
    }
    return cascade;
}

}  // namespace

RandomRing makeRandomRing(unsigned int seed, const std::string& name) {
    Random random(seed);
    RandomRing made;
    made.cascades.emplace_back(randomCascade(random, -30, LQ::BaseSize<int>(29, 33), LQ::BaseSize<int>(21, 25)));
    made.cascades.emplace_back(randomCascade(random, 0, LQ::BaseSize<int>(26, 24), LQ::BaseSize<int>(26, 24)));
    made.ring.reset(new ClassifierRing(std::vector<CascadedClassifier*>{made.cascades[0].get(), made.cascades[1].get()}));
    mapStringString config;
    config["colorMode"] = "COLOR_MODE_MONO";
    config["seed"] = std::to_string(seed);
    config["shape"] = "RandomShape";
    made.ring->setConfig(config);
    made.ring->setName(name);
    return made;
}
