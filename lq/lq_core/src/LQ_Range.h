#pragma once

#include <limits>
#include <ostream>

#include "LQ_Point.h"

namespace LQ {

template <class T>
struct BaseRange {
    // the default is the whole range of T: no limit
    T lower = std::numeric_limits<T>::lowest();
    T upper = std::numeric_limits<T>::max();

    BaseRange() = default;
    BaseRange(T lower_, T upper_) : lower(lower_), upper(upper_) {}

    T length() const { return upper - lower; }
    bool contains(T value) const { return value >= lower && value <= upper; }
    bool operator==(const BaseRange& o) const { return lower == o.lower && upper == o.upper; }
    bool operator!=(const BaseRange& o) const { return !(*this == o); }
};

template <class T>
std::ostream& operator<<(std::ostream& stream, const BaseRange<T>& r) {
    StreamO(stream) << "Range" << typeChar<T>() << "(" << printable(r.lower) << ", " << printable(r.upper) << ")";
    return stream;
}

typedef BaseRange<float> RangeF;

}  // namespace LQ
