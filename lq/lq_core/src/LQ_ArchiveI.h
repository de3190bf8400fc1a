#pragma once
// Reading side of the binary archive. Plain values aren't checked: a short file leaves
// the stream failed, and the next literal mark stops the load with its check.

#include <cstdint>
#include <fstream>
#include <istream>
#include <string>
#include <type_traits>
#include <vector>

#include "LQ_Archive.h"
#include "LQ_Point.h"
#include "LQ_Range.h"
#include "LQ_Rect.h"
#include "LQ_Size.h"
#include "LQ_Utils.h"

namespace LQ {

class ArchiveI : public Archive {
public:
    // the stream must be in a good state
    explicit ArchiveI(std::istream& stream);

    // up to the NUL; at most 999 characters
    ArchiveI& operator&(std::string& value);
    // reads the mark's bytes and verifies them
    ArchiveI& operator&(const char* value);

    template <class T, std::enable_if_t<ArchivePlain<T>::value, int> = 0>
    ArchiveI& operator&(T& value) {
        if constexpr (std::is_same<T, bool>::value) {
            // a byte other than 0 or 1 must not land in a bool as it is
            char byte = 0;
            stream_.read(&byte, 1);
            value = byte != 0;
        } else {
            stream_.read(reinterpret_cast<char*>(&value), sizeof(T));
        }
        return *this;
    }

    template <class T, class A>
    ArchiveI& operator&(std::vector<T, A>& values) {
        load(&values);
        return *this;
    }

    ArchiveI& read(float* data, unsigned int count) {
        stream_.read(reinterpret_cast<char*>(data), static_cast<std::streamsize>(count) * sizeof(float));
        return *this;
    }
    ArchiveI& read(char* data, unsigned int count) {
        stream_.read(data, count);
        return *this;
    }

    // Reads the value only if this archive's version isn't before the given one;
    // otherwise the value keeps what it had.
    template <class T>
    ArchiveI& archiveFromVersion(const std::string& version, T& value) {
        if (!isBefore(version)) *this & value;
        return *this;
    }

    // A vector. Files before "Version 6" hold the count as decimal text; an empty
    // version counts as current here.
    template <class T, class A>
    void load(std::vector<T, A>* values);

    // Opens the file in binary mode and reads the object through operator&.
    template <class T>
    static void load(const std::string& fileName, T& object);

    operator std::istream&() { return stream_; }

private:
    std::istream& stream_;
};

template <class T, class A>
void ArchiveI::load(std::vector<T, A>* values) {
    std::uint32_t count = 0;
    if (!version_.empty() && isBefore("Version 6")) {
        stream_ >> count;
    } else {
        *this & count;
    }
    values->resize(count);
    if constexpr (std::is_arithmetic<T>::value && !std::is_same<T, bool>::value) {
        if (count) stream_.read(reinterpret_cast<char*>(values->data()), std::streamsize(count) * sizeof(T));
    } else {
        for (auto& value : *values) *this& value;
    }
}

template <class T>
void ArchiveI::load(const std::string& fileName, T& object) {
    std::ifstream file(fileName, std::ios::in | std::ios::binary);
    LQ_ASSERT_MSG(file, "cannot open " << fileName);
    ArchiveI archive(file);
    archive & object;
}

// Reads exactly str's bytes from a plain stream and verifies them.
std::istream& readString(std::istream& stream, const std::string& str);

// The fixed pieces of text forms such as "Size(w, h)". A macro so that the failed check
// shows which piece was expected.
#define LQ_READ_LABEL(stream, label)                                               \
    do {                                                                           \
        static_assert(sizeof(label) <= 256, "label too long");                     \
        char buffer[256] = {};                                                     \
        (stream).read(buffer, sizeof(label) - 1);                                  \
        LQ_ASSERT_MSG((std::string(label) == buffer) && (std::istream&)(stream),   \
                      "cannot parse `" << (label) << "` from `" << buffer << "`"); \
    } while (0)

// Geometry values: their fields in order, each in its own encoding.
template <class T>
ArchiveI& operator&(ArchiveI& archive, BaseSize<T>& size) {
    return archive & size.width & size.height;
}
template <class T>
ArchiveI& operator&(ArchiveI& archive, BasePoint<T>& point) {
    return archive & point.x & point.y;
}
template <class T>
ArchiveI& operator&(ArchiveI& archive, BasePoint3d<T>& point) {
    return archive & point.x & point.y & point.z;
}
template <class T>
ArchiveI& operator&(ArchiveI& archive, BaseRect<T>& rect) {
    return archive & rect.left & rect.top & rect.right & rect.bottom;
}
template <class T>
ArchiveI& operator&(ArchiveI& archive, BaseRange<T>& range) {
    return archive & range.lower & range.upper;
}

}  // namespace LQ
