#pragma once
// Half-open rectangle: right and bottom lie one past the last column and row.

#include <cmath>
#include <ostream>

#include "LQ_Point.h"
#include "LQ_Size.h"
#include "LQ_Utils.h"

namespace LQ {

template <class T>
struct BaseRect {
    T left{}, top{}, right{}, bottom{};

    BaseRect() = default;
    BaseRect(T left_, T top_, T right_, T bottom_) : left(left_), top(top_), right(right_), bottom(bottom_) {}
    explicit BaseRect(const BaseSize<T>& size) : left(0), top(0), right(size.width), bottom(size.height) {}
    BaseRect(const BasePoint<T>& topLeft, const BaseSize<T>& size)
        : left(topLeft.x), top(topLeft.y), right(topLeft.x + size.width), bottom(topLeft.y + size.height) {}
    template <class U>
    explicit BaseRect(const BaseRect<U>& other)
        : left(static_cast<T>(other.left)),
          top(static_cast<T>(other.top)),
          right(static_cast<T>(other.right)),
          bottom(static_cast<T>(other.bottom)) {}

    T width() const { return right - left; }
    T height() const { return bottom - top; }
    BaseSize<T> size() const { return BaseSize<T>(width(), height()); }
    T area() const { return width() * height(); }
    BasePoint<T> topLeft() const { return BasePoint<T>(left, top); }

    bool contains(const BaseRect& r) const {
        return r.left >= left && r.right <= right && r.top >= top && r.bottom <= bottom;
    }
    bool contains(const BasePoint<T>& p) const { return p.x >= left && p.x < right && p.y >= top && p.y < bottom; }

    // Grows (or with negative amounts shrinks) around the centre.
    BaseRect& resize(T dx, T dy) {
        left -= dx;
        right += dx;
        top -= dy;
        bottom += dy;
        return *this;
    }

    BaseRect& shift(T dx, T dy) {
        left += dx;
        right += dx;
        top += dy;
        bottom += dy;
        return *this;
    }

    // the common part; empty rectangles come out with zero area
    BaseRect intersect(const BaseRect& r) const {
        BaseRect result(std::max(left, r.left), std::max(top, r.top), std::min(right, r.right),
                        std::min(bottom, r.bottom));
        if (result.right < result.left) result.right = result.left;
        if (result.bottom < result.top) result.bottom = result.top;
        return result;
    }

    // Each coordinate scaled in float, times the stable multiplier, truncated toward zero.
    BaseRect operator*(float s) const {
        const float m = stableMultiplier<float>();
        return BaseRect(static_cast<T>(left * s * m), static_cast<T>(top * s * m), static_cast<T>(right * s * m),
                        static_cast<T>(bottom * s * m));
    }
    BaseRect operator/(float s) const {
        const float m = stableMultiplier<float>();
        return BaseRect(static_cast<T>(left / s * m), static_cast<T>(top / s * m), static_cast<T>(right / s * m),
                        static_cast<T>(bottom / s * m));
    }

    // Moves the rectangle, keeping its size, until it lies inside the boundary.
    BaseRect& shiftInBoundary(const BaseRect& rectBoundary) {
        const T width = this->width();
        const T height = this->height();
        LQ_ASSERT(width <= T(rectBoundary.size().width) && height <= T(rectBoundary.size().height));
        if (left < rectBoundary.left) {
            left = rectBoundary.left;
            right = rectBoundary.left + width;
        }
        if (top < rectBoundary.top) {
            top = rectBoundary.top;
            bottom = rectBoundary.top + height;
        }
        if (right > rectBoundary.right) {
            right = rectBoundary.right;
            left = rectBoundary.right - width;
        }
        if (bottom > rectBoundary.bottom) {
            bottom = rectBoundary.bottom;
            top = rectBoundary.bottom - height;
        }
        return *this;
    }

    bool operator==(const BaseRect& o) const {
        return left == o.left && top == o.top && right == o.right && bottom == o.bottom;
    }
    bool operator!=(const BaseRect& o) const { return !(*this == o); }
};

template <class T>
std::ostream& operator<<(std::ostream& stream, const BaseRect<T>& r) {
    StreamO(stream) << "Rect(" << printable(r.left) << ", " << printable(r.top) << ", " << printable(r.right)
                    << ", " << printable(r.bottom) << ")";
    return stream;
}

namespace detail {
inline float rectDistance(const BaseRect<float>& a, const BaseRect<float>& b) {
    const float dx = (a.left + a.right) * 0.5f - (b.left + b.right) * 0.5f;
    const float dy = (a.top + a.bottom) * 0.5f - (b.top + b.bottom) * 0.5f;
    return std::sqrt(dx * dx + dy * dy);
}
inline float rectDistance(const BaseRect<int>& a, const BaseRect<int>& b) {
    const int dx = (a.left + a.right) / 2 - (b.left + b.right) / 2;
    const int dy = (a.top + a.bottom) / 2 - (b.top + b.bottom) / 2;
    return std::sqrt(static_cast<float>(dx * dx + dy * dy));
}
}  // namespace detail

// Whether two rectangles are the same object: widths within the width similarity,
// centres closer than the position similarity times the smaller width. Heights don't count.
template <class T>
bool Similar(const BaseRect<T>& a, const BaseRect<T>& b, float widthSimilarity, float positionSimilarity) {
    LQ_ASSERT_MSG(widthSimilarity > 1.f, "incorrect widthSimilarity = " << widthSimilarity);
    LQ_ASSERT_MSG(positionSimilarity < 1.f, "incorrect positionSimilarity = " << positionSimilarity);
    const float wa = static_cast<float>(a.width());
    const float wb = static_cast<float>(b.width());
    const float wmin = std::min(wa, wb);
    const float wmax = std::max(wa, wb);
    return wmax < wmin * widthSimilarity && detail::rectDistance(a, b) < wmin * positionSimilarity;
}

typedef BaseRect<int> Rect;
typedef BaseRect<float> RectF;

}  // namespace LQ
