#include "StrongClassifier.h"

#include <algorithm>
#include <cmath>

#include "LQ_Utils.h"

int scaleBucket(float scale) {
    // log of the float 1.2
    return static_cast<int>(std::log(static_cast<double>(scale)) / 0.18232159653038368 + 0.5);
}

StrongClassifier& StrongClassifier::operator=(const StrongClassifier& other) {
    if (this == &other) return *this;
    rmct_ = other.rmct_;
    haar_ = other.haar_;
    hog_ = other.hog_;
    resizedHaar_ = other.resizedHaar_;
    threshold_ = other.threshold_;
    clearActive();
    if (other.rmctBegin_ != other.rmctEnd_) {
        rmctBegin_ = rmct_.data();
        rmctEnd_ = rmct_.data() + rmct_.size();
    }
    packed_ = other.packed_;
    if (other.packedBegin_ != other.packedEnd_) {
        packedBegin_ = packed_.data();
        packedEnd_ = packed_.data() + packed_.size();
    }
    if (other.activeBucket_ >= 0) {
        activeBucket_ = other.activeBucket_;
        haarBegin_ = resizedHaar_[activeBucket_].data();
        haarEnd_ = haarBegin_ + resizedHaar_[activeBucket_].size();
    }
    if (other.hogBegin_ != other.hogEnd_) {
        hogBegin_ = hog_.data();
        hogEnd_ = hog_.data() + hog_.size();
    }
    packHaar();
    packHog();
    return *this;
}

void StrongClassifier::packHaar() {
    haarTests_.resize(static_cast<size_t>(haarEnd_ - haarBegin_));
    for (size_t k = 0; k < haarTests_.size(); ++k) {
        const WeakClassifierHaar& h = haarBegin_[k];
        HaarTest& t = haarTests_[k];
        const int first = static_cast<int>(h.firstOffset), second = static_cast<int>(h.secondOffset);
        const int firstDown = static_cast<int>(h.firstHeightStep), secondDown = static_cast<int>(h.secondHeightStep);
        const int corners[8] = {first,
                                first + h.firstWidth,
                                first + firstDown,
                                first + firstDown + h.firstWidth,
                                second,
                                second + h.secondWidth,
                                second + secondDown,
                                second + secondDown + h.secondWidth};
        std::copy(corners, corners + 8, t.corner);
        t.first = h.firstFactor;
        t.second = h.secondFactor;
        t.reciprocal = h.reciprocal;
        t.table = h.divisor ? h.table + 127 : h.table;
        t.source = &h;
    }
    haarTestsBegin_ = haarTests_.data();
    haarTestsEnd_ = haarTestsBegin_ + haarTests_.size();
}

void StrongClassifier::packHog() {
    hogTests_.resize(static_cast<size_t>(hogEnd_ - hogBegin_));
    for (size_t k = 0; k < hogTests_.size(); ++k) {
        const WeakClassifierHog& g = hogBegin_[k];
        HogTest& t = hogTests_[k];
        const int cell[4] = {g.cellOffset + g.sector, g.cellOffset + g.cellEnd, g.cellOffset + g.cellHeightStep + g.sector,
                             g.cellOffset + g.cellHeightStep + g.cellEnd};
        const int block[4] = {g.blockOffset + 6, g.blockOffset + g.blockEnd, g.blockOffset + g.blockHeightStep + 6,
                              g.blockOffset + g.blockHeightStep + g.blockEnd};
        std::copy(cell, cell + 4, t.cell);
        std::copy(block, block + 4, t.block);
        t.table = g.table;
    }
    hogTestsBegin_ = hogTests_.data();
    hogTestsEnd_ = hogTestsBegin_ + hogTests_.size();
}

void StrongClassifier::addHogClassifier(const WeakClassifierHog& hogClassifier) {
    LQ_ASSERT(hogClassifier.getSector() < static_cast<LQ::uchar>(WeakClassifierHog::NUM_SECTORS));
    hog_.push_back(hogClassifier);
}

void StrongClassifier::clearActive() {
    rmctBegin_ = rmctEnd_ = nullptr;
    packedBegin_ = packedEnd_ = nullptr;
    haarBegin_ = haarEnd_ = nullptr;
    hogBegin_ = hogEnd_ = nullptr;
    activeBucket_ = -1;
    haarTests_.clear();
    hogTests_.clear();
    haarTestsBegin_ = haarTestsEnd_ = nullptr;
    hogTestsBegin_ = hogTestsEnd_ = nullptr;
}

void StrongClassifier::reset() {
    rmct_.clear();
    haar_.clear();
    hog_.clear();
    resizedHaar_.clear();
    clearActive();
}

void StrongClassifier::activate(int rmctStride, int integralStride, float scale) {
    if (rmct_.empty()) {
        rmctBegin_ = rmctEnd_ = nullptr;
        packed_.clear();
    } else {
        rmctBegin_ = rmct_.data();
        rmctEnd_ = rmct_.data() + rmct_.size();
        const WeakClassifierRmct& first = rmct_.front();
        const bool current = first.point.y != 0 && (first.offset - first.point.x) / first.point.y == rmctStride;
        if (!current)
            for (WeakClassifierRmct& classifier : rmct_) classifier.setStride(rmctStride);
        packed_.resize(rmct_.size());
        for (size_t k = 0; k < rmct_.size(); ++k) packed_[k] = RmctTest{rmct_[k].table, rmct_[k].offset};
    }
    packedBegin_ = packed_.empty() ? nullptr : packed_.data();
    packedEnd_ = packedBegin_ + packed_.size();

    if (haar_.empty()) {
        haarBegin_ = haarEnd_ = nullptr;
        activeBucket_ = -1;
    } else {
        const int k = scaleBucket(scale);
        if (static_cast<int>(resizedHaar_.size()) < k + 1) resizedHaar_.resize(k + 1);
        std::vector<WeakClassifierHaar>& set = resizedHaar_[k];
        // the first scale that reaches a bucket fixes its rectangles
        if (set.size() != haar_.size()) {
            set.resize(haar_.size());
            for (size_t i = 0; i < haar_.size(); ++i) set[i].resize(haar_[i], scale);
        }
        if (set.front().stripLength * 4u != static_cast<unsigned>(integralStride))
            for (WeakClassifierHaar& classifier : set) classifier.setStripLength(integralStride >> 2);
        activeBucket_ = k;
        haarBegin_ = set.data();
        haarEnd_ = set.data() + set.size();
    }

    if (hog_.empty()) {
        hogBegin_ = hogEnd_ = nullptr;
    } else {
        hogBegin_ = hog_.data();
        hogEnd_ = hog_.data() + hog_.size();
    }
    packHaar();
    // the HOG offsets change with the row length only, which repacks them
    if (hogTestsBegin_ == nullptr || hogTests_.size() != hog_.size()) packHog();
}

void StrongClassifier::rotate(const LQ::BaseSize<int>& size) {
    for (WeakClassifierRmct& classifier : rmct_) classifier.rotate(size);
    for (WeakClassifierHaar& classifier : haar_) classifier.rotate(size);
    for (WeakClassifierHog& classifier : hog_) classifier.rotate(size);
    resizedHaar_.clear();
    clearActive();
}

void StrongClassifier::flip(const LQ::BaseSize<int>& size) {
    for (WeakClassifierRmct& classifier : rmct_) classifier.flip(size);
    for (WeakClassifierHaar& classifier : haar_) classifier.flip(size);
    for (WeakClassifierHog& classifier : hog_) classifier.flip(size);
    resizedHaar_.clear();
    clearActive();
}

LQ::BaseRect<int> StrongClassifier::calculateHogRoi() const {
    if (hog_.empty()) return LQ::BaseRect<int>();
    LQ::BaseRect<int> roi = hog_.front().block;
    for (const WeakClassifierHog& classifier : hog_) {
        roi.left = std::min(roi.left, classifier.block.left);
        roi.top = std::min(roi.top, classifier.block.top);
        roi.right = std::max(roi.right, classifier.block.right);
        roi.bottom = std::max(roi.bottom, classifier.block.bottom);
    }
    return roi.resize(1, 1);
}

void StrongClassifier::moveHogRoi(const LQ::BaseRect<int>& roi) {
    for (WeakClassifierHog& classifier : hog_) classifier.moveRoi(roi);
    if (hogBegin_) packHog();
}

void StrongClassifier::setHogRowLength(int rowLength) {
    for (WeakClassifierHog& classifier : hog_) classifier.setRowLength(rowLength);
    packHog();
}

namespace {
// more classifiers than this in a stage means a corrupt file
constexpr int MAX_STAGE_CLASSIFIERS = 10000;
}  // namespace

void StrongClassifier::save(std::ostream& stream) const {
    stream << rmct_.size() << ' ' << haar_.size() << ' ' << hog_.size() << '\n';
    stream << threshold_ << ' ' << 0 << '\n';
    for (const WeakClassifierHaar& classifier : haar_) classifier.basicSave(stream);
    for (const WeakClassifierRmct& classifier : rmct_) classifier.basicSave(stream);
    for (const WeakClassifierHog& classifier : hog_) classifier.basicSave(stream);
    stream << '\n';
}

bool StrongClassifier::load(std::istream& stream) {
    reset();
    threshold_ = 0;
    int rmctCount = 0, haarCount = 0, hogCount = 0;
    stream >> rmctCount >> haarCount >> hogCount;
    if (!stream || rmctCount < 0 || haarCount < 0 || hogCount < 0 || rmctCount > MAX_STAGE_CLASSIFIERS ||
        haarCount > MAX_STAGE_CLASSIFIERS || hogCount > MAX_STAGE_CLASSIFIERS)
        return false;
    int reserved = 0;
    stream >> threshold_ >> reserved;
    // a failed stream reads nothing more, so a truncated file ends the loops at once
    for (int k = 0; k < haarCount && stream; ++k) {
        WeakClassifierHaar classifier;
        classifier.basicLoad(stream);
        addHaarClassifier(classifier);
    }
    for (int k = 0; k < rmctCount && stream; ++k) {
        WeakClassifierRmct classifier;
        classifier.basicLoad(stream);
        addRmctClassifier(classifier);
    }
    for (int k = 0; k < hogCount && stream; ++k) {
        WeakClassifierHog classifier;
        classifier.basicLoad(stream);
        addHogClassifier(classifier);
    }
    return !stream.fail();
}

void StrongClassifier::writeStrongClassifier(std::ostream& stream, const std::string& name) const {
    stream << "\tstatic cData weak_classifiers_" << name << "[" << size() << "][266] = {\n";
    for (const WeakClassifierRmct& classifier : rmct_) classifier.writeWeakClassifier(stream);
    for (const WeakClassifierHaar& classifier : haar_) classifier.writeWeakClassifier(stream);
    for (const WeakClassifierHog& classifier : hog_) classifier.writeWeakClassifier(stream);
    stream << "};\n";
}
