#pragma once
// Figures of the calibration report computed from the run's images and
// control grids: per-channel block means of a Bayer image and gain surfaces
// sampled on a coarse grid. The pipeline calls these while the images exist;
// the report writer only draws what they leave in the RunReport.

#include <cstdint>
#include <vector>

#include "image/bayer_image.h"
#include "lsc/patch_geometry.h"
#include "report/run_report.h"

namespace report {

// Block counts for a width x height image: `longSide` blocks along the longer
// side and as many along the other as keep the blocks about square (at least 1).
struct BlockGrid {
    int columns = 0;
    int rows = 0;
};
BlockGrid blockGridFor(std::int64_t width, std::int64_t height, int longSide);

// Mean of each Bayer channel (channel order red, green/red, green/blue, blue;
// by the image's Bayer phase) over columns x rows blocks of 2 x 2 pixel
// cells. Cells are dealt to blocks as evenly as integer division allows; an
// odd last row or column is left out. A grid finer than the image's cells is
// reduced to one cell per block. One pass over the pixels.
// Throws std::runtime_error for an image that is not a single-plane float
// Bayer image of at least 2 x 2 pixels, and for fewer than one block.
ChannelBlockMeans blockMeans(const img::BayerImage& mosaic, int columns, int rows);

// Shading relative to each channel's peak: the black level (a fraction of
// full scale) taken off every block, clamped at 0 as the fit does, then every
// block divided by the channel's largest block (1 at the brightest block). A
// channel without a positive peak is left at the black-corrected values.
void scaleToPeak(ChannelBlockMeans& means, float blackLevel = 0.0f);

// Residual deviation: every block's relative difference from the mean of its
// channel's blocks, block / mean - 1 (0 is perfectly flat). A channel whose
// mean is not positive is left as it is.
void deviationFromMean(ChannelBlockMeans& means);

// Smallest value and largest absolute value of one channel (0 and 0 for no blocks).
struct ValueRange {
    float minimum = 0.0f;
    float maximum = 0.0f;
};
ValueRange channelRange(const ChannelBlockMeans& means, int channel);
float largestAbsolute(const std::vector<float>& values);

// One channel's gain surface sampled at the centres of columns x rows cells
// of a width x height image, with its smallest and largest gain over a finer
// lattice that includes the image borders and corners.
struct GainSurface {
    int columns = 0;
    int rows = 0;
    std::vector<float> gain; // row-major
    float minimum = 0.0f;
    float maximum = 0.0f;
};

// Gain of the control grid at pixel (x, y) of a width x height image, with
// the patch choice and local coordinates of the correction.
float gainAt(const float (&grid)[lsc::kGridPoints], const lsc::PatchBreakpoints& breaks,
             std::uint32_t x, std::uint32_t y);

// Samples a control grid as the correction applies it to a width x height
// image with patch fractions (left, centre, top, middle). Throws
// std::runtime_error for an empty image, no cells, or fractions that leave a
// patch without pixels.
GainSurface sampleGainSurface(const float (&grid)[lsc::kGridPoints], std::uint32_t width,
                              std::uint32_t height, const double (&fractions)[4], int columns,
                              int rows);

} // namespace report
