#pragma once
// Colour error of the flattened image: the corrected Bayer image is turned
// into display RGB through the colour matrix and gamma, averaged over a grid
// of blocks, converted to CIE L*a*b*, and each block's distance in the a*b*
// plane from the mean colour of all blocks is measured.

#include <vector>

#include "image/bayer_image.h"
#include "lsc/shading_settings.h"

namespace prep {

struct DeltaAbResult {
    int columns = 0, rows = 0;
    std::vector<float> deltaImage; // columns x rows deltas, row-major
    float meanChroma = 0.0f;
    float maxDelta = 0.0f;    // NaN when a block's colour is not a number
    float deltaStdDev = 0.0f; // population standard deviation of the deltas
};

// Evaluates the balanced flattened image (a single-channel Bayer image) with
// settings.ccm, settings.lumaNormalizeFactor and settings.deltaAbBlocks
// (columns, rows), and turns the image into display values on the way:
// colour-corrected, gamma-encoded and scaled so that its largest green value
// is the luma normalisation factor (the flattened image files are written
// from it so).
// Throws std::runtime_error for block counts below 1, an image too small for
// one pixel per block, and an image without any green signal.
DeltaAbResult evaluateDeltaAb(img::BayerImage& balanced, const lsc::ShadingSettings& settings);

} // namespace prep
