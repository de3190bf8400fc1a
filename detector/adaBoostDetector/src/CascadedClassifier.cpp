#include "CascadedClassifier.h"

#include <algorithm>
#include <set>
#include <sstream>

#include "LQ_Integral.h"
#include "LQ_Utils.h"

namespace {
// the last window's integral position must lie inside the integral image
void checkShift(const int* pShift, const LQ::BaseRect<int>& rect, const LQ::Image& integralImage) {
    LQ_ASSERT_MSG(pShift[rect.right] < integralImage.width(),
                  "ShiftX " << pShift[rect.right] << " not compatible with integral image " << integralImage.size());
    LQ_ASSERT_MSG(pShift[rect.bottom] < integralImage.height(),
                  "ShiftY " << pShift[rect.bottom] << " not compatible with integral image " << integralImage.size());
}

// One stable text per distinct name: hits keep a pointer to it and grouping compares
// names by pointer, so every cascade of a ring must hand out the same one.
const char* internName(const std::string& name) {
    static std::set<std::string> names;
    return names.insert(name).first->c_str();
}
}  // namespace

CascadedClassifier& CascadedClassifier::operator=(const CascadedClassifier& other) {
    if (this == &other) return *this;
    ClassifierProperties::operator=(other);
    strongClassifiers = other.strongClassifiers;
    hogImage_ = LQ::Image();
    hogRoiComputed_ = other.hogRoiComputed_;
    hogRoi_ = other.hogRoi_;
    monoStride_ = other.monoStride_;
    firstHogStage_ = other.firstHogStage_;
    firstStageFlag_ = other.firstStageFlag_;
    startStage_ = other.startStage_;
    firstThreshold_ = other.firstThreshold_;
    shiftTables_ = other.shiftTables_;
    firstStage_ = other.firstStage_ ? &strongClassifiers.front() : nullptr;
    sharedName_ = other.sharedName_;
    hogComputations_ = 0;
    layerHog_ = nullptr;
    denseRowShare_ = other.denseRowShare_;
    layerHogShare_ = other.layerHogShare_;
    hogRowLength_ = other.hogRowLength_;
    return *this;
}

void CascadedClassifier::setName(const std::string& name) {
    ClassifierProperties::setName(name);
    sharedName_ = internName(name);
}

void CascadedClassifier::setLastStageThreshold(int threshold) {
    if (strongClassifiers.empty()) return;
    strongClassifiers.back().setThreshold(threshold);
    if (strongClassifiers.size() == 1 && firstStage_) firstThreshold_ = threshold;
}

void CascadedClassifier::resetRunTimeState() {
    hogRoiComputed_ = false;
    hogRoi_ = LQ::BaseRect<int>();
    firstStage_ = nullptr;
    firstHogStage_ = 0x7fffffff;
    firstStageFlag_ = false;
    startStage_ = 0;
    firstThreshold_ = INT_MIN;
    hogRowLength_ = 0;
}

void CascadedClassifier::rotate() {
    resetRunTimeState();
    for (StrongClassifier& stage : strongClassifiers) stage.rotate(monoSize);
    ClassifierProperties::rotate();
}

void CascadedClassifier::flipVertically() {
    resetRunTimeState();
    for (StrongClassifier& stage : strongClassifiers) stage.flip(monoSize);
    ClassifierProperties::flip();
}

void CascadedClassifier::calculateHogRoi() {
    if (hogRoiComputed_) return;
    hogRoiComputed_ = true;
    hogRoi_ = LQ::BaseRect<int>();
    firstHogStage_ = static_cast<int>(strongClassifiers.size());
    for (size_t s = 0; s < strongClassifiers.size(); ++s) {
        if (strongClassifiers[s].hogClassifiers().empty()) continue;
        const LQ::BaseRect<int> roi = strongClassifiers[s].calculateHogRoi();
        if (firstHogStage_ == static_cast<int>(strongClassifiers.size())) {
            hogRoi_ = roi;
            firstHogStage_ = static_cast<int>(s);
        } else {
            hogRoi_ = LQ::BaseRect<int>(std::min(hogRoi_.left, roi.left), std::min(hogRoi_.top, roi.top),
                                        std::max(hogRoi_.right, roi.right), std::max(hogRoi_.bottom, roi.bottom));
        }
    }
    const LQ::BaseRect<int> monoRect(0, 0, monoSize.width + 1, monoSize.height + 1);
    LQ_ASSERT_MSG(monoRect.contains(hogRoi_), "Computed hogRoi " << hogRoi_ << " is out of monoSize + 1 " << monoRect);
    for (StrongClassifier& stage : strongClassifiers) stage.moveHogRoi(hogRoi_);
    hogRowLength_ = ((hogRoi_.right - hogRoi_.left + 1) * 28) >> 2;
}

void CascadedClassifier::useHogRowLength(int rowLength) {
    if (rowLength == hogRowLength_) return;
    for (StrongClassifier& stage : strongClassifiers) stage.setHogRowLength(rowLength);
    hogRowLength_ = rowLength;
}

const unsigned int* CascadedClassifier::windowHog(const unsigned char* m, int x, int y) {
    const LQ::BaseRect<int> region(x + hogRoi_.left, y + hogRoi_.top, x + hogRoi_.right, y + hogRoi_.bottom);
    if (layerHog_ && layerHog_->rect.contains(region)) {
        LayerHog& shared = *layerHog_;
        if (!shared.computed) {
            LQ::computeIntegralHog(*shared.mono, shared.image, shared.rect, LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
            shared.computed = true;
            ++hogComputations_;
        }
        const int width = shared.rect.width() + 1;
        useHogRowLength(width * 7);
        return reinterpret_cast<const unsigned int*>(shared.image.data()) +
               (static_cast<size_t>(region.top - shared.rect.top) * width + (region.left - shared.rect.left)) * 7;
    }
    LQ::computeIntegralHog(m, monoStride_, hogImage_, hogRoi_, LQ::COLOR_MODE_INTEGRAL_HOG_UNSIGNED6);
    ++hogComputations_;
    useHogRowLength(((hogRoi_.right - hogRoi_.left + 1) * 28) >> 2);
    return reinterpret_cast<const unsigned int*>(hogImage_.data());
}

void CascadedClassifier::activate(int rmctStride, int monoStride, int integralStride, float scale,
                                  const LQ::BaseSize<int>& monoSize) {
    calculateHogRoi();
    monoStride_ = monoStride;
    LQ_ASSERT_MSG(LQ::Rect(monoSize).contains(hogRoi_), "image Size " << monoSize << " to small for Hog " << hogRoi_);
    for (StrongClassifier& stage : strongClassifiers) stage.activate(rmctStride, integralStride, scale);
    if (!firstStage_) {
        LQ_ASSERT_MSG(!strongClassifiers.empty(), "Activating empty cascade Classifier " << getName());
        firstStage_ = &strongClassifiers.front();
        const StrongClassifier& first = *firstStage_;
        firstStageFlag_ = !first.rmctClassifiers().empty() && first.haarClassifiers().empty() &&
                          first.hogClassifiers().empty();
        startStage_ = firstStageFlag_ ? 1 : 0;
        firstThreshold_ = first.getThreshold();
    }
}

void CascadedClassifier::addMatches(const LQ::Image& rmct, const LQ::Image& mono, const LQ::Image& integral,
                                    std::vector<AdaObject>& objects, const LQ::BaseRect<int>& roi, float scale,
                                    int step) {
    const int W = monoSize.width, H = monoSize.height;
    // windows whose object lies in roi, clipped to the layer
    LQ::BaseRect<int> windows(roi.left - objectRect_.left, roi.top - objectRect_.top,
                              roi.right + W - objectRect_.right, roi.bottom + H - objectRect_.bottom);
    windows = windows.intersect(mono.rect());
    if (windows.area() == 0) windows = LQ::BaseRect<int>();
    const int lastX = windows.right - W;
    const int lastY = windows.bottom - H;
    if (windows.left > lastX || windows.top > lastY) return;

    const int m = std::max(std::max(lastX, lastY), 1);
    const int k = scaleBucket(scale);
    std::vector<int>& shift = shiftTables_[k];
    // a table made at one scale serves the later scales of its bucket
    if (static_cast<int>(shift.size()) < m + 1) {
        shift.resize(m + 1);
        for (int i = 0; i <= m; ++i) shift[i] = static_cast<int>(i * scale);
    }
    activate(static_cast<int>(rmct.stripLength()), static_cast<int>(mono.stripLength()),
             static_cast<int>(integral.stripLength()), scale, monoSize);

    const LQ::BaseRect<int> positions(windows.left, windows.top, lastX, lastY);
    const StrongClassifier& first = strongClassifiers.front();
    if (first.haarClassifiers().size() == 1 && first.rmctClassifiers().empty() && first.hogClassifiers().empty())
        addMatchesDynamic(rmct, mono, integral, objects, positions, k, step);
    else
        addMatchesStatic(rmct, mono, integral, objects, positions, k, step);
}

void CascadedClassifier::addMatches(const LQ::Image& rmct, const LQ::Image& mono, const LQ::Image& integral,
                                    std::vector<AdaObject>& objects, float scale, int step) {
    addMatches(rmct, mono, integral, objects, rmct.rect(), scale, step);
}

void CascadedClassifier::appendObject(std::vector<AdaObject>& objects, int x, int y, int score) const {
    objects.emplace_back(sharedName_, baseSize_, LQ::BasePoint<int>(objectCenter_.x + x, objectCenter_.y + y),
                         (side_ & 1) ? SIDE_SCORE : -SIDE_SCORE, 1.0f, angle_, 1, score);
}

bool CascadedClassifier::passesFrom(int first, const unsigned char* r, const unsigned char* m,
                                    const unsigned int* i, int x, int y, int& score) {
    const int stages = static_cast<int>(strongClassifiers.size());
    const unsigned int* hog = nullptr;
    for (int s = first; s < stages; ++s) {
        if (!hog && s >= firstHogStage_) hog = windowHog(m, x, y);
        const StrongClassifier& stage = strongClassifiers[s];
        score = stage.totalScore(r, hog, i);
        if (score < stage.getThreshold()) return false;
    }
    return true;
}

namespace {
// row stages taken densely at most
constexpr int kMaxDenseStages = 16;

bool censusOnly(const StrongClassifier& stage) {
    return stage.haarClassifiers().empty() && stage.hogClassifiers().empty();
}

// Keeps those of list[0, n) whose stage sum reaches the stage's threshold, in order, with
// that sum; returns how many. pointers(window, rmct, hog, integral) finds a window's data.
// Four windows at a time, the last group filled up with the last window.
template <class Survivor, class Pointers>
int keepPassing(const StrongClassifier& stage, Survivor* list, int n, const Pointers& pointers) {
    const int threshold = stage.getThreshold();
    int kept = 0;
    for (int c = 0; c < n; c += 4) {
        const unsigned char* rmct[4];
        const unsigned int* hog[4];
        const unsigned int* integral[4];
        Survivor group[4];
        for (int j = 0; j < 4; ++j) {
            group[j] = list[std::min(c + j, n - 1)];
            pointers(group[j], rmct[j], hog[j], integral[j]);
        }
        int sums[4];
        stage.totalScores(rmct, hog, integral, sums);
        // written behind the reading position: kept never passes c
        for (int j = 0; j < 4 && c + j < n; ++j) {
            list[kept] = group[j];
            list[kept].score = sums[j];
            kept += sums[j] >= threshold;
        }
    }
    return kept;
}
}  // namespace

void CascadedClassifier::addMatchesStatic(const LQ::Image& rmct, const LQ::Image& mono,
                                          const LQ::Image& integralImage, std::vector<AdaObject>& objects,
                                          const LQ::BaseRect<int>& rect, int bucket, int step) {
    const int* pShift = shiftTables_[bucket].data();
    checkShift(pShift, rect, integralImage);

    const size_t rmctStride = rmct.stripLength();
    const size_t monoStride = mono.stripLength();
    const size_t integralStride = integralImage.stripLength() / sizeof(unsigned int);
    const unsigned int* integral = reinterpret_cast<const unsigned int*>(integralImage.data());
    const unsigned char* rmctEnd = rmct.row(rmct.height() - 1) + rmct.width();
    const StrongClassifier::RmctTest* tests = firstStage_->packedBegin();
    const int testCount = static_cast<int>(firstStage_->packedEnd() - tests);
    const int stages = static_cast<int>(strongClassifiers.size());
    // Census stages go on right after the first, over one row's survivors while its census
    // rows are at hand; the rest run over the survivors of the whole layer, stage by stage.
    int rowStages = startStage_;
    while (rowStages < stages && censusOnly(strongClassifiers[rowStages])) ++rowStages;
    const int count = (rect.right - rect.left) / step + 1;
    const size_t windows = static_cast<size_t>(count) * ((rect.bottom - rect.top) / step + 1);
    if (static_cast<int>(passed_.size()) < count) {
        passed_.resize(count);
        passedScores_.resize(count);
    }
    if (survivors_.size() < windows) survivors_.resize(windows);
    int* passed = passed_.data();
    int* scores = passedScores_.data();
    Survivor* list = survivors_.data();
    const auto plain = [&](const Survivor& w, const unsigned char*& r, const unsigned int*& h,
                           const unsigned int*& i) {
        r = rmct.data() + w.y * rmctStride + w.x;
        h = nullptr;
        i = integral + pShift[w.y] * integralStride + pShift[w.x];
    };

    // The row stages the dense kernel can take from the first on: those whose sums fit its
    // 16-bit lanes. It pays where many windows pass the first stage; whether they do is taken
    // from the row before, rows being alike.
    CensusStage dense[kMaxDenseStages];
    int denseCount = 0;
    if (firstStageFlag_ && testCount <= kMaxVectorCensusTests) {
        dense[denseCount++] = CensusStage{tests, testCount, firstThreshold_};
        for (int s = 1; s < rowStages && denseCount < kMaxDenseStages; ++s) {
            const StrongClassifier& stage = strongClassifiers[s];
            const int n = static_cast<int>(stage.packedEnd() - stage.packedBegin());
            if (n > kMaxVectorCensusTests) break;
            dense[denseCount++] = CensusStage{stage.packedBegin(), n, stage.getThreshold()};
        }
    }
    int reached[kMaxDenseStages] = {};
    bool denseRow = false;

    int listed = 0;
    for (int y = rect.top; y <= rect.bottom; y += step) {
        const unsigned char* rmctRow = rmct.data() + y * rmctStride;
        int n = count, from = startStage_;
        if (denseRow) {
            n = censusStagesPass(rmctRow + rect.left, rmctEnd, step, count, dense, denseCount, passed, scores,
                                 reached);
            from = denseCount;
        } else if (firstStageFlag_) {
            n = firstStagePasses(rmctRow + rect.left, rmctEnd, step, count, tests, testCount, firstThreshold_,
                                 passed, scores);
            reached[0] = n;
        } else {
            for (int k = 0; k < count; ++k) passed[k] = k;
            std::fill(scores, scores + count, 0);
        }
        denseRow = denseCount > 1 && reached[0] >= denseRowShare_ * count;
        Survivor* row = list + listed;
        for (int c = 0; c < n; ++c) row[c] = Survivor{rect.left + passed[c] * step, y, scores[c]};
        for (int s = from; s < rowStages && n > 0; ++s) n = keepPassing(strongClassifiers[s], row, n, plain);
        listed += n;
    }

    int s = rowStages;
    for (; s < std::min(stages, firstHogStage_) && listed > 0; ++s)
        listed = keepPassing(strongClassifiers[s], list, listed, plain);
    if (s < stages && listed > 0) {
        // HOG stages: from the layer's integral HOG where it holds every survivor, else
        // window by window, each with its own
        bool shared = layerHog_ != nullptr;
        for (int c = 0; c < listed && shared; ++c)
            shared = layerHog_->rect.contains(LQ::BaseRect<int>(list[c].x + hogRoi_.left, list[c].y + hogRoi_.top,
                                                                list[c].x + hogRoi_.right, list[c].y + hogRoi_.bottom));
        // Not made yet: the layer's costs its area, the windows' own their regions each. It is
        // made once what the layer's cascades have spent on their own would pay for it, so
        // that a layer never costs more than twice the cheaper way.
        const double own = static_cast<double>(listed) * hogRoi_.area();
        if (shared && !layerHog_->computed)
            shared = layerHog_->ownArea + own >= layerHogShare_ * layerHog_->rect.area();
        if (!shared && layerHog_) layerHog_->ownArea += own;
        if (shared) {
            const unsigned int* hog = windowHog(mono.data() + list[0].y * monoStride + list[0].x, list[0].x, list[0].y);
            const size_t width = static_cast<size_t>(layerHog_->rect.width()) + 1;
            const int left = list[0].x, top = list[0].y;
            const auto withHog = [&](const Survivor& w, const unsigned char*& r, const unsigned int*& h,
                                     const unsigned int*& i) {
                plain(w, r, h, i);
                h = hog + (static_cast<ptrdiff_t>(w.y - top) * static_cast<ptrdiff_t>(width) + (w.x - left)) * 7;
            };
            for (; s < stages && listed > 0; ++s) listed = keepPassing(strongClassifiers[s], list, listed, withHog);
        } else {
            LayerHog* layer = layerHog_;
            layerHog_ = nullptr;
            int kept = 0;
            for (int c = 0; c < listed; ++c) {
                Survivor w = list[c];
                const unsigned char* r;
                const unsigned int *h, *i;
                plain(w, r, h, i);
                if (!passesFrom(s, r, mono.data() + w.y * monoStride + w.x, i, w.x, w.y, w.score)) continue;
                list[kept++] = w;
            }
            layerHog_ = layer;
            listed = kept;
        }
    }
    for (int c = 0; c < listed; ++c) appendObject(objects, list[c].x, list[c].y, list[c].score);
}

void CascadedClassifier::addMatchesDynamic(const LQ::Image& rmct, const LQ::Image& mono,
                                           const LQ::Image& integralImage, std::vector<AdaObject>& objects,
                                           const LQ::BaseRect<int>& rect, int bucket, int step) {
    const int* pShift = shiftTables_[bucket].data();
    checkShift(pShift, rect, integralImage);

    AbsFeature feature(*strongClassifiers.front().activeHaar(), firstThreshold_);
    feature.setStripLength(static_cast<uint16_t>(integralImage.stripLength()));
    const size_t rmctStride = rmct.stripLength();
    const size_t monoStride = mono.stripLength();
    const size_t integralStride = integralImage.stripLength() / sizeof(unsigned int);
    const unsigned int* integral = reinterpret_cast<const unsigned int*>(integralImage.data());

    for (int y = rect.top; y <= rect.bottom; y += step) {
        const unsigned char* rmctRow = rmct.data() + y * rmctStride;
        const unsigned char* monoRow = mono.data() + y * monoStride;
        const unsigned int* integralRow = integral + pShift[y] * integralStride;
        for (int x = rect.left; x <= rect.right; x += step) {
            const unsigned int* i = integralRow + pShift[x];
            if (!feature.passes(i)) continue;
            int score = 0;
            if (!passesFrom(1, rmctRow + x, monoRow + x, i, x, y, score)) continue;
            appendObject(objects, x, y, score);
        }
    }
}

bool CascadedClassifier::detect(const unsigned char* rmct, const unsigned char* mono, const unsigned int* integral,
                                unsigned int firstStage, int& score) {
    if (firstStage >= strongClassifiers.size()) return true;
    int value = score;
    // a lone window has no layer position: it always gets its own integral HOG
    LayerHog* shared = layerHog_;
    layerHog_ = nullptr;
    const bool passed = passesFrom(static_cast<int>(firstStage), rmct, mono, integral, 0, 0, value);
    layerHog_ = shared;
    if (!passed) {
        score = value;
        return false;
    }
    score = value;
    return true;
}

namespace {
constexpr int MAX_STAGES = 10000;
// words kept free after each cascade record for later fields
constexpr int RESERVED_WORDS = 1000;
constexpr int MAX_WINDOW_SIDE = 4096;

bool inside(const LQ::BaseRect<int>& r, const LQ::BaseSize<int>& size) {
    return r.left >= 0 && r.top >= 0 && r.left <= r.right && r.top <= r.bottom && r.right <= size.width &&
           r.bottom <= size.height;
}

// Every feature inside the window: the scan reads no pixel outside a window it places in
// the image, so a corrupt file can't make it read out of bounds.
bool featuresInWindow(const std::vector<StrongClassifier>& stages, const LQ::BaseSize<int>& size) {
    for (const StrongClassifier& stage : stages) {
        for (const WeakClassifierRmct& c : stage.rmctClassifiers())
            if (c.point.x < 0 || c.point.y < 0 || c.point.x >= size.width || c.point.y >= size.height) return false;
        for (const WeakClassifierHaar& c : stage.haarClassifiers())
            if (!inside(c.allRect, size) || !inside(c.posRect, size)) return false;
        for (const WeakClassifierHog& c : stage.hogClassifiers())
            if (!inside(c.block, size) || !inside(c.cell, size) || c.cell.left < c.block.left ||
                c.cell.top < c.block.top || c.cell.right > c.block.right || c.cell.bottom > c.block.bottom)
                return false;
    }
    return true;
}

void writeCounts(std::ostream& stream, const char* what, const std::string& prefix,
                 const std::vector<StrongClassifier>& stages, size_t (*count)(const StrongClassifier&)) {
    stream << what << prefix << "[" << stages.size() << "] = {";
    for (const StrongClassifier& stage : stages) stream << count(stage) << ", ";
    stream << "};\n";
}

// the four values of a rectangle stored from byte first of row j
std::string rowRect(const std::string& table, int first) {
    std::ostringstream text;
    for (int k = 0; k < 4; ++k) text << (k ? ", " : "") << table << "[j][" << first + k << "]";
    return text.str();
}
}  // namespace

void CascadedClassifier::save(std::ostream& stream) const {
    stream << monoSize.width << ' ' << monoSize.height << '\n';
    stream << baseSize_.width << ' ' << baseSize_.height << '\n';
    stream << (getName().empty() ? "-" : getName()) << '\n';
    stream << (isSymmetric() ? 1 : 0) << '\n';
    stream << strongClassifiers.size() << '\n';
    stream << angle_ << '\n';
    for (const StrongClassifier& stage : strongClassifiers) stage.save(stream);
    for (int k = 0; k < RESERVED_WORDS; ++k) stream << 0 << ' ';
}

bool CascadedClassifier::load(std::istream& stream) {
    LQ::BaseSize<int> mono, base;
    std::string name;
    int symmetric = 0, stageCount = 0, angle = 0;
    stream >> mono.width >> mono.height >> base.width >> base.height >> name >> symmetric >> stageCount >> angle;
    stream.get();
    if (!stream || stageCount < 0 || stageCount > MAX_STAGES) return false;
    if (mono.width < 1 || mono.height < 1 || mono.width > MAX_WINDOW_SIDE || mono.height > MAX_WINDOW_SIDE ||
        base.width < 1 || base.height < 1 || base.width > mono.width || base.height > mono.height)
        return false;

    *this = CascadedClassifier();
    // the file keeps no centre: the object sits in the middle of the window
    setMonoSize(mono);
    setBaseSize(base);
    setObjectCenter(LQ::BasePoint<int>(mono.width / 2, mono.height / 2));
    setName(name);
    setSymmetry(symmetric == 1);
    setAngle(angle);
    for (int s = 0; s < stageCount && stream; ++s) {
        // a stage that can't be read is kept as it stands; the stream's state tells the rest
        StrongClassifier stage;
        stage.load(stream);
        addStrongClassifier(stage);
    }
    int reserved = 0;
    for (int k = 0; k < RESERVED_WORDS && stream; ++k) stream >> reserved;
    return !stream.fail() && featuresInWindow(strongClassifiers, monoSize);
}

void CascadedClassifier::writeClassifier(std::ostream& stream, const std::string& prefix) const {
    const size_t n = strongClassifiers.size();
    for (size_t i = 0; i < n; ++i) strongClassifiers[i].writeStrongClassifier(stream, prefix + LQ::toStr(i));
    stream << "\n\n    int set_threshold_" << prefix << "[" << n << "] = {";
    for (const StrongClassifier& stage : strongClassifiers) stream << stage.getThreshold() << ", ";
    stream << "};\n";
    writeCounts(stream, "    short set_weak_classifiers_rmct_n_", prefix, strongClassifiers,
                [](const StrongClassifier& s) { return s.rmctClassifiers().size(); });
    writeCounts(stream, "    short set_weak_classifiers_haar_n_", prefix, strongClassifiers,
                [](const StrongClassifier& s) { return s.haarClassifiers().size(); });
    writeCounts(stream, "    short set_weak_classifiers_hog_n_", prefix, strongClassifiers,
                [](const StrongClassifier& s) { return s.hogClassifiers().size(); });

    const std::string c = "    " + prefix + "_cascadedClassifier.";
    stream << "    static CascadedClassifier " << prefix << "_cascadedClassifier;\n";
    stream << "    StrongClassifier " << prefix << "_strong_classifier;\n";
    stream << "    WeakClassifierRmct " << prefix << "_weak_rmct;\n";
    stream << "    WeakClassifierHaar " << prefix << "_weak_haar;\n";
    stream << "    WeakClassifierHog " << prefix << "_weak_hog;\n";
    stream << c << "setMonoSize(LQ::" << monoSize << ");\n";
    stream << c << "setBaseSize(LQ::" << baseSize_ << ");\n";
    // only an object away from the middle needs its centre: the others get it from the sizes
    const LQ::BasePoint<int> middle(monoSize.width / 2, monoSize.height / 2);
    if (baseSize_ != monoSize || objectCenter_ != middle)
        stream << c << "setObjectCenter(LQ::" << objectCenter_ << ");\n";
    stream << c << "setAngle(" << angle_ << ");\n";
    stream << c << "setName(\"" << prefix << "\");\n";
    stream << c << "setSymmetry(" << (isSymmetric() ? 1 : 0) << ");\n";

    stream << "        {\n";
    stream << "        int j;\n";
    const std::string s = "            " + prefix + "_strong_classifier.";
    const std::string rmctN = "set_weak_classifiers_rmct_n_" + prefix;
    const std::string haarN = "set_weak_classifiers_haar_n_" + prefix;
    const std::string hogN = "set_weak_classifiers_hog_n_" + prefix;
    for (size_t i = 0; i < n; ++i) {
        const std::string table = "weak_classifiers_" + prefix + LQ::toStr(i);
        const std::string at = "[" + LQ::toStr(i) + "]";
        stream << s << "reset();\n";
        stream << "        for(j = 0; j < " << rmctN << at << "; j++)\n";
        stream << "        {\n";
        stream << "            " << prefix << "_weak_rmct.set(" << table << "[j][0], " << table << "[j][1]);\n";
        stream << "            " << prefix << "_weak_rmct.setData((LQ::schar*) " << table << "[j] + 2);\n";
        stream << s << "addRmctClassifier(" << prefix << "_weak_rmct);\n";
        stream << "        }\n\n";
        stream << "        for(; j < " << rmctN << at << " + " << haarN << at << "; j++)\n";
        stream << "        {\n";
        stream << "            LQ::Rect allRect(" << rowRect(table, 0) << ");\n";
        stream << "            LQ::Rect posRect(" << rowRect(table, 4) << ");\n";
        stream << "            " << prefix << "_weak_haar.set(allRect, posRect, " << table << "[j][8]);\n";
        stream << "            " << prefix << "_weak_haar.setData((LQ::schar*) " << table << "[j] + 8);\n";
        stream << s << "addHaarClassifier(" << prefix << "_weak_haar);\n";
        stream << "        }\n\n";
        stream << "        for(; j < " << rmctN << at << " + " << haarN << at << " + " << hogN << at << "; j++)\n";
        stream << "        {\n";
        stream << "            " << prefix << "_weak_hog.setBlock(LQ::Rect(" << rowRect(table, 0) << "));\n";
        stream << "            " << prefix << "_weak_hog.setCell(LQ::Rect(" << rowRect(table, 4) << "));\n";
        stream << "            " << prefix << "_weak_hog.setSector(" << table << "[j][8]);\n";
        stream << "            " << prefix << "_weak_hog.setData((LQ::schar*) " << table << "[j] + 9);\n";
        stream << s << "addHogClassifier(" << prefix << "_weak_hog);\n";
        stream << "        }\n\n";
        stream << s << "setThreshold( set_threshold_" << prefix << at << ");\n";
        stream << "            " << prefix << "_cascadedClassifier.addStrongClassifier(" << prefix
               << "_strong_classifier);\n";
    }
    stream << "        }\n";
}
