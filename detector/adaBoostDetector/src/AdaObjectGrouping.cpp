#include "AdaObjectGrouping.h"

#include <algorithm>
#include <climits>
#include <cmath>
#include <map>

#include "LQ_Utils.h"

bool Similar(const AdaObject& a, const AdaObject& b, float similarity, int maxAngle) {
    const float d = static_cast<float>(std::abs(a.center.x - b.center.x) + std::abs(a.center.y - b.center.y));
    const float z = a.zoom + b.zoom;
    return a.size.width * similarity * z > d && std::fabs(a.zoom - b.zoom) < z * similarity &&
           std::abs(a.angle - b.angle) <= maxAngle;
}

namespace LQ {

template <>
int partition<AdaObject, std::pair<float, int>>(const std::vector<AdaObject>& objects, std::vector<int>& labels,
                                                 const std::pair<float, int>& parameters) {
    enum { PARENT = 0, RANK = 1 };
    const int n = static_cast<int>(objects.size());
    std::vector<int> storage(2 * static_cast<size_t>(n));
    int(*nodes)[2] = reinterpret_cast<int(*)[2]>(storage.data());
    for (int i = 0; i < n; ++i) {
        nodes[i][PARENT] = -1;
        nodes[i][RANK] = 0;
    }
    auto findRoot = [&](int k) {
        while (nodes[k][PARENT] >= 0) k = nodes[k][PARENT];
        return k;
    };
    for (int i = 0; i < n; ++i) {
        int root = findRoot(i);
        for (int j = 0; j < n; ++j) {
            if (j == i || !Similar(objects[i], objects[j], parameters.first, parameters.second)) continue;
            int root2 = findRoot(j);
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
            // compress the paths from j and from i
            for (int k = j; nodes[k][PARENT] >= 0;) {
                const int parent = nodes[k][PARENT];
                if (k != root) nodes[k][PARENT] = root;
                k = parent;
            }
            for (int k = i; nodes[k][PARENT] >= 0;) {
                const int parent = nodes[k][PARENT];
                if (k != root) nodes[k][PARENT] = root;
                k = parent;
            }
        }
    }
    labels.resize(objects.size());
    int classes = 0;
    for (int i = 0; i < n; ++i) {
        const int root = findRoot(i);
        // a root's rank is free once merging is over: it holds the class number, negated
        if (nodes[root][RANK] >= 0) nodes[root][RANK] = ~classes++;
        labels[i] = ~nodes[root][RANK];
    }
    return classes;
}

}  // namespace LQ

std::vector<AdaObject> groupAdaObjects(const std::vector<AdaObject>& objects, int minWeight, float similarity) {
    if (minWeight < 1 || objects.empty()) return objects;
    std::vector<int> labels;
    const int classes =
        LQ::partition<AdaObject, std::pair<float, int>>(objects, labels, std::pair<float, int>(similarity, 30));

    struct Sums {
        int width = 0, height = 0, x = 0, y = 0, angle = 0, side = 0, weight = 0;
        float zoom = 0.f;
        int score = INT_MIN;
        std::map<const char*, int> names;
    };
    std::vector<Sums> sums(classes);
    for (size_t i = 0; i < objects.size(); ++i) {
        const AdaObject& o = objects[i];
        Sums& s = sums[labels[i]];
        s.width += o.weight * o.size.width;
        s.height += o.weight * o.size.height;
        s.x += o.weight * o.center.x;
        s.y += o.weight * o.center.y;
        s.angle += o.weight * o.angle;
        s.side += o.weight * o.side;
        s.zoom += static_cast<float>(o.weight) * o.zoom;
        s.weight += o.weight;
        s.score = std::max(s.score, o.score);
        ++s.names[o.name];
    }
    std::vector<AdaObject> result;
    for (const Sums& s : sums) {
        const int w = s.weight;
        if (w < minWeight) continue;
        const char* name = "";
        int best = 0;
        for (const auto& entry : s.names)
            if (entry.second > best) {
                best = entry.second;
                name = entry.first;
            }
        result.emplace_back(name, LQ::BaseSize<int>(s.width / w, s.height / w), LQ::BasePoint<int>(s.x / w, s.y / w),
                            s.side / w, s.zoom / static_cast<float>(w), s.angle / w, w, s.score);
    }
    std::sort(result.begin(), result.end(), adaObjectsWeightCompare);
    return result;
}

std::vector<AdaObject> groupAdaObjects(const LQ::History<AdaObject>& objects, int minWeight, float similarity) {
    std::vector<AdaObject> list;
    for (unsigned int i = 0; i < objects.size(); ++i) list.push_back(objects.element(i));
    return groupAdaObjects(list, minWeight, similarity);
}
