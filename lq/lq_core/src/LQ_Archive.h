#pragma once
// Base of the binary archives: the format version that decides which fields exist.

#include <string>
#include <type_traits>

namespace LQ {

// Types written as their memory image. Arithmetic types and enumerations by default;
// a fixed-layout record may opt in by specialising this.
template <class T>
struct ArchivePlain : std::integral_constant<bool, std::is_arithmetic<T>::value || std::is_enum<T>::value> {};

// Versions compare as strings, bytewise: "Version 8" is after "Version 2", and the empty
// version is before every other one.
bool isVersionBefore(const std::string& version, const std::string& other);

class Archive {
public:
    void setVersion(const std::string& version) { version_ = version; }
    std::string getVersion() const { return version_; }

    // whether this archive's version is before the given one
    bool isBefore(const std::string& version) const { return isVersionBefore(version_, version); }

protected:
    std::string version_;
};

}  // namespace LQ
