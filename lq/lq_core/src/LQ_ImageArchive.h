#pragma once
// Binary archive form of an image: size, colour mode, then the rows without their
// stride's surplus, so a reference into a larger image writes only its own pixels.

#include "LQ_ArchiveI.h"
#include "LQ_ArchiveO.h"
#include "LQ_Image.h"

namespace LQ {

ArchiveO& operator&(ArchiveO& archive, const Image& image);
// Creates the image with the stored size and mode and fills its rows.
ArchiveI& operator&(ArchiveI& archive, Image& image);

}  // namespace LQ
