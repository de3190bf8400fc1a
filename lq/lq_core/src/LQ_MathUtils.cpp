#include "LQ_MathUtils.h"

#include <algorithm>
#include <cmath>
#include <cstdint>

#include "LQ_Utils.h"

namespace LQ {

// ---- numeric helpers ----------------------------------------------------------------

float normalizePeriodic(float x, float a, float b) {
    LQ_ASSERT(a < b);
    return (b - a) * floorf((b - x) / (b - a)) + x;
}

float mixPeriodic(float t, float a, float b, float period) {
    LQ_ASSERT(period > 0);
    if (std::fabs(a - b) <= period * 0.5f || !std::isfinite(a) || !std::isfinite(b)) return a + (b - a) * t;
    // Whole steps rather than one multiplication, so the lifted value is the one a
    // caller stepping round the circle would reach.
    if (a < b) {
        while (a < b) a += period;
    } else {
        while (b < a) b += period;
    }
    return a + (b - a) * t;
}

bool solveQuadraticEquation(float a, float b, float c, float& x1, float& x2, float tolerance) {
    if (std::fabs(a) < 1e-6f) {
        if (std::fabs(b) < 1e-6f) return false;
        x1 = x2 = -c / b;
        return true;
    }
    const float D = b * b - 4 * a * c;
    if (D < -tolerance) {
        x1 = x2 = b / (-2 * a);
        return false;
    }
    const float s = std::sqrt(std::max(D, 0.f));
    x1 = (-b - s) / (2 * a);
    x2 = (s - b) / (2 * a);
    return true;
}

// ---- random generator ---------------------------------------------------------------

std::int64_t randomSeed = 123456789;

void setRandomSeed(long seed) {
    randomSeed = seed;
}

int rand() {
    constexpr std::int64_t MODULUS = 0x7fffffff;
    const std::int64_t q = randomSeed / 44488;
    const std::int64_t r = randomSeed % 44488;
    randomSeed = 48271 * r - 3399 * q;
    if (randomSeed < 1) randomSeed += MODULUS;
    return static_cast<int>(randomSeed % MODULUS);
}

float randomUniform() {
    return static_cast<float>(rand()) * 4.656613e-10f;
}

float randomUniform(float a, float b) {
    return (b - a) * randomUniform() + a;
}

float randomUniform(const BaseRange<float>& range) {
    return randomUniform(range.lower, range.upper);
}

int randomUniformInt(int n) {
    if (n == 0) return 0;
    return rand() % n;
}

float randomNormal() {
    float p, s;
    do {
        const float u1 = randomUniform();
        const float u2 = randomUniform();
        p = 2 * u1 - 1;
        const float q = 2 * u2 - 1;
        s = p * p + q * q;
    } while (s < 1.1920929e-7f || s > 0.9999999f);
    return static_cast<float>(std::sqrt(-2.0 * std::log(static_cast<double>(s)) / s) * p);
}

float randomNormal(float mean, float sigma) {
    return randomNormal() * sigma + mean;
}

// ---- statistics ---------------------------------------------------------------------

namespace {

constexpr float WEIGHT_EPSILON = 1.1920929e-7f;

// Adds w d d^T to the upper triangle of the n x n sums.
inline void addOuter(const float* d, int n, float w, float* sums) {
    for (int i = 0; i < n; ++i)
        for (int j = i; j < n; ++j) sums[i * n + j] += w * d[i] * d[j];
}

void finish(float* sums, int n, float divisor, Matrix& out) {
    out.create(BaseSize<int>(n, n));
    for (int i = 0; i < n; ++i)
        for (int j = i; j < n; ++j) out[i * n + j] = out[j * n + i] = sums[i * n + j] / divisor;
}

void toArray(const BasePoint3d<float>& d, float* v) {
    v[0] = d.x;
    v[1] = d.y;
    v[2] = d.z;
}

void toArray(const BasePoint<float>& d, float* v) {
    v[0] = d.x;
    v[1] = d.y;
}

template <class P>
constexpr int dimensionOf();
template <>
constexpr int dimensionOf<BasePoint<float>>() {
    return 2;
}
template <>
constexpr int dimensionOf<BasePoint3d<float>>() {
    return 3;
}

template <class P>
void covarianceOf(const std::vector<P>& points, const P& mean, Matrix& out) {
    constexpr int n = dimensionOf<P>();
    float sums[n * n] = {};
    float d[n];
    for (const P& point : points) {
        toArray(point - mean, d);
        addOuter(d, n, 1.f, sums);
    }
    finish(sums, n, points.empty() ? 1.f : static_cast<float>(points.size()), out);
}

template <class P>
void covarianceOf(const std::vector<P>& points, const std::vector<float>& weights, const P& mean,
                  Matrix& out) {
    LQ_ASSERT_EQ(points.size(), weights.size());
    constexpr int n = dimensionOf<P>();
    float sums[n * n] = {};
    float d[n];
    float total = 0.f;
    for (size_t i = 0; i < points.size(); ++i) {
        toArray(points[i] - mean, d);
        addOuter(d, n, weights[i], sums);
        total += weights[i];
    }
    finish(sums, n, total > WEIGHT_EPSILON ? total : 1.f, out);
}

}  // namespace

void covariance(const std::vector<BasePoint3d<float>>& points, const BasePoint3d<float>& mean, Matrix& out) {
    covarianceOf(points, mean, out);
}

void covariance(const std::vector<BasePoint<float>>& points, const BasePoint<float>& mean, Matrix& out) {
    covarianceOf(points, mean, out);
}

void covariance(const std::vector<BasePoint3d<float>>& points, const std::vector<float>& weights,
                const BasePoint3d<float>& mean, Matrix& out) {
    covarianceOf(points, weights, mean, out);
}

void covariance(const std::vector<BasePoint<float>>& points, const std::vector<float>& weights,
                const BasePoint<float>& mean, Matrix& out) {
    covarianceOf(points, weights, mean, out);
}

float variance(const std::vector<BasePoint<int>>& points) {
    const int n = static_cast<int>(points.size());
    if (n < 2) return 0.f;
    // 32-bit sums; unsigned so that an overflow wraps instead of being undefined
    std::uint32_t sx = 0, sy = 0, s2 = 0;
    for (const BasePoint<int>& p : points) {
        const std::uint32_t x = static_cast<std::uint32_t>(p.x), y = static_cast<std::uint32_t>(p.y);
        sx += x;
        sy += y;
        s2 += x * x + y * y;
    }
    const float fx = static_cast<float>(static_cast<std::int32_t>(sx));
    const float fy = static_cast<float>(static_cast<std::int32_t>(sy));
    const float fn = static_cast<float>(n);
    return static_cast<float>(static_cast<std::int32_t>(s2)) / fn - ((fx * fx + fy * fy) / fn) / fn;
}

float variance(const float* data, int n) {
    if (n < 2) return 0.f;
    // double sums: the difference of the two terms cancels most of their digits
    double sum = 0, sum2 = 0;
    for (int i = 0; i < n; ++i) {
        sum += data[i];
        sum2 += double(data[i]) * data[i];
    }
    return static_cast<float>((sum2 - sum * sum / n) / (n - 1));
}

float computeR2(const float* x, const float* y, const float* coefficients, int n, int k) {
    if (n < 1) return 0.f;
    double mean = 0;
    for (int i = 0; i < n; ++i) mean += y[i];
    mean /= n;
    double explained = 0, total = 0;
    for (int i = 0; i < n; ++i) {
        double p = 0;
        for (int j = 0; j < k; ++j) p += double(x[j * n + i]) * coefficients[j];
        explained += (p - mean) * (p - mean);
        total += (y[i] - mean) * (y[i] - mean);
    }
    return total == 0 ? 0.f : static_cast<float>(explained / total);
}

float regression(const float* x, const float* y, float* coefficients, int n, int k) {
    const Matrix X(BaseSize<int>(n, k), x);
    const Matrix Y(BaseSize<int>(1, n), y);
    Matrix matrix, inverse, xy, solution;
    Matrix::XXT(X, matrix);
    Matrix::multiply(X, Y, xy);
    const bool status = Matrix::invert(matrix, inverse);
    LQ_ASSERT_MSG(status, "matrix inversion failed: " << matrix);
    Matrix::multiply(inverse, xy, solution);
    for (int j = 0; j < k; ++j) coefficients[j] = solution[j];
    return computeR2(x, y, coefficients, n, k);
}

float linearRegressionMat(const Matrix& regressors, const Matrix& responce, Matrix& parameters) {
    LQ_ASSERT_MSG(!regressors.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(!responce.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(!parameters.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_EQ(regressors.size().width, responce.size().height);
    LQ_ASSERT_EQ(responce.size().width, 1);
    LQ_ASSERT_EQ(regressors.size().height, parameters.size().height);
    Matrix xxt;
    Matrix::XXT(regressors, xxt);
    parameters = xxt.invert() * regressors * responce;
    return computeR2(regressors.data(), responce.data(), parameters.data(), regressors.size().width,
                     regressors.size().height);
}

}  // namespace LQ
