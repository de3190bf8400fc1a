#include "LQ_Archive.h"

namespace LQ {

bool isVersionBefore(const std::string& version, const std::string& other) {
    // std::string compares through char_traits<char>, which orders bytes as unsigned
    // and puts a prefix before the longer text
    return version.compare(other) < 0;
}

}  // namespace LQ
