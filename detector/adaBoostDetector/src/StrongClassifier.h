#pragma once
// One stage of a cascade: the sum of its weak classifiers' scores against one threshold.

#include <istream>
#include <ostream>
#include <string>
#include <vector>

#include "LQ_Image.h"
#include "WeakClassifier.h"

class StrongClassifier {
public:
    StrongClassifier() = default;
    // copies keep their active ranges pointing into their own vectors
    StrongClassifier(const StrongClassifier& other) { *this = other; }
    StrongClassifier& operator=(const StrongClassifier& other);

    void addRmctClassifier(const WeakClassifierRmct& classifier) { rmct_.push_back(classifier); }
    void addHaarClassifier(const WeakClassifierHaar& classifier) { haar_.push_back(classifier); }
    void addHogClassifier(const WeakClassifierHog& classifier);
    void addWeakClassifier(const WeakClassifierHog& classifier) { addHogClassifier(classifier); }
    void setThreshold(int threshold) { threshold_ = threshold; }
    int getThreshold() const { return threshold_; }
    void reset();

    // ready for one layer: RMCT offsets for its stride, Haar rectangles for its scale bucket
    void activate(int rmctStride, int integralStride, float scale);

    // the stage's sum for the window whose first RMCT byte, first integral element and
    // integral HOG are given
    int totalScore(const unsigned char* rmct, const LQ::Image& hog, const unsigned int* integral) const {
        return totalScore(rmct, reinterpret_cast<const unsigned int*>(hog.data()), integral);
    }
    // the same with the window's first integral HOG sum given directly
    int totalScore(const unsigned char* rmct, const unsigned int* hog, const unsigned int* integral) const {
        int s0 = 0, s1 = 0, s2 = 0, s3 = 0;
        const RmctTest* r = packedBegin_;
        // four running sums: the order of integer additions doesn't change the result
        for (; r + 3 < packedEnd_; r += 4) {
            s0 += r[0].table[rmct[r[0].offset]];
            s1 += r[1].table[rmct[r[1].offset]];
            s2 += r[2].table[rmct[r[2].offset]];
            s3 += r[3].table[rmct[r[3].offset]];
        }
        for (; r < packedEnd_; ++r) s0 += r->table[rmct[r->offset]];
        s0 += s2;
        s1 += s3;
        // each kind in its own local sum, so that none of them lives in memory
        int haar = 0, hogSum = 0;
        for (const WeakClassifierHaar* h = haarBegin_; h < haarEnd_; ++h) haar += h->table[h->index(integral)];
        for (const WeakClassifierHog* g = hogBegin_; g < hogEnd_; ++g) hogSum += g->table[g->index(hog)];
        return s0 + s1 + haar + hogSum;
    }

    void rotate(const LQ::BaseSize<int>& size);
    void flip(const LQ::BaseSize<int>& size);
    // union of the HOG blocks widened by 1; zero without HOG classifiers
    LQ::BaseRect<int> calculateHogRoi() const;
    void moveHogRoi(const LQ::BaseRect<int>& roi);
    // HOG offsets for an integral HOG image with rowLength sums per row
    void setHogRowLength(int rowLength);

    // the stage record of a ring file
    void save(std::ostream& stream) const;
    bool load(std::istream& stream);
    // one table of the generated source
    void writeStrongClassifier(std::ostream& stream, const std::string& name) const;

    const std::vector<WeakClassifierRmct>& rmctClassifiers() const { return rmct_; }
    const std::vector<WeakClassifierHaar>& haarClassifiers() const { return haar_; }
    const std::vector<WeakClassifierHog>& hogClassifiers() const { return hog_; }
    // the Haar set of the present scale bucket
    const WeakClassifierHaar* activeHaar() const { return haarBegin_; }
    size_t size() const { return rmct_.size() + haar_.size() + hog_.size(); }

    // an RMCT classifier as the scan reads it: two fields side by side
    struct RmctTest {
        const LQ::schar* table;
        int offset;
    };
    const RmctTest* packedBegin() const { return packedBegin_; }
    const RmctTest* packedEnd() const { return packedEnd_; }

    bool operator==(const StrongClassifier& other) const {
        return threshold_ == other.threshold_ && rmct_ == other.rmct_ && haar_ == other.haar_ && hog_ == other.hog_;
    }

private:
    void clearActive();

    std::vector<WeakClassifierRmct> rmct_;
    std::vector<WeakClassifierHaar> haar_;
    std::vector<WeakClassifierHog> hog_;
    // one set of rescaled Haar classifiers per scale bucket, made on demand
    std::vector<std::vector<WeakClassifierHaar>> resizedHaar_;
    int threshold_ = 0;
    const WeakClassifierRmct* rmctBegin_ = nullptr;
    const WeakClassifierRmct* rmctEnd_ = nullptr;
    const WeakClassifierHaar* haarBegin_ = nullptr;
    const WeakClassifierHaar* haarEnd_ = nullptr;
    int activeBucket_ = -1;
    const WeakClassifierHog* hogBegin_ = nullptr;
    const WeakClassifierHog* hogEnd_ = nullptr;
    // the active RMCT range packed for the scan; rebuilt at activation, same size after the first
    std::vector<RmctTest> packed_;
    const RmctTest* packedBegin_ = nullptr;
    const RmctTest* packedEnd_ = nullptr;
};

// The scale bucket of a zoom: buckets span a factor of about 1.2.
int scaleBucket(float scale);
