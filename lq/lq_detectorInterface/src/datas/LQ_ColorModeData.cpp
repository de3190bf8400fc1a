#include "LQ_ColorModeData.h"

#include "LQ_ColorSpaceConversion.h"

namespace LQ {

ColorModeData::ColorModeData(const SharedPtr<ImageData>& parent, ColorMode colorMode)
    : pImageData_(parent), targetMode_(colorMode) {
    addParent(parent);
    init();
}

void ColorModeData::init() {
    LQ_ASSERT_EQ(parents_[0], pImageData_);
    BaseSize<int> size = pImageData_->size();
    // an integral image has a zero row and column in front
    if (targetMode_ == COLOR_MODE_INTEGRAL) size = BaseSize<int>(size.width + 1, size.height + 1);
    image_.create(size, targetMode_);
    computedRect_ = BaseRect<int>();
}

void ColorModeData::compute(const BaseRect<int>& rect) {
    BaseRect<int> source = rect;
    if (targetMode_ == COLOR_MODE_RMCT) {
        // the census of a pixel reads its eight neighbours
        source = BaseRect<int>(rect.left - 1, rect.top - 1, rect.right + 1, rect.bottom + 1)
                     .intersect(pImageData_->rect());
        if (source.area() <= 0) source = BaseRect<int>();
    }
    const Image& parentImage = pImageData_->get(source);
    toColorMode(parentImage, image_, targetMode_, rect);
}

void ColorModeData::update() {
    if (size() != pImageData_->size()) init();
    ImageData::update();
}

}  // namespace LQ
