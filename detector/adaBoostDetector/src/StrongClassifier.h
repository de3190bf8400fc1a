#pragma once
// One stage of a cascade: the sum of its weak classifiers' scores against one threshold.

#include <istream>
#include <ostream>
#include <string>
#include <vector>

#include "LQ_Image.h"
#include "StageKernels.h"
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
        for (const HaarTest* h = haarTestsBegin_; h < haarTestsEnd_; ++h) haar += h->score(integral);
        for (const HogTest* g = hogTestsBegin_; g < hogTestsEnd_; ++g) hogSum += g->score(hog);
        return s0 + s1 + haar + hogSum;
    }

    // The sums of four windows at once, given as above: each classifier's fields are read
    // once for the four, and the look-ups of the four windows overlap in memory.
    void totalScores(const unsigned char* const* rmct, const unsigned int* const* hog,
                     const unsigned int* const* integral, int* sums) const {
        int a = 0, b = 0, c = 0, d = 0;
        const unsigned char *r0 = rmct[0], *r1 = rmct[1], *r2 = rmct[2], *r3 = rmct[3];
        for (const RmctTest* t = packedBegin_; t < packedEnd_; ++t) {
            const LQ::schar* table = t->table;
            const int offset = t->offset;
            a += table[r0[offset]];
            b += table[r1[offset]];
            c += table[r2[offset]];
            d += table[r3[offset]];
        }
        const unsigned int *i0 = integral[0], *i1 = integral[1], *i2 = integral[2], *i3 = integral[3];
        for (const HaarTest* h = haarTestsBegin_; h < haarTestsEnd_; ++h) {
            a += h->score(i0);
            b += h->score(i1);
            c += h->score(i2);
            d += h->score(i3);
        }
        const unsigned int *h0 = hog[0], *h1 = hog[1], *h2 = hog[2], *h3 = hog[3];
        for (const HogTest* g = hogTestsBegin_; g < hogTestsEnd_; ++g) {
            a += g->score(h0);
            b += g->score(h1);
            c += g->score(h2);
            d += g->score(h3);
        }
        sums[0] = a;
        sums[1] = b;
        sums[2] = c;
        sums[3] = d;
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
    typedef CensusTest RmctTest;

    // A Haar classifier of the active set as the scan reads it: the eight corner offsets of
    // its two rectangles (top left, top right, bottom left, bottom right) and its look-up
    // table moved to entry 127, the index of a zero difference.
    struct HaarTest {
        int corner[8];
        int64_t first, second;
        double reciprocal;
        const LQ::schar* table;
        const WeakClassifierHaar* source;

        int score(const unsigned int* i) const {
            const int s1 = static_cast<int>(i[corner[3]] + i[corner[0]] - i[corner[2]] - i[corner[1]]);
            const int s2 = static_cast<int>(i[corner[7]] + i[corner[4]] - i[corner[6]] - i[corner[5]]);
            const int64_t numerator = first * s2 - second * s1;
            // the quotient as WeakClassifierHaar::index finds it; without a divisor the
            // reciprocal is 0 and the table is not moved, which reads entry 0
            if (static_cast<uint64_t>(numerator + WeakClassifierHaar::kExactRange) <
                static_cast<uint64_t>(2 * WeakClassifierHaar::kExactRange))
                return table[static_cast<int64_t>(static_cast<double>(numerator) * reciprocal)];
            return source->table[source->index(i)];
        }
    };
    // A HOG classifier as the scan reads it: the offsets of its bin at the cell's corners and
    // of the total at the block's corners, in the order of HaarTest.
    struct HogTest {
        int cell[4];
        int block[4];
        const LQ::schar* table;

        int score(const unsigned int* h) const {
            const unsigned int c = h[cell[3]] + h[cell[0]] - h[cell[1]] - h[cell[2]];
            const unsigned int b = h[block[0]] + h[block[3]] + 1 - h[block[1]] - h[block[2]];
            if (c < (1u << 24)) return table[(c << 8) / b];
            return table[(static_cast<uint64_t>(c) << 8) / b];
        }
    };
    const RmctTest* packedBegin() const { return packedBegin_; }
    const RmctTest* packedEnd() const { return packedEnd_; }

    bool operator==(const StrongClassifier& other) const {
        return threshold_ == other.threshold_ && rmct_ == other.rmct_ && haar_ == other.haar_ && hog_ == other.hog_;
    }

private:
    void clearActive();
    // the compact forms of the active Haar set and of the HOG classifiers
    void packHaar();
    void packHog();

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
    std::vector<HaarTest> haarTests_;
    const HaarTest* haarTestsBegin_ = nullptr;
    const HaarTest* haarTestsEnd_ = nullptr;
    std::vector<HogTest> hogTests_;

    const HogTest* hogTestsBegin_ = nullptr;
    const HogTest* hogTestsEnd_ = nullptr;
};

// The scale bucket of a zoom: buckets span a factor of about 1.2.
int scaleBucket(float scale);
