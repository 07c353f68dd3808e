// The surface maths of the fit: Bernstein weights, the dense solvers (small
// systems with exact answers, one case per failure), the 3 x 3 patch layout
// (breakpoints, exported sizes and steps), the patch surface and its fit, and
// the single-precision evaluation of the correction.

#include <cmath>
#include <cstdint>
#include <limits>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "lsc/bernstein.h"
#include "lsc/bernstein_surface.h"
#include "lsc/eval_patch.h"
#include "lsc/linear_least_squares.h"
#include "lsc/patch_geometry.h"
#include "lsc/patch_surface.h"
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

TEST(PatchGeometry, BreakpointsSizesAndWhetherEveryPatchHasPixels) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const struct {
        std::uint32_t width, height;
        double left, center, top, middle;
        std::uint32_t x1, x2, y1, y2;
        bool usable;
    } cases[] = {
        {1001, 1001, 0.25, 0.5, 0.25, 0.5, 250, 751, 250, 751,
         true}, // left truncates, centre rounds
        {64, 48, 0.25, 0.5, 0.25, 0.5, 16, 48, 12, 36, true},
        {64, 48, 0.0, 0.5, 0.25, 0.5, 0, 32, 12, 36, false},
        {64, 48, 0.25, 0.0, 0.25, 0.5, 16, 16, 12, 36, false},
        {64, 48, 0.5, 0.5, 0.25, 0.5, 32, 64, 12, 36, false},
        {64, 48, 0.25, 0.5, 0.25, 0.75, 16, 48, 12, 48, false},
        {3, 48, 0.25, 0.5, 0.25, 0.5, 0, 2, 12, 36, false},
        {100, 100, -0.5, 1e30, nan, 0.5, 0, 0xffffffffu, 0, 50, false}, // stays within range
    };
    for (const auto& c : cases) {
        const PatchBreakpoints b =
            patchBreakpoints(c.width, c.height, c.left, c.center, c.top, c.middle);
        EXPECT_EQ(b.x[1], c.x1) << c.width << " " << c.left << " " << c.center;
        EXPECT_EQ(b.x[2], c.x2) << c.width << " " << c.left << " " << c.center;
        EXPECT_EQ(b.x[3], c.width);
        EXPECT_EQ(b.y[1], c.y1) << c.height << " " << c.top;
        if (c.top == c.top) {
            EXPECT_EQ(b.y[2], c.y2) << c.height << " " << c.top << " " << c.middle;
        }
        EXPECT_EQ(patchGeometryUsable(b), c.usable) << c.width << " " << c.left << " " << c.center;
    }
    EXPECT_EQ(lsc_test::runtimeError([] { usablePatchBreakpoints(64, 48, 0.6, 0.5, 0.25, 0.5); }),
              "Patch geometry leaves a patch without pixels: the patch factors (or patch sizes) "
              "must give left and top patches of at least one pixel and leave room for the right "
              "and bottom patches.");
    // Exported: the outer patches round, the centre truncates.
    const ExportedPatchSizes s = exportedPatchSizes(1001, 801, 0.25, 0.5, 0.25, 0.5);
    const std::int64_t sizes[6] = {s.left, s.center, s.right, s.top, s.middle, s.bottom};
    const std::int64_t expected[6] = {250, 500, 251, 200, 400, 201};
    for (int i = 0; i < 6; ++i)
        EXPECT_EQ(sizes[i], expected[i]) << i;
}

TEST(PatchStep, EncodesFourTimesTwoOverSizeInFixedPoint) {
    const struct {
        std::int64_t size;
        std::uint32_t msb, lsb;
    } cases[] = {{250, 0, 0x83126e9u},
                 {16, 0, 0x80000000u},
                 {3, 2, 0xaaaaaaaau},
                 {2, 4, 0},
                 {1, 0, 0}, // step 8 does not fit the 3-bit integer field and wraps
                 {0, 0, 0},
                 {-1, 0, 0},
                 {-250, 0, 0}};
    for (const auto& c : cases) {
        EXPECT_EQ(patchStep(c.size).msb, c.msb) << c.size;
        EXPECT_EQ(patchStep(c.size).lsb, c.lsb) << c.size;
    }
}

const std::vector<double> kXBreaks = {0, 250, 750, 1000};
const std::vector<double> kYBreaks = {0, 200, 600, 800};

double plane(double x, double y) {
    return 1.0 + 0.002 * x - 0.001 * y;
}

// Value of a fitted surface at (x, y), in double precision.
double surfaceValue(const patchSurface& s, double x, double y) {
    std::ostringstream ignored;
    const PatchIndex at = findPatch(s, x, y, ignored);
    const surfacePatch& p = s.patch(at.row, at.column);
    double sum = 0;
    for (int r = 0; r < 4; ++r)
        for (int c = 0; c < 4; ++c)
            sum +=
                p.controlPoints(r, c) * bernstein(r, 3, p.localV(y)) * bernstein(c, 3, p.localU(x));
    return sum;
}

TEST(PatchSurface, SharesEachGlobalPointWithEveryPatchThatHoldsIt) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    EXPECT_EQ(s.globalRows() * s.globalColumns(), 100u);
    const surfacePatch& p = s.patch(1, 2);
    EXPECT_EQ(p.x0 + p.x1 + p.y0 + p.y1, 750 + 1000 + 200 + 600);
    EXPECT_EQ(p.localU(875), 0.5);
    EXPECT_EQ(p.localV(300), 0.25);
    s.setGlobal(3, 3, 7.0);
    s.setGlobal(6, 1, 5.0);
    const struct {
        std::uint32_t row, column, r, c;
        double value;
    } held[] = {{0, 0, 3, 3, 7}, {0, 1, 3, 0, 7}, {1, 0, 0, 3, 7},
                {1, 1, 0, 0, 7}, {1, 0, 3, 1, 5}, {2, 0, 0, 1, 5}};
    for (const auto& h : held)
        EXPECT_EQ(s.patch(h.row, h.column).controlPoints(h.r, h.c), h.value) << h.row << h.column;
    for (std::uint32_t i = 0; i < 100; ++i)
        s.setGlobal(i / 10, i % 10, i + 0.25);
    float grid[100];
    s.copyToGrid(grid);
    for (int i = 0; i < 100; ++i)
        EXPECT_EQ(grid[i], static_cast<float>(i) + 0.25f) << i;
    EXPECT_EQ(s.patch(2, 2).controlPoints(3, 3), 99.25);
    EXPECT_THROW(patchSurface(3, 3, {0, 1, 2}, kYBreaks), std::invalid_argument);
    EXPECT_THROW(patchSurface(0, 3, {0}, kYBreaks), std::invalid_argument);
}

TEST(PatchSurface, FitReproducesAPlaneFromValuesOrValuesAndSlopes) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    for (double x = 0; x < 1000; x += 37)
        for (double y = 0; y < 800; y += 29)
            s.addValueConstraint(x, y, plane(x, y));
    std::ostringstream messages;
    s.fit(1e-10, messages);
    EXPECT_EQ(messages.str(), "");
    for (double x : {0.0, 249.0, 250.0, 251.0, 999.0})
        for (double y : {0.0, 199.0, 200.0, 601.0, 799.0})
            EXPECT_NEAR(surfaceValue(s, x, y), plane(x, y), 1e-9) << x << "," << y;
    EXPECT_NEAR(s.global(0, 1), plane(250.0 / 3, 0), 1e-9); // at thirds of each patch

    patchSurface sparse(3, 3, kXBreaks, kYBreaks);
    for (double x = 0; x < 1000; x += 111)
        for (double y = 0; y < 800; y += 89)
            sparse.addValueConstraint(x, y, plane(x, y));
    EXPECT_EQ(lsc_test::caught([&] { sparse.fit(1e-10, messages); }).code(), 220); // 81 values
    for (double x = 20; x < 1000; x += 111)
        for (double y = 15; y < 800; y += 89) {
            sparse.addXDerivativeConstraint(x, y, 0.002);
            sparse.addYDerivativeConstraint(x, y, -0.001);
        }
    sparse.fit(1e-10, messages);
    EXPECT_NEAR(surfaceValue(sparse, 500, 400), plane(500, 400), 1e-9);
    EXPECT_NEAR(surfaceValue(sparse, 10, 790), plane(10, 790), 1e-9);
}

TEST(FindPatch, BordersGoToTheLowerPatchAndOutsidePointsToTheNearest) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    const struct {
        double x, y;
        std::uint32_t row, column;
        const char* message;
    } cases[] = {{250, 100, 0, 0, ""},
                 {251, 600.5, 2, 1, ""},
                 {1000, 800, 2, 2, ""},
                 {1200, -3.5, 0, 2, "patch containing 1200,-3.5 not found.\n"},
                 {std::nan(""), 300, 1, 0, "patch containing nan,300 not found.\n"}};
    for (const auto& c : cases) {
        std::ostringstream messages;
        const PatchIndex at = findPatch(s, c.x, c.y, messages);
        EXPECT_EQ(at.row, c.row) << c.x << "," << c.y;
        EXPECT_EQ(at.column, c.column) << c.x << "," << c.y;
        EXPECT_EQ(messages.str(), c.message);
    }
}

TEST(EvalPatch, BothPathsGiveTheBernsteinSurfaceAndHitTheCorners) {
    float grid[100];
    for (int i = 0; i < 100; ++i)
        grid[i] = 0.3f + 0.137f * static_cast<float>((i * 53) % 17);
    // Values of the cubic Bernstein surface over each patch's 4 x 4 points.
    const struct {
        std::uint32_t patch;
        float u, v, value;
    } cases[] = {{0, 0.013f, 0.25f, 0.6189360f}, {0, 0.37f, 0.61f, 1.3562700f},
                 {0, 0.999f, 1.0f, 2.3541772f},  {4, 0.013f, 0.25f, 1.2896595f},
                 {4, 0.37f, 0.61f, 1.1168151f},  {4, 0.999f, 1.0f, 2.0801778f},
                 {8, 0.013f, 0.25f, 1.9977126f}, {8, 0.37f, 0.61f, 1.0657756f},
                 {8, 0.999f, 1.0f, 1.8061776f}};
    for (const auto& c : cases) {
        const std::uint32_t start = patchStart(c.patch / 3, c.patch % 3);
        const float value = evalPatch(grid, start, c.u, c.v);
        EXPECT_NEAR(value, c.value, 2e-6f) << c.patch << ": " << c.u << ", " << c.v;
        float weights[4];
        cubicWeights(c.v, weights);
        EXPECT_EQ(
            evalPatchCubics(patchCubics(grid, start), c.u, c.u * c.u, c.u * c.u * c.u, weights),
            value);
        EXPECT_FLOAT_EQ(evalPatch(grid, start, 0.0f, 0.0f), grid[start]);
        EXPECT_FLOAT_EQ(evalPatch(grid, start, 1.0f, 1.0f), grid[start + 33]);
    }
    EXPECT_EQ(patchStart(2, 1), 63u);
}

} // namespace
} // namespace lsc
