#include <initializer_list>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "caught_exception.h"
#include "lsc/apan_exception.h"
#include "lsc/dense_matrix.h"
#include "lsc/linear_system.h"

namespace lsc {

using apan::denseMatrix;
namespace {

using lsc_test::caught;

denseMatrix matrixOf(std::uint32_t rows, std::uint32_t columns,
                     std::initializer_list<double> values) {
    denseMatrix m(rows, columns);
    std::size_t i = 0;
    for (double v : values)
        m[i++] = v;
    return m;
}

TEST(DenseMatrix, StartsZeroedAndIndexesRowMajor) {
    denseMatrix m(2, 3);
    EXPECT_EQ(m.rows(), 2u);
    EXPECT_EQ(m.columns(), 3u);
    for (std::size_t i = 0; i < m.size(); ++i)
        EXPECT_EQ(m[i], 0.0);
    m(1, 2) = 7.0;
    EXPECT_EQ(m[5], 7.0);
}

TEST(DenseMatrix, RefusesAnUnaddressableSize) {
    EXPECT_THROW(denseMatrix(0xffffffffu, 0xffffffffu), std::bad_alloc);
}

TEST(LinearSystem, SolvesTheSelfTestSystem) {
    denseMatrix a(3, 3), x(3, 1), b(3, 1);
    apan::linearSystem<double> system(&a, &x, &b);
    EXPECT_NO_THROW(system.selfTest());
    EXPECT_NEAR(x[0], 2.0, 1e-12);
    EXPECT_NEAR(x[1], 1.0, 1e-12);
    EXPECT_NEAR(x[2], -1.0, 1e-12);
}

TEST(LinearSystem, SelfTestReportsAWrongAnswerAsCode1) {
    struct Broken : apan::linearSystem<double> {
        using apan::linearSystem<double>::linearSystem;
        void solve(double) override { (*x_)[0] = 2.1; }
    };
    denseMatrix a(3, 3), x(3, 1), b(3, 1);
    Broken system(&a, &x, &b);
    const apan::exception e = caught([&] { system.selfTest(); });
    EXPECT_EQ(e.code(), 1);
    EXPECT_STREQ(e.what(), "The linear system solver failed.");
    EXPECT_EQ(e.hint(), "Selftest failure.");
}

TEST(LinearSystem, SelfTestRefusesStorageOfAnotherSize) {
    denseMatrix a(4, 4), x(4, 1), b(4, 1);
    apan::linearSystem<double> system(&a, &x, &b);
    EXPECT_THROW(system.selfTest(), std::invalid_argument);
}

TEST(LinearSystem, ZeroPivotSwapsWithTheFirstUsableRowNotTheLargest) {
    denseMatrix a = matrixOf(3, 3, {0, 1, 1, 1, 2, 3, 4, 1, 1});
    denseMatrix b = matrixOf(3, 1, {2, 6, 6});
    denseMatrix x(3, 1);
    apan::linearSystem<double>(&a, &x, &b).solve(1e-7);
    // Row 1 (leading 1) became the normalised first row; row 2 (leading 4) would give 0.25.
    EXPECT_EQ(a(0, 1), 2.0);
    EXPECT_EQ(a(0, 2), 3.0);
    EXPECT_NEAR(x[0], 1.0, 1e-12);
    EXPECT_NEAR(x[1], 1.0, 1e-12);
    EXPECT_NEAR(x[2], 1.0, 1e-12);
}

TEST(LinearSystem, RowsWithALeadWithinTheToleranceAreLeftUntouched) {
    denseMatrix a = matrixOf(2, 2, {1, 1, 0.25, 1});
    denseMatrix b = matrixOf(2, 1, {2, 1.25});
    denseMatrix x(2, 1);
    apan::linearSystem<double>(&a, &x, &b).solve(0.5);
    EXPECT_EQ(a(1, 0), 0.25);
    EXPECT_EQ(x[1], 1.25);
    EXPECT_EQ(x[0], 0.75);
}

TEST(LinearSystem, SingularLastPivotThrows231) {
    denseMatrix a = matrixOf(3, 3, {2, 1, 1, 1, 3, 2, 3, 4, 3}); // row 2 = row 0 + row 1
    denseMatrix b = matrixOf(3, 1, {1, 2, 3});
    denseMatrix x(3, 1);
    apan::linearSystem<double> system(&a, &x, &b);
    const apan::exception e = caught([&] { system.solve(1e-7); });
    EXPECT_EQ(e.code(), 231);
    EXPECT_STREQ(e.what(), "Singular or undetermined linear system.");
    EXPECT_EQ(e.hint(), "Usually the rows or columns are not linear independent.");
}

TEST(LinearSystem, NonSquareMatrixThrows231) {
    denseMatrix a(3, 2), x(2, 1), b(3, 1);
    apan::linearSystem<double> system(&a, &x, &b);
    const apan::exception e = caught([&] { system.solve(1e-7); });
    EXPECT_EQ(e.code(), 231);
    EXPECT_STREQ(e.what(), "You can only solve linear system if the 'A' matrix is square.");
    EXPECT_EQ(e.hint(),
              "You need as many constraints as equations our the system can't be solved.");
}

TEST(LinearSystem, RefusesVectorsThatDoNotFitTheMatrix) {
    denseMatrix a = matrixOf(2, 2, {1, 0, 0, 1});
    denseMatrix shortX(1, 1), b(2, 1), longB(3, 1), x(2, 1);
    EXPECT_THROW(apan::linearSystem<double>(&a, &shortX, &b).solve(1e-7), std::invalid_argument);
    EXPECT_THROW(apan::linearSystem<double>(&a, &x, &longB).solve(1e-7), std::invalid_argument);
    EXPECT_THROW(apan::linearSystem<double>(&a, nullptr, &b).solve(1e-7), std::invalid_argument);
}

TEST(LinearSystem, ZeroToleranceNeverDividesByAZeroPivot) {
    denseMatrix a = matrixOf(2, 2, {0, 1, 1, 0});
    denseMatrix b = matrixOf(2, 1, {3, 4});
    denseMatrix x(2, 1);
    apan::linearSystem<double>(&a, &x, &b).solve(0.0);
    EXPECT_EQ(x[0], 4.0);
    EXPECT_EQ(x[1], 3.0);

    denseMatrix s = matrixOf(2, 2, {1, 1, 1, 1});
    denseMatrix c = matrixOf(2, 1, {1, 1});
    EXPECT_EQ(caught([&] { apan::linearSystem<double>(&s, &x, &c).solve(0.0); }).code(), 231);
}

} // namespace
} // namespace lsc
