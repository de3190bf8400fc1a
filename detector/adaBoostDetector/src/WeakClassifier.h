#pragma once
// The three look-up weak classifiers of the cascades: one RMCT byte, a ratio of two
// rectangle means, or the share of a HOG bin in a block, each turned into a signed score
// by a table of 256 entries. No common base and no virtual calls: a stage keeps a plain
// vector of each kind and reads the precomputed offsets directly in its scan loop.

#include <climits>
#include <cstdint>
#include <istream>
#include <ostream>

#include "LQ_Point.h"
#include "LQ_Rect.h"
#include "LQ_SharedPtr.h"
#include "LQ_Size.h"
#include "LQ_Utils.h"

// A quarter turn and a mirror of a window of the given size (the size before the turn).
LQ::BasePoint<int> rotatePointOnSize(const LQ::BasePoint<int>& point, const LQ::BaseSize<int>& size);
LQ::BaseRect<int> rotateRectOnSize(const LQ::BaseRect<int>& rect, const LQ::BaseSize<int>& size);
LQ::BasePoint<int> flipPointOnSize(const LQ::BasePoint<int>& point, const LQ::BaseSize<int>& size);
LQ::BaseRect<int> flipRectOnSize(const LQ::BaseRect<int>& rect, const LQ::BaseSize<int>& size);

// true when both tables exist and hold the same 256 scores
bool equalTables(const LQ::schar* a, const LQ::schar* b);

class WeakClassifierRmct {
public:
    static const int bitRotationMatrix[256];
    static const int bitFlipMatrix[256];

    WeakClassifierRmct() = default;
    explicit WeakClassifierRmct(const LQ::BasePoint<int>& point) { set(point.x, point.y); }

    void set(int x, int y) {
        point.x = static_cast<LQ::schar>(x);
        point.y = static_cast<LQ::schar>(y);
    }
    // adopts a table that outlives the classifier
    void setData(LQ::schar* data);
    // new[matrix[i]] = old[i]; the classifier owns the new table
    void modifyData(const int* matrix);
    void rotate(const LQ::BaseSize<int>& size);
    void flip(const LQ::BaseSize<int>& size);
    // offset of the tested pixel in an image of this stride
    void setStride(int stride) { offset = point.x + point.y * stride; }

    void basicSave(std::ostream& stream) const;
    void basicLoad(std::istream& stream);
    void writeWeakClassifier(std::ostream& stream) const;

    bool operator==(const WeakClassifierRmct& other) const;

    LQ::schar* table = nullptr;
    LQ::BasePoint<LQ::schar> point;
    LQ::SharedArray<LQ::schar> owner;
    int offset = 0;

private:
    void transform(const LQ::BasePoint<int>& newPoint, const int* matrix);
};

class WeakClassifierHaar {
public:
    static constexpr int TABLE_SIZE = 256;

    WeakClassifierHaar() = default;

    // the third argument is kept for the generated tables and has no effect
    void set(const LQ::BaseRect<int>& first, const LQ::BaseRect<int>& second, int = 0);
    // derives areas, divisor, widths and offsets from the rectangles
    void set();
    void setData(LQ::schar* data);
    // a copy of other sharing its table, rectangles scaled, other's stride kept
    void resize(const WeakClassifierHaar& other, float factor);
    void rotate(const LQ::BaseSize<int>& size);
    void flip(const LQ::BaseSize<int>& size);
    // stride of the integral image in 32-bit elements
    void setStripLength(unsigned int stride);

    void basicSave(std::ostream& stream) const;
    void basicLoad(std::istream& stream);
    void writeWeakClassifier(std::ostream& stream) const;

    bool operator==(const WeakClassifierHaar& other) const;

    // the look-up index of a window whose top-left integral element is i
    int index(const unsigned int* i) const {
        if (divisor == 0) return 0;
        const int s1 = static_cast<int>(i[firstOffset + firstHeightStep + firstWidth] + i[firstOffset] -
                                        i[firstOffset + firstHeightStep] - i[firstOffset + firstWidth]);
        const int s2 = static_cast<int>(i[secondOffset + secondHeightStep + secondWidth] + i[secondOffset] -
                                        i[secondOffset + secondHeightStep] - i[secondOffset + secondWidth]);
        const int64_t numerator = firstFactor * s2 - secondFactor * s1;
        // A multiplication instead of the division: the reciprocal is raised by a factor
        // 1 + 2^-46 that outweighs every rounding, so the product lies just beyond the true
        // quotient on the side away from zero, never by as much as the quotient's distance to
        // the next integer (1 / divisor at least) while |numerator| < 2^44. Truncation then
        // gives the integer quotient exactly.
        if (static_cast<uint64_t>(numerator + kExactRange) < static_cast<uint64_t>(2 * kExactRange))
            return 127 + static_cast<int>(static_cast<int64_t>(static_cast<double>(numerator) * reciprocal));
        return 127 + static_cast<int>(numerator / divisor);
    }
    // the quotient by division, for comparison
    int dividedIndex(const unsigned int* i) const;

    static constexpr int64_t kExactRange = int64_t(1) << 44;

    LQ::schar* table = nullptr;
    LQ::BaseRect<int> allRect;
    LQ::BaseRect<int> posRect;
    int64_t firstFactor = 0;
    int64_t secondFactor = 0;
    int64_t divisor = 0;
    // (1 + 2^-46) / divisor
    double reciprocal = 0;
    uint16_t secondWidth = 0;
    uint16_t firstWidth = 0;
    // integral images up to 16383 elements wide
    uint16_t stripLength = 0;
    uint32_t firstOffset = 0;
    uint32_t firstHeightStep = 0;
    uint32_t secondOffset = 0;
    uint32_t secondHeightStep = 0;
    LQ::SharedArray<LQ::schar> owner;
};

class WeakClassifierHog {
public:
    static constexpr int TABLE_SIZE = 256;
    static constexpr int NUM_SECTORS = 6;

    WeakClassifierHog() = default;

    void setCell(const LQ::BaseRect<int>& rect) { cell = rect; }
    void setBlock(const LQ::BaseRect<int>& rect) { block = rect; }
    void setSector(int value) { sector = static_cast<LQ::schar>(value); }
    void setData(LQ::schar* data);
    LQ::uchar getSector() const { return static_cast<LQ::uchar>(sector); }

    void rotate(const LQ::BaseSize<int>& size);
    void flip(const LQ::BaseSize<int>& size);
    // offsets into an integral HOG image with rowLength sums per row (7 per pixel)
    void setRowLength(int rowLength);
    // cell and block made relative to roi, in an integral HOG image of roi
    void moveRoi(const LQ::BaseRect<int>& roi);

    void basicSave(std::ostream& stream) const;
    void basicLoad(std::istream& stream);
    void writeWeakClassifier(std::ostream& stream) const;

    bool operator==(const WeakClassifierHog& other) const;

    int index(const unsigned int* h) const {
        const unsigned int c = h[cellOffset + cellHeightStep + cellEnd] + h[cellOffset + sector] -
                               h[cellOffset + cellEnd] - h[cellOffset + cellHeightStep + sector];
        const unsigned int b = h[blockOffset + 6] + h[blockOffset + blockHeightStep + blockEnd] + 1 -
                               h[blockOffset + blockEnd] - h[blockOffset + blockHeightStep + 6];
        if (c < (1u << 24)) return static_cast<int>((c << 8) / b);
        return static_cast<int>((static_cast<uint64_t>(c) << 8) / b);
    }

    LQ::BaseRect<int> cell;
    LQ::BaseRect<int> block;
    LQ::schar sector = 0;
    LQ::schar* table = nullptr;
    LQ::SharedArray<LQ::schar> owner;
    int blockOffset = 0;
    int blockHeightStep = 0;
    int cellOffset = 0;
    int cellHeightStep = 0;
    int blockEnd = 0;
    int cellEnd = 0;

private:
    int rowLength() const { return block.height() ? blockHeightStep / block.height() : 0; }
};

// A first-stage Haar test by its passing range of rectangle sums: no table, no division.
class AbsFeature {
public:
    AbsFeature() = default;
    AbsFeature(const WeakClassifierHaar& haar, int threshold);

    // stride in bytes
    void setStripLength(uint16_t stripLength);

    bool passes(const unsigned int* i) const {
        const int s = static_cast<int>(i[offset + heightStep + width] + i[offset] - i[offset + heightStep] -
                                       i[offset + width]);
        return s >= lowerBound && s <= upperBound;
    }

    LQ::BaseRect<int> rectangle;
    int lowerBound = 0;
    int upperBound = 0;
    int width = 0;
    int offset = 0;
    int heightStep = 0;
};
