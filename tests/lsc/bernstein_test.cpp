#include <gtest/gtest.h>

#include "caught_exception.h"
#include "lsc/apan_exception.h"
#include "lsc/bernstein.h"
#include "lsc/bernstein_surface.h"

namespace lsc {
namespace {

TEST(Bernstein, SumsToOneForEveryDegreeAndPosition) {
    for (int n = 0; n <= 5; ++n)
        for (double t : {0.0, 0.1, 0.25, 0.5, 0.9, 1.0}) {
            double sum = 0;
            for (int i = 0; i <= n; ++i)
                sum += bernstein(i, n, t);
            EXPECT_NEAR(sum, 1.0, 1e-15) << "n " << n << " t " << t;
        }
}

TEST(Bernstein, EndpointsAndKnownValues) {
    EXPECT_EQ(bernstein(0, 3, 0.0), 1.0);
    EXPECT_EQ(bernstein(3, 3, 1.0), 1.0);
    EXPECT_EQ(bernstein(1, 3, 0.0), 0.0);
    EXPECT_EQ(bernstein(1, 3, 0.5), 0.375);
    EXPECT_EQ(bernstein(1, 2, 0.5), 0.5);
}

TEST(Bernstein, IndicesOutsideTheDegreeAreZero) {
    EXPECT_EQ(bernstein(-1, 2, 0.3), 0.0);
    EXPECT_EQ(bernstein(3, 2, 0.3), 0.0);
    EXPECT_EQ(bernstein(0, -1, 0.3), 0.0);
}

// A quadratic in x and y that a 3 x 3 Bernstein surface holds exactly.
double quadratic(double x, double y) {
    return 0.5 + 0.001 * x - 0.002 * y + 1e-6 * x * y + 2e-7 * x * x;
}

TEST(BernsteinSurface, NineSamplesDetermineAQuadraticExactly) {
    bernsteinSurface surface(3, 3, 0.0, 640.0, 0.0, 480.0);
    for (double x : {0.0, 320.0, 639.0})
        for (double y : {0.0, 240.0, 479.0})
            surface.addSample(x, y, quadratic(x, y));
    surface.fit(1e-7);
    for (double x : {0.0, 100.0, 320.0, 555.0, 639.0})
        for (double y : {0.0, 17.0, 240.0, 479.0})
            // The square solve rescales rows by 1/lead; leads of ~1e-6 near the far
            // edge cost some digits.
            EXPECT_NEAR(surface.value(x, y), quadratic(x, y), 1e-7) << x << "," << y;
}

TEST(BernsteinSurface, ControlPointsAreRowMajorWithRowsAlongY) {
    bernsteinSurface surface(3, 3, 0.0, 100.0, 0.0, 100.0);
    surface.controlPoints()(2, 0) = 1.0; // bottom-left corner
    EXPECT_EQ(surface.value(0.0, 100.0), 1.0);
    EXPECT_EQ(surface.value(100.0, 0.0), 0.0);
}

TEST(BernsteinSurface, FewerSamplesThanControlPointsThrow220) {
    bernsteinSurface surface(3, 3, 0.0, 640.0, 0.0, 480.0);
    for (int i = 0; i < 8; ++i)
        surface.addSample(i * 80.0, i * 60.0, 1.0);
    const apan::exception e = lsc_test::caught([&] { surface.fit(1e-7); });
    EXPECT_EQ(e.code(), 220);
    EXPECT_STREQ(e.what(), "Under constrained fit being attempted. You must specify at least as "
                           "many sample points as control points.");
    EXPECT_EQ(e.hint(), "While it's possible to solve undercontrained linear least squares "
                        "systems we don't support it.");
}

} // namespace
} // namespace lsc
