#pragma once
// Loads patch geometry, control points and white-balance levels from stored
// calibration data into the patch surface, checking on the way that the data
// describe the same patch layout as the configuration and the same sensor
// size as the input image.

#include "config/config_node.h"
#include "image/bayer_image.h"
#include "lsc/fit_result.h"

namespace config {

// What stored calibration data hold: the correction (patch layout and
// control points) and the white-balance levels.
struct StoredCalibration {
    lsc::ShadingCorrection correction;
    float whiteBalance[lsc::kChannels] = {0, 0, 0, 0};
};

// `root` is the configuration tree's root (read as config.lsc.*); `data`
// holds the register names without their block prefix (leftPatchWidth,
// leftPatchFactor, imageWidth, controlPointR, R, ...); `image` is the image
// the correction is for. What the data leave out stays as in `fitted`.
// Throws std::range_error when the sensor size does not match,
// std::runtime_error for the other mismatches.
StoredCalibration readConfigParam(const config_node& root, const config_node& data,
                                  const img::BayerImage& image,
                                  const lsc::ShadingCorrection& fitted);

} // namespace config
