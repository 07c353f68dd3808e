#include "lsc/linear_least_squares.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <memory>
#include <utility>

#include "lsc/apan_exception.h"
#include "lsc/lsc_messages.h"

namespace apan {

namespace {

// Applies the Householder reflection of column j (v = (v0, A[j+1..m-1][j]))
// to one column t of stride `stride`, rows j..m-1. d = v0 * alpha != 0.
void reflect(const double* a, std::size_t n, std::size_t m, std::size_t j, double v0, double d,
             double* t, std::size_t stride) {
    double s = v0 * t[j * stride];
    for (std::size_t r = j + 1; r < m; ++r)
        s += a[r * n + j] * t[r * stride];
    const double f = s / d;
    t[j * stride] += f * v0;
    for (std::size_t r = j + 1; r < m; ++r)
        t[r * stride] += f * a[r * n + j];
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
    std::unique_ptr<double[]> work(new double[n]); // column measures, then v0 of each step
    auto addSquares = [&](std::size_t fromRow, std::size_t fromColumn) {
        for (std::size_t c = fromColumn; c < n; ++c) {
            double sum = work[c];
            for (std::size_t r = fromRow; r < m; ++r)
                sum += a[r * n + c] * a[r * n + c];
            work[c] = sum;
        }
    };

    for (std::size_t j = 0; j < k; ++j) {
        std::size_t pivot = j;
        if (j == 0) {
            std::fill(work.get(), work.get() + n, 0.0);
            addSquares(0, 0);
            double largest = 0.0;
            for (std::size_t c = 0; c < n; ++c)
                if (work[c] > largest) {
                    largest = work[c];
                    pivot = c;
                }
        } else {
            // Down-date the measures by the row just finished; only when the
            // largest has turned negative is it taken as it is. Otherwise the
            // remaining sums of squares are added on top and the choice made
            // again.
            for (std::size_t c = j; c < n; ++c)
                work[c] -= a[(j - 1) * n + c] * a[(j - 1) * n + c];
            double largest = work[j];
            for (std::size_t c = j + 1; c < n; ++c)
                if (work[c] > largest) {
                    largest = work[c];
                    pivot = c;
                }
            if (!(largest < 0.001 * largest)) {
                addSquares(j, j);
                for (std::size_t c = j; c < n; ++c)
                    if (work[c] > work[pivot])
                        pivot = c;
            }
        }

        permutation[j] = static_cast<unsigned>(pivot);
        if (pivot != j) {
            work[pivot] = work[j];
            for (std::size_t r = 0; r < m; ++r)
                std::swap(a[r * n + j], a[r * n + pivot]);
        }

        const double diagonal = a[j * n + j];
        double alpha;
        if (j + 1 < m) {
            double scale = 0.0;
            for (std::size_t r = j; r < m; ++r)
                scale = std::max(scale, std::fabs(a[r * n + j]));
            double sum = 0.0;
            // An all-zero column has no reflection (and no scale to divide by).
            if (scale > 0.0)
                for (std::size_t r = j; r < m; ++r) {
                    const double scaled = a[r * n + j] / scale;
                    sum += scaled * scaled;
                }
            const double sigma = scale * std::sqrt(sum);
            alpha = diagonal > 0 ? -sigma : sigma;
        } else {
            alpha = diagonal > 0 ? -diagonal : diagonal;
        }
        const double v0 = diagonal - alpha;
        work[j] = v0;
        a[j * n + j] = alpha;

        const double d = v0 * alpha;
        if (d == 0.0)
            continue;
        for (std::size_t c = j + 1; c < n; ++c)
            reflect(a, n, m, j, v0, d, a + c, n);
        reflect(a, n, m, j, v0, d, b, 1);
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
