#pragma once
// What a cascade is about: its window, the object inside it, the ring's name, the angle
// and the hand; and how one cascade turns into another by quarter turns and a mirror.

#include <ostream>
#include <string>

#include "LQ_DetectRegion.h"
#include "LQ_ObjectLocation.h"
#include "LQ_Point.h"
#include "LQ_Rect.h"
#include "LQ_Size.h"

class ClassifierProperties {
public:
    // the strength of one hit's vote for its hand
    static constexpr int SIDE_SCORE = 100;

    struct Transformation {
        bool possible = false;
        bool flip = false;
        int rotations = 0;
        int cost() const { return possible ? rotations + (flip ? 1 : 0) : 0x7fffffff; }
    };

    ClassifierProperties() = default;
    virtual ~ClassifierProperties() = default;

    void setMonoSize(const LQ::BaseSize<int>& size);
    void setBaseSize(const LQ::BaseSize<int>& size) { baseSize_ = size; }
    void setObjectCenter(const LQ::BasePoint<int>& center);
    void setAngle(int angle) { angle_ = angle; }
    void setName(const std::string& name) { name_ = name; }
    void setSymmetry(bool symmetric) { side_ = symmetric ? LQ::Side::BOTH : LQ::Side::RIGHT; }
    void setSide(LQ::Side::Value side) { side_ = side; }

    void flip();
    void rotate();
    void resize(float factor);
    Transformation transformCost(const ClassifierProperties& other) const;
    // whether this cascade at this zoom can serve the region
    bool in(const LQ::DetectRegion& region, float zoom) const;

    bool operator==(const ClassifierProperties& other) const;
    bool operator!=(const ClassifierProperties& other) const { return !(*this == other); }

    const LQ::BaseSize<int>& getMonoSize() const { return monoSize; }
    const LQ::BaseSize<int>& getBaseSize() const { return baseSize_; }
    const LQ::BaseRect<int>& getObjectRect() const { return objectRect_; }
    const LQ::BasePoint<int>& getObjectCenter() const { return objectCenter_; }
    const std::string& getName() const { return name_; }
    int getAngle() const { return angle_; }
    LQ::Side::Value getSide() const { return side_; }
    bool isSymmetric() const { return side_ == LQ::Side::BOTH; }

    // the window on the mono and RMCT images
    LQ::BaseSize<int> monoSize;

protected:
    // the object inside the window, of size baseSize_ round the object centre
    LQ::BaseRect<int> objectRect_;
    LQ::BaseSize<int> baseSize_;
    LQ::BasePoint<int> objectCenter_;
    std::string name_;
    int angle_ = 0;
    LQ::Side::Value side_ = LQ::Side::RIGHT;
};

std::ostream& operator<<(std::ostream& stream, const ClassifierProperties& properties);

// ((a + 540) mod 360) - 180
int normalizedCascadeAngle(int angle);
