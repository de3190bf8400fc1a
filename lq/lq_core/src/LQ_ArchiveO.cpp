#include "LQ_ArchiveO.h"

#include <cstring>

namespace LQ {

ArchiveO& ArchiveO::operator&(const std::string& value) {
    // c_str() so that the text stops where a reader would stop
    stream_.write(value.c_str(), static_cast<std::streamsize>(std::strlen(value.c_str())) + 1);
    return *this;
}

ArchiveO& ArchiveO::operator&(const char* value) {
    stream_.write(value, static_cast<std::streamsize>(std::strlen(value)));
    return *this;
}

}  // namespace LQ
