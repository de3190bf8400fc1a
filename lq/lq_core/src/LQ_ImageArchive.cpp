#include "LQ_ImageArchive.h"

#include <cstdint>

namespace LQ {

ArchiveO& operator&(ArchiveO& archive, const Image& image) {
    archive & image.size() & static_cast<std::int32_t>(image.colorMode());
    const unsigned int rowBytes = static_cast<unsigned int>(image.width() * image.depth());
    if (rowBytes == 0) return archive;
    for (int y = 0; y < image.height(); ++y)
        archive.write(reinterpret_cast<const char*>(image.row(y)), rowBytes);
    return archive;
}

ArchiveI& operator&(ArchiveI& archive, Image& image) {
    BaseSize<int> size;
    std::int32_t colorMode = 0;
    archive & size & colorMode;
    // checked before the cast: an enumeration can't hold an arbitrary word
    LQ_ASSERT_MSG(colorMode >= 0 && colorMode < COLOR_MODE_END, "Invalid color mode: " << colorMode);
    if (colorMode == COLOR_MODE_UNDEFINED) {
        image.reset();
        return archive;
    }
    image.create(size, static_cast<ColorMode>(colorMode));
    const unsigned int rowBytes = static_cast<unsigned int>(image.width() * image.depth());
    if (rowBytes == 0) return archive;
    for (int y = 0; y < image.height(); ++y) archive.read(reinterpret_cast<char*>(image.row(y)), rowBytes);
    return archive;
}

}  // namespace LQ
