#include "lsc/linear_least_squares.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <memory>
#include <utility>

#include "image/simd_clones.h"
#include "lsc/apan_exception.h"
#include "lsc/lsc_messages.h"

namespace apan {

namespace {

// The reflections walk the row-major matrix a row at a time. Every column's
// sums still add the rows in ascending order, so each number comes out as a
// walk down the columns gives it, but the matrix streams through the cache
// once per pass instead of once per column.

// The sums go through the rows in tiles that stay in the first-level cache;
// within a tile each group of columns keeps its running sums in registers.
// Each column's sum still takes its rows in ascending order.
constexpr std::size_t kTileRows = 32;
constexpr std::size_t kGroup = 8;

// sums[c] += A[r][j] * A[r][c] for rows r0..r1-1 and columns c0..n-1.
inline void addColumnTerms(const double* a, std::size_t n, std::size_t r0, std::size_t r1,
                           std::size_t j, std::size_t c0, double* sums) {
    std::size_t c = c0;
    for (; c + kGroup <= n; c += kGroup) {
        double acc[kGroup];
        for (std::size_t l = 0; l < kGroup; ++l)
            acc[l] = sums[c + l];
        for (std::size_t r = r0; r < r1; ++r) {
            const double* row = a + r * n;
            const double v = row[j];
            for (std::size_t l = 0; l < kGroup; ++l)
                acc[l] += v * row[c + l];
        }
        for (std::size_t l = 0; l < kGroup; ++l)
            sums[c + l] = acc[l];
    }
    for (std::size_t r = r0; r < r1; ++r) {
        const double* row = a + r * n;
        const double v = row[j];
        for (std::size_t cc = c; cc < n; ++cc)
            sums[cc] += v * row[cc];
    }
}

// Adds the squares of rows from..m-1, columns from..n-1, to `measure`.
LSC_VECTOR_CLONES void addSquares(const double* a, std::size_t n, std::size_t m, std::size_t from,
                                  double* measure) {
    for (std::size_t r = from; r < m; ++r) {
        const double* row = a + r * n;
        for (std::size_t c = from; c < n; ++c)
            measure[c] += row[c] * row[c];
    }
}

// The pivot choice of step j >= 1, first part: down-dates the measures of
// columns j..n-1 by row j-1 and returns the first column with the largest.
// `needsSquares` tells whether the sums of squares of rows j..m-1 must be
// added and the choice made again (not when the largest has turned negative).
std::size_t downdate(const double* a, std::size_t n, std::size_t j, double* measure,
                     bool* needsSquares) {
    const double* finished = a + (j - 1) * n;
    for (std::size_t c = j; c < n; ++c)
        measure[c] -= finished[c] * finished[c];
    std::size_t pivot = j;
    double largest = measure[j];
    for (std::size_t c = j + 1; c < n; ++c)
        if (measure[c] > largest) {
            largest = measure[c];
            pivot = c;
        }
    *needsSquares = !(largest < 0.001 * largest);
    return pivot;
}

// s[c] = v0 * A[j][c] + sum over r = j+1..m-1 of A[r][j] * A[r][c] for the
// columns c = j+1..n-1, and the same for b in s[n].
LSC_VECTOR_CLONES void reflectionSums(const double* a, const double* b, std::size_t n,
                                      std::size_t m, std::size_t j, double v0, double* s) {
    const double* top = a + j * n;
    for (std::size_t c = j + 1; c < n; ++c)
        s[c] = v0 * top[c];
    s[n] = v0 * b[j];
    for (std::size_t r0 = j + 1; r0 < m; r0 += kTileRows) {
        const std::size_t r1 = std::min(m, r0 + kTileRows);
        addColumnTerms(a, n, r0, r1, j, j + 1, s);
        for (std::size_t r = r0; r < r1; ++r)
            s[n] += a[r * n + j] * b[r];
    }
}

// Applies the reflection with factors f (b's at f[n]) to rows j+1..m-1 of
// columns j+1..n-1 and of b; v of a row is its entry in column j. When
// `squares` is given, the next step's pivot choice has started: the squares
// of the reflected rows are added to it, and the largest magnitude of each
// column over those rows is kept in `largest`.
LSC_VECTOR_CLONES void reflectBelow(double* a, double* b, std::size_t n, std::size_t m,
                                    std::size_t j, const double* f, double* squares,
                                    double* largest) {
    for (std::size_t r0 = j + 1; r0 < m; r0 += kTileRows) {
        const std::size_t r1 = std::min(m, r0 + kTileRows);
        for (std::size_t r = r0; r < r1; ++r) {
            double* row = a + r * n;
            const double v = row[j];
            for (std::size_t c = j + 1; c < n; ++c)
                row[c] += f[c] * v;
            b[r] += f[n] * v;
            if (squares)
                for (std::size_t c = j + 1; c < n; ++c) {
                    squares[c] += row[c] * row[c];
                    const double magnitude = std::fabs(row[c]);
                    largest[c] = largest[c] < magnitude ? magnitude : largest[c];
                }
        }
    }
}

} // namespace

template <typename Real> void linearLeastSquares<Real>::solve(Real tolerance) {
    if (this->a_ && this->a_->rows() == this->a_->columns()) {
        linearSystem<Real>::solve(tolerance);
        return;
    }
    this->checkShapes();

    const std::size_t m = this->a_->rows();
    const std::size_t n = this->a_->columns();
    const std::size_t k = std::min(m, n);
    double* a = this->a_->data();
    double* b = this->b_->data();
    double* x = this->x_->data();

    // The only temporaries: released on every way out, exceptions included.
    std::unique_ptr<unsigned[]> permutation(new unsigned[k]());
    // Column measures, then v0 of each step.
    std::unique_ptr<double[]> work(new double[n]);
    // The reflection's sums, then its factors: columns at their index, b at n.
    std::unique_ptr<double[]> factors(new double[n + 1]);
    // Largest magnitude of each column below the next diagonal, kept by a
    // reflection that passes the rows anyway.
    std::unique_ptr<double[]> largest(new double[n]);

    // The pivot choice of step j when the previous reflection already made
    // its first part (and added the squares it asked for) while it passed.
    bool chosen = false;
    bool haveLargest = false;
    std::size_t candidate = 0;
    bool needsSquares = false;
    for (std::size_t j = 0; j < k; ++j) {
        std::size_t pivot = j;
        if (j == 0) {
            std::fill(work.get(), work.get() + n, 0.0);
            addSquares(a, n, m, 0, work.get());
            double largestMeasure = 0.0;
            for (std::size_t c = 0; c < n; ++c)
                if (work[c] > largestMeasure) {
                    largestMeasure = work[c];
                    pivot = c;
                }
        } else {
            // Down-date the measures by the row just finished; only when the
            // largest has turned negative is it taken as it is. Otherwise the
            // remaining sums of squares are added on top and the choice made
            // again.
            if (!chosen) {
                candidate = downdate(a, n, j, work.get(), &needsSquares);
                if (needsSquares)
                    addSquares(a, n, m, j, work.get());
            }
            pivot = candidate;
            if (needsSquares)
                for (std::size_t c = j; c < n; ++c)
                    if (work[c] > work[pivot])
                        pivot = c;
        }
        chosen = false;

        permutation[j] = static_cast<unsigned>(pivot);
        if (pivot != j) {
            work[pivot] = work[j];
            for (std::size_t r = 0; r < j; ++r)
                std::swap(a[r * n + j], a[r * n + pivot]);
        }

        const double diagonal = a[j * n + pivot];
        double alpha;
        if (j + 1 < m) {
            // The scale is the largest magnitude in the column from the
            // diagonal down: taken from the last reflection when it kept it.
            double scale = 0.0;
            if (haveLargest)
                scale = largest[pivot];
            else
                for (std::size_t r = j; r < m; ++r)
                    scale = std::max(scale, std::fabs(a[r * n + pivot]));
            // One pass down the column moves it into place and adds the
            // squares; an all-zero column has no reflection (and no scale to
            // divide by).
            double sum = 0.0;
            for (std::size_t r = j; r < m; ++r) {
                double* row = a + r * n;
                if (pivot != j)
                    std::swap(row[j], row[pivot]);
                if (scale > 0.0) {
                    const double scaled = row[j] / scale;
                    sum += scaled * scaled;
                }
            }
            const double sigma = scale * std::sqrt(sum);
            alpha = diagonal > 0 ? -sigma : sigma;
        } else {
            if (pivot != j)
                std::swap(a[j * n + j], a[j * n + pivot]);
            alpha = diagonal > 0 ? -diagonal : diagonal;
        }
        haveLargest = false;
        const double v0 = diagonal - alpha;
        work[j] = v0;
        a[j * n + j] = alpha;

        const double d = v0 * alpha;
        if (d == 0.0)
            continue;
        // Reflect columns j+1..n-1 and b: T += (s / d) * v, v = (v0, A[j+1..m-1][j]).
        double* f = factors.get();
        reflectionSums(a, b, n, m, j, v0, f);
        for (std::size_t c = j + 1; c <= n; ++c)
            f[c] = f[c] / d;
        for (std::size_t c = j + 1; c < n; ++c)
            a[j * n + c] += f[c] * v0;
        b[j] += f[n] * v0;
        // Row j is final: the next step's pivot choice starts here, and the
        // squares it may need are added as the rows below are reflected.
        double* squares = nullptr;
        if (j + 1 < k) {
            candidate = downdate(a, n, j + 1, work.get(), &needsSquares);
            chosen = true;
            if (needsSquares) {
                squares = work.get();
                std::fill(largest.get(), largest.get() + n, 0.0);
                haveLargest = true;
            }
        }
        reflectBelow(a, b, n, m, j, f, squares, largest.get());
    }

    std::size_t rank = 1;
    for (std::size_t i = 0; i < k; ++i)
        if (std::fabs(a[i * n + i]) > tolerance)
            rank = i + 1;
    if (n > rank)
        throw exception(230, lsc::msg::kRankDeficient, lsc::msg::kRankDeficientHint);

    for (std::size_t i = rank; i-- > 0;) {
        const double diagonal = a[i * n + i];
        // A zero inside R (a later diagonal passing the test) still means the
        // columns are dependent; dividing by it would return infinities.
        if (diagonal == 0.0)
            throw exception(230, lsc::msg::kRankDeficient, lsc::msg::kRankDeficientHint);
        double sum = b[i];
        for (std::size_t l = i + 1; l < rank; ++l)
            sum -= a[i * n + l] * x[l];
        x[i] = sum / diagonal;
    }

    for (std::size_t j = k; j-- > 0;)
        if (permutation[j] != j)
            std::swap(x[j], x[permutation[j]]);
}

template class linearLeastSquares<double>;

} // namespace apan
