#pragma once
// How flat the brightness of the corrected image is: delta ab judges colour
// only, so a correction that leaves the corners 7 % too dark, or a dust
// blotch on the diffuser, passes it. This measures what it cannot see.

#include <optional>

#include "image/bayer_image.h"
#include "lsc/shading_settings.h"

namespace prep {

// The largest |block luminance / mean block luminance - 1| over the delta-ab
// block grid (settings.deltaAbBlocks, blocks laid as the delta-ab evaluation
// lays them) of the white-balanced corrected image, as a fraction. The
// luminance is Rec. 709 Y of the linear RGB of each 2 x 2 block (green the
// mean of the two greens) after the colour matrix settings.ccm. Nothing when
// the grid does not fit the image (no blocks, or blocks of no pixel) or the
// image holds no light.
std::optional<float> luminanceResidual(const img::BayerImage& balanced,
                                       const lsc::ShadingSettings& settings);

// Throws std::range_error "Maximum luminance residual is greater than
// threshold of <bound> %" and the possible causes on a second line when
// residual (a fraction) exceeds bound (per cent); a bound of 0 is off. With a
// bound, a residual that could not be measured throws std::runtime_error.
void checkLuminanceResidual(std::optional<float> residual, float boundPercent);

} // namespace prep
