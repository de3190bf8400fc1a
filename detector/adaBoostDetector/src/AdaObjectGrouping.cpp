#include "AdaObjectGrouping.h"

#include <algorithm>
#include <array>
#include <climits>
#include <cmath>
#include <cstdlib>

#include "LQ_Utils.h"

bool Similar(const AdaObject& a, const AdaObject& b, float similarity, int maxAngle) {
    const float d = static_cast<float>(std::abs(a.center.x - b.center.x) + std::abs(a.center.y - b.center.y));
    const float z = a.zoom + b.zoom;
    return a.size.width * similarity * z > d && std::fabs(a.zoom - b.zoom) < z * similarity &&
           std::abs(a.angle - b.angle) <= maxAngle;
}

namespace LQ {

template <>
int partition<AdaObject, std::pair<float, int>>(const std::vector<AdaObject>& objects,
                                                std::vector<int>& labels,
                                                const std::pair<float, int>& parameters) {
    enum { PARENT = 0, RANK = 1 };
    const int n = static_cast<int>(objects.size());
    // a parent of -1 marks a root
    std::vector<std::array<int, 2>> nodes(objects.size(), std::array<int, 2>{{-1, 0}});
    auto findRoot = [&nodes](int k) {
        while (nodes[k][PARENT] >= 0) k = nodes[k][PARENT];
        return k;
    };
    auto compress = [&nodes](int k, int root) {
        while (nodes[k][PARENT] >= 0) {
            const int parent = nodes[k][PARENT];
            nodes[k][PARENT] = root;
            k = parent;
        }
    };
    // All ordered pairs: Similar looks at its first argument's size only.
    for (int i = 0; i < n; ++i) {
        int root = findRoot(i);
        for (int j = 0; j < n; ++j) {
            if (j == i || !Similar(objects[i], objects[j], parameters.first, parameters.second)) continue;
            const int root2 = findRoot(j);
            if (root2 == root) continue;
            LQ_ASSERT_MSG(nodes[root][PARENT] < 0, "Failed check: nodes[root][PARENT] < 0");
            const int rank = nodes[root][RANK], rank2 = nodes[root2][RANK];
            if (rank > rank2) {
                nodes[root2][PARENT] = root;
            } else {
                nodes[root][PARENT] = root2;
                if (rank == rank2) ++nodes[root2][RANK];
                root = root2;
            }
            compress(j, root);
            compress(i, root);
        }
    }
    labels.resize(objects.size());
    int classes = 0;
    for (int i = 0; i < n; ++i) {
        const int root = findRoot(i);
        // merging is over, so a root's rank is free to hold its class number (negated)
        if (nodes[root][RANK] >= 0) nodes[root][RANK] = ~classes++;
        labels[i] = ~nodes[root][RANK];
    }
    return classes;
}

}  // namespace LQ

namespace {

struct ClassSums {
    int width = 0, height = 0, x = 0, y = 0, angle = 0, side = 0, weight = 0;
    float zoom = 0.f;
    int score = INT_MIN;
    // A ring's cascades share one name, so a class rarely holds more than one or two:
    // a short list in order of first appearance beats a map, and settles ties.
    std::vector<std::pair<const char*, int>> names;

    void add(const AdaObject& o) {
        width += o.weight * o.size.width;
        height += o.weight * o.size.height;
        x += o.weight * o.center.x;
        y += o.weight * o.center.y;
        angle += o.weight * o.angle;
        side += o.weight * o.side;
        zoom += static_cast<float>(o.weight) * o.zoom;
        weight += o.weight;
        score = std::max(score, o.score);
        auto it = std::find_if(names.begin(), names.end(), [&o](const auto& e) { return e.first == o.name; });
        if (it == names.end())
            names.emplace_back(o.name, 1);
        else
            ++it->second;
    }

    // the most frequent name; on a tie the one seen first
    const char* name() const {
        auto best = names.begin();
        for (auto it = names.begin(); it != names.end(); ++it)
            if (it->second > best->second) best = it;
        return best->first;
    }
};

}  // namespace

std::vector<AdaObject> groupAdaObjects(const std::vector<AdaObject>& objects, int minWeight,
                                       float similarity) {
    if (minWeight < 1 || objects.empty()) return objects;
    std::vector<int> labels;
    // the largest angle difference within a group is always 30 degrees
    const int classes = LQ::partition<AdaObject, std::pair<float, int>>(
        objects, labels, std::pair<float, int>(similarity, 30));

    std::vector<ClassSums> sums(static_cast<size_t>(classes));
    for (size_t i = 0; i < objects.size(); ++i) sums[static_cast<size_t>(labels[i])].add(objects[i]);

    std::vector<AdaObject> result;
    for (const ClassSums& s : sums) {
        const int w = s.weight;
        if (w < minWeight) continue;
        // integer division truncates toward zero, also for negative sides and angles
        result.emplace_back(s.name(), LQ::BaseSize<int>(s.width / w, s.height / w),
                            LQ::BasePoint<int>(s.x / w, s.y / w), s.side / w, s.zoom / static_cast<float>(w),
                            s.angle / w, w, s.score);
    }
    std::sort(result.begin(), result.end(), adaObjectsWeightCompare);
    return result;
}

std::vector<AdaObject> groupAdaObjects(const LQ::History<AdaObject>& objects, int minWeight,
                                       float similarity) {
    std::vector<AdaObject> present;
    present.reserve(objects.size());
    for (unsigned int i = 0; i < objects.size(); ++i) present.push_back(objects.element(i));
    return groupAdaObjects(present, minWeight, similarity);
}
