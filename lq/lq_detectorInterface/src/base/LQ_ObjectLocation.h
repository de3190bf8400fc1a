#pragma once
// Where an object is: a turned rectangle with a mirror flag, the one location type that
// detectors, trackers and verifiers share. A LEFT object is the mirror of its RIGHT
// pattern, so every map here has a mirrored branch.

#include <istream>
#include <ostream>

#include "LQ_Image.h"
#include "LQ_Point.h"
#include "LQ_Rect.h"
#include "LQ_Size.h"
#include "LQ_Utils.h"

namespace LQ {

struct Side {
    enum Value { NONE = 0, RIGHT = 1, LEFT = 2, BOTH = 3 };
};

template <>
struct EnumNames<Side::Value> {
    static const char* typeName() { return "Side::Value"; }
    static const char* const* names();
    static int count() { return 4; }
};

std::ostream& operator<<(std::ostream& stream, Side::Value side);
std::istream& operator>>(std::istream& stream, Side::Value& side);

// ((angle + 540) % 360) - 180: into -180 .. 179
void normalizeAngle(int& angle);

// An interval of whole degrees on the circle, running upward from lower to upper; with
// lower above upper it wraps through 180.
class AngleRange {
public:
    AngleRange() { reset(); }
    explicit AngleRange(int angle) { setRange(angle); }
    AngleRange(int lower, int upper) { setRange(lower, upper); }

    void reset() { lower_ = -180, upper_ = 179; }
    void setRange(int angle) { setRange(angle, angle); }
    void setRange(int lower, int upper);
    // angle must already be normalised
    bool contains(int angle) const {
        return lower_ > upper_ ? (angle >= lower_ || angle <= upper_) : (angle >= lower_ && angle <= upper_);
    }
    int lower() const { return lower_; }
    int upper() const { return upper_; }
    bool operator==(const AngleRange& o) const { return lower_ == o.lower_ && upper_ == o.upper_; }

private:
    int lower_ = -180;
    int upper_ = 179;
};

std::ostream& operator<<(std::ostream& stream, const AngleRange& range);

class ObjectLocation {
public:
    ObjectLocation() = default;
    ObjectLocation(const BasePoint<float>& center_, const BaseSize<float>& size_, float angle_, Side::Value side_)
        : center(center_), size(size_), angle(angle_), side(side_) {}
    explicit ObjectLocation(const BaseRect<float>& rect);

    void reset() { *this = ObjectLocation(); }
    bool isSet() const { return size.width * size.height > 0; }
    // the upright rectangle around the centre; the angle is not applied
    BaseRect<float> getRect() const;
    float getZoom(const BaseSize<int>& patch) const { return size.width / patch.width; }

    // patch coordinates to image coordinates, and back
    BasePoint<float> getPoint(const BaseSize<int>& patch, const BasePoint<float>& point) const;
    BasePoint<float> getPointInverse(const BaseSize<int>& patch, const BasePoint<float>& point) const;
    // a location inside the patch as a location in the image, and back
    ObjectLocation getLocationState(const BaseSize<int>& patch, const ObjectLocation& inner) const;
    ObjectLocation getLocationStateInverse(const BaseSize<int>& patch, const ObjectLocation& outer) const;
    // a location in this object's own units (centre in widths, size in widths)
    ObjectLocation getRelativeLocationState(const ObjectLocation& relative) const;
    // the object cut out upright at patch size; a LEFT object comes out mirrored
    void getPatch(const Image& image, const BaseSize<int>& patchSize, Image& out) const;

    bool operator==(const ObjectLocation& o) const {
        return center == o.center && size == o.size && angle == o.angle && side == o.side;
    }

    BasePoint<float> center;
    BaseSize<float> size;
    float angle = 0;
    Side::Value side = Side::RIGHT;
};

std::ostream& operator<<(std::ostream& stream, const ObjectLocation& location);

// How a target location follows from a source location, in the source's own frame.
class RelativeLocation {
public:
    RelativeLocation() = default;
    RelativeLocation(float scale, const BasePoint<float>& shift, float angle, float targetAspect, float sourceAspect)
        : scale_(scale), shift_(shift), angle_(angle), targetAspect_(targetAspect), sourceAspect_(sourceAspect) {}
    RelativeLocation(const ObjectLocation& source, const ObjectLocation& target);

    // swaps source and target as far as position goes; the aspects stay
    void reverse();
    ObjectLocation getLocationState(const ObjectLocation& source) const;
    ObjectLocation getInverseLocationState(const ObjectLocation& target) const;
    BasePoint<float> getPointInverse(const BaseSize<int>& patch, const BasePoint<float>& point) const;

    float scale() const { return scale_; }
    const BasePoint<float>& shift() const { return shift_; }
    float angle() const { return angle_; }
    float targetAspect() const { return targetAspect_; }
    float sourceAspect() const { return sourceAspect_; }

private:
    float scale_ = 1;
    BasePoint<float> shift_;
    float angle_ = 0;
    float targetAspect_ = 0;
    float sourceAspect_ = 0;
};

std::ostream& operator<<(std::ostream& stream, const RelativeLocation& relative);

}  // namespace LQ
