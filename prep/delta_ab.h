#pragma once
// Colour error of the flattened image: the corrected Bayer image is turned
// into display RGB through the colour matrix and gamma, averaged over a grid
// of blocks, converted to CIE L*a*b*, and each block's distance in the a*b*
// plane from the mean colour of all blocks is measured.

#include "lsc/processing_context.h"

namespace prep {

// Works on context.corrected (a single-channel Bayer image) with
// context.ccm, context.lumaNormalizeFactor and context.deltaAbBlocks
// (columns, rows). Leaves in the context:
//   - corrected: colour-corrected, gamma-encoded and scaled so that its
//     largest green value is the luma normalisation factor;
//   - deltaImage: columns x rows deltas, row-major;
//   - meanChroma, maxDelta (NaN when a block's colour is not a number) and
//     deltaStdDev (population standard deviation of the deltas).
// Throws std::runtime_error for block counts below 1, an image too small for
// one pixel per block, and an image without any green signal.
void evaluateDeltaAb(ProcessingContext& context);

} // namespace prep
