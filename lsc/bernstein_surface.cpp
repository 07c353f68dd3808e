#include "lsc/bernstein_surface.h"

#include <cstddef>
#include <limits>
#include <new>

#include "lsc/apan_exception.h"
#include "lsc/bernstein.h"
#include "lsc/linear_least_squares.h"
#include "lsc/lsc_messages.h"

namespace lsc {

using apan::denseMatrix;

bernsteinSurface::bernsteinSurface(std::uint32_t rows, std::uint32_t columns, double x0,
                                   double xExtent, double y0, double yExtent)
    : controlPoints_(rows, columns), x0_(x0), xExtent_(xExtent), y0_(y0), yExtent_(yExtent),
      sx_(1.0 / xExtent), sy_(1.0 / yExtent) {
}

double bernsteinSurface::value(double x, double y) const {
    const int rowDegree = static_cast<int>(controlPoints_.rows()) - 1;
    const int columnDegree = static_cast<int>(controlPoints_.columns()) - 1;
    const double u = ((x - x0_) + ox_) * sx_;
    const double v = ((y - y0_) + oy_) * sy_;
    double sum = 0.0;
    for (std::uint32_t r = 0; r < controlPoints_.rows(); ++r)
        for (std::uint32_t c = 0; c < controlPoints_.columns(); ++c)
            sum += controlPoints_(r, c) * bernstein(static_cast<int>(r), rowDegree, v) *
                   bernstein(static_cast<int>(c), columnDegree, u);
    return sum;
}

void bernsteinSurface::addSample(double x, double y, double value) {
    samples_.push_back(fitSample{x, y, value});
}

void bernsteinSurface::fit(double tolerance) {
    const std::uint32_t rows = controlPoints_.rows();
    const std::uint32_t columns = controlPoints_.columns();
    const std::size_t unknowns = controlPoints_.size();
    if (unknowns > samples_.size())
        throw apan::exception(220, lsc::msg::kUnderConstrained, lsc::msg::kUnderConstrainedHint);
    if (samples_.size() > std::numeric_limits<std::uint32_t>::max())
        throw std::bad_alloc();
    const std::uint32_t equations = static_cast<std::uint32_t>(samples_.size());

    denseMatrix a(equations, static_cast<std::uint32_t>(unknowns));
    denseMatrix b(equations, 1);
    for (std::uint32_t i = 0; i < equations; ++i) {
        const fitSample& s = samples_[i];
        const double u = ((s.x - x0_) + ox_) / xExtent_;
        const double v = ((s.y - y0_) + oy_) / yExtent_;
        for (std::uint32_t r = 0; r < rows; ++r)
            for (std::uint32_t c = 0; c < columns; ++c)
                a(i, r * columns + c) =
                    bernstein(static_cast<int>(r), static_cast<int>(rows) - 1, v) *
                    bernstein(static_cast<int>(c), static_cast<int>(columns) - 1, u);
        b[i] = s.value;
    }
    // Solved into a temporary: a failed fit leaves the control points as they were.
    denseMatrix solution(static_cast<std::uint32_t>(unknowns), 1);
    apan::linearLeastSquares<double>(&a, &solution, &b).solve(tolerance);
    for (std::size_t k = 0; k < unknowns; ++k)
        controlPoints_[k] = solution[k];
}

} // namespace lsc
