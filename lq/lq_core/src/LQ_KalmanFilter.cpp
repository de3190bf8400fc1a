#include "LQ_KalmanFilter.h"

#include "LQ_Utils.h"

namespace LQ {

KalmanFilter::KalmanFilter(const DimentionParameters& dimentions) {
    init(dimentions);
}

KalmanFilter::KalmanFilter(const TrajectoryParameters& trajectory) {
    createTrajectoryFilter(trajectory);
}

void KalmanFilter::init(const DimentionParameters& dimentions) {
    const int n = static_cast<int>(dimentions.dynamic);
    const int m = static_cast<int>(dimentions.measurement);
    const int control = static_cast<int>(dimentions.control);
    A.makeIdentity(n);
    if (control > 0)
        B.makeZero(BaseSize<int>(control, n));
    else
        B.reset();
    H.makeZero(BaseSize<int>(n, m));
    Q.makeIdentity(n);
    R.makeIdentity(m);
    xPred.makeZero(BaseSize<int>(1, n));
    x.makeZero(BaseSize<int>(1, n));
    PPred.makeZero(n);
    K.makeZero(BaseSize<int>(m, n));
    P.makeZero(n);
    HP.makeZero(BaseSize<int>(n, m));
    S.makeZero(m);
    parameters = dimentions;
}

void KalmanFilter::createTrajectoryFilter(const TrajectoryParameters& trajectory) {
    const int dim = static_cast<int>(trajectory.dim);
    init(DimentionParameters(2 * trajectory.dim, trajectory.dim, 0));
    for (int i = 0; i < dim; ++i) {
        A(i, dim + i) = trajectory.velocityCoupling;
        H(i, i) = 1.f;
        H(i, dim + i) = 1.f;
        Q(i, i) = 0.f;
        Q(dim + i, dim + i) = trajectory.velocityNoise;
    }
    R *= trajectory.measurementNoise;
}

const Matrix& KalmanFilter::predict(const Matrix& control) {
    Matrix::multiply(A, x, xPred);
    if (!control.isEmpty()) xPred += B * control;
    Matrix AP;
    Matrix::multiply(A, P, AP);
    Matrix::multiply(AP, A.transpose(), PPred);
    PPred += Q;
    return xPred;
}

const Matrix& KalmanFilter::correct(const Matrix& measurement) {
    Matrix::multiply(H, PPred, HP);
    const Matrix Ht = H.transpose();
    Matrix::multiply(HP, Ht, S);
    S += R;
    // A singular S leaves a zero gain: the prediction stands.
    Matrix::multiply(PPred * Ht, S.invert(), K);
    Matrix::multiply(K, measurement - H * xPred, x);
    x += xPred;
    Matrix KHP;
    Matrix::multiply(K, HP, KHP);
    P = PPred - KHP;
    return x;
}

void KalmanFilter::initState(const Matrix& state) {
    x = state;
}

void KalmanFilter::initTrajectoryState(const Matrix& state) {
    const int m = static_cast<int>(parameters.measurement);
    LQ_ASSERT_MSG(
        x.size().area() >= m && state.size().area() >= m,
        "the state " << x.size() << " and the positions " << state.size() << " must hold " << m << " values");
    for (int i = 0; i < m; ++i) x[i] = state[i];
}

std::ostream& operator<<(std::ostream& stream, const KalmanFilter& filter) {
    stream << "KalmanFilter(x = " << filter.x << "P = " << filter.P << ")";
    return stream;
}

}  // namespace LQ
