#include "LQ_Geometry.h"

#include <algorithm>
#include <cfloat>
#include <cmath>

#include "LQ_History.h"
#include "LQ_Utils.h"

namespace LQ {

namespace {
// Below this a determinant counts as zero: the lines are parallel, the points collinear.
constexpr float DETERMINANT_EPSILON = 1e-5f;

// A rotated coordinate that should be an integer may come out just below it.
int truncateStable(float value) {
    return static_cast<int>(value * stableMultiplier<float>());
}

float clampUnit(float value) {
    return std::min(1.f, std::max(-1.f, value));
}
}  // namespace

// ---- plane ------------------------------------------------------------------

float getLength(const BasePoint<float>& v) {
    return std::sqrt(v.dot(v));
}

BasePoint<float> getNormalized(const BasePoint<float>& v) {
    const float length = getLength(v);
    if (length <= FLT_EPSILON) return BasePoint<float>();
    return v / length;
}

BasePoint<float> projectPointOnLine(const BasePoint<float>& point, const BasePoint<float>& linePoint,
                                    const BasePoint<float>& direction) {
    const BasePoint<float> unit = getNormalized(direction);
    return linePoint + unit * (point - linePoint).dot(unit);
}

bool intersectLines(const BasePoint<float>& p1, const BasePoint<float>& d1, const BasePoint<float>& p2,
                    const BasePoint<float>& d2, BasePoint<float>& intersection) {
    const float determinant = d1.y * d2.x - d1.x * d2.y;
    if (std::fabs(determinant) <= DETERMINANT_EPSILON) return false;
    // p1 + t·d1 = p2 + s·d2, solved for t by crossing both sides with d2
    const BasePoint<float> w = p2 - p1;
    const float t = (w.y * d2.x - w.x * d2.y) / determinant;
    intersection = p1 + d1 * t;
    return true;
}

bool makeCircleThrough3Points(const BasePoint<float>& a, const BasePoint<float>& b, const BasePoint<float>& c,
                              BasePoint<float>& centre, float& radius) {
    // The centre u relative to a satisfies 2·u·(b - a) = |b - a|² and 2·u·(c - a) = |c - a|².
    const BasePoint<float> ab = b - a;
    const BasePoint<float> ac = c - a;
    const float determinant = ab.cross(ac);
    if (std::fabs(determinant) <= DETERMINANT_EPSILON) return false;
    const float ab2 = ab.dot(ab);
    const float ac2 = ac.dot(ac);
    const BasePoint<float> u((ab2 * ac.y - ac2 * ab.y) / (2.f * determinant),
                             (ac2 * ab.x - ab2 * ac.x) / (2.f * determinant));
    centre = a + u;
    radius = getLength(u);
    return true;
}

BasePoint<float> getOrthogonal(const BasePoint<float>& v) {
    return BasePoint<float>(-v.y, v.x);
}

float getPositionPointOnSegment(const BasePoint<float>& point, const BasePoint<float>& a,
                                const BasePoint<float>& b) {
    const float length = getLength(b - a);
    if (length <= FLT_EPSILON) return 0.f;
    return (point - a).dot(getNormalized(b - a)) / length;
}

BasePoint<float> getNearestPointOnSegment(const BasePoint<float>& point, const BasePoint<float>& a,
                                          const BasePoint<float>& b) {
    const float t = std::min(1.f, std::max(0.f, getPositionPointOnSegment(point, a, b)));
    return a * (1.f - t) + b * t;
}

float getAngle(const BasePoint<float>& first, const BasePoint<float>& second) {
    const BasePoint<float> u = getNormalized(first);
    const BasePoint<float> v = getNormalized(second);
    return std::atan2(u.cross(v), u.dot(v));
}

BasePoint<float> rotate(const BasePoint<float>& v, float angle) {
    const float c = std::cos(angle);
    const float s = std::sin(angle);
    return BasePoint<float>(v.x * c - v.y * s, v.x * s + v.y * c);
}

BasePoint<int> rotate(const BasePoint<int>& v, float angle) {
    const BasePoint<float> r = rotate(BasePoint<float>(v), angle);
    return BasePoint<int>(truncateStable(r.x), truncateStable(r.y));
}

BaseRect<int> rotateRect(const BaseRect<int>& rect, float angle) {
    const BasePoint<int> centre((rect.left + rect.right) / 2, (rect.top + rect.bottom) / 2);
    const BasePoint<int> corners[4] = {
        {rect.left, rect.top}, {rect.right, rect.top}, {rect.right, rect.bottom}, {rect.left, rect.bottom}};
    float minX = FLT_MAX, minY = FLT_MAX, maxX = -FLT_MAX, maxY = -FLT_MAX;
    for (const BasePoint<int>& corner : corners) {
        const BasePoint<float> p =
            BasePoint<float>(centre) + rotate(BasePoint<float>(corner - centre), angle);
        minX = std::min(minX, p.x);
        minY = std::min(minY, p.y);
        maxX = std::max(maxX, p.x);
        maxY = std::max(maxY, p.y);
    }
    return BaseRect<int>(truncateStable(minX), truncateStable(minY), truncateStable(maxX),
                         truncateStable(maxY));
}

namespace {
float signedArea(const BasePoint<float>* points, size_t count) {
    if (count < 3) return 0.f;
    float sum = 0.f;
    for (size_t i = 0; i < count; ++i) sum += points[i].cross(points[(i + 1) % count]);
    return 0.5f * sum;
}
}  // namespace

float getTriangleArea(const BasePoint<float>* points) {
    return signedArea(points, 3);
}

float getQuadArea(const BasePoint<float>* points) {
    return signedArea(points, 4);
}

float getPolylineArea(const std::vector<BasePoint<float>>& points) {
    return signedArea(points.data(), points.size());
}

float getSignedDistanceToLine(const BasePoint<float>& point, const BasePoint<float>& linePoint,
                              const BasePoint<float>& direction) {
    return (point - linePoint).cross(getNormalized(direction));
}

bool isPointInsideShape(const BasePoint<float>& point, const std::vector<BasePoint<float>>& vertices,
                        float tolerance) {
    if (vertices.empty()) return false;
    float least = FLT_MAX;
    float greatest = -FLT_MAX;
    const size_t count = vertices.size();
    for (size_t i = 0; i < count; ++i) {
        const BasePoint<float>& from = vertices[i];
        const BasePoint<float>& to = vertices[(i + 1) % count];
        const float distance = getSignedDistanceToLine(point, from, to - from);
        least = std::min(least, distance);
        greatest = std::max(greatest, distance);
    }
    // one sign for all edges whatever the orientation; a small excursion is a tolerated miss
    if (least >= 0.f || greatest <= 0.f) return true;
    return std::min(-least, greatest) < tolerance;
}

bool isShapeConvex(const std::vector<BasePoint<float>>& vertices, float tolerance) {
    const size_t count = vertices.size();
    if (count < 4) return true;
    bool positive = false;
    bool negative = false;
    for (size_t i = 0; i < count; ++i) {
        const BasePoint<float> in = getNormalized(vertices[(i + 1) % count] - vertices[i]);
        const BasePoint<float> out = getNormalized(vertices[(i + 2) % count] - vertices[(i + 1) % count]);
        const float turn = in.cross(out);
        if (std::fabs(turn) < tolerance) continue;
        (turn > 0.f ? positive : negative) = true;
    }
    return !(positive && negative);
}

// ---- space ------------------------------------------------------------------

float getLength(const BasePoint3d<float>& v) {
    return std::sqrt(v.dot(v));
}

BasePoint3d<float> getNormalized(const BasePoint3d<float>& v) {
    const float length = getLength(v);
    if (length <= FLT_EPSILON) return BasePoint3d<float>();
    return v / length;
}

BasePoint3d<float> projectVectorOnPlane(const BasePoint3d<float>& vector, const BasePoint3d<float>& normal) {
    const BasePoint3d<float> unit = getNormalized(normal);
    return vector - unit * vector.dot(unit);
}

BasePoint3d<float> projectPointOnLine(const BasePoint3d<float>& point, const BasePoint3d<float>& linePoint,
                                      const BasePoint3d<float>& direction) {
    const BasePoint3d<float> unit = getNormalized(direction);
    return linePoint + unit * (point - linePoint).dot(unit);
}

float getAngle(const BasePoint3d<float>& first, const BasePoint3d<float>& second,
               const BasePoint3d<float>& normal) {
    const BasePoint3d<float> u = getNormalized(first);
    const BasePoint3d<float> v = getNormalized(second);
    // rounding can push the dot product of unit vectors just past 1
    const float angle = std::acos(clampUnit(u.dot(v)));
    return u.cross(v).dot(normal) < 0.f ? -angle : angle;
}

float getAngleToPlane(const BasePoint3d<float>& vector, const BasePoint3d<float>& normal) {
    return std::asin(clampUnit(getNormalized(vector).dot(getNormalized(normal))));
}

BasePoint3d<float> projectPointOnPlane(const BasePoint3d<float>& point, const BasePoint3d<float>& planePoint,
                                       const BasePoint3d<float>& normal) {
    return planePoint + projectVectorOnPlane(point - planePoint, normal);
}

float getPositionPointOnSegment(const BasePoint3d<float>& point, const BasePoint3d<float>& a,
                                const BasePoint3d<float>& b) {
    const float length = getLength(b - a);
    if (length <= FLT_EPSILON) return 0.f;
    return (point - a).dot(getNormalized(b - a)) / length;
}

BasePoint3d<float> getNearestPointOnSegment(const BasePoint3d<float>& point, const BasePoint3d<float>& a,
                                            const BasePoint3d<float>& b) {
    const float t = std::min(1.f, std::max(0.f, getPositionPointOnSegment(point, a, b)));
    return a * (1.f - t) + b * t;
}

bool intersectLinePlane(const BasePoint3d<float>& linePoint, const BasePoint3d<float>& direction,
                        const BasePoint3d<float>& planePoint, const BasePoint3d<float>& normal,
                        BasePoint3d<float>& intersection) {
    const BasePoint3d<float> unitDirection = getNormalized(direction);
    const BasePoint3d<float> unitNormal = getNormalized(normal);
    // the cosine between line and normal; a zero vector makes it 0 as well
    const float cosine = unitDirection.dot(unitNormal);
    if (std::fabs(cosine) <= DETERMINANT_EPSILON) return false;
    const float t = (planePoint - linePoint).dot(unitNormal) / cosine;
    intersection = linePoint + unitDirection * t;
    return true;
}

BasePoint3d<float> selectNearestPointInDirection(const BasePoint3d<float>& first,
                                                 const BasePoint3d<float>& second,
                                                 const BasePoint3d<float>& direction) {
    return first.dot(direction) < second.dot(direction) ? first : second;
}

// ---- device orientation -----------------------------------------------------

float getAngleFromAcceleration(float x, float y, float z) {
    constexpr unsigned int HISTORY_LENGTH = 30;
    static History<float> history;
    history.init(HISTORY_LENGTH);  // keeps the content after the first call

    // Gravity mostly along z: the device lies flat and x, y are noise.
    const bool flat = z > 8.f && 0.5f * std::sqrt(x * x + y * y) < 2.f;
    if (flat && history.size() > 0) {
        float values[HISTORY_LENGTH];
        const unsigned int count = history.size();
        for (unsigned int i = 0; i < count; ++i) values[i] = history.element(i);
        // the upper middle for an even count: always an angle that was measured
        std::nth_element(values, values + count / 2, values + count);
        return values[count / 2];
    }
    const float angle = std::atan2(y, x);
    history.add(angle);
    return angle;
}

// ---- with matrices ----------------------------------------------------------

void getBaryCoordsN(int n, const BasePoint<float>& point, const BasePoint<float>* vertices, float* weights) {
    const BasePoint<float>& last = vertices[n - 1];
    // the other vertices relative to the last, as the columns of a 2 x (n - 1) matrix
    Matrix relative(Size(n - 1, 2));
    for (int i = 0; i < n - 1; ++i) {
        relative(0, i) = vertices[i].x - last.x;
        relative(1, i) = vertices[i].y - last.y;
    }
    Matrix normal;
    Matrix::XXT(relative, normal);
    const Matrix solution = relative.transpose() * (Matrix::pseudoInverse2x2(normal) * Matrix(point - last));
    float sum = 0;
    for (int i = 0; i < n - 1; ++i) {
        weights[i] = solution[i];
        sum += solution[i];
    }
    weights[n - 1] = 1.f - sum;
}

void getBaryCoordsTriangle(const BasePoint<float>& point, const BasePoint<float>* vertices, float* weights) {
    getBaryCoordsN(3, point, vertices, weights);
}

void getBaryCoordsQuad(const BasePoint<float>& point, const BasePoint<float>* vertices, float* weights) {
    getBaryCoordsN(4, point, vertices, weights);
}

BasePoint<float> applyHomography(const BasePoint<float>& point, const Matrix& matrix) {
    LQ_ASSERT(matrix.size() == Size(3, 3));
    const float w = matrix[6] * point.x + matrix[7] * point.y + matrix[8];
    return BasePoint<float>((matrix[0] * point.x + matrix[1] * point.y + matrix[2]) / w,
                            (matrix[3] * point.x + matrix[4] * point.y + matrix[5]) / w);
}

BasePoint<float> applyAffineTransformation(const BasePoint<float>& point, const Matrix& matrix) {
    LQ_ASSERT(matrix.size() == Size(3, 2) || matrix.size() == Size(3, 3));
    return BasePoint<float>(matrix[0] * point.x + matrix[1] * point.y + matrix[2],
                            matrix[3] * point.x + matrix[4] * point.y + matrix[5]);
}

BasePoint<float> applyAffineTransformationToVec(const BasePoint<float>& vector, const Matrix& matrix) {
    LQ_ASSERT(matrix.size() == Size(3, 2) || matrix.size() == Size(3, 3));
    return BasePoint<float>(matrix[0] * vector.x + matrix[1] * vector.y, matrix[3] * vector.x + matrix[4] * vector.y);
}

Matrix scaleTransformArgument(float scale, const Matrix& _transform) {
    LQ_ASSERT(!_transform.isEmpty());
    Matrix result(_transform);
    result[2] *= scale;
    result[5] *= scale;
    result[6] /= scale;
    result[7] /= scale;
    return result;
}

Matrix pseudoInverseIterative(const Matrix& matrix) {
    Matrix normal;
    Matrix::XTX(matrix, normal);
    for (int i = 0; i < normal.size().width; ++i) normal(i, i) += 0.01f;
    Matrix x = normal.invert() * matrix.transpose();
    for (int step = 0; step < 2; ++step) x = 2.f * x - x * matrix * x;
    return x;
}

}  // namespace LQ
