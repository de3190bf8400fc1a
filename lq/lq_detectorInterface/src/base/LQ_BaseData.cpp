#include "LQ_BaseData.h"

namespace LQ {

BaseData::~BaseData() {
    for (SharedPtr<BaseData>& parent : parents_) parent->children_.erase(this);
}

// A child may be dropped from a cache while its parent's children are walked (the
// pyramid forgets leaves in its reset). std::set keeps the walking iterator valid as
// long as the element it stands on stays, and the dropped nodes are leaves off the path.
void BaseData::resetRecursive() {
    updated_ = false;
    reset();
    for (auto it = children_.begin(); it != children_.end(); ++it) (*it)->resetRecursive();
}

void BaseData::resetRecursive(std::ostream& stream) {
    updated_ = false;
    for (auto it = children_.begin(); it != children_.end(); ++it) {
        stream << "\"";
        print(stream);
        stream << "\" -> \"";
        (*it)->print(stream);
        stream << "\"\n";
        (*it)->resetRecursive(stream);
    }
    reset();
}

void BaseData::updateRecursive() {
    if (updated_) return;
    update();
    updated_ = true;
    for (auto it = children_.begin(); it != children_.end(); ++it) (*it)->updateRecursive();
}

std::string BaseData::parentNames() const {
    std::string names;
    for (size_t i = 0; i < parents_.size(); ++i) {
        if (i) names += ", ";
        names += parents_[i]->name();
    }
    return names;
}

std::ostream& operator<<(std::ostream& stream, const BaseData& data) {
    data.print(stream);
    return stream;
}

}  // namespace LQ
