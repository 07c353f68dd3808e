#pragma once
// Single-precision evaluation of one bicubic patch of a 10 x 10 control grid:
// the per-pixel work of the correction, kept inline for the hot loop.

#include <cstdint>

inline constexpr std::uint32_t kGridStride = 10; // control points per grid row

// Patch start index in the grid: 30 * patch row + 3 * patch column.
inline constexpr std::uint32_t patchStart(std::uint32_t patchRow, std::uint32_t patchColumn) {
    return 3 * kGridStride * patchRow + 3 * patchColumn;
}

// Value at local (u, v) of the patch whose control points are
// grid[start + r * 10 + c], r, c = 0..3: each row's cubic in power form in u,
// weighted by the cubic Bernstein values of v.
inline float evalPatch(const float* grid, std::uint32_t start, float u, float v) {
    const float w = 1.0f - v;
    const float weights[4] = {w * w * w, 3.0f * v * w * w, 3.0f * v * v * w, v * v * v};
    const float u2 = u * u;
    const float u3 = u2 * u;
    float sum = 0.0f;
    for (std::uint32_t r = 0; r < 4; ++r) {
        const float* p = grid + start + r * kGridStride;
        const float row = p[0] + 3.0f * (p[1] - p[0]) * u +
                          3.0f * (p[0] - 2.0f * p[1] + p[2]) * u2 +
                          (p[3] - p[0] + 3.0f * p[1] - 3.0f * p[2]) * u3;
        sum += weights[r] * row;
    }
    return sum;
}
