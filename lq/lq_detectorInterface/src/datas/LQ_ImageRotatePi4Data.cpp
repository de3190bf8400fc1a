#include "LQ_ImageRotatePi4Data.h"

#include "LQ_Geometry.h"
#include "LQ_ImageRotate.h"
#include "LQ_ObjectLocation.h"

namespace LQ {

ImageRotatePi4Data::ImageRotatePi4Data(const SharedPtr<ImageData>& parent, int* angle)
    : pImageData_(parent), angle_(angle) {
    addParent(parent);
    init();
}

int ImageRotatePi4Data::quarterTurns() const {
    normalizeAngle(*angle_);
    static const AngleRange ranges[] = {AngleRange(315, 44), AngleRange(45, 134), AngleRange(135, 224),
                                        AngleRange(225, 314)};
    for (int turns = 0; turns < 4; ++turns)
        if (ranges[turns].contains(*angle_)) return turns;
    return 0;
}

BaseSize<int> ImageRotatePi4Data::turnedSize() const {
    const BaseSize<int> size = pImageData_->size();
    return quarterTurns() % 2 ? BaseSize<int>(size.height, size.width) : size;
}

void ImageRotatePi4Data::init() {
    LQ_ASSERT_EQ(parents_[0], pImageData_);
    image_.create(turnedSize(), pImageData_->colorMode());
    computedRect_ = BaseRect<int>();
}

void ImageRotatePi4Data::compute(const BaseRect<int>& rect) {
    // always the whole parent: a turned rectangle would need the whole row range anyway
    const BaseSize<int> before = image_.size();
    rotatePi4(pImageData_->get(), image_, quarterTurns());
    if (image_.size() != before) {
        // the angle moved since the frame began: the nodes below must follow
        resetRecursive();
        updateRecursive();
    }
}

void ImageRotatePi4Data::update() {
    if (pImageData_->colorMode() != image_.colorMode() || turnedSize() != image_.size()) init();
    ImageData::update();
}

float ImageRotatePi4Data::getAngle(float x, float y, float z) { return getAngleFromAcceleration(x, y, z); }

}  // namespace LQ
