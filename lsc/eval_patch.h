#pragma once
// Single-precision evaluation of one bicubic patch of a 10 x 10 control grid:
// the per-pixel work of the correction, kept inline for the hot loop.

#include <cstdint>

namespace lsc {

inline constexpr std::uint32_t kGridStride = 10; // control points per grid row

// Patch start index in the grid: 30 * patch row + 3 * patch column.
inline constexpr std::uint32_t patchStart(std::uint32_t patchRow, std::uint32_t patchColumn) {
    return 3 * kGridStride * patchRow + 3 * patchColumn;
}

// The four row cubics of a patch in power form, a0 + a1 u + a2 u^2 + a3 u^3.
// They depend only on the control points, so the correction builds them once
// per patch instead of once per pixel; the arithmetic is the same either way.
struct PatchCubics {
    float a[4][4];
};

inline PatchCubics patchCubics(const float* grid, std::uint32_t start) {
    PatchCubics cubics;
    for (std::uint32_t r = 0; r < 4; ++r) {
        const float* p = grid + start + r * kGridStride;
        cubics.a[r][0] = p[0];
        cubics.a[r][1] = 3.0f * (p[1] - p[0]);
        cubics.a[r][2] = 3.0f * (p[0] - 2.0f * p[1] + p[2]);
        cubics.a[r][3] = p[3] - p[0] + 3.0f * p[1] - 3.0f * p[2];
    }
    return cubics;
}

// Cubic Bernstein weights of v: (1 - v)^3, 3 v (1 - v)^2, 3 v^2 (1 - v), v^3.
inline void cubicWeights(float v, float weights[4]) {
    const float w = 1.0f - v;
    weights[0] = w * w * w;
    weights[1] = 3.0f * v * w * w;
    weights[2] = 3.0f * v * v * w;
    weights[3] = v * v * v;
}

// Sum over the rows of weight x row cubic at u (u2 = u * u, u3 = u2 * u).
inline float evalPatchCubics(const PatchCubics& cubics, float u, float u2, float u3,
                             const float weights[4]) {
    float sum = 0.0f;
    for (std::uint32_t r = 0; r < 4; ++r) {
        const float* a = cubics.a[r];
        sum += weights[r] * (a[0] + a[1] * u + a[2] * u2 + a[3] * u3);
    }
    return sum;
}

// Value at local (u, v) of the patch whose control points are
// grid[start + r * 10 + c], r, c = 0..3: each row's cubic in power form in u,
// weighted by the cubic Bernstein values of v.
inline float evalPatch(const float* grid, std::uint32_t start, float u, float v) {
    float weights[4];
    cubicWeights(v, weights);
    const float u2 = u * u;
    return evalPatchCubics(patchCubics(grid, start), u, u2, u2 * u, weights);
}

} // namespace lsc
