#include "lsc/linear_system.h"

#include <cmath>
#include <cstddef>
#include <stdexcept>
#include <utility>

#include "lsc/apan_exception.h"
#include "lsc/lsc_messages.h"

namespace apan {

template <typename Real> void linearSystem<Real>::checkShapes() const {
    if (!a_ || !x_ || !b_ || !a_->data() || !x_->data() || !b_->data() ||
        x_->size() < a_->columns() || b_->size() != a_->rows())
        throw std::invalid_argument(lsc::msg::kSolverShapeMismatch);
}

template <typename Real> void linearSystem<Real>::solve(Real tolerance) {
    if (a_ && a_->rows() != a_->columns())
        throw exception(231, lsc::msg::kNotSquare, lsc::msg::kNotSquareHint);
    checkShapes();

    const std::size_t n = a_->rows();
    double* a = a_->data();
    double* b = b_->data();
    double* x = x_->data();

    for (std::size_t k = 0; k < n; ++k) {
        double* pivotRow = a + k * n;
        // A pivot is exchanged only when it fails the tolerance, and then for
        // the first later row that passes; an exact zero never passes (this
        // matters only for a tolerance of 0 or less).
        if (std::fabs(pivotRow[k]) < tolerance || pivotRow[k] == 0.0) {
            std::size_t i = k + 1;
            while (i < n && !(std::fabs(a[i * n + k]) > tolerance && a[i * n + k] != 0.0))
                ++i;
            if (i == n)
                throw exception(231, lsc::msg::kSingular, lsc::msg::kSingularHint);
            for (std::size_t j = 0; j < n; ++j)
                std::swap(pivotRow[j], a[i * n + j]);
            std::swap(b[k], b[i]);
        }

        const double inversePivot = 1.0 / pivotRow[k];
        for (std::size_t j = 0; j < n; ++j)
            pivotRow[j] *= inversePivot;
        b[k] *= inversePivot;

        // Rows are rescaled by 1/a before the pivot row is subtracted, so each
        // eliminated row also ends with a leading 1.
        for (std::size_t i = k + 1; i < n; ++i) {
            double* row = a + i * n;
            if (!(std::fabs(row[k]) > tolerance) || row[k] == 0.0)
                continue;
            const double inverseLead = 1.0 / row[k];
            for (std::size_t j = 0; j < n; ++j)
                row[j] = row[j] * inverseLead - pivotRow[j];
            b[i] = b[i] * inverseLead - b[k];
        }
    }

    for (std::size_t i = n; i-- > 0;) {
        double sum = b[i];
        for (std::size_t j = i + 1; j < n; ++j)
            sum -= a[i * n + j] * x[j];
        x[i] = sum;
    }
}

template <typename Real> void linearSystem<Real>::selfTest() {
    if (!a_ || a_->rows() != 3 || a_->columns() != 3)
        throw std::invalid_argument(lsc::msg::kSolverShapeMismatch);
    checkShapes();

    static const double kA[9] = {3, -4, 1, 2, 1, 2, 1, 2, -1};
    static const double kB[3] = {1, 3, 5};
    for (std::size_t i = 0; i < 9; ++i)
        (*a_)[i] = kA[i];
    for (std::size_t i = 0; i < 3; ++i)
        (*b_)[i] = kB[i];

    const Real tolerance = static_cast<float>(1e-7);
    solve(tolerance);

    const double* x = x_->data();
    // Written as "not within" so that a NaN answer fails too.
    if (!(std::fabs(x[0] - 2) <= tolerance && std::fabs(x[1] - 1) <= tolerance &&
          std::fabs(x[2] + 1) <= tolerance))
        throw exception(1, lsc::msg::kSolverFailed, lsc::msg::kSelfTestFailure);
}

template class linearSystem<double>;

} // namespace apan
