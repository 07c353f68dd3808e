#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <random>
#include <stdexcept>
#include <vector>

#include <gtest/gtest.h>

#include "caught_exception.h"
#include "lsc/apan_exception.h"
#include "lsc/dense_matrix.h"
#include "lsc/linear_least_squares.h"

namespace lsc {

using apan::denseMatrix;
namespace {

using lsc_test::caught;

// Least squares through the normal equations AᵀA x = Aᵀb, in long double with
// partial pivoting: an independent reference for well-conditioned problems.
std::vector<long double> normalEquations(const denseMatrix& a, const denseMatrix& b) {
    const std::uint32_t m = a.rows(), n = a.columns();
    std::vector<long double> g(n * (n + 1), 0.0L);
    for (std::uint32_t i = 0; i < n; ++i) {
        for (std::uint32_t j = 0; j < n; ++j)
            for (std::uint32_t r = 0; r < m; ++r)
                g[i * (n + 1) + j] += static_cast<long double>(a(r, i)) * a(r, j);
        for (std::uint32_t r = 0; r < m; ++r)
            g[i * (n + 1) + n] += static_cast<long double>(a(r, i)) * b[r];
    }
    for (std::size_t k = 0; k < n; ++k) {
        std::size_t best = k;
        for (std::size_t i = k + 1; i < n; ++i)
            if (std::fabs(g[i * (n + 1) + k]) > std::fabs(g[best * (n + 1) + k]))
                best = i;
        for (std::size_t j = 0; j <= n; ++j)
            std::swap(g[k * (n + 1) + j], g[best * (n + 1) + j]);
        for (std::size_t i = k + 1; i < n; ++i) {
            const long double f = g[i * (n + 1) + k] / g[k * (n + 1) + k];
            for (std::size_t j = k; j <= n; ++j)
                g[i * (n + 1) + j] -= f * g[k * (n + 1) + j];
        }
    }
    std::vector<long double> x(n);
    for (std::size_t i = n; i-- > 0;) {
        long double s = g[i * (n + 1) + n];
        for (std::size_t j = i + 1; j < n; ++j)
            s -= g[i * (n + 1) + j] * x[j];
        x[i] = s / g[i * (n + 1) + i];
    }
    return x;
}

TEST(LinearLeastSquares, SelfTestTakesTheSquarePath) {
    denseMatrix a(3, 3), x(3, 1), b(3, 1);
    apan::linearLeastSquares<double> system(&a, &x, &b);
    apan::linearSystem<double>& base = system;
    EXPECT_NO_THROW(base.selfTest());
    EXPECT_NEAR(x[0], 2.0, 1e-12);
    EXPECT_NEAR(x[1], 1.0, 1e-12);
    EXPECT_NEAR(x[2], -1.0, 1e-12);
}

TEST(LinearLeastSquares, SquareProblemMatchesTheSquareSolveExactly) {
    const double values[] = {4, -2, 1, 3, 6, -4, 2, 1, 8};
    denseMatrix a1(3, 3), a2(3, 3), b1(3, 1), b2(3, 1), x1(3, 1), x2(3, 1);
    for (int i = 0; i < 9; ++i)
        a1[i] = a2[i] = values[i];
    for (int i = 0; i < 3; ++i)
        b1[i] = b2[i] = i + 1;
    apan::linearSystem<double>(&a1, &x1, &b1).solve(1e-7);
    apan::linearLeastSquares<double>(&a2, &x2, &b2).solve(1e-7);
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(x1[i], x2[i]);
}

TEST(LinearLeastSquares, AgreesWithTheNormalEquationsOnRandomSystems) {
    std::mt19937 random(12345);
    std::uniform_real_distribution<double> value(-1.0, 1.0);
    const std::uint32_t shapes[][2] = {{12, 3}, {40, 9}, {200, 25}, {600, 100}};
    for (const auto& shape : shapes) {
        const std::uint32_t m = shape[0], n = shape[1];
        denseMatrix a(m, n), b(m, 1), x(n, 1);
        for (std::size_t i = 0; i < a.size(); ++i)
            a[i] = value(random);
        for (std::uint32_t r = 0; r < m; ++r)
            b[r] = value(random);
        const std::vector<long double> expected = normalEquations(a, b);

        apan::linearLeastSquares<double>(&a, &x, &b).solve(1e-10);
        long double largest = 0;
        for (long double v : expected)
            largest = std::max(largest, std::fabs(v));
        for (std::uint32_t i = 0; i < n; ++i)
            EXPECT_NEAR(static_cast<double>(x[i]), static_cast<double>(expected[i]),
                        1e-9 * static_cast<double>(largest))
                << m << " x " << n << ", unknown " << i;
    }
}

TEST(LinearLeastSquares, IdenticalColumnsThrow230) {
    denseMatrix a(6, 3), x(3, 1), b(6, 1);
    for (std::uint32_t r = 0; r < 6; ++r) {
        a(r, 0) = r + 1.0;
        a(r, 1) = (r * r) % 5;
        a(r, 2) = r + 1.0;
        b[r] = r;
    }
    apan::linearLeastSquares<double> system(&a, &x, &b);
    const apan::exception e = caught([&] { system.solve(1e-10); });
    EXPECT_EQ(e.code(), 230);
    EXPECT_STREQ(e.what(), "Warning: trying to solve a rank deficient system");
    EXPECT_EQ(e.hint(), "Rank deficient matrices often occur whenyou have an ill-conditioned "
                        "system of linear equations.");
}

TEST(LinearLeastSquares, AZeroColumnIsRankDeficientNotNaN) {
    denseMatrix a(5, 2), x(2, 1), b(5, 1);
    for (std::uint32_t r = 0; r < 5; ++r) {
        a(r, 0) = r + 1.0;
        b[r] = 1.0;
    }
    EXPECT_EQ(caught([&] { apan::linearLeastSquares<double>(&a, &x, &b).solve(1e-10); }).code(),
              230);
}

TEST(LinearLeastSquares, UnderdeterminedProblemsAreRankDeficient) {
    denseMatrix a(2, 4), x(4, 1), b(2, 1);
    for (std::size_t i = 0; i < a.size(); ++i)
        a[i] = static_cast<double>(i * i + 1);
    b[0] = b[1] = 1.0;
    EXPECT_EQ(caught([&] { apan::linearLeastSquares<double>(&a, &x, &b).solve(1e-10); }).code(),
              230);
}

TEST(LinearLeastSquares, RefusesARightHandSideOfTheWrongLength) {
    denseMatrix a(5, 2), x(2, 1), b(4, 1);
    EXPECT_THROW(apan::linearLeastSquares<double>(&a, &x, &b).solve(1e-10), std::invalid_argument);
}

// Problems of the shape of the patch fit: rows of 16 products of cubic
// Bernstein weights in one of 3 x 3 patches of a 10 x 10 grid (or dense
// rows), values from a fixed integer generator so that every platform builds
// the same bits.
std::uint64_t solutionDigest(unsigned rows, unsigned columns, std::uint64_t seed, bool patchRows) {
    std::mt19937_64 generator(seed);
    auto unit = [&] { return static_cast<double>(generator() >> 11) * 0x1p-53; };
    denseMatrix a(rows, columns), b(rows, 1), x(columns, 1);
    for (unsigned r = 0; r < rows; ++r) {
        if (patchRows) {
            const double u = unit() * 3, v = unit() * 3;
            const unsigned px = std::min(2u, static_cast<unsigned>(u));
            const unsigned py = std::min(2u, static_cast<unsigned>(v));
            const double s = u - px, t = v - py;
            const double bu[4] = {(1 - s) * (1 - s) * (1 - s), 3 * s * (1 - s) * (1 - s),
                                  3 * s * s * (1 - s), s * s * s};
            const double bv[4] = {(1 - t) * (1 - t) * (1 - t), 3 * t * (1 - t) * (1 - t),
                                  3 * t * t * (1 - t), t * t * t};
            for (unsigned i = 0; i < 4; ++i)
                for (unsigned k = 0; k < 4; ++k)
                    a((r), (py * 3 + i) * 10 + px * 3 + k) = bv[i] * bu[k];
            b[r] = 1.0 + 0.3 * ((u - 1.5) * (u - 1.5) + (v - 1.5) * (v - 1.5)) + 0.01 * unit();
        } else {
            for (unsigned c = 0; c < columns; ++c)
                a(r, c) = unit() - 0.5;
            b[r] = unit();
        }
    }
    apan::linearLeastSquares<double>(&a, &x, &b).solve(1e-10);
    std::uint64_t digest = 14695981039346656037ull; // FNV-1a over the solution's bits
    for (unsigned c = 0; c < columns; ++c) {
        std::uint64_t bits;
        std::memcpy(&bits, &x[c], sizeof bits);
        for (int i = 0; i < 8; ++i) {
            digest ^= (bits >> (8 * i)) & 0xff;
            digest *= 1099511628211ull;
        }
    }
    return digest;
}

// The digests are those of the solver that walked the matrix a column at a
// time: the row-wise walk must keep every bit of every solution.
struct DigestCase {
    unsigned rows, columns;
    std::uint64_t seed;
    bool patchRows;
    std::uint64_t digest;
};

TEST(LinearLeastSquares, KeepsEveryBitOfTheColumnWalk) {
    const DigestCase cases[] = {
        {400, 100, 1, true, 0x99c506538941cc22ull},  {900, 100, 2, true, 0x5d833e53309bb4bfull},
        {3000, 100, 3, true, 0x86d02878d89d7e0dull}, {57, 13, 4, false, 0x073e4b2c04f1c01bull},
        {400, 31, 5, false, 0xb40f1054123b0d55ull},
    };
    for (const DigestCase& c : cases)
        EXPECT_EQ(solutionDigest(c.rows, c.columns, c.seed, c.patchRows), c.digest)
            << c.rows << " x " << c.columns << " seed " << c.seed;
}

} // namespace
} // namespace lsc
