#include <cmath>

#include <gtest/gtest.h>

#include "lsc/xtest_surface.h"

namespace lsc {
namespace {

class XTestSurface : public ::testing::Test {
protected:
    void SetUp() override { applyXTestSurface(correction); }
    const float* red() const { return correction.controlGrids[0]; }
    const float* green() const { return correction.controlGrids[1]; }
    ShadingCorrection correction;
};

TEST_F(XTestSurface, RedEqualsBlueAndTheGreensAreEqual) {
    for (int i = 0; i < 100; ++i) {
        EXPECT_EQ(correction.controlGrids[3][i], red()[i]) << i;
        EXPECT_EQ(correction.controlGrids[2][i], green()[i]) << i;
    }
}

TEST_F(XTestSurface, RedPlusGreenIsOneEverywhere) {
    for (int i = 0; i < 100; ++i)
        EXPECT_EQ(red()[i] + green()[i], 1.0f) << i;
}

TEST_F(XTestSurface, ValuesAreMultiplesOf4096thsWithinTheRange) {
    for (int k = 0; k < 4; ++k)
        for (int i = 0; i < 100; ++i) {
            const float v = correction.controlGrids[k][i];
            EXPECT_EQ(v * 4096.0f, std::round(v * 4096.0f)) << k << ", " << i;
            EXPECT_GE(v, -3.2775879f);
            EXPECT_LE(v, 4.2775879f);
        }
}

TEST_F(XTestSurface, LargeValuesAlternateOnlyInTheGroupsNextToTheCorners) {
    auto inGroup = [](int i) { return i == 1 || i == 2 || i == 7 || i == 8; };
    for (int k = 0; k < 4; ++k)
        for (int row = 0; row < 10; ++row)
            for (int column = 0; column < 10; ++column) {
                const float v = correction.controlGrids[k][row * 10 + column];
                if (!inGroup(row) || !inGroup(column)) {
                    EXPECT_LE(std::fabs(v), 2.0f) << k << ": " << row << ", " << column;
                    continue;
                }
                EXPECT_GT(std::fabs(v), 2.0f) << k << ": " << row << ", " << column;
                // Horizontal and vertical neighbours inside a group have opposite signs.
                if (column == 1 || column == 7) {
                    EXPECT_LT(v * correction.controlGrids[k][row * 10 + column + 1], 0.0f);
                }
                if (row == 1 || row == 7) {
                    EXPECT_LT(v * correction.controlGrids[k][(row + 1) * 10 + column], 0.0f);
                }
            }
}

TEST_F(XTestSurface, FirstRowsAreTheEstablishedOnes) {
    const float expectedRed[10] = {-0.0002441406f, 1.322754f,  0.3754883f, 0.6831055f, 0.6645508f,
                                   0.651123f,      0.6896973f, 0.3291016f, 1.413818f,  -0.1052246f};
    const float expectedGreen[10] = {1.000244f, -0.3227539f, 0.6245117f, 0.3168945f,  0.3354492f,
                                     0.348877f, 0.3103027f,  0.6708984f, -0.4138184f, 1.105225f};
    for (int i = 0; i < 10; ++i) {
        EXPECT_NEAR(red()[i], expectedRed[i], 1e-6f) << i;
        EXPECT_NEAR(green()[i], expectedGreen[i], 1e-6f) << i;
    }
}

} // namespace
} // namespace lsc
