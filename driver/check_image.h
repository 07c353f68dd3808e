#pragma once
// The full-resolution check image (--check): the capture corrected at sensor
// resolution, so dust, blotches and residual shading can be inspected in any
// image viewer (the flattened images are reduced).

#include <string>

#include "image/bayer_image.h"
#include "lsc/fit_result.h"

namespace driver {

// Applies the correction (control grids, patch layout) and the black level
// to every pixel of `capture`, balances the four channels to the larger
// green's target level, so a good flat field shows as an even grey mosaic,
// and writes the result as an uncompressed 16-bit grey TIFF of the capture's
// size (rounded down to even), 0..65535 for 0..full scale, beside the target
// and renamed into place. The capture's samples are released on the way (only
// its size and Bayer order are needed afterwards). Throws std::runtime_error
// "Cannot store check image: <path>" when it cannot be written.
void writeCheckImage(const std::string& path, img::BayerImage capture,
                     const lsc::ShadingCorrection& correction, float blackLevel,
                     const float (&targetLevels)[lsc::kChannels]);

} // namespace driver
