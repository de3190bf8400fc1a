#include "LQ_Size.h"

#include "LQ_ArchiveI.h"

namespace LQ {

std::istream& operator>>(std::istream& stream, BaseSize<int>& size) {
    LQ_READ_LABEL(stream, "Size(");
    stream >> size.width;
    LQ_READ_LABEL(stream, ", ");
    stream >> size.height;
    LQ_READ_LABEL(stream, ")");
    return stream;
}

}  // namespace LQ
