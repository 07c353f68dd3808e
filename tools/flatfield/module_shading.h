#pragma once
// Lens shading measured on a real camera module, from a tuning file of the
// form the libcamera-ipa package ships (block "rpi.alsc": a 16 x 12 luminance
// correction table and colour tables per colour temperature), rendered at any
// sensor size. Between the cell centres the shading is a natural bicubic
// spline in the logarithm of the shading; beyond the outermost centres the
// spline continues linearly in the logarithm, so the shading keeps falling
// towards the corners.

#include <array>
#include <string>
#include <vector>

namespace flatfield {

class ModuleShading {
public:
    static constexpr int kColumns = 16;
    static constexpr int kRows = 12;

    // Per channel (R, GR, GB, B) the relative shading at the cell centres,
    // row-major: green 1 / lum, red 1 / (lum x Cr), blue 1 / (lum x Cb).
    using Table = std::array<std::vector<double>, 4>;

    // Reads the tuning file at `path` and takes the colour tables of the
    // colour temperature nearest `colourTemperature` (Cr and Cb each on its
    // own). Throws std::runtime_error naming the file for anything it cannot
    // use: unreadable, not JSON, no "rpi.alsc" block, tables of the wrong
    // size, or a gain that is not a positive number.
    static ModuleShading fromTuningFile(const std::string& path, double colourTemperature);
    explicit ModuleShading(Table table);

    // Shading of `channel` at the continuous position (x, y) of a width x
    // height image (pixel (i, j) covers [i, i + 1) x [j, j + 1)), relative to
    // the brightest green cell centre.
    double at(int channel, double x, double y, int width, int height) const;
    // The value at cell (column, row) centre, relative to the brightest green one.
    double cell(int channel, int column, int row) const;
    // The shading of every pixel's own channel, row-major, for a width x
    // height mosaic of Bayer phase `phase` (0 RGGB, 1 GRBG, 2 GBRG, 3 BGGR).
    std::vector<double> mosaic(int width, int height, int phase) const;
    // The colour temperatures whose tables were taken (Cr, Cb).
    double crTemperature = 0.0, cbTemperature = 0.0;

private:
    // Logarithms of the relative shading, per channel.
    Table log_;
};

// Weights of the natural cubic spline through `count` nodes (at least 2) at
// positions (i + 0.5) * size / count, evaluated at t, continued linearly
// beyond the outer nodes: value(t) = sum of weights[i] * node value i.
std::vector<double> splineWeights(int count, double size, double t);

} // namespace flatfield
