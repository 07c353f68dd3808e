#include "lsc/bernstein.h"

namespace lsc {

double bernstein(int i, int n, double t) {
    if (i < 0 || i > n)
        return 0.0;
    if (n == 0)
        return 1.0;
    return (1.0 - t) * bernstein(i, n - 1, t) + t * bernstein(i - 1, n - 1, t);
}

} // namespace lsc
