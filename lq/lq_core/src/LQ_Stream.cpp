#include "LQ_Stream.h"

#include "LQ_Utils.h"

namespace LQ {

StreamO& StreamO::operator<<(const std::string& text) {
    stream_ << '"';
    for (const char c : text) {
        if (c == '\\' || c == '"') stream_ << '\\';
        stream_ << c;
    }
    stream_ << '"';
    return *this;
}

StreamO& StreamO::operator<<(float value) {
    stream_.precision(7);
    stream_ << value;
    return *this;
}

StreamO& StreamO::operator<<(double value) {
    stream_.precision(16);
    stream_ << value;
    return *this;
}

StreamI::StreamI(std::istream& stream) : stream_(stream) { LQ_ASSERT_MSG(stream_, "empty stream"); }

StreamI& StreamI::operator>>(std::string& text) {
    text.clear();
    char c = 0;
    stream_.get(c);
    if (!stream_ || c != '"') LQ_FAIL("cannot find starting \": " << c);
    while (stream_.get(c)) {
        if (c == '\\') {
            stream_.get(c);
            LQ_ASSERT_MSG(stream_, "error during parsing stream");
            LQ_ASSERT_MSG(c == '\\' || c == '\"', "wrong escaped character " << c << "after " << text);
            text += c;
        } else if (c == '"') {
            return *this;
        } else {
            text += c;
        }
    }
    LQ_ASSERT_MSG(stream_, "error during parsing stream");
    return *this;
}

}  // namespace LQ
