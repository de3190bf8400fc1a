#include "AdaObject.h"

#include "LQ_Size.h"

LQ::BaseRect<int> AdaObject::getBaseRect() const {
    const float m = LQ::stableMultiplier<float>();
    const int width = static_cast<int>(zoom * size.width * m);
    const int height = static_cast<int>(zoom * size.height * m);
    const int left = center.x - width / 2;
    const int top = center.y - height / 2;
    return LQ::BaseRect<int>(left, top, left + width, top + height);
}

LQ::LocationState AdaObject::toLocationState() const {
    const LQ::BaseRect<int> rect = getBaseRect();
    LQ::LocationState location;
    location.center = LQ::BasePoint<float>(static_cast<float>(center.x), static_cast<float>(center.y));
    location.size = LQ::BaseSize<float>(static_cast<float>(rect.width()), static_cast<float>(rect.height()));
    location.angle = static_cast<float>(angle);
    location.side = side < 1 ? LQ::Side::LEFT : LQ::Side::RIGHT;
    return location;
}

std::ostream& operator<<(std::ostream& stream, const AdaObject& object) {
    return stream << "AdaObject(" << object.size << ", " << object.center << ", " << object.side << ", "
                  << object.zoom << ", " << object.angle << ", " << object.weight << ", " << object.score << ")";
}

std::ostream& operator<<(std::ostream& stream, const std::vector<AdaObject>& objects) {
    stream << "vector[" << objects.size() << "](";
    for (size_t i = 0; i < objects.size(); ++i) stream << (i ? ", " : "") << objects[i];
    return stream << ")";
}

bool adaObjectsWeightCompare(const AdaObject& a, const AdaObject& b) { return a.weight > b.weight; }
bool adaObjectsScoresCompare(const AdaObject& a, const AdaObject& b) { return a.score > b.score; }
