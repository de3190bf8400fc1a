#include "LQ_ObjectLocation.h"

#include <cmath>

#include "LQ_ImageRotate.h"

namespace LQ {

namespace {
const char* const kSideNames[] = {"NONE", "RIGHT", "LEFT", "BOTH"};

// R(theta) times v; the matrix is made in double and kept in float, as a 2x2 float matrix
BasePoint<float> rotated(float theta, const BasePoint<float>& v) {
    const float c = static_cast<float>(std::cos(static_cast<double>(theta)));
    const float s = static_cast<float>(std::sin(static_cast<double>(theta)));
    return BasePoint<float>(c * v.x - s * v.y, s * v.x + c * v.y);
}

BasePoint<float> patchCentre(const BaseSize<int>& patch) {
    return BasePoint<float>((patch.width - 1) / 2.f, (patch.height - 1) / 2.f);
}

// the library's float conversion: a negative angle is first brought into one turn
float toRadian(float degrees) {
    if (degrees < 0) degrees += 360;
    return degrees * 3.1415927f / 180;
}

// the side of a location seen through a LEFT (mirrored) object
Side::Value mirrored(Side::Value side) { return side == Side::RIGHT ? Side::LEFT : Side::RIGHT; }
}  // namespace

const char* const* EnumNames<Side::Value>::names() { return kSideNames; }

std::ostream& operator<<(std::ostream& stream, Side::Value side) {
    const char* name = enumName(side);
    if (name) return stream << name;
    return stream << static_cast<int>(side);
}

std::istream& operator>>(std::istream& stream, Side::Value& side) { return readEnum(stream, side); }

void normalizeAngle(int& angle) { angle = ((angle + 540) % 360) - 180; }

void AngleRange::setRange(int lower, int upper) {
    normalizeAngle(lower);
    normalizeAngle(upper);
    lower_ = lower;
    upper_ = upper;
}

std::ostream& operator<<(std::ostream& stream, const AngleRange& range) {
    return stream << "AngleRange(" << range.lower() << ", " << range.upper() << ")";
}

ObjectLocation::ObjectLocation(const BaseRect<float>& rect)
    : center((rect.left + rect.right) / 2, (rect.top + rect.bottom) / 2), size(rect.width(), rect.height()) {}

BaseRect<float> ObjectLocation::getRect() const {
    const float left = center.x - size.width / 2;
    const float top = center.y - size.height / 2;
    return BaseRect<float>(left, top, left + size.width, top + size.height);
}

BasePoint<float> ObjectLocation::getPoint(const BaseSize<int>& patch, const BasePoint<float>& point) const {
    BasePoint<float> q = point - patchCentre(patch);
    if (side == Side::LEFT) q.x = -q.x;
    return center + rotated(-toRadian(angle), q) * getZoom(patch);
}

BasePoint<float> ObjectLocation::getPointInverse(const BaseSize<int>& patch, const BasePoint<float>& point) const {
    BasePoint<float> q = rotated(toRadian(angle), point - center) / getZoom(patch);
    if (side == Side::LEFT) q.x = -q.x;
    return q + patchCentre(patch);
}

ObjectLocation ObjectLocation::getLocationState(const BaseSize<int>& patch, const ObjectLocation& inner) const {
    ObjectLocation result = inner;
    const float z = getZoom(patch);
    result.center = getPoint(patch, inner.center);
    result.angle = inner.angle + angle;
    result.size = BaseSize<float>(inner.size.width * z, inner.size.height * z);
    if (side == Side::LEFT) result.side = mirrored(inner.side);
    return result;
}

ObjectLocation ObjectLocation::getLocationStateInverse(const BaseSize<int>& patch,
                                                       const ObjectLocation& outer) const {
    ObjectLocation result = outer;
    const float z = getZoom(patch);
    result.center = getPointInverse(patch, outer.center);
    result.angle = outer.angle - angle;
    result.size = BaseSize<float>(outer.size.width / z, outer.size.height / z);
    if (side == Side::LEFT) result.side = mirrored(outer.side);
    return result;
}

ObjectLocation ObjectLocation::getRelativeLocationState(const ObjectLocation& relative) const {
    ObjectLocation result = *this;
    const float w = size.width;
    result.center += rotated(toRadian(angle), relative.center) * w;
    result.size.width = w * relative.size.width;
    result.size.height = w * relative.size.height;
    if (relative.size.height == 0) result.size.height = result.size.width * size.height / w;
    result.angle += relative.angle;
    if (side == Side::LEFT) result.side = mirrored(relative.side);
    return result;
}

void ObjectLocation::getPatch(const Image& image, const BaseSize<int>& patchSize, Image& out) const {
    out.create(patchSize, image.colorMode());
    const float z = size.width / patchSize.width;
    rotateAndZoomImage(image, out, -toRadian(angle), z, z, center);
    if (side == Side::LEFT) {
        const Image copy = out;
        flipLeftRight(copy, out);
    }
}

std::ostream& operator<<(std::ostream& stream, const ObjectLocation& location) {
    return stream << "ObjectLocation(" << location.center << ", " << location.size << ", " << location.angle << ", "
                  << location.side << ")";
}

RelativeLocation::RelativeLocation(const ObjectLocation& source, const ObjectLocation& target)
    : scale_(target.size.width / source.size.width),
      shift_((target.center - source.center) / source.size.width),
      angle_(target.angle - source.angle),
      targetAspect_(target.size.height / target.size.width),
      sourceAspect_(source.size.height / source.size.width) {}

void RelativeLocation::reverse() {
    shift_ = BasePoint<float>(-shift_.x / scale_, -shift_.y / scale_);
    angle_ = -angle_;
    scale_ = 1 / scale_;
}

ObjectLocation RelativeLocation::getLocationState(const ObjectLocation& source) const {
    ObjectLocation result = source;
    BasePoint<float> s = shift_;
    if (source.side == Side::LEFT) s.x = -s.x;
    result.center += rotated(-toRadian(source.angle), s) * source.size.width;
    result.size = BaseSize<float>(source.size.width * scale_, source.size.height * scale_);
    result.angle += angle_;
    if (targetAspect_ > 1e-5f) result.size.height = result.size.width * targetAspect_;
    return result;
}

ObjectLocation RelativeLocation::getInverseLocationState(const ObjectLocation& target) const {
    ObjectLocation result = target;
    result.size = BaseSize<float>(target.size.width / scale_, target.size.height / scale_);
    result.angle = target.angle - angle_;
    BasePoint<float> s = shift_;
    if (target.side == Side::LEFT) s.x = -s.x;
    result.center -= rotated(-toRadian(result.angle), s) * result.size.width;
    if (sourceAspect_ > 1e-5f) result.size.height = result.size.width * sourceAspect_;
    return result;
}

BasePoint<float> RelativeLocation::getPointInverse(const BaseSize<int>& patch, const BasePoint<float>& point) const {
    const BasePoint<float> q = rotated(toRadian(angle_), point - patchCentre(patch)) / static_cast<float>(patch.width);
    return shift_ + q * scale_;
}

std::ostream& operator<<(std::ostream& stream, const RelativeLocation& relative) {
    return stream << "RelativeLocation(" << relative.scale() << ", " << relative.shift() << ", " << relative.angle()
                  << ", " << relative.targetAspect() << ", " << relative.sourceAspect() << ")";
}

}  // namespace LQ
