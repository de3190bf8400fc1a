#pragma once
// Writing side of the binary archive. Values go out as they lie in memory, with no
// alignment and no gaps; the writer checks nothing.

#include <cstdint>
#include <ostream>
#include <string>
#include <type_traits>
#include <vector>

#include "LQ_Archive.h"
#include "LQ_Point.h"
#include "LQ_Range.h"
#include "LQ_Rect.h"
#include "LQ_Size.h"

namespace LQ {

class ArchiveO : public Archive {
public:
    explicit ArchiveO(std::ostream& stream) : stream_(stream) {}

    // the bytes and one NUL; a NUL inside would end the string on reading
    ArchiveO& operator&(const std::string& value);
    // the bytes only: a mark the reader verifies
    ArchiveO& operator&(const char* value);

    template <class T, std::enable_if_t<ArchivePlain<T>::value, int> = 0>
    ArchiveO& operator&(const T& value) {
        stream_.write(reinterpret_cast<const char*>(&value), sizeof(T));
        return *this;
    }

    // 32-bit count, then the elements
    template <class T, class A>
    ArchiveO& operator&(const std::vector<T, A>& values);

    ArchiveO& write(const float* data, unsigned int count) {
        stream_.write(reinterpret_cast<const char*>(data),
                      static_cast<std::streamsize>(count) * sizeof(float));
        return *this;
    }
    ArchiveO& write(const char* data, unsigned int count) {
        stream_.write(data, count);
        return *this;
    }

    // Writes the value only if this archive's version isn't before the given one.
    template <class T>
    ArchiveO& archiveFromVersion(const std::string& version, const T& value) {
        if (!isBefore(version)) *this & value;
        return *this;
    }

    operator std::ostream&() { return stream_; }

private:
    std::ostream& stream_;
};

template <class T, class A>
ArchiveO& ArchiveO::operator&(const std::vector<T, A>& values) {
    const std::uint32_t count = static_cast<std::uint32_t>(values.size());
    *this & count;
    if constexpr (std::is_arithmetic<T>::value && !std::is_same<T, bool>::value) {
        // same bytes as element by element, in one call
        if (count)
            stream_.write(reinterpret_cast<const char*>(values.data()), std::streamsize(count) * sizeof(T));
    } else {
        for (const auto& value : values) *this& value;
    }
    return *this;
}

// Geometry values: their fields in order, each in its own encoding.
template <class T>
ArchiveO& operator&(ArchiveO& archive, const BaseSize<T>& size) {
    return archive & size.width & size.height;
}
template <class T>
ArchiveO& operator&(ArchiveO& archive, const BasePoint<T>& point) {
    return archive & point.x & point.y;
}
template <class T>
ArchiveO& operator&(ArchiveO& archive, const BasePoint3d<T>& point) {
    return archive & point.x & point.y & point.z;
}
template <class T>
ArchiveO& operator&(ArchiveO& archive, const BaseRect<T>& rect) {
    return archive & rect.left & rect.top & rect.right & rect.bottom;
}
template <class T>
ArchiveO& operator&(ArchiveO& archive, const BaseRange<T>& range) {
    return archive & range.lower & range.upper;
}

}  // namespace LQ
