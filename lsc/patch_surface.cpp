#include "lsc/patch_surface.h"

#include <cstddef>
#include <limits>
#include <new>
#include <ostream>
#include <stdexcept>

#include "lsc/apan_exception.h"
#include "lsc/bernstein.h"
#include "lsc/linear_least_squares.h"
#include "lsc/lsc_messages.h"

namespace lsc {

using apan::denseMatrix;

namespace {

enum ConstraintKind { kValue, kXDerivative, kYDerivative };

// Index of the interval [breaks[i], breaks[i + 1]] nearest to t (0 when t is
// NaN); used only for points that no patch holds.
std::uint32_t nearestInterval(const std::vector<double>& breaks, double t) {
    std::uint32_t best = 0;
    double bestDistance = std::numeric_limits<double>::infinity();
    for (std::size_t i = 0; i + 1 < breaks.size(); ++i) {
        const double distance = t < breaks[i]       ? breaks[i] - t
                                : t > breaks[i + 1] ? t - breaks[i + 1]
                                                    : 0.0;
        if (distance < bestDistance) {
            bestDistance = distance;
            best = static_cast<std::uint32_t>(i);
        }
    }
    return best;
}

// Patch and local index of a global grid line: shared lines belong to the
// lower-indexed patch, as its last local line.
void owner(std::uint32_t global, std::uint32_t* patch, std::uint32_t* local) {
    *patch = global == 0 ? 0 : (global - 1) / (patchSurface::kPointsPerPatch - 1);
    *local = global - *patch * (patchSurface::kPointsPerPatch - 1);
}

} // namespace

patchSurface::patchSurface(std::uint32_t patchesX, std::uint32_t patchesY,
                           const std::vector<double>& xBreaks, const std::vector<double>& yBreaks)
    : patchRows_(patchesY), patchColumns_(patchesX), xBreaks_(xBreaks), yBreaks_(yBreaks) {
    if (patchesX == 0 || patchesY == 0 || xBreaks.size() != patchesX + std::size_t{1} ||
        yBreaks.size() != patchesY + std::size_t{1} || patchesX > 0xffffu || patchesY > 0xffffu)
        throw std::invalid_argument("patch grid and breakpoints do not match");
    globalRows_ = patchRows_ * (pointsY_ - 1) + 1;
    globalColumns_ = patchColumns_ * (pointsX_ - 1) + 1;
    patches_.reserve(static_cast<std::size_t>(patchRows_) * patchColumns_);
    for (std::uint32_t i = 0; i < patchRows_; ++i)
        for (std::uint32_t j = 0; j < patchColumns_; ++j) {
            const double x0 = xBreaks_[j], x1 = xBreaks_[j + 1];
            const double y0 = yBreaks_[i], y1 = yBreaks_[i + 1];
            patches_.push_back(surfacePatch{denseMatrix(pointsY_, pointsX_), x0, x1, y0, y1,
                                            1.0 / (x1 - x0), 1.0 / (y1 - y0)});
        }
}

void patchSurface::addValueConstraint(double x, double y, double value) {
    valueConstraints_.push_back(fitSample{x, y, value});
}

void patchSurface::addXDerivativeConstraint(double x, double y, double slope) {
    xDerivativeConstraints_.push_back(fitSample{x, y, slope});
}

void patchSurface::addYDerivativeConstraint(double x, double y, double slope) {
    yDerivativeConstraints_.push_back(fitSample{x, y, slope});
}

const surfacePatch& patchSurface::addDesignRow(denseMatrix& a, std::uint32_t equation,
                                               const fitSample& sample, int kind,
                                               std::ostream& messages) const {
    const PatchIndex where = findPatch(*this, sample.x, sample.y, messages);
    const surfacePatch& p = patch(where.row, where.column);
    const double u = p.localU(sample.x);
    const double v = p.localV(sample.y);
    const int degree = static_cast<int>(kPointsPerPatch) - 1;
    for (std::uint32_t r = 0; r < pointsY_; ++r)
        for (std::uint32_t c = 0; c < pointsX_; ++c) {
            const int ri = static_cast<int>(r), ci = static_cast<int>(c);
            double entry;
            if (kind == kValue)
                entry = bernstein(ri, degree, v) * bernstein(ci, degree, u);
            else if (kind == kYDerivative)
                entry = degree * (bernstein(ri - 1, degree - 1, v) - bernstein(ri, degree - 1, v)) *
                        bernstein(ci, degree, u);
            else
                entry = bernstein(ri, degree, v) * degree *
                        (bernstein(ci - 1, degree - 1, u) - bernstein(ci, degree - 1, u));
            const std::uint32_t globalRow = (pointsY_ - 1) * where.row + r;
            const std::uint32_t globalColumn = (pointsX_ - 1) * where.column + c;
            a(equation, globalRow * globalColumns_ + globalColumn) = entry;
        }
    return p;
}

void patchSurface::fit(double tolerance, std::ostream& messages) {
    const std::uint64_t unknowns = static_cast<std::uint64_t>(globalRows_) * globalColumns_;
    const std::uint64_t equations = static_cast<std::uint64_t>(valueConstraints_.size()) +
                                    yDerivativeConstraints_.size() + xDerivativeConstraints_.size();
    if (unknowns > equations)
        throw apan::exception(220, lsc::msg::kUnderConstrained, lsc::msg::kUnderConstrainedHint);
    if (equations > std::numeric_limits<std::uint32_t>::max())
        throw std::bad_alloc();

    denseMatrix a(static_cast<std::uint32_t>(equations), static_cast<std::uint32_t>(unknowns));
    denseMatrix b(static_cast<std::uint32_t>(equations), 1);
    std::uint32_t e = 0;
    for (const fitSample& s : valueConstraints_) {
        addDesignRow(a, e, s, kValue, messages);
        b[e++] = s.value;
    }
    // Derivatives are constrained in local coordinates: slope times patch size.
    for (const fitSample& s : yDerivativeConstraints_) {
        const surfacePatch& p = addDesignRow(a, e, s, kYDerivative, messages);
        b[e++] = s.value * (p.y1 - p.y0);
    }
    for (const fitSample& s : xDerivativeConstraints_) {
        const surfacePatch& p = addDesignRow(a, e, s, kXDerivative, messages);
        b[e++] = s.value * (p.x1 - p.x0);
    }

    denseMatrix solution(static_cast<std::uint32_t>(unknowns), 1);
    apan::linearLeastSquares<double>(&a, &solution, &b).solve(tolerance);
    for (std::uint32_t row = 0; row < globalRows_; ++row)
        for (std::uint32_t column = 0; column < globalColumns_; ++column)
            setGlobal(row, column,
                      solution[static_cast<std::size_t>(row) * globalColumns_ + column]);
}

void patchSurface::setGlobal(std::uint32_t row, std::uint32_t column, double value) {
    std::uint32_t i, r, j, c;
    owner(row, &i, &r);
    owner(column, &j, &c);
    const bool sharedRow = r == pointsY_ - 1 && i + 1 < patchRows_;
    const bool sharedColumn = c == pointsX_ - 1 && j + 1 < patchColumns_;
    patchAt(i, j).controlPoints(r, c) = value;
    if (sharedRow)
        patchAt(i + 1, j).controlPoints(0, c) = value;
    if (sharedColumn)
        patchAt(i, j + 1).controlPoints(r, 0) = value;
    if (sharedRow && sharedColumn)
        patchAt(i + 1, j + 1).controlPoints(0, 0) = value;
}

double patchSurface::global(std::uint32_t row, std::uint32_t column) const {
    std::uint32_t i, r, j, c;
    owner(row, &i, &r);
    owner(column, &j, &c);
    return patch(i, j).controlPoints(r, c);
}

double patchSurface::value(double x, double y, std::ostream& messages) const {
    const PatchIndex where = findPatch(*this, x, y, messages);
    const surfacePatch& p = patch(where.row, where.column);
    const double u = p.localU(x);
    const double v = p.localV(y);
    const int degree = static_cast<int>(kPointsPerPatch) - 1;
    double sum = 0.0;
    for (std::uint32_t r = 0; r < pointsY_; ++r) {
        const double weight = bernstein(static_cast<int>(r), degree, v);
        for (std::uint32_t c = 0; c < pointsX_; ++c)
            sum += weight * bernstein(static_cast<int>(c), degree, u) * p.controlPoints(r, c);
    }
    return sum;
}

void patchSurface::copyToGrid(float* grid) const {
    for (std::uint32_t i = 0; i < patchRows_; ++i)
        for (std::uint32_t j = 0; j < patchColumns_; ++j) {
            const surfacePatch& p = patch(i, j);
            for (std::uint32_t r = i > 0 ? 1 : 0; r < pointsY_; ++r)
                for (std::uint32_t c = j > 0 ? 1 : 0; c < pointsX_; ++c)
                    grid[((pointsY_ - 1) * i + r) * globalColumns_ + (pointsX_ - 1) * j + c] =
                        static_cast<float>(p.controlPoints(r, c));
        }
}

PatchIndex findPatch(const patchSurface& surface, double x, double y, std::ostream& messages) {
    for (std::uint32_t i = 0; i < surface.patchRows(); ++i)
        for (std::uint32_t j = 0; j < surface.patchColumns(); ++j) {
            const surfacePatch& p = surface.patch(i, j);
            if (p.x0 <= x && x <= p.x1 && p.y0 <= y && y <= p.y1)
                return {i, j};
        }
    messages << lsc::msg::kPatchNotFoundPrefix << x << "," << y << lsc::msg::kPatchNotFoundSuffix
             << std::endl;
    return {nearestInterval(surface.yBreaks(), y), nearestInterval(surface.xBreaks(), x)};
}

} // namespace lsc
