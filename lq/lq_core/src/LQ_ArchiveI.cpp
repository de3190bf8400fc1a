#include "LQ_ArchiveI.h"

namespace LQ {

ArchiveI::ArchiveI(std::istream& stream) : stream_(stream) {
    LQ_ASSERT_MSG(stream_, "empty stream");
}

ArchiveI& ArchiveI::operator&(std::string& value) {
    constexpr int MAX_BUFFER_SIZE = 1000;
    // One byte beyond the buffer for get's terminator: a string that fills the whole
    // buffer leaves its last byte set and is refused instead of being cut.
    char buffer[MAX_BUFFER_SIZE + 1] = {};
    // An empty string extracts nothing and fails the stream, so the next read fails too.
    stream_.get(buffer, MAX_BUFFER_SIZE + 1, '\0');
    LQ_ASSERT_MSG(buffer[MAX_BUFFER_SIZE - 1] == 0, "too large string");
    stream_.get();
    value = buffer;
    return *this;
}

ArchiveI& ArchiveI::operator&(const char* value) {
    constexpr size_t MAX_BUFFER_SIZE = 256;
    const size_t size = std::char_traits<char>::length(value);
    LQ_ASSERT_MSG(size < MAX_BUFFER_SIZE, "wrong str size " << size << " >= " << MAX_BUFFER_SIZE);
    char buffer[MAX_BUFFER_SIZE] = {};
    stream_.read(buffer, static_cast<std::streamsize>(size));
    LQ_ASSERT_MSG((std::string(value) == buffer) && (std::istream&)(stream_),
                  "cannot read \"" << value << "\" from \"" << buffer);
    return *this;
}

std::istream& readString(std::istream& stream, const std::string& str) {
    constexpr size_t MAX_BUFFER_SIZE = 256;
    LQ_ASSERT_MSG(str.size() < MAX_BUFFER_SIZE, "wrong str size " << str.size() << " >= " << MAX_BUFFER_SIZE);
    char buffer[MAX_BUFFER_SIZE] = {};
    stream.read(buffer, static_cast<std::streamsize>(str.size()));
    LQ_ASSERT_MSG(str == buffer && stream, "cannot read \"" << str << "\" from \"" << buffer);
    return stream;
}

}  // namespace LQ
