#pragma once
// A single tensor-product Bernstein surface over a rectangle; the fit uses a
// quadratic one as the target level of each channel.

#include <cstdint>
#include <vector>

#include "lsc/dense_matrix.h"
#include "lsc/fit_sample.h"

namespace lsc {

class bernsteinSurface {
public:
    // rows x columns control points (rows along y) over x0 .. x0 + xExtent and
    // y0 .. y0 + yExtent.
    bernsteinSurface(std::uint32_t rows, std::uint32_t columns, double x0, double xExtent,
                     double y0, double yExtent);

    double value(double x, double y) const;

    void addSample(double x, double y, double value);
    const std::vector<fitSample>& samples() const { return samples_; }

    // Least-squares fit of the control points to the samples. Throws
    // apan::exception 220 when there are fewer samples than control points,
    // and the solver's exceptions.
    void fit(double tolerance);

    apan::denseMatrix& controlPoints() { return controlPoints_; }
    const apan::denseMatrix& controlPoints() const { return controlPoints_; }

private:
    apan::denseMatrix controlPoints_;
    double x0_, xExtent_, y0_, yExtent_;
    double sx_, sy_;         // 1 / extent
    double ox_ = 0, oy_ = 0; // offsets added after the origin is subtracted
    std::vector<fitSample> samples_;
};

} // namespace lsc
