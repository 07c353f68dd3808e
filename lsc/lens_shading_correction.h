#pragma once
// Applies the fitted correction to the working Bayer image.

#include "image/bayer_image.h"
#include "lsc/fit_result.h"

namespace lsc {

// Returns gain x (pixel - black level) for every pixel of every
// applyStep-th 2x2 block of `image` as a new REAL32 Bayer image of
// (W div applyStep) x (H div applyStep) rounded down to even, with the
// input's cfa and bit depth. Gains come from the correction's control grids,
// patch geometry from its layout.
// Throws std::runtime_error for a missing or non-float image, an applyStep
// below 1, an image smaller than 2 x applyStep in either direction, a patch
// geometry that leaves a patch without pixels, and when the output image
// cannot be allocated ("Unable to allocate image memory.").
img::BayerImage applyLensShading(const img::BayerImage& image, const ShadingCorrection& correction,
                                 float blackLevel, unsigned applyStep);

} // namespace lsc
