#include "ClassifierProperties.h"

#include <cmath>

#include "LQ_Utils.h"
#include "WeakClassifier.h"

int normalizedCascadeAngle(int angle) { return ((angle + 540) % 360 + 360) % 360 - 180; }

void ClassifierProperties::setMonoSize(const LQ::BaseSize<int>& size) {
    monoSize = size;
    if (objectRect_.area() == 0) {
        baseSize_ = size;
        setObjectCenter(LQ::BasePoint<int>(size.width / 2, size.height / 2));
    }
}

void ClassifierProperties::setObjectCenter(const LQ::BasePoint<int>& center) {
    LQ_ASSERT_MSG(baseSize_.area(), "set baseSize firts");
    objectCenter_ = center;
    objectRect_.left = center.x - baseSize_.width / 2;
    objectRect_.top = center.y - baseSize_.height / 2;
    objectRect_.right = objectRect_.left + baseSize_.width;
    objectRect_.bottom = objectRect_.top + baseSize_.height;
}

void ClassifierProperties::flip() {
    if (side_ != LQ::Side::BOTH) side_ = static_cast<LQ::Side::Value>(side_ ^ 3);
    objectCenter_ = flipPointOnSize(objectCenter_, monoSize);
    objectRect_ = flipRectOnSize(objectRect_, monoSize);
    angle_ = normalizedCascadeAngle(-angle_);
}

void ClassifierProperties::rotate() {
    objectCenter_ = rotatePointOnSize(objectCenter_, monoSize);
    objectRect_ = rotateRectOnSize(objectRect_, monoSize);
    monoSize = LQ::BaseSize<int>(monoSize.height, monoSize.width);
    angle_ = normalizedCascadeAngle(angle_ + 90);
}

void ClassifierProperties::resize(float factor) {
    // a hair above 1 so that products that should be whole don't fall just below
    const float up = 1.00000095367431640625f;
    monoSize = LQ::BaseSize<int>(static_cast<int>(monoSize.width * factor * up),
                                 static_cast<int>(monoSize.height * factor * up));
    if (objectRect_.area() == 0) {
        baseSize_ = monoSize;
        setObjectCenter(LQ::BasePoint<int>(monoSize.width / 2, monoSize.height / 2));
    }
    objectRect_ = objectRect_ * factor;
    objectCenter_ = LQ::BasePoint<int>(static_cast<int>(objectCenter_.x * factor * up),
                                       static_cast<int>(objectCenter_.y * factor * up));
}

ClassifierProperties::Transformation ClassifierProperties::transformCost(const ClassifierProperties& other) const {
    Transformation result;
    if (name_ != other.name_) return result;
    int d = 0;
    bool flip = false;
    if ((side_ & other.side_) != 0 && (side_ != LQ::Side::BOTH || (360 - angle_ + other.angle_) % 90 == 0)) {
        d = 360 - angle_ + other.angle_;
    } else {
        flip = true;
        d = other.angle_ + 360 - normalizedCascadeAngle(-angle_);
    }
    if (d % 90 != 0) return result;
    result.rotations = (d / 90) % 4;
    result.flip = flip;
    result.possible = result.rotations != 0 || flip;
    if (!result.possible) result.rotations = 0;
    return result;
}

bool ClassifierProperties::in(const LQ::DetectRegion& region, float zoom) const {
    return baseSize_.width * zoom < static_cast<float>(region.rect.width()) &&
           baseSize_.height * zoom < static_cast<float>(region.rect.height()) &&
           static_cast<double>(region.zoomRange.lower) - 0.00001 < zoom && zoom < region.zoomRange.upper &&
           region.angleRange.contains(angle_) && (region.side & side_) != 0;
}

bool ClassifierProperties::operator==(const ClassifierProperties& other) const {
    return name_ == other.name_ && angle_ == other.angle_ && side_ == other.side_ && monoSize == other.monoSize &&
           objectRect_ == other.objectRect_;
}

std::ostream& operator<<(std::ostream& stream, const ClassifierProperties& properties) {
    static const char* sides[] = {"NONE", "RIGHT", "LEFT", "BOTH"};
    stream << "ClassifierProperties(" << properties.getName() << ", angle=" << properties.getAngle()
           << ", side=" << sides[properties.getSide() & 3] << ", patchSize_=" << properties.getMonoSize()
           << ", objectRect_=" << properties.getObjectRect() << ")";
    return stream;
}
