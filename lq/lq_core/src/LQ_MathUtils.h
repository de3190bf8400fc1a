#pragma once
// Periodic values, the quadratic equation, the process-wide random generator and a few
// statistics on float arrays and matrices.

#include <climits>
#include <cstdint>
#include <vector>

#include "LQ_Matrix.h"
#include "LQ_Point.h"
#include "LQ_Range.h"

namespace LQ {

// ---- numeric helpers ----------------------------------------------------------------

// x moved by whole periods (b - a) into (a, b]; needs a < b
float normalizePeriodic(float x, float a, float b);

// a + (b - a) * t along the shorter way round: when a and b are more than half a period
// apart, the smaller is first raised by whole periods.
float mixPeriodic(float t, float a, float b, float period);

// Real roots of a x^2 + b x + c = 0, x1 <= x2 for a > 0. A nearly zero a solves the linear
// equation (false when b is nearly zero too). A discriminant below -tolerance gives
// false with both roots at the vertex; one within the tolerance counts as zero.
bool solveQuadraticEquation(float a, float b, float c, float& x1, float& x2, float tolerance);

template <class T>
constexpr T minValue();
template <class T>
constexpr T maxValue();
template <>
constexpr int minValue<int>() {
    return INT_MIN;
}
template <>
constexpr int maxValue<int>() {
    return INT_MAX;
}
template <>
constexpr float minValue<float>() {
    return -3.4028235e38f;
}
template <>
constexpr float maxValue<float>() {
    return 3.4028235e38f;
}

// ---- random generator ---------------------------------------------------------------
// One process-wide state shared by all the functions below, so a seed repeats every
// sequence drawn from them. The frame thread is the only user: no lock.

extern std::int64_t randomSeed;  // 123456789 at start
void setRandomSeed(long seed);

// The minimal-standard generator (multiplier 48271, modulus 2^31 - 1) by Schrage's
// method, which needs no product wider than the modulus.
int rand();
// in [0, 1)
float randomUniform();
// in [a, b)
float randomUniform(float a, float b);
float randomUniform(const BaseRange<float>& range);
// in [0, n); 0 when n is 0
int randomUniformInt(int n);
// Standard normal by the polar method; the second value of each pair is dropped.
float randomNormal();
float randomNormal(float mean, float sigma);

// ---- statistics ---------------------------------------------------------------------

// Sum of d d^T / n over the points, d = point - mean: 3 x 3 and 2 x 2. No points give
// the zero matrix.
void covariance(const std::vector<BasePoint3d<float>>& points, const BasePoint3d<float>& mean, Matrix& out);
void covariance(const std::vector<BasePoint<float>>& points, const BasePoint<float>& mean, Matrix& out);
// Sum of w d d^T / sum of w; a total weight not above FLT_EPSILON leaves the plain sums.
void covariance(const std::vector<BasePoint3d<float>>& points, const std::vector<float>& weights,
                const BasePoint3d<float>& mean, Matrix& out);
void covariance(const std::vector<BasePoint<float>>& points, const std::vector<float>& weights,
                const BasePoint<float>& mean, Matrix& out);

// Mean squared distance of the points from their centre; 0 below two points.
float variance(const std::vector<BasePoint<int>>& points);
// Sample variance (divided by n - 1); 0 below two values.
float variance(const float* data, int n);

// x holds k rows of n regressors. The share of the variance of y that the prediction
// sum_j x(j, i) * c(j) explains; 0 when y is constant.
float computeR2(const float* x, const float* y, const float* coefficients, int n, int k);
// Least squares fit of the k coefficients; returns R^2. A singular x x^T fails the check.
float regression(const float* x, const float* y, float* coefficients, int n, int k);
// The same on matrices: regressors k x n (width n), responce a column of height n,
// parameters of height k gets (X X^T)^-1 X y. Returns R^2.
float linearRegressionMat(const Matrix& regressors, const Matrix& responce, Matrix& parameters);

}  // namespace LQ
