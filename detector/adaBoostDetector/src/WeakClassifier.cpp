#include "WeakClassifier.h"

#include <array>
#include <cstring>

namespace {

// The code permutation that follows from moving bit b to bit moves[b].
constexpr std::array<int, 256> bitPermutation(const int (&moves)[8]) {
    std::array<int, 256> result{};
    for (int code = 0; code < 256; ++code) {
        int out = 0;
        for (int b = 0; b < 8; ++b)
            if (code & (1 << b)) out |= 1 << moves[b];
        result[code] = out;
    }
    return result;
}

constexpr int rotationMoves[8] = {5, 3, 0, 6, 1, 7, 4, 2};
constexpr int flipMoves[8] = {2, 1, 0, 4, 3, 7, 6, 5};
constexpr std::array<int, 256> rotationTable = bitPermutation(rotationMoves);
constexpr std::array<int, 256> flipTable = bitPermutation(flipMoves);

LQ::schar* newTable() { return new LQ::schar[256]; }

void readTable(std::istream& stream, LQ::schar*& table, LQ::SharedArray<LQ::schar>& owner) {
    table = newTable();
    owner = LQ::SharedArray<LQ::schar>(table);
    for (int i = 0; i < 256; ++i) {
        int value = 0;
        stream >> value;
        table[i] = static_cast<LQ::schar>(value);
    }
}

void writeTable(std::ostream& stream, const LQ::schar* table) {
    for (int i = 0; i < 256; ++i) stream << static_cast<int>(table ? table[i] : 0) << ' ';
}

void writeSourceTable(std::ostream& stream, const LQ::schar* table) {
    for (int i = 0; i < 256; ++i) stream << ',' << static_cast<int>(table ? table[i] : 0);
    stream << "},\n";
}

// the ring files keep rectangles as top, left, right, bottom
void writeRect(std::ostream& stream, const LQ::BaseRect<int>& r) {
    stream << r.top << ' ' << r.left << ' ' << r.right << ' ' << r.bottom;
}
void readRect(std::istream& stream, LQ::BaseRect<int>& r) { stream >> r.top >> r.left >> r.right >> r.bottom; }

void writeSourceRect(std::ostream& stream, const LQ::BaseRect<int>& r) {
    stream << r.left << ", " << r.top << ", " << r.right << ", " << r.bottom;
}

}  // namespace

LQ::BasePoint<int> rotatePointOnSize(const LQ::BasePoint<int>& point, const LQ::BaseSize<int>& size) {
    return LQ::BasePoint<int>(point.y, size.width - 1 - point.x);
}

LQ::BaseRect<int> rotateRectOnSize(const LQ::BaseRect<int>& rect, const LQ::BaseSize<int>& size) {
    return LQ::BaseRect<int>(rect.top, size.width - rect.right, rect.bottom, size.width - rect.left);
}

LQ::BasePoint<int> flipPointOnSize(const LQ::BasePoint<int>& point, const LQ::BaseSize<int>& size) {
    return LQ::BasePoint<int>(size.width - 1 - point.x, point.y);
}

LQ::BaseRect<int> flipRectOnSize(const LQ::BaseRect<int>& rect, const LQ::BaseSize<int>& size) {
    return LQ::BaseRect<int>(size.width - rect.right, rect.top, size.width - rect.left, rect.bottom);
}

bool equalTables(const LQ::schar* a, const LQ::schar* b) {
    return a && b && (a == b || std::memcmp(a, b, 256) == 0);
}

// ---- RMCT -----------------------------------------------------------------------

const int WeakClassifierRmct::bitRotationMatrix[256] = {
#define LQ_ENTRY(i) rotationTable[i]
#define LQ_ROW(r)                                                                                 \
    LQ_ENTRY(r + 0), LQ_ENTRY(r + 1), LQ_ENTRY(r + 2), LQ_ENTRY(r + 3), LQ_ENTRY(r + 4), LQ_ENTRY(r + 5), \
        LQ_ENTRY(r + 6), LQ_ENTRY(r + 7), LQ_ENTRY(r + 8), LQ_ENTRY(r + 9), LQ_ENTRY(r + 10),   \
        LQ_ENTRY(r + 11), LQ_ENTRY(r + 12), LQ_ENTRY(r + 13), LQ_ENTRY(r + 14), LQ_ENTRY(r + 15)
    LQ_ROW(0),   LQ_ROW(16),  LQ_ROW(32),  LQ_ROW(48),  LQ_ROW(64),  LQ_ROW(80),  LQ_ROW(96),  LQ_ROW(112),
    LQ_ROW(128), LQ_ROW(144), LQ_ROW(160), LQ_ROW(176), LQ_ROW(192), LQ_ROW(208), LQ_ROW(224), LQ_ROW(240),
#undef LQ_ENTRY
};

const int WeakClassifierRmct::bitFlipMatrix[256] = {
#define LQ_ENTRY(i) flipTable[i]
    LQ_ROW(0),   LQ_ROW(16),  LQ_ROW(32),  LQ_ROW(48),  LQ_ROW(64),  LQ_ROW(80),  LQ_ROW(96),  LQ_ROW(112),
    LQ_ROW(128), LQ_ROW(144), LQ_ROW(160), LQ_ROW(176), LQ_ROW(192), LQ_ROW(208), LQ_ROW(224), LQ_ROW(240),
#undef LQ_ENTRY
#undef LQ_ROW
};

void WeakClassifierRmct::setData(LQ::schar* data) {
    table = data;
    owner = LQ::SharedArray<LQ::schar>(data, false);
}

void WeakClassifierRmct::modifyData(const int* matrix) {
    LQ::schar* fresh = newTable();
    for (int i = 0; i < 256; ++i) fresh[matrix[i]] = table ? table[i] : 0;
    table = fresh;
    owner = LQ::SharedArray<LQ::schar>(fresh);
}

void WeakClassifierRmct::transform(const LQ::BasePoint<int>& newPoint, const int* matrix) {
    const int stride = point.y != 0 ? (offset - point.x) / point.y : 0;
    set(newPoint.x, newPoint.y);
    modifyData(matrix);
    setStride(stride);
}

void WeakClassifierRmct::rotate(const LQ::BaseSize<int>& size) {
    transform(rotatePointOnSize(LQ::BasePoint<int>(point.x, point.y), size), bitRotationMatrix);
}

void WeakClassifierRmct::flip(const LQ::BaseSize<int>& size) {
    transform(flipPointOnSize(LQ::BasePoint<int>(point.x, point.y), size), bitFlipMatrix);
}

void WeakClassifierRmct::basicSave(std::ostream& stream) const {
    stream << static_cast<int>(point.x) << ' ' << static_cast<int>(point.y) << ' ';
    writeTable(stream, table);
    stream << '\n';
}

void WeakClassifierRmct::basicLoad(std::istream& stream) {
    int x = 0, y = 0;
    stream >> x >> y;
    set(x, y);
    readTable(stream, table, owner);
}

void WeakClassifierRmct::writeWeakClassifier(std::ostream& stream) const {
    stream << "\t{" << static_cast<int>(point.x) << ", " << static_cast<int>(point.y);
    writeSourceTable(stream, table);
}

bool WeakClassifierRmct::operator==(const WeakClassifierRmct& other) const {
    // the offset follows from the point and the image stride: it isn't part of the classifier
    return point.x == other.point.x && point.y == other.point.y && equalTables(table, other.table);
}

// ---- Haar -----------------------------------------------------------------------

void WeakClassifierHaar::set(const LQ::BaseRect<int>& first, const LQ::BaseRect<int>& second, int) {
    allRect = first;
    posRect = second;
    set();
}

void WeakClassifierHaar::set() {
    const int64_t a1 = allRect.area();
    const int64_t a2 = posRect.area();
    if (posRect.width() != 0) {
        firstFactor = a1;
        secondFactor = a2;
        divisor = 2 * a2 * (a1 - a2);
    } else {
        firstFactor = 0;
        secondFactor = -1;
        divisor = 2 * a1;
    }
    reciprocal = divisor ? 1.0 / static_cast<double>(divisor) * (1.0 + 0x1p-46) : 0.0;
    firstWidth = static_cast<uint16_t>(allRect.width());
    secondWidth = static_cast<uint16_t>(posRect.width());
    setStripLength(stripLength);
}

int WeakClassifierHaar::dividedIndex(const unsigned int* i) const {
    if (divisor == 0) return 0;
    const int s1 = static_cast<int>(i[firstOffset + firstHeightStep + firstWidth] + i[firstOffset] -
                                    i[firstOffset + firstHeightStep] - i[firstOffset + firstWidth]);
    const int s2 = static_cast<int>(i[secondOffset + secondHeightStep + secondWidth] + i[secondOffset] -
                                    i[secondOffset + secondHeightStep] - i[secondOffset + secondWidth]);
    return 127 + static_cast<int>((firstFactor * s2 - secondFactor * s1) / divisor);
}

void WeakClassifierHaar::setStripLength(unsigned int stride) {
    stripLength = static_cast<uint16_t>(stride & 0x3fff);
    firstOffset = static_cast<uint32_t>(allRect.left + allRect.top * static_cast<int>(stripLength));
    firstHeightStep = static_cast<uint32_t>(allRect.height() * static_cast<int>(stripLength));
    secondOffset = static_cast<uint32_t>(posRect.left + posRect.top * static_cast<int>(stripLength));
    secondHeightStep = static_cast<uint32_t>(posRect.height() * static_cast<int>(stripLength));
}

void WeakClassifierHaar::setData(LQ::schar* data) {
    table = data;
    owner = LQ::SharedArray<LQ::schar>(data, false);
}

void WeakClassifierHaar::resize(const WeakClassifierHaar& other, float factor) {
    *this = other;
    allRect = other.allRect * factor;
    posRect = other.posRect * factor;
    set();
}

void WeakClassifierHaar::rotate(const LQ::BaseSize<int>& size) {
    allRect = rotateRectOnSize(allRect, size);
    posRect = rotateRectOnSize(posRect, size);
    set();
}

void WeakClassifierHaar::flip(const LQ::BaseSize<int>& size) {
    allRect = flipRectOnSize(allRect, size);
    posRect = flipRectOnSize(posRect, size);
    set();
}

void WeakClassifierHaar::basicSave(std::ostream& stream) const {
    writeRect(stream, allRect);
    stream << '\t';
    writeRect(stream, posRect);
    stream << '\t';
    writeTable(stream, table);
    stream << '\n';
}

void WeakClassifierHaar::basicLoad(std::istream& stream) {
    readRect(stream, allRect);
    readRect(stream, posRect);
    readTable(stream, table, owner);
    set();
}

void WeakClassifierHaar::writeWeakClassifier(std::ostream& stream) const {
    stream << "\t{";
    writeSourceRect(stream, allRect);
    stream << ", ";
    writeSourceRect(stream, posRect);
    writeSourceTable(stream, table);
}

bool WeakClassifierHaar::operator==(const WeakClassifierHaar& other) const {
    return allRect == other.allRect && posRect == other.posRect && equalTables(table, other.table);
}

// ---- HOG ------------------------------------------------------------------------

void WeakClassifierHog::setData(LQ::schar* data) {
    table = data;
    owner = LQ::SharedArray<LQ::schar>(data, false);
}

void WeakClassifierHog::setRowLength(int rowLength) {
    blockOffset = block.top * rowLength + 7 * block.left;
    blockHeightStep = block.height() * rowLength;
    cellOffset = cell.top * rowLength + 7 * cell.left;
    cellHeightStep = cell.height() * rowLength;
    blockEnd = block.width() * 7 + 6;
    cellEnd = cell.width() * 7 + sector;
}

void WeakClassifierHog::rotate(const LQ::BaseSize<int>& size) {
    const int length = rowLength();
    cell = rotateRectOnSize(cell, size);
    block = rotateRectOnSize(block, size);
    sector = static_cast<LQ::schar>((sector + 3) % NUM_SECTORS);
    setRowLength(length);
}

void WeakClassifierHog::flip(const LQ::BaseSize<int>& size) {
    const int length = rowLength();
    cell = flipRectOnSize(cell, size);
    block = flipRectOnSize(block, size);
    sector = static_cast<LQ::schar>((NUM_SECTORS - sector) % NUM_SECTORS);
    setRowLength(length);
}

void WeakClassifierHog::moveRoi(const LQ::BaseRect<int>& roi) {
    cell.shift(-roi.left, -roi.top);
    block.shift(-roi.left, -roi.top);
    setRowLength(((roi.right - roi.left + 1) * 28) >> 2);
}

void WeakClassifierHog::basicSave(std::ostream& stream) const {
    writeRect(stream, block);
    stream << '\t';
    writeRect(stream, cell);
    stream << '\t' << static_cast<int>(sector) << ' ';
    writeTable(stream, table);
    stream << '\n';
}

void WeakClassifierHog::basicLoad(std::istream& stream) {
    readRect(stream, block);
    readRect(stream, cell);
    int value = 0;
    stream >> value;
    sector = static_cast<LQ::schar>(value);
    readTable(stream, table, owner);
}

void WeakClassifierHog::writeWeakClassifier(std::ostream& stream) const {
    stream << "\t{";
    writeSourceRect(stream, block);
    stream << ", ";
    writeSourceRect(stream, cell);
    stream << ", " << static_cast<int>(sector);
    writeSourceTable(stream, table);
}

bool WeakClassifierHog::operator==(const WeakClassifierHog& other) const {
    return cell == other.cell && block == other.block && sector == other.sector && equalTables(table, other.table);
}

// ---- AbsFeature -----------------------------------------------------------------

AbsFeature::AbsFeature(const WeakClassifierHaar& haar, int threshold) : rectangle(haar.allRect) {
    int first = 256;
    for (int i = 0; i < 256; ++i)
        if (haar.table[i] >= threshold) {
            first = i;
            break;
        }
    int tail = 0;
    for (int i = 255; i > 0 && haar.table[i] < threshold; --i) ++tail;
    const int a = rectangle.area();
    lowerBound = (first - 127) * 2 * a;
    upperBound = 2 * a * (129 - tail) - 1;
}

void AbsFeature::setStripLength(uint16_t stripLength) {
    const int stride = stripLength >> 2;
    width = rectangle.width();
    offset = rectangle.left + rectangle.top * stride;
    heightStep = rectangle.height() * stride;
}
