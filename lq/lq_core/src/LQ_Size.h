#pragma once

#include <istream>
#include <ostream>

#include "LQ_Stream.h"

namespace LQ {

// 1.000001f (bits 0x3F800008): applied whenever a scaled float coordinate is truncated
// to an integer, so an exact multiple doesn't lose one to rounding below it.
template <class T>
constexpr T stableMultiplier();
template <>
constexpr float stableMultiplier<float>() {
    return 1.000001f;
}

template <class T>
struct BaseSize {
    T width{}, height{};

    BaseSize() = default;
    BaseSize(T width_, T height_) : width(width_), height(height_) {}
    template <class U>
    explicit BaseSize(const BaseSize<U>& other)
        : width(static_cast<T>(other.width)), height(static_cast<T>(other.height)) {}

    T area() const { return width * height; }
    bool operator==(const BaseSize& o) const { return width == o.width && height == o.height; }
    bool operator!=(const BaseSize& o) const { return !(*this == o); }
    BaseSize operator*(T s) const { return BaseSize(width * s, height * s); }
    BaseSize operator/(T s) const { return BaseSize(width / s, height / s); }
};

template <class T>
std::ostream& operator<<(std::ostream& stream, const BaseSize<T>& size) {
    StreamO(stream) << "Size(" << size.width << ", " << size.height << ")";
    return stream;
}

// Reads "Size(w, h)"; a piece that doesn't match fails the check.
std::istream& operator>>(std::istream& stream, BaseSize<int>& size);

typedef BaseSize<int> Size;
typedef BaseSize<float> SizeF;

}  // namespace LQ
