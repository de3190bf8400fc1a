#include <gtest/gtest.h>

#include <cmath>
#include <sstream>
#include <vector>

#include "LQ_KalmanFilter.h"

using namespace LQ;

namespace {

// One coordinate of the constant-velocity model in double, from the textbook formulas
// written out for state (p, v), H = (1 1) and symmetric P.
struct ScalarTrajectory {
    double c, velocityNoise, measurementNoise;
    double p = 0, v = 0, P00 = 0, P01 = 0, P11 = 0;

    void step(double z) {
        const double pp = p + c * v;
        const double Pp00 = P00 + 2 * c * P01 + c * c * P11, Pp01 = P01 + c * P11, Pp11 = P11 + velocityNoise;
        const double h0 = Pp00 + Pp01, h1 = Pp01 + Pp11;  // H PPred
        const double S = h0 + h1 + measurementNoise;
        const double k0 = h0 / S, k1 = h1 / S, innovation = z - (pp + v);
        p = pp + k0 * innovation;
        v += k1 * innovation;
        P00 = Pp00 - k0 * h0;
        P01 = Pp01 - k0 * h1;
        P11 = Pp11 - k1 * h1;
    }
};

}  // namespace

// a control enters the prediction through B; no control leaves the state as it is
TEST(KalmanFilter, control) {
    KalmanFilter c(DimentionParameters(2, 1, 1));
    c.B(0, 0) = 0.5f;
    c.B(1, 0) = 1.f;
    c.initState(Matrix(PointF(1, 2)));
    EXPECT_EQ(static_cast<PointF>(c.predict(Matrix(4.f))), PointF(3, 6));
    EXPECT_EQ(static_cast<PointF>(c.predict(Matrix())), PointF(1, 2));
}

// One coordinate, worked out by hand: A = (1 0.5; 0 1), H = (1 1), Q = diag(0, 0.1), R = 0.1.
TEST(KalmanFilter, constantVelocityByHand) {
    KalmanFilter f(TrajectoryParameters(1, 0.5f, 0.1f, 0.1f));
    f.initTrajectoryState(Matrix(30.f));
    f.predict(Matrix());
    // PPred = Q, S = 0.2, K = (0, 0.5), no innovation
    f.correct(Matrix(30.f));
    EXPECT_NEAR(f.P(1, 1), 0.05f, 1e-7f);
    // PPred = (0.0125 0.025; 0.025 0.15), S = 0.3125, K = (0.12, 0.56), innovation 10
    f.predict(Matrix());
    const Matrix& x = f.correct(Matrix(40.f));
    EXPECT_NEAR(f.K[0], 0.12f, 1e-6f);
    EXPECT_NEAR(f.K[1], 0.56f, 1e-6f);
    EXPECT_NEAR(x[0], 31.2f, 1e-5f);
    EXPECT_NEAR(x[1], 5.6f, 1e-5f);
}

// Two coordinates over several steps against the double-precision model; the
// coordinates must not leak into each other.
TEST(KalmanFilter, trajectoryAgreesWithDoublePrecisionModel) {
    const float coupling = 1.f, velocityNoise = 0.05f, measurementNoise = 0.5f;
    KalmanFilter f(TrajectoryParameters(2, coupling, velocityNoise, measurementNoise));
    f.initTrajectoryState(Matrix(PointF(10, 20)));
    ScalarTrajectory model[2] = {{coupling, velocityNoise, measurementNoise},
                                 {coupling, velocityNoise, measurementNoise}};
    model[0].p = 10;
    model[1].p = 20;

    // moving by (2, -1) per frame with a fixed wobble
    const double wobble[] = {0.3, -0.2, 0.1, 0.4, -0.3, 0.0, 0.2, -0.1};
    for (int step = 0; step < 8; ++step) {
        const double z[2] = {10 + 2 * (step + 1) + wobble[step], 20 - (step + 1) - wobble[7 - step]};
        f.predict(Matrix());
        const Matrix& x = f.correct(Matrix(PointF(float(z[0]), float(z[1]))));
        for (int i = 0; i < 2; ++i) {
            ScalarTrajectory& m = model[i];
            m.step(z[i]);
            EXPECT_NEAR(x[i], m.p, 1e-4 * std::fabs(m.p)) << "step " << step;
            EXPECT_NEAR(x[2 + i], m.v, 1e-4) << "step " << step;
            EXPECT_NEAR(f.P(i, i), m.P00, 1e-5) << "step " << step;
            EXPECT_NEAR(f.P(i, 2 + i), m.P01, 1e-5) << "step " << step;
            EXPECT_NEAR(f.P(2 + i, 2 + i), m.P11, 1e-5) << "step " << step;
            EXPECT_EQ(f.P(i, 1 - i), 0.f);
            EXPECT_EQ(f.P(i, 3 - i), 0.f);
        }
    }
    // the velocity estimate has found the motion
    EXPECT_NEAR(f.x[2], 2.f, 0.5f);
    EXPECT_NEAR(f.x[3], -1.f, 0.5f);

    // new positions keep the velocities
    const float vx = f.x[2], vy = f.x[3];
    f.initTrajectoryState(Matrix(PointF(-5, 6)));
    EXPECT_EQ(std::vector<float>(f.x.data(), f.x.data() + 4), std::vector<float>({-5, 6, vx, vy}));

    std::ostringstream text;
    text << f;
    EXPECT_EQ(text.str().rfind("KalmanFilter(x = Matrix(Size(1, 4)\n", 0), 0u) << text.str();
}
