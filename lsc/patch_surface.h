#pragma once
// The gain surface of one channel while it is fitted: a grid of bicubic
// Bernstein patches that share their border control points, so 3 x 3 patches
// make one 10 x 10 global grid of unknowns.

#include <cstdint>
#include <iosfwd>
#include <vector>

#include "lsc/dense_matrix.h"
#include "lsc/fit_sample.h"

namespace lsc {

// One bicubic patch over [x0, x1] x [y0, y1] pixels.
struct surfacePatch {
    apan::denseMatrix controlPoints; // 4 x 4, rows along y
    double x0, x1, y0, y1;
    double inverseWidth;  // 1 / (x1 - x0)
    double inverseHeight; // 1 / (y1 - y0)

    double localU(double x) const { return (x - x0) / (x1 - x0); }
    double localV(double y) const { return (y - y0) / (y1 - y0); }
};

struct PatchIndex {
    std::uint32_t row;
    std::uint32_t column;
};

class patchSurface {
public:
    static constexpr std::uint32_t kPointsPerPatch = 4; // along each axis

    // patchesX x patchesY patches; xBreaks and yBreaks hold one more value
    // than patches in their direction (std::invalid_argument otherwise).
    // Patch (i, j) spans xBreaks[j] .. xBreaks[j + 1], yBreaks[i] .. yBreaks[i + 1].
    patchSurface(std::uint32_t patchesX, std::uint32_t patchesY, const std::vector<double>& xBreaks,
                 const std::vector<double>& yBreaks);

    void addValueConstraint(double x, double y, double value);
    // Slopes along x and y, in value per pixel.
    void addXDerivativeConstraint(double x, double y, double slope);
    void addYDerivativeConstraint(double x, double y, double slope);

    // Least-squares fit of all global control points to the constraints;
    // shared border points are single unknowns. Throws apan::exception 220
    // when there are fewer constraints than unknowns, and the solver's
    // exceptions. Lookups of points outside every patch report on `messages`.
    void fit(double tolerance, std::ostream& messages);

    std::uint32_t patchRows() const { return patchRows_; }
    std::uint32_t patchColumns() const { return patchColumns_; }
    std::uint32_t globalRows() const { return globalRows_; }
    std::uint32_t globalColumns() const { return globalColumns_; }
    const surfacePatch& patch(std::uint32_t row, std::uint32_t column) const {
        return patches_[row * patchColumns_ + column];
    }
    const std::vector<double>& xBreaks() const { return xBreaks_; }
    const std::vector<double>& yBreaks() const { return yBreaks_; }

    // Sets global point (row, column) in every patch that holds it.
    void setGlobal(std::uint32_t row, std::uint32_t column, double value);
    // Global point (row, column) as its first holder (upper-left patch) has it.
    double global(std::uint32_t row, std::uint32_t column) const;

    // Value of the surface at (x, y), in the patch findPatch gives for it
    // (points outside every patch are reported on `messages`).
    double value(double x, double y, std::ostream& messages) const;

    // Writes the global grid, row-major, as single precision into
    // grid[0 .. globalRows * globalColumns - 1].
    void copyToGrid(float* grid) const;

private:
    surfacePatch& patchAt(std::uint32_t row, std::uint32_t column) {
        return patches_[row * patchColumns_ + column];
    }
    // Fills row `equation` of the design matrix; returns the patch holding the sample.
    const surfacePatch& addDesignRow(apan::denseMatrix& a, std::uint32_t equation,
                                     const fitSample& sample, int kind,
                                     std::ostream& messages) const;

    std::uint32_t pointsY_ = kPointsPerPatch;
    std::uint32_t pointsX_ = kPointsPerPatch;
    std::vector<fitSample> valueConstraints_;
    std::vector<fitSample> xDerivativeConstraints_;
    std::vector<fitSample> yDerivativeConstraints_;
    std::uint32_t patchRows_;
    std::uint32_t patchColumns_;
    std::vector<surfacePatch> patches_; // row-major
    std::vector<double> xBreaks_;
    std::vector<double> yBreaks_;
    std::uint32_t globalRows_;
    std::uint32_t globalColumns_;
};

// The patch holding (x, y): patch rows are scanned in order and within a row
// the columns, and the first with x0 <= x <= x1 and y0 <= y <= y1 wins, so a
// point on a shared border belongs to the lower-indexed patch. A point outside
// every patch is reported on `messages` ("patch containing x,y not found.")
// and gets the nearest patch in each direction (the first on a tie), so the
// result is always a valid index.
PatchIndex findPatch(const patchSurface& surface, double x, double y, std::ostream& messages);

} // namespace lsc
