#pragma once
// Square dense solver of the surface fit, and the base of the least-squares
// solver (lsc/linear_least_squares.h). Works in place on caller-owned storage:
// A and b are overwritten, x receives the solution. Failures are thrown as
// apan::exception (1 self-test, 231 not square or singular); storage whose
// size does not match A is refused with std::invalid_argument before anything
// is touched.

#include "lsc/dense_matrix.h"

namespace apan {

// Gauss elimination with row normalisation; a row is swapped in only when the
// diagonal entry is below the tolerance, and then the first usable one.
template <typename Real> class linearSystem {
public:
    // A: rows x columns; x: at least `columns` elements; b: `rows` elements.
    linearSystem(denseMatrix* a, denseMatrix* x, denseMatrix* b) : a_(a), x_(x), b_(b) {}
    virtual ~linearSystem() = default;

    // Solves A x = b; `tolerance` is the magnitude below which a pivot or a
    // diagonal entry counts as zero.
    virtual void solve(Real tolerance);

    // Solves a fixed 3 x 3 system through solve() and checks the answer
    // (2, 1, -1). The object must point at 3 x 3 and 3-element storage.
    virtual void selfTest();

protected:
    // Throws std::invalid_argument unless x and b fit A.
    void checkShapes() const;

    denseMatrix* a_;
    denseMatrix* x_;
    denseMatrix* b_;
};

extern template class linearSystem<double>;

} // namespace apan
