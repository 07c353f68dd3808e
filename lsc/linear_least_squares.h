#pragma once
// Least-squares solver of the surface fit: Householder QR with column
// pivoting, in place like the square solver it derives from. A rank-deficient
// A throws apan::exception 230; a square A goes to the square solve.

#include "lsc/linear_system.h"

namespace apan {

template <typename Real> class linearLeastSquares : public linearSystem<Real> {
public:
    using linearSystem<Real>::linearSystem;
    void solve(Real tolerance) override;
};

extern template class linearLeastSquares<double>;

} // namespace apan
