#include "CascadeTrainer.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <thread>

#include "LQ_Check.h"
#include "LQ_Integral.h"
#include "LQ_RmctTransform.h"
#include "WeakClassifier.h"

namespace ctrain {

namespace {

// draws from the raw engine output only, so that a seed gives the same pools everywhere
struct Draw {
    explicit Draw(std::uint64_t seed) : engine(seed) {}
    int below(int n) { return n <= 1 ? 0 : static_cast<int>(engine() % static_cast<std::uint64_t>(n)); }
    int between(int low, int high) { return low + below(high - low + 1); }
    std::mt19937_64 engine;
};

template <class Work>
void parallelFor(size_t count, int threads, Work work) {
    const size_t parts =
        std::max<size_t>(1, std::min<size_t>(static_cast<size_t>(std::max(1, threads)), count));
    std::vector<std::thread> workers;
    for (size_t p = 1; p < parts; ++p)
        workers.emplace_back([&, p] { work(count * p / parts, count * (p + 1) / parts, p); });
    work(0, count / parts, 0);
    for (std::thread& worker : workers) worker.join();
}

}  // namespace

const char* kindName(Feature::Kind kind) {
    switch (kind) {
        case Feature::Kind::Rmct:
            return "rmct";
        case Feature::Kind::Haar:
            return "haar";
        default:
            return "hog";
    }
}

std::vector<Feature> rmctFeatures(int width, int height) {
    std::vector<Feature> out;
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            Feature f;
            f.kind = Feature::Kind::Rmct;
            f.x = x;
            f.y = y;
            out.push_back(f);
        }
    return out;
}

std::vector<Feature> randomHaarFeatures(int width, int height, int count, std::uint64_t seed) {
    LQ_ASSERT_MSG(width >= 4 && height >= 4, "window too small for Haar features");
    Draw draw(seed);
    std::vector<Feature> out;
    while (static_cast<int>(out.size()) < count) {
        const int w = draw.between(4, width), h = draw.between(4, height);
        const int l = draw.between(0, width - w), t = draw.between(0, height - h);
        LQ::BaseRect<int> all(l, t, l + w, t + h), pos;
        switch (draw.below(5)) {
            case 0:
                pos = LQ::BaseRect<int>(l, t, l + w / 2, t + h);
                break;
            case 1:
                pos = LQ::BaseRect<int>(l, t, l + w, t + h / 2);
                break;
            case 2:
                pos = LQ::BaseRect<int>(l + w / 3, t, l + w - w / 3, t + h);
                break;
            case 3:
                pos = LQ::BaseRect<int>(l, t + h / 3, l + w, t + h - h / 3);
                break;
            default: {
                const int sw = draw.between(1, w), sh = draw.between(1, h);
                const int sl = l + draw.between(0, w - sw), st = t + draw.between(0, h - sh);
                pos = LQ::BaseRect<int>(sl, st, sl + sw, st + sh);
            }
        }
        if (pos.area() <= 0 || pos.area() >= all.area()) continue;
        Feature f;
        f.kind = Feature::Kind::Haar;
        f.first = all;
        f.second = pos;
        out.push_back(f);
    }
    return out;
}

std::vector<Feature> randomHogFeatures(int width, int height, int count, std::uint64_t seed) {
    // the scan's HOG region is the blocks widened by one and must lie in the window
    LQ_ASSERT_MSG(width >= 6 && height >= 6, "window too small for HOG features");
    Draw draw(seed);
    std::vector<Feature> out;
    const int maxW = std::min(16, (width - 2) & ~1), maxH = std::min(16, (height - 2) & ~1);
    while (static_cast<int>(out.size()) < count) {
        const int w = 2 * draw.between(2, maxW / 2), h = 2 * draw.between(2, maxH / 2);
        const int l = draw.between(1, width - 1 - w), t = draw.between(1, height - 1 - h);
        const LQ::BaseRect<int> block(l, t, l + w, t + h);
        const int part = draw.below(5);
        LQ::BaseRect<int> cell = block;
        if (part < 4) {
            const int cl = l + (part & 1) * (w / 2), ct = t + (part >> 1) * (h / 2);
            cell = LQ::BaseRect<int>(cl, ct, cl + w / 2, ct + h / 2);
        }
        Feature f;
        f.kind = Feature::Kind::Hog;
        f.first = block;
        f.second = cell;
        f.sector = draw.below(WeakClassifierHog::NUM_SECTORS);
        out.push_back(f);
    }
    return out;
}

size_t SampleSet::positives() const {
    return static_cast<size_t>(std::count(positive_.begin(), positive_.end(), std::uint8_t(1)));
}

void SampleSet::add(const std::uint8_t* crop, bool positive) {
    bytes_.insert(bytes_.end(), crop, crop + cropBytes());
    positive_.push_back(positive ? 1 : 0);
}

void SampleSet::keep(const std::vector<bool>& flags) {
    size_t out = 0;
    for (size_t i = 0; i < positive_.size(); ++i) {
        if (!flags[i]) continue;
        if (out != i) {
            std::memmove(bytes_.data() + out * cropBytes(), bytes_.data() + i * cropBytes(), cropBytes());
            positive_[out] = positive_[i];
        }
        ++out;
    }
    positive_.resize(out);
    bytes_.resize(out * cropBytes());
}

LQ::Image SampleSet::image(size_t i) const {
    LQ::Image view;
    view.createRef(const_cast<std::uint8_t*>(crop(i)), LQ::BaseSize<int>(cropWidth(), cropHeight()),
                   LQ::COLOR_MODE_MONO, static_cast<unsigned int>(cropWidth()));
    return view;
}

void WindowFeatures::compute(const LQ::Image& crop) {
    width_ = crop.width() - 2 * kMargin;
    height_ = crop.height() - 2 * kMargin;
    LQ::computeRmct(crop, rmct_);
    LQ::computeIntegral(crop, integral_);
    LQ::computeIntegralHog(crop, hog_,
                           LQ::BaseRect<int>(kMargin, kMargin, kMargin + width_, kMargin + height_),
                           LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
}

const unsigned char* WindowFeatures::rmct() const {
    return rmct_.row(kMargin) + kMargin;
}
const unsigned int* WindowFeatures::integral() const {
    return integral_.row<unsigned int>(kMargin) + kMargin;
}
const unsigned int* WindowFeatures::hog() const {
    return hog_.row<unsigned int>(0);
}

int WindowFeatures::value(const Feature& feature) const {
    switch (feature.kind) {
        case Feature::Kind::Rmct:
            return rmct()[feature.x + feature.y * static_cast<int>(rmct_.stripLength())];
        case Feature::Kind::Haar: {
            WeakClassifierHaar haar;
            haar.set(feature.first, feature.second);
            haar.setStripLength(integral_.stripLength() / 4);
            return haar.index(integral());
        }
        default: {
            WeakClassifierHog hog;
            hog.setBlock(feature.first);
            hog.setCell(feature.second);
            hog.setSector(feature.sector);
            hog.setRowLength(static_cast<int>(hog_.stripLength() / 4));
            return hog.index(this->hog());
        }
    }
}

void FeatureMatrix::compute(const SampleSet& samples, const std::vector<Feature>& features, int threads) {
    samples_ = samples.size();
    values_.assign(features.size() * samples_, 0);
    parallelFor(samples_, threads, [&](size_t from, size_t to, size_t) {
        WindowFeatures window;
        for (size_t n = from; n < to; ++n) {
            window.compute(samples.image(n));
            for (size_t f = 0; f < features.size(); ++f)
                values_[f * samples_ + n] = static_cast<std::uint8_t>(window.value(features[f]));
        }
    });
}

int StageModel::sum(const WindowFeatures& window) const {
    int total = 0;
    for (const WeakModel& w : weak) total += w.table[static_cast<size_t>(window.value(w.feature))];
    return total;
}

int thresholdFor(std::vector<int> sums, double hitRate) {
    if (sums.empty()) return 0;
    std::sort(sums.begin(), sums.end());
    const size_t drop =
        std::min(sums.size() - 1, static_cast<size_t>(std::floor((1.0 - hitRate) * sums.size() + 1e-9)));
    return sums[drop];
}

StageModel trainStage(const SampleSet& samples, const std::vector<Feature>& candidates,
                      const FeatureMatrix& matrix, const StageOptions& options, StageReport* report,
                      std::ostream* log) {
    const size_t n = samples.size();
    LQ_ASSERT_MSG(matrix.samples() == n && n > 0, "feature matrix doesn't match the samples");
    const size_t positives = samples.positives();
    LQ_ASSERT_MSG(positives > 0 && positives < n, "a stage needs positives and negatives");
    std::vector<double> weight(n);
    std::vector<std::uint8_t> label(n);
    for (size_t i = 0; i < n; ++i) {
        label[i] = samples.positive(i) ? 1 : 0;
        weight[i] = label[i] ? 0.5 / positives : 0.5 / (n - positives);
    }
    const double scale = 127.0 / options.maxScore;
    const double eps = options.smoothing / static_cast<double>(n);
    std::vector<int> sums(n, 0);
    StageModel stage;

    struct Best {
        double z = std::numeric_limits<double>::infinity();
        size_t feature = 0;
        std::array<signed char, 256> table{};
    };
    const int threads = std::max(1, options.threads);
    for (int round = 0; round < options.rounds; ++round) {
        std::vector<Best> best(static_cast<size_t>(threads));
        parallelFor(candidates.size(), threads, [&](size_t from, size_t to, size_t part) {
            std::vector<double> hist(512);
            std::array<signed char, 256> table;
            for (size_t f = from; f < to; ++f) {
                std::fill(hist.begin(), hist.end(), 0.0);
                const std::uint8_t* v = matrix.row(f);
                for (size_t i = 0; i < n; ++i) hist[(static_cast<size_t>(label[i]) << 8) | v[i]] += weight[i];
                double z = 0;
                for (int b = 0; b < 256; ++b) {
                    const double neg = hist[b], pos = hist[256 + b];
                    const double h = 0.5 * std::log((pos + eps) / (neg + eps));
                    const long q = std::lround(std::max(-127.0, std::min(127.0, h * scale)));
                    table[b] = static_cast<signed char>(q);
                    z += pos * std::exp(-q / scale) + neg * std::exp(q / scale);
                }
                if (z < best[part].z) {
                    best[part].z = z;
                    best[part].feature = f;
                    best[part].table = table;
                }
            }
        });
        // the parts cover ascending ranges: the first of equal normalisers wins
        Best chosen;
        for (const Best& b : best)
            if (b.z < chosen.z) chosen = b;
        WeakModel weak;
        weak.feature = candidates[chosen.feature];
        weak.table = chosen.table;
        stage.weak.push_back(weak);

        const std::uint8_t* v = matrix.row(chosen.feature);
        double total = 0;
        for (size_t i = 0; i < n; ++i) {
            const int q = chosen.table[v[i]];
            sums[i] += q;
            weight[i] *= std::exp((label[i] ? -q : q) / scale);
            total += weight[i];
        }
        for (double& w : weight) w /= total;

        if (log) {
            std::vector<int> pos;
            for (size_t i = 0; i < n; ++i)
                if (label[i]) pos.push_back(sums[i]);
            const int threshold = thresholdFor(pos, options.hitRate);
            size_t falsePositives = 0;
            for (size_t i = 0; i < n; ++i) falsePositives += !label[i] && sums[i] >= threshold;
            const Feature& f = weak.feature;
            *log << "  round " << round + 1 << " " << kindName(f.kind) << " ";
            if (f.kind == Feature::Kind::Rmct)
                *log << "(" << f.x << "," << f.y << ")";
            else
                *log << f.first << " " << f.second
                     << (f.kind == Feature::Kind::Hog ? " s" + std::to_string(f.sector) : "");
            *log << " z=" << chosen.z << " threshold=" << threshold
                 << " fp=" << static_cast<double>(falsePositives) / static_cast<double>(n - positives)
                 << "\n";
        }
    }

    std::vector<int> pos, neg;
    for (size_t i = 0; i < n; ++i) (label[i] ? pos : neg).push_back(sums[i]);
    stage.threshold = thresholdFor(pos, options.hitRate);
    if (report) {
        size_t hits = 0, falsePositives = 0;
        for (int s : pos) hits += s >= stage.threshold;
        for (int s : neg) falsePositives += s >= stage.threshold;
        report->hitRate = static_cast<double>(hits) / static_cast<double>(pos.size());
        report->falsePositiveRate = static_cast<double>(falsePositives) / static_cast<double>(neg.size());
        report->positiveSums = pos;
        report->negativeSums = neg;
    }
    return stage;
}

StrongClassifier toStrongClassifier(const StageModel& stage) {
    StrongClassifier out;
    auto table = [](const WeakModel& w) {
        LQ::schar* data = new LQ::schar[256];
        std::memcpy(data, w.table.data(), 256);
        return data;
    };
    for (const Feature::Kind kind : {Feature::Kind::Rmct, Feature::Kind::Haar, Feature::Kind::Hog})
        for (const WeakModel& w : stage.weak) {
            if (w.feature.kind != kind) continue;
            LQ::schar* data = table(w);
            if (kind == Feature::Kind::Rmct) {
                WeakClassifierRmct c(LQ::BasePoint<int>(w.feature.x, w.feature.y));
                c.setData(data);
                c.owner = LQ::SharedArray<LQ::schar>(data, true);
                out.addRmctClassifier(c);
            } else if (kind == Feature::Kind::Haar) {
                WeakClassifierHaar c;
                c.set(w.feature.first, w.feature.second);
                c.setData(data);
                c.owner = LQ::SharedArray<LQ::schar>(data, true);
                out.addHaarClassifier(c);
            } else {
                WeakClassifierHog c;
                c.setBlock(w.feature.first);
                c.setCell(w.feature.second);
                c.setSector(w.feature.sector);
                c.setData(data);
                c.owner = LQ::SharedArray<LQ::schar>(data, true);
                out.addHogClassifier(c);
            }
        }
    out.setThreshold(stage.threshold);
    return out;
}

}  // namespace ctrain
