#pragma once

namespace lsc {

// The Bernstein basis of the lens-shading surfaces.

// B(i, n, t) by the recursion B(0, 0, t) = 1,
// B(i, n, t) = (1 - t) B(i, n - 1, t) + t B(i - 1, n - 1, t); 0 when i < 0 or
// i > n. Its derivative is n (B(i - 1, n - 1, t) - B(i, n - 1, t)). The
// recursion costs 2^n calls; the surfaces use degrees up to 3.
double bernstein(int i, int n, double t);

} // namespace lsc
