#pragma once
// Typed text streams: one readable text form for every value type, used by logs,
// dumps and generated source.

#include <istream>
#include <map>
#include <ostream>
#include <string>
#include <vector>

namespace LQ {

class StreamO {
public:
    explicit StreamO(std::ostream& stream) : stream_(stream) {}

    // quoted, with backslash and double quote escaped
    StreamO& operator<<(const std::string& text);
    StreamO& operator<<(const char* text) {
        stream_ << text;
        return *this;
    }
    // Sets the precision and leaves it so.
    StreamO& operator<<(float value);
    StreamO& operator<<(double value);

    template <class T>
    StreamO& operator<<(const T& value) {
        stream_ << value;
        return *this;
    }

    template <class T, class A>
    StreamO& operator<<(const std::vector<T, A>& values) {
        stream_ << "vector[" << values.size() << "](";
        for (size_t i = 0; i < values.size(); ++i) {
            if (i) stream_ << ", ";
            *this << values[i];
        }
        stream_ << ")";
        return *this;
    }

    template <class K, class V, class C, class A>
    StreamO& operator<<(const std::map<K, V, C, A>& values) {
        stream_ << "map[" << values.size() << "](";
        bool first = true;
        for (const auto& entry : values) {
            if (!first) stream_ << ", ";
            first = false;
            *this << entry.first;
            stream_ << " = ";
            *this << entry.second;
        }
        stream_ << ")";
        return *this;
    }

    operator std::ostream&() { return stream_; }

private:
    std::ostream& stream_;
};

class StreamI {
public:
    explicit StreamI(std::istream& stream);

    // reads the quoted form that StreamO writes
    StreamI& operator>>(std::string& text);

    template <class T>
    StreamI& operator>>(T& value) {
        stream_ >> value;
        return *this;
    }

    StreamI& seekg(std::streampos position) {
        stream_.seekg(position);
        return *this;
    }
    StreamI& read(char* data, long count) {
        stream_.read(data, count);
        return *this;
    }

    operator std::istream&() { return stream_; }

private:
    std::istream& stream_;
};

}  // namespace LQ
