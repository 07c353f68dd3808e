#include <cmath>
#include <sstream>
#include <vector>

#include <gtest/gtest.h>

#include "caught_exception.h"
#include "lsc/apan_exception.h"
#include "lsc/bernstein.h"
#include "lsc/eval_patch.h"
#include "lsc/patch_surface.h"

namespace lsc {
namespace {

const std::vector<double> kXBreaks = {0, 250, 750, 1000};
const std::vector<double> kYBreaks = {0, 200, 600, 800};

double plane(double x, double y) {
    return 1.0 + 0.002 * x - 0.001 * y;
}

// Value of a fitted surface at (x, y), evaluated in double precision.
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

TEST(PatchSurface, BuildsTheGlobalGridFromThePatchGrid) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    EXPECT_EQ(s.globalRows(), 10u);
    EXPECT_EQ(s.globalColumns(), 10u);
    const surfacePatch& p = s.patch(1, 2);
    EXPECT_EQ(p.x0, 750);
    EXPECT_EQ(p.x1, 1000);
    EXPECT_EQ(p.y0, 200);
    EXPECT_EQ(p.y1, 600);
    EXPECT_EQ(p.inverseWidth, 1.0 / 250);
    EXPECT_EQ(p.inverseHeight, 1.0 / 400);
    EXPECT_EQ(p.localU(875), 0.5);
}

TEST(PatchSurface, RefusesBreakpointListsOfTheWrongLength) {
    EXPECT_THROW(patchSurface(3, 3, {0, 1, 2}, kYBreaks), std::invalid_argument);
    EXPECT_THROW(patchSurface(0, 3, {0}, kYBreaks), std::invalid_argument);
}

TEST(PatchSurface, SharedGlobalPointIsWrittenIntoEveryPatchThatHoldsIt) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    s.setGlobal(3, 3, 7.0);
    EXPECT_EQ(s.patch(0, 0).controlPoints(3, 3), 7.0);
    EXPECT_EQ(s.patch(0, 1).controlPoints(3, 0), 7.0);
    EXPECT_EQ(s.patch(1, 0).controlPoints(0, 3), 7.0);
    EXPECT_EQ(s.patch(1, 1).controlPoints(0, 0), 7.0);
    s.setGlobal(6, 1, 5.0);
    EXPECT_EQ(s.patch(1, 0).controlPoints(3, 1), 5.0);
    EXPECT_EQ(s.patch(2, 0).controlPoints(0, 1), 5.0);
    s.setGlobal(9, 9, 4.0);
    EXPECT_EQ(s.patch(2, 2).controlPoints(3, 3), 4.0);
    EXPECT_EQ(s.global(9, 9), 4.0);
}

TEST(PatchSurface, CopyToGridWritesEveryGlobalPointOnce) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    for (std::uint32_t r = 0; r < 10; ++r)
        for (std::uint32_t c = 0; c < 10; ++c)
            s.setGlobal(r, c, r * 10 + c + 0.25);
    float grid[100];
    s.copyToGrid(grid);
    for (int i = 0; i < 100; ++i)
        EXPECT_EQ(grid[i], static_cast<float>(i) + 0.25f) << i;
}

TEST(PatchSurface, FitReproducesAPlaneExactly) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    for (double x = 0; x < 1000; x += 37)
        for (double y = 0; y < 800; y += 29)
            s.addValueConstraint(x, y, plane(x, y));
    std::ostringstream messages;
    s.fit(1e-10, messages);
    EXPECT_EQ(messages.str(), "");
    for (double x : {0.0, 249.0, 250.0, 251.0, 600.0, 999.0})
        for (double y : {0.0, 199.0, 200.0, 601.0, 799.0})
            EXPECT_NEAR(surfaceValue(s, x, y), plane(x, y), 1e-9) << x << "," << y;
    // A plane's control points sit on the plane at thirds of each patch.
    EXPECT_NEAR(s.global(0, 1), plane(250.0 / 3, 0), 1e-9);
}

TEST(PatchSurface, SlopeConstraintsCountAsEquations) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    for (double x = 0; x < 1000; x += 111)
        for (double y = 0; y < 800; y += 89)
            s.addValueConstraint(x, y, plane(x, y));
    ASSERT_THROW(s.fit(1e-10, std::cout), apan::exception); // 81 values: too few
    for (double x = 20; x < 1000; x += 111)
        for (double y = 15; y < 800; y += 89) {
            s.addXDerivativeConstraint(x, y, 0.002);
            s.addYDerivativeConstraint(x, y, -0.001);
        }
    s.fit(1e-10, std::cout);
    EXPECT_NEAR(surfaceValue(s, 500, 400), plane(500, 400), 1e-9);
    EXPECT_NEAR(surfaceValue(s, 10, 790), plane(10, 790), 1e-9);
}

TEST(PatchSurface, FewerConstraintsThanControlPointsThrow220) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    for (int i = 0; i < 99; ++i)
        s.addValueConstraint(i * 10.0, i * 8.0, 1.0);
    const apan::exception e = lsc_test::caught([&] { s.fit(1e-10, std::cout); });
    EXPECT_EQ(e.code(), 220);
    EXPECT_STREQ(e.what(), "Under constrained fit being attempted. You must specify at least as "
                           "many sample points as control points.");
}

TEST(FindPatch, PointsOnABorderBelongToTheLowerIndexedPatch) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    std::ostringstream messages;
    const PatchIndex onLeftBorder = findPatch(s, 250, 100, messages);
    EXPECT_EQ(onLeftBorder.row, 0u);
    EXPECT_EQ(onLeftBorder.column, 0u);
    const PatchIndex inside = findPatch(s, 251, 600.5, messages);
    EXPECT_EQ(inside.row, 2u);
    EXPECT_EQ(inside.column, 1u);
    const PatchIndex corner = findPatch(s, 1000, 800, messages);
    EXPECT_EQ(corner.row, 2u);
    EXPECT_EQ(corner.column, 2u);
    EXPECT_EQ(messages.str(), "");
}

TEST(FindPatch, PointOutsideEveryPatchIsReportedAndGetsTheNearestPatch) {
    patchSurface s(3, 3, kXBreaks, kYBreaks);
    std::ostringstream messages;
    const PatchIndex beyond = findPatch(s, 1200, -3.5, messages);
    EXPECT_EQ(messages.str(), "patch containing 1200,-3.5 not found.\n");
    EXPECT_EQ(beyond.row, 0u);
    EXPECT_EQ(beyond.column, 2u);

    const PatchIndex notANumber = findPatch(s, std::nan(""), 300, messages);
    EXPECT_EQ(notANumber.row, 1u);
    EXPECT_EQ(notANumber.column, 0u);
}

TEST(EvalPatch, ConstantGridGivesTheConstant) {
    float grid[100];
    for (float& g : grid)
        g = 1.0f;
    for (float u : {0.0f, 0.3f, 1.0f})
        for (float v : {0.0f, 0.7f, 1.0f})
            EXPECT_NEAR(evalPatch(grid, patchStart(1, 2), u, v), 1.0f, 1e-6f);
}

TEST(EvalPatch, AgreesWithTheBernsteinFormAndHitsTheCorners) {
    float grid[100];
    for (int i = 0; i < 100; ++i)
        grid[i] = 0.5f + 0.01f * static_cast<float>((i * 37) % 23);
    const std::uint32_t start = patchStart(2, 1);
    EXPECT_EQ(start, 63u);
    EXPECT_FLOAT_EQ(evalPatch(grid, start, 0.0f, 0.0f), grid[63]);
    EXPECT_FLOAT_EQ(evalPatch(grid, start, 1.0f, 1.0f), grid[63 + 33]);
    for (double u : {0.1, 0.5, 0.8})
        for (double v : {0.2, 0.6, 0.95}) {
            double expected = 0;
            for (int r = 0; r < 4; ++r)
                for (int c = 0; c < 4; ++c)
                    expected += grid[start + r * 10 + c] * bernstein(r, 3, v) * bernstein(c, 3, u);
            EXPECT_NEAR(evalPatch(grid, start, static_cast<float>(u), static_cast<float>(v)),
                        expected, 1e-5);
        }
}

// The documented single-precision form, written out term by term.
float powerForm(const float* g, std::uint32_t start, float u, float v) {
    const float w = 1.0f - v;
    const float weights[4] = {w * w * w, 3.0f * v * w * w, 3.0f * v * v * w, v * v * v};
    float sum = 0.0f;
    for (std::uint32_t r = 0; r < 4; ++r) {
        const float* p = g + start + r * 10;
        sum += weights[r] *
               (p[0] + 3.0f * (p[1] - p[0]) * u + 3.0f * (p[0] - 2.0f * p[1] + p[2]) * (u * u) +
                (p[3] - p[0] + 3.0f * p[1] - 3.0f * p[2]) * (u * u * u));
    }
    return sum;
}

TEST(EvalPatch, BothEvaluationPathsGiveTheBitsOfThePowerForm) {
    float grid[100];
    for (int i = 0; i < 100; ++i)
        grid[i] = 0.3f + 0.137f * static_cast<float>((i * 53) % 17);
    for (std::uint32_t patch = 0; patch < 9; ++patch) {
        const std::uint32_t start = patchStart(patch / 3, patch % 3);
        const PatchCubics cubics = patchCubics(grid, start);
        for (float u : {0.0f, 0.013f, 0.37f, 0.999f})
            for (float v : {0.0f, 0.25f, 0.61f, 1.0f}) {
                const float expected = powerForm(grid, start, u, v);
                EXPECT_EQ(evalPatch(grid, start, u, v), expected);
                float weights[4];
                cubicWeights(v, weights);
                EXPECT_EQ(evalPatchCubics(cubics, u, u * u, u * u * u, weights), expected);
            }
    }
}

} // namespace
} // namespace lsc
