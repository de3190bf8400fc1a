#pragma once
// One hit of a cascade: where, how large, at which zoom and angle, and how sure.

#include <climits>
#include <ostream>
#include <vector>

#include "LQ_Point.h"
#include "LQ_Rect.h"
#include "LQ_Size.h"
#include "LQ_StateAggregator.h"
#include "LQ_States.h"

struct AdaObject {
    AdaObject() = default;
    AdaObject(const char* name_, const LQ::BaseSize<int>& size_, const LQ::BasePoint<int>& center_, int side_,
              float zoom_, int angle_, int weight_, int score_)
        : size(size_), center(center_), zoom(zoom_), name(name_), side(side_), angle(angle_), weight(weight_),
          score(score_) {}

    void reset() { *this = AdaObject(); }
    bool isSet() const { return name != nullptr && name[0] != 0; }

    // the object's rectangle in base-image pixels
    LQ::BaseRect<int> getBaseRect() const;
    LQ::LocationState toLocationState() const;

    // object size at zoom 1 of its layer
    LQ::BaseSize<int> size;
    // layer coordinates while a layer is scanned, base-image coordinates afterwards
    LQ::BasePoint<int> center;
    // base pixels per layer pixel
    float zoom = 0.f;
    // the cascade's ring name; owned by the cascade, compared by pointer
    const char* name = "";
    // +SIDE_SCORE for a right hand, the negative for a left; a weighted mean after grouping
    int side = 0;
    int angle = 0;
    int weight = 0;
    int score = INT_MIN;
};

std::ostream& operator<<(std::ostream& stream, const AdaObject& object);
std::ostream& operator<<(std::ostream& stream, const std::vector<AdaObject>& objects);

bool adaObjectsWeightCompare(const AdaObject& a, const AdaObject& b);
bool adaObjectsScoresCompare(const AdaObject& a, const AdaObject& b);

LQ_DECLARE_STATE(AdaObjectState, LQ::InheritedState, AdaObject);
