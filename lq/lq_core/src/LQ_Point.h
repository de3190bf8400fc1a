#pragma once

#include <ostream>

#include "LQ_Stream.h"
#include "LQ_Utils.h"

namespace LQ {

template <class T>
struct BasePoint {
    T x{}, y{};

    BasePoint() = default;
    BasePoint(T x_, T y_) : x(x_), y(y_) {}
    template <class U>
    explicit BasePoint(const BasePoint<U>& other) : x(static_cast<T>(other.x)), y(static_cast<T>(other.y)) {}

    BasePoint operator+(const BasePoint& o) const { return BasePoint(x + o.x, y + o.y); }
    BasePoint operator-(const BasePoint& o) const { return BasePoint(x - o.x, y - o.y); }
    BasePoint operator-() const { return BasePoint(-x, -y); }
    BasePoint operator*(T s) const { return BasePoint(x * s, y * s); }
    BasePoint operator/(T s) const { return BasePoint(x / s, y / s); }
    BasePoint& operator+=(const BasePoint& o) {
        x += o.x;
        y += o.y;
        return *this;
    }
    BasePoint& operator-=(const BasePoint& o) {
        x -= o.x;
        y -= o.y;
        return *this;
    }
    BasePoint& operator*=(T s) {
        x *= s;
        y *= s;
        return *this;
    }
    bool operator==(const BasePoint& o) const { return x == o.x && y == o.y; }
    bool operator!=(const BasePoint& o) const { return !(*this == o); }

    T dot(const BasePoint& o) const { return x * o.x + y * o.y; }
    T cross(const BasePoint& o) const { return x * o.y - y * o.x; }
};

template <class T>
struct BasePoint3d {
    T x{}, y{}, z{};

    BasePoint3d() = default;
    BasePoint3d(T x_, T y_, T z_) : x(x_), y(y_), z(z_) {}

    BasePoint3d operator+(const BasePoint3d& o) const { return BasePoint3d(x + o.x, y + o.y, z + o.z); }
    BasePoint3d operator-(const BasePoint3d& o) const { return BasePoint3d(x - o.x, y - o.y, z - o.z); }
    BasePoint3d operator-() const { return BasePoint3d(-x, -y, -z); }
    BasePoint3d operator*(T s) const { return BasePoint3d(x * s, y * s, z * s); }
    BasePoint3d operator/(T s) const { return BasePoint3d(x / s, y / s, z / s); }
    bool operator==(const BasePoint3d& o) const { return x == o.x && y == o.y && z == o.z; }
    bool operator!=(const BasePoint3d& o) const { return !(*this == o); }

    T dot(const BasePoint3d& o) const { return x * o.x + y * o.y + z * o.z; }
    BasePoint3d cross(const BasePoint3d& o) const {
        return BasePoint3d(y * o.z - z * o.y, z * o.x - x * o.z, x * o.y - y * o.x);
    }
};

// signed char would print as a character; widen it
template <class T>
inline auto printable(T value) {
    return value;
}
inline int printable(signed char value) { return value; }

template <class T>
std::ostream& operator<<(std::ostream& stream, const BasePoint<T>& p) {
    StreamO(stream) << "Point" << typeChar<T>() << "(" << printable(p.x) << ", " << printable(p.y) << ")";
    return stream;
}

template <class T>
std::ostream& operator<<(std::ostream& stream, const BasePoint3d<T>& p) {
    StreamO(stream) << "Point3d" << typeChar<T>() << "(" << printable(p.x) << ", " << printable(p.y) << ", "
                    << printable(p.z) << ")";
    return stream;
}

typedef BasePoint<float> PointF;
typedef BasePoint<int> PointI;
typedef BasePoint3d<float> Point3dF;

}  // namespace LQ
