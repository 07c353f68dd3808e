// Bernstein weights and the dense solvers of the surface fit: small systems
// with exact answers, and one case per failure.

#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "lsc/bernstein.h"
#include "lsc/bernstein_surface.h"
#include "lsc/linear_least_squares.h"
#include "test_helpers.h"

namespace lsc {
namespace {

using apan::denseMatrix;
using lsc_test::caught;

denseMatrix matrixOf(std::uint32_t rows, std::uint32_t columns, const std::vector<double>& values) {
    denseMatrix m(rows, columns);
    for (std::size_t i = 0; i < values.size(); ++i)
        m[i] = values[i];
    return m;
}

TEST(Bernstein, KnownValuesAndIndicesOutsideTheDegree) {
    const struct {
        int i, n;
        double t, value;
    } cases[] = {{0, 3, 0.0, 1.0},       {3, 3, 1.0, 1.0}, {1, 3, 0.0, 0.0}, {1, 3, 0.5, 0.375},
                 {2, 3, 0.25, 0.140625}, {1, 2, 0.5, 0.5}, {0, 0, 0.3, 1.0}, {-1, 2, 0.3, 0.0},
                 {3, 2, 0.3, 0.0},       {0, -1, 0.3, 0.0}};
    for (const auto& c : cases)
        EXPECT_EQ(bernstein(c.i, c.n, c.t), c.value) << c.i << ", " << c.n << ", " << c.t;
}

// A x = b with x exact; square systems go through both solvers (the
// least-squares one hands them to the square solve).
TEST(LinearSystem, SolvesSmallSystemsExactly) {
    const struct {
        std::uint32_t rows, columns;
        std::vector<double> a, b;
        double tolerance;
        std::vector<double> x;
    } cases[] = {
        {3, 3, {2, 1, -1, -3, -1, 2, -2, 1, 2}, {8, -11, -3}, 1e-7, {2, 3, -1}},
        // Zero pivot: the first usable row (leading 1) comes up, not the largest (4).
        {3, 3, {0, 1, 1, 1, 2, 3, 4, 1, 1}, {2, 6, 6}, 1e-7, {1, 1, 1}},
        {2, 2, {1, 1, 0.25, 1}, {2, 1.25}, 0.5, {0.75, 1.25}}, // lead within the tolerance
        {2, 2, {0, 1, 1, 0}, {3, 4}, 0.0, {4, 3}},             // zero tolerance still swaps
        {3, 2, {1, 0, 0, 1, 1, 1}, {1, 2, 3}, 1e-10, {1, 2}},  // consistent
        {3, 1, {1, 1, 1}, {1, 2, 6}, 1e-10, {3}},              // the mean
        {4, 2, {1, 0, 1, 1, 1, 2, 1, 3}, {1, 3, 2, 4}, 1e-10, {1.3, 0.8}}, // a line
    };
    for (const auto& c : cases)
        for (bool square : {false, true}) {
            if (square && c.rows != c.columns)
                continue;
            denseMatrix a = matrixOf(c.rows, c.columns, c.a), b = matrixOf(c.rows, 1, c.b);
            denseMatrix x(c.columns, 1);
            if (square)
                apan::linearSystem<double>(&a, &x, &b).solve(c.tolerance);
            else
                apan::linearLeastSquares<double>(&a, &x, &b).solve(c.tolerance);
            for (std::uint32_t i = 0; i < c.columns; ++i)
                EXPECT_NEAR(x[i], c.x[i], 1e-12) << c.a[0] << c.a[1] << ", unknown " << i;
            if (c.a[0] == 0 && c.rows == 3) {
                EXPECT_EQ(a(0, 1), 2.0); // row 1 became the normalised first row
            }
        }
}

// Codes and texts of each failure, kept in tests/data/lsc/solver_errors.txt.
TEST(LinearSystem, EachFailureHasItsCodeAndTexts) {
    struct Broken : apan::linearSystem<double> {
        using apan::linearSystem<double>::linearSystem;
        void solve(double) override { (*x_)[0] = 2.1; }
    };
    denseMatrix a(3, 3), x(3, 1), b(3, 1), x2(2, 1), b6(6, 1), a63(6, 3), a24(2, 4), x4(4, 1);
    for (std::uint32_t i = 0; i < 8; ++i)
        a24[i] = i * i + 1.0;
    for (std::uint32_t r = 0; r < 6; ++r) { // identical columns 0 and 2
        a63(r, 0) = a63(r, 2) = r + 1.0;
        a63(r, 1) = (r * r) % 5;
    }
    denseMatrix singular = matrixOf(3, 3, {2, 1, 1, 1, 3, 2, 3, 4, 3}); // row 2 = row 0 + row 1
    denseMatrix ones = matrixOf(2, 2, {1, 1, 1, 1}),
                zeroColumn = matrixOf(3, 2, {1, 0, 2, 0, 3, 0});
    denseMatrix a32(3, 2), b3(3, 1), b2 = matrixOf(2, 1, {1, 1}), c2 = matrixOf(2, 1, {1, 1});
    bernsteinSurface surface(3, 3, 0.0, 640.0, 0.0, 480.0);
    for (int i = 0; i < 8; ++i)
        surface.addSample(i * 80.0, i * 60.0, 1.0);
    const apan::exception errors[] = {
        caught([&] { Broken(&a, &x, &b).selfTest(); }),
        caught([&] { surface.fit(1e-7); }),
        caught([&] { apan::linearLeastSquares<double>(&a63, &x, &b6).solve(1e-10); }),
        caught([&] { apan::linearLeastSquares<double>(&zeroColumn, &x2, &b3).solve(1e-10); }),
        caught([&] { apan::linearLeastSquares<double>(&a24, &x4, &b2).solve(1e-10); }), // wide
        caught([&] { apan::linearSystem<double>(&singular, &x, &b).solve(1e-7); }),
        caught([&] { apan::linearSystem<double>(&ones, &x2, &c2).solve(0.0); }),
        caught([&] { apan::linearSystem<double>(&a32, &x2, &b3).solve(1e-7); }),
    };
    std::string text;
    for (const apan::exception& e : errors)
        text += std::to_string(e.code()) + " " + e.what() + "\n    " + e.hint() + "\n";
    lsc_test::expectGolden("lsc/solver_errors.txt", text);
}

TEST(LinearSystem, SelfTestSolvesItsSystemAndBadShapesAreRefused) {
    denseMatrix a(3, 3), x(3, 1), b(3, 1);
    apan::linearLeastSquares<double> lls(&a, &x, &b);
    apan::linearSystem<double> square(&a, &x, &b);
    for (apan::linearSystem<double>* system : {&square, static_cast<decltype(&square)>(&lls)}) {
        x = denseMatrix(3, 1);
        system->selfTest();
        for (std::uint32_t i = 0; i < 3; ++i)
            EXPECT_NEAR(x[i], (std::vector<double>{2, 1, -1}[i]), 1e-12);
    }
    denseMatrix a4(4, 4), x4(4, 1), b4(4, 1), x1(1, 1), x2(2, 1), b2(2, 1), b3(3, 1);
    denseMatrix i2 = matrixOf(2, 2, {1, 0, 0, 1});
    EXPECT_THROW(apan::linearSystem<double>(&a4, &x4, &b4).selfTest(), std::invalid_argument);
    EXPECT_THROW(apan::linearSystem<double>(&i2, &x1, &b2).solve(1e-7), std::invalid_argument);
    EXPECT_THROW(apan::linearSystem<double>(&i2, &x2, &b3).solve(1e-7), std::invalid_argument);
    EXPECT_THROW(apan::linearSystem<double>(&i2, nullptr, &b2).solve(1e-7), std::invalid_argument);
    EXPECT_THROW(apan::linearLeastSquares<double>(&i2, &x2, &b3).solve(1e-7),
                 std::invalid_argument);
    EXPECT_THROW(denseMatrix(0xffffffffu, 0xffffffffu), std::bad_alloc);
}

TEST(BernsteinSurface, NineSamplesDetermineAQuadraticAndRowsRunAlongY) {
    const auto quadratic = [](double x, double y) {
        return 0.5 + 0.001 * x - 0.002 * y + 1e-6 * x * y + 2e-7 * x * x;
    };
    bernsteinSurface surface(3, 3, 0.0, 640.0, 0.0, 480.0);
    for (double x : {0.0, 320.0, 639.0})
        for (double y : {0.0, 240.0, 479.0})
            surface.addSample(x, y, quadratic(x, y));
    surface.fit(1e-7);
    for (double x : {0.0, 100.0, 555.0, 639.0})
        for (double y : {0.0, 17.0, 479.0})
            EXPECT_NEAR(surface.value(x, y), quadratic(x, y), 1e-7) << x << "," << y;
    bernsteinSurface corner(3, 3, 0.0, 100.0, 0.0, 100.0);
    corner.controlPoints()(2, 0) = 1.0; // bottom-left
    EXPECT_EQ(corner.value(0.0, 100.0), 1.0);
    EXPECT_EQ(corner.value(100.0, 0.0), 0.0);
}

} // namespace
} // namespace lsc
