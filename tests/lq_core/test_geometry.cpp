#include <gtest/gtest.h>

#include <cmath>
#include <sstream>
#include <string>
#include <vector>

#include "LQ_Geometry.h"
#include "LQ_Range.h"
#include "LQ_Rect.h"
#include "LQ_Size.h"
#include "LogCapture.h"

using namespace LQ;

namespace {
const float PI = 3.14159265f;
const float EPS = 1e-5f;

using P3 = Point3dF;

void expectCheck(const FailedCheck& check, const std::string& expression, const std::string& tail) {
    EXPECT_TRUE(check.thrown) << expression;
    EXPECT_EQ(check.expression, expression);
    EXPECT_EQ(check.tail, tail);
}

template <class T>
std::string printed(const T& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}

#define EXPECT_POINT_NEAR(actual, ex, ey)      \
    do {                                       \
        const auto point_ = (actual);          \
        EXPECT_NEAR(point_.x, ex, EPS) << "x"; \
        EXPECT_NEAR(point_.y, ey, EPS) << "y"; \
    } while (0)

#define EXPECT_POINT3D_NEAR(actual, ex, ey, ez) \
    do {                                        \
        const auto point_ = (actual);           \
        EXPECT_NEAR(point_.x, ex, EPS) << "x";  \
        EXPECT_NEAR(point_.y, ey, EPS) << "y";  \
        EXPECT_NEAR(point_.z, ez, EPS) << "z";  \
    } while (0)
}  // namespace

TEST(GeometryTypes, printForms) {
    EXPECT_EQ(printed(Rect(1, -2, 3, 4)), "Rect(1, -2, 3, 4)");
    // a signed char is a number here, not a character
    EXPECT_EQ(printed(BasePoint<signed char>(-3, 65)), "PointC(-3, 65)");
    EXPECT_EQ(printed(Point3dF(1.f, 2.5f, -3.f)), "Point3dF(1, 2.5, -3)");
    // floats print with seven significant digits
    EXPECT_EQ(printed(PointF(1.f / 3.f, 0.1f)), "PointF(0.3333333, 0.1)");
    EXPECT_EQ(printed(RangeF(123456.7f, -2.f / 3.f)), "RangeF(123456.7, -0.6666667)");
}

TEST(GeometryTypes, rectScalingAndShiftInBoundary) {
    // 90 * 1.3f falls just below 117: plain truncation would lose one
    EXPECT_LT(static_cast<int>(90 * 1.3f), 117);
    EXPECT_EQ(Rect(0, 0, 90, 180) * 1.3f, Rect(0, 0, 117, 234));
    EXPECT_EQ(Rect(-90, -180, 0, 0) * 1.3f, Rect(-117, -234, 0, 0));

    // otherwise truncation toward zero, on both sides of it
    EXPECT_EQ(Rect(0, 0, 5, 7) * 0.5f, Rect(0, 0, 2, 3));
    EXPECT_EQ(Rect(-5, -7, 0, 0) * 0.5f, Rect(-2, -3, 0, 0));
    EXPECT_EQ(Rect(1, 2, 5, 7) / 2.f, Rect(0, 1, 2, 3));

    const Rect boundary(0, 0, 100, 50);
    EXPECT_EQ(Rect(10, 10, 20, 20).shiftInBoundary(boundary), Rect(10, 10, 20, 20));
    EXPECT_EQ(Rect(-5, 10, 15, 20).shiftInBoundary(boundary), Rect(0, 10, 20, 20));
    EXPECT_EQ(Rect(95, 10, 110, 20).shiftInBoundary(boundary), Rect(85, 10, 100, 20));
    EXPECT_EQ(Rect(-5, 48, 5, 58).shiftInBoundary(boundary), Rect(0, 40, 10, 50));
    // a boundary away from the origin
    EXPECT_EQ(Rect(0, 0, 5, 5).shiftInBoundary(Rect(10, 20, 30, 40)), Rect(10, 20, 15, 25));
    EXPECT_EQ(Rect(40, 50, 45, 55).shiftInBoundary(Rect(10, 20, 30, 40)), Rect(25, 35, 30, 40));

    for (Rect tooLarge : {Rect(0, 0, 101, 10), Rect(0, 0, 10, 51)})
        expectCheck(catchCheck([&] { tooLarge.shiftInBoundary(boundary); }),
                    "width <= T(rectBoundary.size().width) && height <= T(rectBoundary.size().height)", "");
}

TEST(GeometryTypes, similarRectangles) {
    const RectF a(0.f, 0.f, 10.f, 10.f);
    EXPECT_TRUE(Similar(a, a, 1.2f, 0.5f));
    // zero widths: 0 < 0 fails
    EXPECT_FALSE(Similar(RectF(5.f, 0.f, 5.f, 10.f), RectF(5.f, 0.f, 5.f, 10.f), 1.2f, 0.5f));
    // heights are not compared
    EXPECT_TRUE(Similar(a, RectF(0.f, 4.f, 10.f, 6.f), 1.2f, 0.5f));
    // both comparisons are strict: widths 10 and 12, centre distance 5 with smaller width 10
    EXPECT_FALSE(Similar(a, RectF(-1.f, 0.f, 11.f, 10.f), 1.2f, 0.5f));
    EXPECT_TRUE(Similar(a, RectF(-1.f, 0.f, 11.f, 10.f), 1.25f, 0.5f));
    EXPECT_FALSE(Similar(a, RectF(5.f, 0.f, 15.f, 10.f), 1.2f, 0.5f));
    // integer centres are truncated halves: 5 and 6 here, where the float centres are 5.5 and 6
    EXPECT_TRUE(Similar(RectF(0.f, 0.f, 11.f, 10.f), RectF(0.f, 0.f, 12.f, 10.f), 1.2f, 0.05f));
    EXPECT_FALSE(Similar(Rect(0, 0, 11, 10), Rect(0, 0, 12, 10), 1.2f, 0.05f));

    expectCheck(catchCheck([&] { Similar(a, a, 1.f, 0.5f); }), "widthSimilarity > 1.f",
                "incorrect widthSimilarity = 1");
    expectCheck(catchCheck([&] { Similar(a, a, 1.2f, 1.5f); }), "positionSimilarity < 1.f",
                "incorrect positionSimilarity = 1.5");
}

TEST(PlaneGeometry, projectionsIntersectionsAndSegments) {
    EXPECT_POINT_NEAR(projectPointOnLine(PointF(3, 4), PointF(0, 0), PointF(2, 0)), 3.f, 0.f);
    EXPECT_POINT_NEAR(projectPointOnLine(PointF(3, 1), PointF(1, 1), PointF(5, 5)), 2.f, 2.f);
    // no direction: the line is its point
    EXPECT_POINT_NEAR(projectPointOnLine(PointF(3, 1), PointF(1, 1), PointF(0, 0)), 1.f, 1.f);

    PointF meet(-1, -1);
    EXPECT_TRUE(intersectLines(PointF(0, 0), PointF(2, 0), PointF(3, 5), PointF(0, -3), meet));
    EXPECT_POINT_NEAR(meet, 3.f, 0.f);
    meet = PointF(-1, -1);  // left alone by the parallel cases below
    EXPECT_FALSE(intersectLines(PointF(0, 0), PointF(1, 1), PointF(0, 1), PointF(2, 2), meet));
    // a determinant of exactly 1e-5 still counts as parallel
    EXPECT_FALSE(intersectLines(PointF(0, 0), PointF(1, 0), PointF(0, 1), PointF(1, 1e-5f), meet));
    EXPECT_POINT_NEAR(meet, -1.f, -1.f);
    EXPECT_TRUE(intersectLines(PointF(0, 0), PointF(1, 0), PointF(0, 1), PointF(1, 2e-5f), meet));
    EXPECT_NEAR(meet.x, -50000.f, 1.f);
    EXPECT_NEAR(meet.y, 0.f, EPS);

    PointF centre;
    float radius = 0;
    EXPECT_TRUE(makeCircleThrough3Points(PointF(4, 1), PointF(1, 4), PointF(-2, 1), centre, radius));
    EXPECT_POINT_NEAR(centre, 1.f, 1.f);
    EXPECT_NEAR(radius, 3.f, EPS);
    EXPECT_FALSE(makeCircleThrough3Points(PointF(0, 0), PointF(1, 1), PointF(2, 2), centre, radius));
    EXPECT_FALSE(makeCircleThrough3Points(PointF(0, 0), PointF(0, 0), PointF(2, 1), centre, radius));
    EXPECT_EQ(getOrthogonal(PointF(2, 3)), PointF(-3, 2));

    const PointF a(2, 0), b(6, 0);
    EXPECT_NEAR(getPositionPointOnSegment(PointF(5, 7), a, b), 0.75f, EPS);
    EXPECT_NEAR(getPositionPointOnSegment(PointF(0, 3), a, b), -0.5f, EPS);
    EXPECT_EQ(getPositionPointOnSegment(PointF(4, 3), a, a), 0.f);

    EXPECT_POINT_NEAR(getNearestPointOnSegment(PointF(5, 7), a, b), 5.f, 0.f);
    EXPECT_POINT_NEAR(getNearestPointOnSegment(PointF(0, 3), a, b), 2.f, 0.f);
    EXPECT_POINT_NEAR(getNearestPointOnSegment(PointF(9, 9), a, a), 2.f, 0.f);

    EXPECT_NEAR(getSignedDistanceToLine(PointF(0, 1), PointF(0, 0), PointF(1, 0)), -1.f, EPS);
    EXPECT_NEAR(getSignedDistanceToLine(PointF(1, 0), PointF(0, 1), PointF(1, 1)), std::sqrt(2.f), EPS);
    EXPECT_EQ(getSignedDistanceToLine(PointF(3, -2), PointF(1, 0), PointF(0, 0)), 0.f);
}

TEST(PlaneGeometry, anglesRotationAndAreas) {
    EXPECT_NEAR(getAngle(PointF(1, 0), PointF(0, 1)), PI / 2, EPS);
    EXPECT_NEAR(getAngle(PointF(2, 0), PointF(-3, 0)), PI, EPS);
    EXPECT_NEAR(getAngle(PointF(3, 3), PointF(1, 0)), -PI / 4, EPS);
    EXPECT_EQ(getAngle(PointF(0, 0), PointF(1, 0)), 0.f);

    EXPECT_POINT_NEAR(rotate(PointF(1, 0), -PI / 3), 0.5f, -std::sqrt(3.f) / 2);

    // 3·sin + 4·cos comes out just below 3 in float
    EXPECT_EQ(rotate(PointI(3, 4), PI / 2), PointI(-4, 3));
    EXPECT_EQ(rotate(PointI(10, 0), PI / 4), PointI(7, 7));

    EXPECT_EQ(rotateRect(Rect(0, 0, 10, 4), PI / 2), Rect(3, -3, 7, 7));
    // turned about the integer centre (2, 1), not (2.5, 1.5)
    EXPECT_EQ(rotateRect(Rect(0, 0, 5, 3), PI / 2), Rect(0, -1, 3, 4));
    // the corners reach -2.07 and 12.07: truncated toward zero
    EXPECT_EQ(rotateRect(Rect(0, 0, 10, 10), PI / 4), Rect(-2, -2, 12, 12));

    const PointF triangle[3] = {{0, 0}, {4, 0}, {0, 3}};
    const PointF reversed[3] = {{0, 3}, {4, 0}, {0, 0}};
    EXPECT_NEAR(getTriangleArea(triangle), 6.f, EPS);
    EXPECT_NEAR(getTriangleArea(reversed), -6.f, EPS);

    const PointF quad[4] = {{0, 0}, {4, 0}, {4, 3}, {0, 3}};
    const PointF bowTie[4] = {{0, 0}, {4, 3}, {4, 0}, {0, 3}};
    EXPECT_NEAR(getQuadArea(quad), 12.f, EPS);
    EXPECT_NEAR(getQuadArea(bowTie), 0.f, EPS);

    EXPECT_NEAR(getPolylineArea({{0, 0}, {4, 0}, {4, 3}, {2, 5}, {0, 3}}), 16.f, EPS);
    EXPECT_EQ(getPolylineArea({{0, 0}, {5, 5}}), 0.f);
    EXPECT_EQ(getPolylineArea({}), 0.f);
}

TEST(PlaneGeometry, shapeTests) {
    const std::vector<PointF> square = {{0, 0}, {4, 0}, {4, 4}, {0, 4}};
    const std::vector<PointF> clockwise(square.rbegin(), square.rend());
    for (const auto& shape : {square, clockwise}) {
        EXPECT_TRUE(isPointInsideShape(PointF(2, 2), shape, 0.f));
        EXPECT_TRUE(isPointInsideShape(PointF(4, 2), shape, 0.f));
        // 0.2 past the right edge: inside only within the tolerance
        EXPECT_TRUE(isPointInsideShape(PointF(4.2f, 2), shape, 0.5f));
        EXPECT_FALSE(isPointInsideShape(PointF(4.2f, 2), shape, 0.1f));
        EXPECT_FALSE(isPointInsideShape(PointF(10, 10), shape, 5.f));
    }
    EXPECT_FALSE(isPointInsideShape(PointF(0, 0), {}, 1.f));

    // a triangle is convex whatever the tolerance
    const std::vector<PointF> triangle = {{0, 0}, {5, 0}, {1, 1}};
    for (const float tolerance : {0.f, 0.5f, 10.f}) EXPECT_TRUE(isShapeConvex(triangle, tolerance));
    EXPECT_TRUE(isShapeConvex(square, 0.f));
    const std::vector<PointF> dart = {{0, 0}, {4, 2}, {0, 4}, {1, 2}};
    EXPECT_FALSE(isShapeConvex(dart, 0.01f));

    // A dent of about 1.15 degrees: its turn has sine 0.02, whatever the shape's scale.
    std::vector<PointF> dented = {{0, 0}, {2, 0.02f}, {4, 0}, {4, 4}, {0, 4}};
    for (const float scale : {1.f, 100.f}) {
        std::vector<PointF> shape;
        for (const PointF& p : dented) shape.push_back(p * scale);
        EXPECT_TRUE(isShapeConvex(shape, 0.05f)) << scale;
        EXPECT_FALSE(isShapeConvex(shape, 0.01f)) << scale;
    }
}

TEST(SpaceGeometry, projectionsAnglesAndIntersections) {
    EXPECT_POINT3D_NEAR(projectVectorOnPlane(P3(1, 2, 3), P3(0, 0, 5)), 1.f, 2.f, 0.f);
    EXPECT_POINT3D_NEAR(projectVectorOnPlane(P3(1, 0, 1), P3(1, 1, 0)), 0.5f, -0.5f, 1.f);
    EXPECT_POINT3D_NEAR(projectPointOnLine(P3(1, 2, 3), P3(0, 0, 0), P3(0, 0, 2)), 0.f, 0.f, 3.f);
    EXPECT_POINT3D_NEAR(projectPointOnLine(P3(1, 2, 3), P3(5, 5, 5), P3(0, 0, 0)), 5.f, 5.f, 5.f);
    EXPECT_POINT3D_NEAR(projectPointOnPlane(P3(1, 2, 3), P3(0, 0, 1), P3(0, 0, 2)), 1.f, 2.f, 1.f);
    EXPECT_POINT3D_NEAR(projectPointOnPlane(P3(3, 0, 0), P3(1, 1, 0), P3(-1, 0, 0)), 1.f, 0.f, 0.f);

    const Point3dF up(0, 0, 1);
    EXPECT_NEAR(getAngle(P3(1, 0, 0), P3(0, 2, 0), up), PI / 2, EPS);
    EXPECT_NEAR(getAngle(P3(1, 0, 0), P3(0, 2, 0), -up), -PI / 2, EPS);
    EXPECT_NEAR(getAngle(P3(1, 0, 0), P3(-1, 0, 0), up), PI, EPS);
    // unit vectors whose dot product rounds past 1 must still give an angle
    for (const Point3dF& v : {P3(0.3f, 0.3f, 0.3f), P3(1, 1, 1), P3(0.2f, 0.3f, 0.4f)}) {
        const float angle = getAngle(v, v * 2.f, up);
        EXPECT_FALSE(std::isnan(angle));
        EXPECT_NEAR(angle, 0.f, 1e-3f);
    }

    EXPECT_NEAR(getAngleToPlane(P3(1, 0, 1), P3(0, 0, 3)), PI / 4, EPS);
    EXPECT_NEAR(getAngleToPlane(P3(1, 0, -1), P3(0, 0, 3)), -PI / 4, EPS);
    EXPECT_FALSE(std::isnan(getAngleToPlane(P3(0.3f, 0.3f, 0.3f), P3(0.6f, 0.6f, 0.6f))));

    const Point3dF a(0, 0, 0), b(0, 0, 10);
    EXPECT_NEAR(getPositionPointOnSegment(P3(1, 1, 5), a, b), 0.5f, EPS);
    EXPECT_NEAR(getPositionPointOnSegment(P3(1, 1, -5), a, b), -0.5f, EPS);
    EXPECT_EQ(getPositionPointOnSegment(P3(1, 1, 5), b, b), 0.f);
    EXPECT_POINT3D_NEAR(getNearestPointOnSegment(P3(1, 1, 5), a, b), 0.f, 0.f, 5.f);
    EXPECT_POINT3D_NEAR(getNearestPointOnSegment(P3(1, 1, 15), a, b), 0.f, 0.f, 10.f);

    Point3dF meet(-1, -1, -1);
    EXPECT_TRUE(intersectLinePlane(P3(0, 0, 10), P3(0, 0, -2), P3(5, 5, 1), P3(0, 0, 1), meet));
    EXPECT_POINT3D_NEAR(meet, 0.f, 0.f, 1.f);
    EXPECT_TRUE(intersectLinePlane(P3(0, 0, 0), P3(1, 1, 1), P3(0, 0, 3), P3(0, 0, -4), meet));
    EXPECT_POINT3D_NEAR(meet, 3.f, 3.f, 3.f);
    meet = P3(-1, -1, -1);
    EXPECT_FALSE(intersectLinePlane(P3(0, 0, 0), P3(1, 0, 0), P3(0, 0, 3), P3(0, 0, 1), meet));
    EXPECT_FALSE(intersectLinePlane(P3(0, 0, 0), P3(0, 0, 0), P3(0, 0, 3), P3(0, 0, 1), meet));
    EXPECT_POINT3D_NEAR(meet, -1.f, -1.f, -1.f);

    const Point3dF near(0, 0, 1), far(0, 0, 2);
    EXPECT_EQ(selectNearestPointInDirection(near, far, P3(0, 0, 1)), near);
    EXPECT_EQ(selectNearestPointInDirection(near, far, P3(0, 0, -1)), far);
    // a tie goes to the second
    EXPECT_EQ(selectNearestPointInDirection(P3(1, 0, 0), P3(-1, 0, 0), P3(0, 0, 1)), P3(-1, 0, 0));
}

// The history behind it lives for the whole process: this must be the only test that feeds it.
TEST(DeviceOrientation, angleFromAcceleration) {
    // flat on the very first call: nothing to fall back on yet
    const float first = std::atan2(0.2f, 0.1f);
    EXPECT_EQ(getAngleFromAcceleration(0.1f, 0.2f, 9.8f), first);

    EXPECT_EQ(getAngleFromAcceleration(0.f, 9.8f, 0.f), std::atan2(9.8f, 0.f));
    EXPECT_EQ(getAngleFromAcceleration(9.8f, 0.f, 0.f), 0.f);
    // flat: the median of {first, pi/2, 0}, and the history stays as it was
    EXPECT_EQ(getAngleFromAcceleration(1.f, 1.f, 9.8f), first);
    // half the length of (x, y) must be below 2
    EXPECT_EQ(getAngleFromAcceleration(3.9f, 0.f, 9.f), first);
    EXPECT_EQ(getAngleFromAcceleration(4.f, 0.f, 9.f), 0.f);
    // z must be above 8
    EXPECT_EQ(getAngleFromAcceleration(0.1f, 0.1f, 8.f), std::atan2(0.1f, 0.1f));
    // {first, pi/2, 0, 0, pi/4}: the median is pi/4
    EXPECT_EQ(getAngleFromAcceleration(0.f, 0.f, 9.8f), std::atan2(0.1f, 0.1f));

    // Only the last 30 angles count: 30 of pi push everything older out, then the
    // median turns to 0 once the 16th zero makes zeros the majority.
    const float pi = std::atan2(0.f, -9.8f);
    for (int i = 0; i < 30; ++i) getAngleFromAcceleration(-9.8f, 0.f, 0.f);
    EXPECT_EQ(getAngleFromAcceleration(0.f, 0.f, 9.8f), pi);
    for (int i = 0; i < 15; ++i) getAngleFromAcceleration(9.8f, 0.f, 0.f);
    EXPECT_EQ(getAngleFromAcceleration(0.f, 0.f, 9.8f), pi);
    getAngleFromAcceleration(9.8f, 0.f, 0.f);
    EXPECT_EQ(getAngleFromAcceleration(0.f, 0.f, 9.8f), 0.f);
}

// Barycentric weights rebuild the point; transforms by matrix agree with the same
// transform written out; the iterative pseudo-inverse of a tall matrix is a left inverse.
TEST(PlaneGeometry, withMatrices) {
    const PointF triangle[3] = {{0, 0}, {4, 0}, {0, 2}};
    float w[4];
    getBaryCoordsTriangle(PointF(1, 0.5f), triangle, w);
    EXPECT_POINT3D_NEAR(P3(w[0], w[1], w[2]), 0.5f, 0.25f, 0.25f);
    const PointF square[4] = {{0, 0}, {2, 0}, {2, 2}, {0, 2}};
    const PointF p(0.5f, 1.5f);
    getBaryCoordsQuad(p, square, w);
    PointF rebuilt(0, 0);
    float sum = 0;
    for (int i = 0; i < 4; ++i) {
        rebuilt += square[i] * w[i];
        sum += w[i];
    }
    EXPECT_NEAR(sum, 1.f, 1e-5f);
    EXPECT_NEAR(rebuilt.x, p.x, 1e-4f);
    EXPECT_NEAR(rebuilt.y, p.y, 1e-4f);

    const float h[9] = {2, 0, 3, 0, 1, -1, 0.5f, 0, 1};
    const Matrix homography(Size(3, 3), h);
    // ((4 + 3) / 2, (4 - 1) / 2); the same transform for coordinates twice as large maps 2p to 2q
    EXPECT_POINT_NEAR(applyHomography(PointF(2, 4), homography), 3.5f, 1.5f);
    EXPECT_POINT_NEAR(applyHomography(PointF(4, 8), scaleTransformArgument(2, homography)), 7.f, 3.f);

    const float a[6] = {0, -1, 10, 1, 0, 20};
    const Matrix affine(Size(3, 2), a);
    EXPECT_EQ(applyAffineTransformation(PointF(1, 2), affine), PointF(8, 21));
    EXPECT_EQ(applyAffineTransformationToVec(PointF(1, 2), affine), PointF(-2, 1));
    EXPECT_EQ(catchCheck([&] { applyHomography(PointF(), affine); }).expression,
              "matrix.size() == Size(3, 3)");
    EXPECT_EQ(catchCheck([] { scaleTransformArgument(2, Matrix()); }).expression, "!_transform.isEmpty()");

    const float t[6] = {1, 2, 3, 4, 5, 7};
    const Matrix tall(Size(2, 3), t);
    const Matrix identity = pseudoInverseIterative(tall) * tall;
    for (int r = 0; r < 2; ++r)
        for (int c = 0; c < 2; ++c) EXPECT_NEAR(identity(r, c), r == c ? 1.f : 0.f, 1e-3f) << r << c;
}
