#include "CascadedClassifier.h"

#include <algorithm>
#include <set>

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
    hogRowLength_ = other.hogRowLength_;
    return *this;
}

void CascadedClassifier::setName(const std::string& name) {
    ClassifierProperties::setName(name);
    sharedName_ = internName(name);
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

void CascadedClassifier::addMatchesStatic(const LQ::Image& rmct, const LQ::Image& mono,
                                          const LQ::Image& integralImage, std::vector<AdaObject>& objects,
                                          const LQ::BaseRect<int>& rect, int bucket, int step) {
    const int* pShift = shiftTables_[bucket].data();
    checkShift(pShift, rect, integralImage);

    const size_t rmctStride = rmct.stripLength();
    const size_t monoStride = mono.stripLength();
    const size_t integralStride = integralImage.stripLength() / sizeof(unsigned int);
    const unsigned int* integral = reinterpret_cast<const unsigned int*>(integralImage.data());
    const StrongClassifier::RmctTest* testsBegin = firstStage_->packedBegin();
    const StrongClassifier::RmctTest* testsEnd = firstStage_->packedEnd();
    const int threshold = firstThreshold_;
    const bool inlineFirst = firstStageFlag_;
    const int start = startStage_;

    for (int y = rect.top; y <= rect.bottom; y += step) {
        const unsigned char* rmctRow = rmct.data() + y * rmctStride;
        const unsigned char* monoRow = mono.data() + y * monoStride;
        const unsigned int* integralRow = integral + pShift[y] * integralStride;
        // the rest of the stages for a window, its first-stage sum in score
        const auto rest = [&](int x, int score) {
            if (passesFrom(start, rmctRow + x, monoRow + x, integralRow + pShift[x], x, y, score))
                appendObject(objects, x, y, score);
        };
        int x = rect.left;
        if (inlineFirst) {
            // two windows at a time: their look-ups don't wait for each other
            for (; x + step <= rect.right; x += 2 * step) {
                const unsigned char* a = rmctRow + x;
                const unsigned char* b = a + step;
                int sumA = 0, sumB = 0;
                for (const StrongClassifier::RmctTest* t = testsBegin; t < testsEnd; ++t) {
                    sumA += t->table[a[t->offset]];
                    sumB += t->table[b[t->offset]];
                }
                if (sumA >= threshold) rest(x, sumA);
                if (sumB >= threshold) rest(x + step, sumB);
            }
            for (; x <= rect.right; x += step) {
                const unsigned char* a = rmctRow + x;
                int sum = 0;
                for (const StrongClassifier::RmctTest* t = testsBegin; t < testsEnd; ++t) sum += t->table[a[t->offset]];
                if (sum >= threshold) rest(x, sum);
            }
        } else {
            for (; x <= rect.right; x += step) rest(x, 0);
        }
    }
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
