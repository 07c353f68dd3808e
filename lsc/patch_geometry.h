#pragma once
// Where the patch borders of the 3 x 3 patch grid lie, and the patch sizes and
// fixed-point patch steps that the register file exports.

#include <cstdint>

namespace lsc {

// Breakpoints (0, L, L + Cw, W) and (0, T, T + M, H) used by the fit and the
// correction: the left width and top height truncate, the centre width and
// middle height round.
struct PatchBreakpoints {
    std::uint32_t x[4];
    std::uint32_t y[4];
};
PatchBreakpoints patchBreakpoints(std::uint32_t width, std::uint32_t height, double leftFraction,
                                  double centerFraction, double topFraction, double middleFraction);

// Patch index (0..2) and local coordinate (0..1) of position p along one
// axis with breakpoints (0, first, second, size), as the correction picks them.
struct AxisPosition {
    std::uint32_t patch;
    float local;
};
// Inline: the correction calls it once a block.
inline AxisPosition axisPosition(std::uint32_t p, const std::uint32_t (&breaks)[4]) {
    if (p < breaks[1])
        return {0, static_cast<float>(p) / static_cast<float>(breaks[1])};
    if (p < breaks[2])
        return {1, static_cast<float>(p - breaks[1]) / static_cast<float>(breaks[2] - breaks[1])};
    return {2, static_cast<float>(p - breaks[2]) / static_cast<float>(breaks[3] - breaks[2])};
}

// Patch sizes as the register file exports them: the outer patches round, the
// central ones truncate, the far ones take the rest (signed: a bad geometry
// can leave them zero or negative).
struct ExportedPatchSizes {
    std::int64_t left, center, right;
    std::int64_t top, middle, bottom;
};
ExportedPatchSizes exportedPatchSizes(std::uint32_t width, std::uint32_t height,
                                      double leftFraction, double centerFraction,
                                      double topFraction, double middleFraction);

// 4 x (2 / size) as unsigned fixed point: 3 integer bits and 32 fraction bits.
struct PatchStep {
    std::uint32_t msb;
    std::uint32_t lsb;
};
PatchStep patchStep(std::int64_t size);

// True when every patch of the grid holds at least one pixel in each
// direction (0 < L < L + Cw < W, 0 < T < T + M < H). Anything else would
// give a patch of zero or negative size and infinite local coordinates.
bool patchGeometryUsable(const PatchBreakpoints& breaks);

// The breakpoints of a width x height image, or std::runtime_error when the
// fractions leave a patch without pixels (see patchGeometryUsable).
PatchBreakpoints usablePatchBreakpoints(std::uint32_t width, std::uint32_t height,
                                        double leftFraction, double centerFraction,
                                        double topFraction, double middleFraction);

} // namespace lsc
