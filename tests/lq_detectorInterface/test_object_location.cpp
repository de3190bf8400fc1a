#include <gtest/gtest.h>

#include <sstream>
#include <utility>

#include "LQ_ObjectLocation.h"
#include "LogCapture.h"

using LQ::AngleRange;
using LQ::ObjectLocation;
using LQ::PointF;
using LQ::RelativeLocation;
using LQ::Side;
using LQ::SizeF;

namespace {
void expectNear(const PointF& a, const PointF& b) {
    EXPECT_NEAR(a.x, b.x, 1e-3f);
    EXPECT_NEAR(a.y, b.y, 1e-3f);
}
}  // namespace

TEST(AngleRange, NormalisesAndWrapsThroughHalfTurn) {
    const std::pair<int, int> cases[] = {{315, -45}, {-181, 179}, {180, -180}};
    for (const auto& [in, out] : cases) {
        int angle = in;
        LQ::normalizeAngle(angle);
        EXPECT_EQ(angle, out) << in;
    }

    const AngleRange whole;
    EXPECT_TRUE(whole.contains(-180) && whole.contains(179));
    const AngleRange wrapped(170, -170);
    EXPECT_TRUE(wrapped.contains(-180));
    EXPECT_TRUE(wrapped.contains(175));
    EXPECT_FALSE(wrapped.contains(0));
    const AngleRange quarter(315, 44);
    EXPECT_EQ(quarter, AngleRange(-45, 44));
    EXPECT_TRUE(quarter.contains(0));
    EXPECT_FALSE(quarter.contains(45));
    const AngleRange one(90);
    EXPECT_TRUE(one.contains(90));
    EXPECT_FALSE(one.contains(89) || one.contains(91));
}

TEST(ObjectLocation, SetRectPrintAndSideText) {
    EXPECT_FALSE(ObjectLocation().isSet());
    EXPECT_FALSE(ObjectLocation(PointF(5, 5), SizeF(10, 0), 0, Side::RIGHT).isSet());
    const LQ::RectF rect(10, 20, 50, 80);
    const ObjectLocation location(rect);
    EXPECT_TRUE(location.isSet());
    EXPECT_EQ(location.getRect(), rect);
    EXPECT_EQ(location.side, Side::RIGHT);

    std::ostringstream text;
    text << ObjectLocation(PointF(1.5f, 2), SizeF(3, 4), -30, Side::LEFT);
    EXPECT_EQ(text.str(), "ObjectLocation(PointF(1.5, 2), Size(3, 4), -30, LEFT)");

    Side::Value side = Side::NONE;
    std::istringstream in("BOTH),");
    in >> side;
    EXPECT_EQ(side, Side::BOTH);
    EXPECT_EQ(in.peek(), ')');
    FailedCheck check = catchCheck([&] {
        std::istringstream bad("UP ");
        bad >> side;
    });
    EXPECT_EQ(check.tail, "cannot parse enum Side::Value from `UP`. Use one of NONE, RIGHT, LEFT, BOTH");
}

TEST(ObjectLocation, PatchPointsMapBothWaysForEverySideAndAngle) {
    const LQ::Size patch(24, 16);
    for (float angle : {0.f, 35.f}) {
        for (Side::Value side : {Side::RIGHT, Side::LEFT}) {
            const ObjectLocation object(PointF(100, 60), SizeF(48, 32), angle, side);
            for (const PointF& p : {PointF(0, 0), PointF(23, 15), PointF(3.5f, 9)}) {
                expectNear(object.getPointInverse(patch, object.getPoint(patch, p)), p);
            }
            // the patch centre is the object's centre
            expectNear(object.getPoint(patch, PointF(11.5f, 7.5f)), object.center);
        }
    }
    // upright RIGHT: a plain scale by width / patch width about the centre
    const ObjectLocation upright(PointF(100, 60), SizeF(48, 32), 0, Side::RIGHT);
    expectNear(upright.getPoint(patch, PointF(23, 7.5f)), PointF(100 + 2 * 11.5f, 60));
    // LEFT mirrors: the patch's right edge lies left of the centre
    const ObjectLocation left(PointF(100, 60), SizeF(48, 32), 0, Side::LEFT);
    expectNear(left.getPoint(patch, PointF(23, 7.5f)), PointF(100 - 2 * 11.5f, 60));
    // a positive angle turns the patch's x axis upward in the image (y grows downward)
    const ObjectLocation turned(PointF(0, 0), SizeF(24, 16), 90, Side::RIGHT);
    expectNear(turned.getPoint(patch, PointF(12.5f, 7.5f)), PointF(0, -1));
}

TEST(ObjectLocation, InnerLocationsAndSidesThroughAMirroredObject) {
    const LQ::Size patch(20, 20);
    const ObjectLocation object(PointF(50, 50), SizeF(40, 40), 10, Side::LEFT);
    const ObjectLocation inner(PointF(9.5f, 9.5f), SizeF(10, 5), 5, Side::RIGHT);
    const ObjectLocation outer = object.getLocationState(patch, inner);
    expectNear(outer.center, PointF(50, 50));
    EXPECT_FLOAT_EQ(outer.size.width, 20);
    EXPECT_FLOAT_EQ(outer.size.height, 10);
    EXPECT_FLOAT_EQ(outer.angle, 15);
    EXPECT_EQ(outer.side, Side::LEFT);
    for (Side::Value s : {Side::LEFT, Side::BOTH, Side::NONE}) {
        ObjectLocation other = inner;
        other.side = s;
        EXPECT_EQ(object.getLocationState(patch, other).side, Side::RIGHT);
    }
    const ObjectLocation back = object.getLocationStateInverse(patch, outer);
    expectNear(back.center, inner.center);
    EXPECT_FLOAT_EQ(back.size.width, 10);
    EXPECT_FLOAT_EQ(back.angle, 5);
    EXPECT_EQ(back.side, Side::RIGHT);

    // relative units: centre in widths, height 0 keeps the object's proportions
    const ObjectLocation wide(PointF(10, 10), SizeF(20, 10), 0, Side::RIGHT);
    const ObjectLocation relative = wide.getRelativeLocationState(ObjectLocation(PointF(0.5f, 0), SizeF(2, 0), 30, Side::RIGHT));
    expectNear(relative.center, PointF(20, 10));
    EXPECT_FLOAT_EQ(relative.size.width, 40);
    EXPECT_FLOAT_EQ(relative.size.height, 20);
    EXPECT_FLOAT_EQ(relative.angle, 30);
}

TEST(RelativeLocation, MeasuresAppliesAndReverses) {
    const ObjectLocation source(PointF(100, 100), SizeF(40, 20), 0, Side::RIGHT);
    const ObjectLocation target(PointF(120, 90), SizeF(80, 60), 15, Side::RIGHT);
    RelativeLocation relation(source, target);
    EXPECT_FLOAT_EQ(relation.scale(), 2);
    expectNear(relation.shift(), PointF(0.5f, -0.25f));
    const ObjectLocation made = relation.getLocationState(source);
    expectNear(made.center, target.center);
    EXPECT_FLOAT_EQ(made.size.width, 80);
    EXPECT_FLOAT_EQ(made.size.height, 60);
    EXPECT_FLOAT_EQ(made.angle, 15);
    const ObjectLocation found = relation.getInverseLocationState(made);
    EXPECT_FLOAT_EQ(found.size.width, 40);
    EXPECT_FLOAT_EQ(found.size.height, 20);
    EXPECT_FLOAT_EQ(found.angle, 0);

    // a LEFT source mirrors the shift
    ObjectLocation mirrored = source;
    mirrored.side = Side::LEFT;
    expectNear(relation.getLocationState(mirrored).center, PointF(80, 90));

    relation.reverse();
    EXPECT_FLOAT_EQ(relation.scale(), 0.5f);
    expectNear(relation.shift(), PointF(-0.25f, 0.125f));
    EXPECT_FLOAT_EQ(relation.angle(), -15);
}
