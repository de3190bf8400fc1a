#pragma once
// Plane and space geometry on float points: projections, intersections, angles,
// areas and shape tests used by object locations, trackers and drawing.
//
// Where a length is divided by, a length not above FLT_EPSILON gives a zero vector
// (or a zero position) instead of a division, so degenerate input never yields NaN.
// Angles are in radians.

#include <vector>

#include "LQ_Matrix.h"
#include "LQ_Point.h"
#include "LQ_Rect.h"

namespace LQ {

// ---- plane ------------------------------------------------------------------

float getLength(const BasePoint<float>& v);
// v scaled to length 1, or the zero vector when v is not longer than FLT_EPSILON
BasePoint<float> getNormalized(const BasePoint<float>& v);

// foot of the perpendicular from point on the line
BasePoint<float> projectPointOnLine(const BasePoint<float>& point, const BasePoint<float>& linePoint,
                                    const BasePoint<float>& direction);

// Writes p1 + t·d1 where the two lines meet; false for (nearly) parallel directions.
bool intersectLines(const BasePoint<float>& p1, const BasePoint<float>& d1, const BasePoint<float>& p2,
                    const BasePoint<float>& d2, BasePoint<float>& intersection);

// false when the three points are (nearly) on one line
bool makeCircleThrough3Points(const BasePoint<float>& a, const BasePoint<float>& b, const BasePoint<float>& c,
                              BasePoint<float>& centre, float& radius);

// (-v.y, v.x)
BasePoint<float> getOrthogonal(const BasePoint<float>& v);

// Position of the projection of point on the segment: 0 at a, 1 at b, unclamped.
float getPositionPointOnSegment(const BasePoint<float>& point, const BasePoint<float>& a,
                                const BasePoint<float>& b);
BasePoint<float> getNearestPointOnSegment(const BasePoint<float>& point, const BasePoint<float>& a,
                                          const BasePoint<float>& b);

// signed angle from first to second, in (-pi, pi]
float getAngle(const BasePoint<float>& first, const BasePoint<float>& second);

BasePoint<float> rotate(const BasePoint<float>& v, float angle);
// computed in float, truncated toward zero with the stable multiplier
BasePoint<int> rotate(const BasePoint<int>& v, float angle);
// bounding rectangle of the four corners turned about the rectangle's integer centre
BaseRect<int> rotateRect(const BaseRect<int>& rect, float angle);

// Signed areas (half the sum of cross products of successive vertices, closed).
// The triangle and quad forms read 3 and 4 points.
float getTriangleArea(const BasePoint<float>* points);
float getQuadArea(const BasePoint<float>* points);
// 0 for fewer than 3 points
float getPolylineArea(const std::vector<BasePoint<float>>& points);

// (point - linePoint) x normalised direction
float getSignedDistanceToLine(const BasePoint<float>& point, const BasePoint<float>& linePoint,
                              const BasePoint<float>& direction);

// The point lies on one side of every edge of the closed polygon, or on the wrong side
// of some by less than tolerance. Works for either orientation; false without vertices.
bool isPointInsideShape(const BasePoint<float>& point, const std::vector<BasePoint<float>>& vertices,
                        float tolerance);

// Every turn between successive edges whose magnitude (sine of the turn angle) is at
// least tolerance has the same sign. Fewer than 4 vertices are always convex.
bool isShapeConvex(const std::vector<BasePoint<float>>& vertices, float tolerance);

// ---- space ------------------------------------------------------------------

float getLength(const BasePoint3d<float>& v);
BasePoint3d<float> getNormalized(const BasePoint3d<float>& v);

// vector less its component along the normal
BasePoint3d<float> projectVectorOnPlane(const BasePoint3d<float>& vector, const BasePoint3d<float>& normal);

BasePoint3d<float> projectPointOnLine(const BasePoint3d<float>& point, const BasePoint3d<float>& linePoint,
                                      const BasePoint3d<float>& direction);

// Unsigned angle between the vectors, in [0, pi], negated when (first x second)·normal < 0.
float getAngle(const BasePoint3d<float>& first, const BasePoint3d<float>& second,
               const BasePoint3d<float>& normal);

// Angle between vector and the plane, in [-pi/2, pi/2]: positive on the normal's side.
float getAngleToPlane(const BasePoint3d<float>& vector, const BasePoint3d<float>& normal);

BasePoint3d<float> projectPointOnPlane(const BasePoint3d<float>& point, const BasePoint3d<float>& planePoint,
                                       const BasePoint3d<float>& normal);

float getPositionPointOnSegment(const BasePoint3d<float>& point, const BasePoint3d<float>& a,
                                const BasePoint3d<float>& b);
BasePoint3d<float> getNearestPointOnSegment(const BasePoint3d<float>& point, const BasePoint3d<float>& a,
                                            const BasePoint3d<float>& b);

// false when the line is (nearly) parallel to the plane
bool intersectLinePlane(const BasePoint3d<float>& linePoint, const BasePoint3d<float>& direction,
                        const BasePoint3d<float>& planePoint, const BasePoint3d<float>& normal,
                        BasePoint3d<float>& intersection);

// Of two points the one with the smaller dot product with direction; the second on a tie.
BasePoint3d<float> selectNearestPointInDirection(const BasePoint3d<float>& first,
                                                 const BasePoint3d<float>& second,
                                                 const BasePoint3d<float>& direction);

// ---- with matrices ----------------------------------------------------------

// Generalised barycentric coordinates of point in the polygon of n vertices: the
// least-squares (smallest) weights of the vertices relative to the last one, which gets
// 1 minus the sum of the others. Exact for a triangle that isn't degenerate.
void getBaryCoordsN(int n, const BasePoint<float>& point, const BasePoint<float>* vertices, float* weights);
void getBaryCoordsTriangle(const BasePoint<float>& point, const BasePoint<float>* vertices, float* weights);
void getBaryCoordsQuad(const BasePoint<float>& point, const BasePoint<float>* vertices, float* weights);

// point through a 3 x 3 projective transform
BasePoint<float> applyHomography(const BasePoint<float>& point, const Matrix& matrix);
// point through an affine transform, 3 wide and 2 or 3 high; the vector form leaves out
// the translation
BasePoint<float> applyAffineTransformation(const BasePoint<float>& point, const Matrix& matrix);
BasePoint<float> applyAffineTransformationToVec(const BasePoint<float>& vector, const Matrix& matrix);
// the same 3 x 3 transform for coordinates multiplied by scale
Matrix scaleTransformArgument(float scale, const Matrix& _transform);
// Moore-Penrose inverse of any matrix: a regularised normal solution refined by two
// Newton steps
Matrix pseudoInverseIterative(const Matrix& matrix);

// ---- device orientation -----------------------------------------------------

// Roll angle of the device from an accelerometer reading. Lying flat, x and y say
// nothing about the roll, so the median of the last 30 angles is returned instead.
// Keeps process-wide state; not thread-safe.
float getAngleFromAcceleration(float x, float y, float z);

}  // namespace LQ
