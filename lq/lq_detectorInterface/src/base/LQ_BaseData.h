#pragma once
// A node of the lazy image graph. Parents are held strongly, so a node keeps its inputs
// alive; children are plain pointers that each child withdraws when it dies.

#include <ostream>
#include <set>
#include <string>
#include <vector>

#include "LQ_SharedPtr.h"

namespace LQ {

class BaseData {
public:
    BaseData() = default;
    BaseData(const BaseData&) = delete;
    BaseData& operator=(const BaseData&) = delete;
    virtual ~BaseData();

    virtual void print(std::ostream& stream) const = 0;
    virtual std::string name() const { return std::string(); }
    virtual std::string arguments() const { return std::string(); }
    // once per frame, before the new frame is set: forget what was computed
    virtual void reset() {}
    // once per frame, after the new frame is set: check the geometry
    virtual void update() {}

    template <class T>
    void addParent(const SharedPtr<T>& parent) {
        parents_.push_back(SharedPtr<BaseData>(parent));
        parent->children_.insert(this);
    }

    void resetRecursive();
    // the same, writing one graph edge per child as it goes
    void resetRecursive(std::ostream& stream);
    void updateRecursive();
    bool isLeafNode() const { return children_.empty(); }

    const std::vector<SharedPtr<BaseData>>& parents() const { return parents_; }
    const std::set<BaseData*>& children() const { return children_; }

protected:
    // the names of the parents joined with ", "
    std::string parentNames() const;

    std::vector<SharedPtr<BaseData>> parents_;
    std::set<BaseData*> children_;
    bool updated_ = false;
};

std::ostream& operator<<(std::ostream& stream, const BaseData& data);

}  // namespace LQ
