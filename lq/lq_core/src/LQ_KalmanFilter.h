#pragma once
// A linear Kalman filter on float matrices. States and measurements are columns.
// Sizes below are written width x height.

#include <ostream>

#include "LQ_Matrix.h"

namespace LQ {

struct DimentionParameters {
    unsigned dynamic = 0;      // state size n
    unsigned measurement = 0;  // measurement size m
    unsigned control = 0;      // control size

    DimentionParameters() = default;
    DimentionParameters(unsigned dynamic_, unsigned measurement_, unsigned control_)
        : dynamic(dynamic_), measurement(measurement_), control(control_) {}
};

// A constant-velocity model of dim coordinates: the state holds the positions and then
// their velocities.
struct TrajectoryParameters {
    unsigned dim = 0;
    float velocityCoupling = 0.f;  // the position moves by velocityCoupling * velocity per step
    float velocityNoise = 0.f;     // process noise of the velocities
    float measurementNoise = 0.f;  // measurement noise of each coordinate

    TrajectoryParameters() = default;
    TrajectoryParameters(unsigned dim_, float velocityCoupling_, float velocityNoise_,
                         float measurementNoise_)
        : dim(dim_),
          velocityCoupling(velocityCoupling_),
          velocityNoise(velocityNoise_),
          measurementNoise(measurementNoise_) {}
};

class KalmanFilter {
public:
    KalmanFilter() = default;
    explicit KalmanFilter(const DimentionParameters& parameters);
    explicit KalmanFilter(const TrajectoryParameters& parameters);

    // A and Q identities, R identity, B zero (empty without control), the rest zero.
    void init(const DimentionParameters& parameters);
    // A couples each position to its velocity, a measurement reads position plus
    // velocity, only the velocities get process noise.
    void createTrajectoryFilter(const TrajectoryParameters& parameters);

    // xPred = A x (+ B control when control is not empty), PPred = A P A^T + Q
    const Matrix& predict(const Matrix& control);
    // the corrected state x
    const Matrix& correct(const Matrix& measurement);

    void initState(const Matrix& state);
    // sets the positions (the first measurement-size values) and keeps the velocities
    void initTrajectoryState(const Matrix& state);

    Matrix A;      // transition, n x n
    Matrix B;      // control, control x n
    Matrix H;      // measurement, n x m
    Matrix Q;      // process noise, n x n
    Matrix R;      // measurement noise, m x m
    Matrix xPred;  // predicted state, 1 x n
    Matrix x;      // corrected state, 1 x n
    Matrix PPred;  // predicted covariance, n x n
    Matrix K;      // gain, m x n
    Matrix P;      // corrected covariance, n x n
    Matrix HP;     // scratch H * PPred, n x m
    Matrix S;      // innovation covariance, m x m
    DimentionParameters parameters;
};

// "KalmanFilter(x = <matrix>P = <matrix>)"
std::ostream& operator<<(std::ostream& stream, const KalmanFilter& filter);

}  // namespace LQ
