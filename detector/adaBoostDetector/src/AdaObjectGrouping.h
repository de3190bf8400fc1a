#pragma once
// Merging the hits of neighbouring windows, zooms and angles into one object each, and
// dropping groups with too little support.

#include <utility>
#include <vector>

#include "AdaObject.h"
#include "LQ_History.h"

// Whether b may be the same thing as a: near in a's own size, of a similar zoom and angle.
// Only a's size counts, so the test isn't symmetric.
bool Similar(const AdaObject& a, const AdaObject& b, float similarity, int maxAngle);

namespace LQ {
// Union-find over all ordered pairs: labels each object with its class, gives the number
// of classes.
template <class T, class P>
int partition(const std::vector<T>& objects, std::vector<int>& labels, const P& parameters);
template <>
int partition<AdaObject, std::pair<float, int>>(const std::vector<AdaObject>& objects, std::vector<int>& labels,
                                                 const std::pair<float, int>& parameters);
}  // namespace LQ

// Groups of weight below minWeight are dropped; below 1 nothing is grouped.
std::vector<AdaObject> groupAdaObjects(const std::vector<AdaObject>& objects, int minWeight, float similarity);
std::vector<AdaObject> groupAdaObjects(const LQ::History<AdaObject>& objects, int minWeight, float similarity);
