#pragma once
// Boosting of look-up stages in the form the scan evaluates: every weak classifier is a
// table of 256 signed bytes indexed by an RMCT code, a Haar quotient or a HOG bin share,
// and a stage is an integer sum against an integer threshold.
//
// A training window is stored with a margin of one pixel on every side, so that the census
// codes of its border pixels are those a scan of a larger picture computes there. Feature
// values come from the engine's own kernels (census, integral, integral HOG) and the weak
// classifiers' own index functions, at zoom 1: what the trainer measures is what a layer
// scan at zoom 1 measures.

#include <array>
#include <cstdint>
#include <ostream>
#include <vector>

#include "LQ_Image.h"
#include "LQ_Rect.h"
#include "StrongClassifier.h"

namespace ctrain {

constexpr int kMargin = 1;

struct Feature {
    enum class Kind { Rmct, Haar, Hog };
    Kind kind = Kind::Rmct;
    int x = 0, y = 0;          // census point
    LQ::BaseRect<int> first;   // Haar allRect, or HOG block
    LQ::BaseRect<int> second;  // Haar posRect, or HOG cell
    int sector = 0;            // HOG bin
};
const char* kindName(Feature::Kind kind);

// every census point of the window
std::vector<Feature> rmctFeatures(int width, int height);
// rectangle pairs whose second lies inside the first with a smaller area, so that the
// quotient index stays within 0..254 at any zoom
std::vector<Feature> randomHaarFeatures(int width, int height, int count, std::uint64_t seed);
// blocks of 2x2 cells (or a cell that is the whole block) one pixel in from the window's
// edges, as the scan's HOG region needs
std::vector<Feature> randomHogFeatures(int width, int height, int count, std::uint64_t seed);

// Windows of one size with their margin, as mono bytes, and their labels.
class SampleSet {
public:
    SampleSet(int width, int height) : width_(width), height_(height) {}
    int width() const { return width_; }
    int height() const { return height_; }
    int cropWidth() const { return width_ + 2 * kMargin; }
    int cropHeight() const { return height_ + 2 * kMargin; }
    size_t cropBytes() const { return static_cast<size_t>(cropWidth()) * cropHeight(); }
    size_t size() const { return positive_.size(); }
    size_t positives() const;

    void add(const std::uint8_t* crop, bool positive);
    // keeps the samples whose flag is set, in order
    void keep(const std::vector<bool>& flags);
    const std::uint8_t* crop(size_t i) const { return bytes_.data() + i * cropBytes(); }
    bool positive(size_t i) const { return positive_[i] != 0; }
    // the crop as an image (a view of the set's bytes)
    LQ::Image image(size_t i) const;

private:
    int width_, height_;
    std::vector<std::uint8_t> bytes_;
    std::vector<std::uint8_t> positive_;
};

// The feature images of one crop and the index of any feature in its window.
class WindowFeatures {
public:
    void compute(const LQ::Image& crop);
    int value(const Feature& feature) const;
    // pointers to the window's top-left element in each feature image
    const unsigned char* rmct() const;
    const unsigned int* integral() const;
    const unsigned int* hog() const;

private:
    LQ::Image rmct_, integral_, hog_;
    int width_ = 0, height_ = 0;
};

// Feature values of every sample, one row of samples per feature.
class FeatureMatrix {
public:
    void compute(const SampleSet& samples, const std::vector<Feature>& features, int threads);
    const std::uint8_t* row(size_t feature) const { return values_.data() + feature * samples_; }
    size_t samples() const { return samples_; }

private:
    std::vector<std::uint8_t> values_;
    size_t samples_ = 0;
};

struct WeakModel {
    Feature feature;
    std::array<signed char, 256> table{};
};

struct StageModel {
    std::vector<WeakModel> weak;
    int threshold = 0;
    int sum(const WindowFeatures& window) const;
};

struct StageOptions {
    int rounds = 10;
    double hitRate = 0.995;  // share of positives that reach the threshold
    double maxScore = 3.0;   // |0.5 ln ratio| at which a table entry saturates to 127
    double smoothing = 200;  // added to each bin's weight, in units of 1 / sample count:
                             // a code seen in a few samples only votes little
    int threads = 1;
};

struct StageReport {
    double hitRate = 0, falsePositiveRate = 0;
    std::vector<int> positiveSums, negativeSums;
};

// Real boosting of one stage over the candidates; samples start with equal total weight
// per class. Scores are quantised with one stage-wide scale, and the weights follow the
// quantised tables, so that the integer sums are what boosting optimised.
StageModel trainStage(const SampleSet& samples, const std::vector<Feature>& candidates,
                      const FeatureMatrix& matrix, const StageOptions& options, StageReport* report = nullptr,
                      std::ostream* log = nullptr);

// the lowest threshold that keeps at least hitRate of the sums
int thresholdFor(std::vector<int> positiveSums, double hitRate);

// The stage as the engine holds it: census, then Haar, then HOG classifiers, each owning a
// copy of its table.
StrongClassifier toStrongClassifier(const StageModel& stage);

}  // namespace ctrain
