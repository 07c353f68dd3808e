#pragma once
// Copies the validated configuration into the settings that preparation,
// fitting and evaluation work with: each value converted once, percentages
// and pixel sizes turned into fractions, image-dependent defaults chosen.

#include "config/config_node.h"
#include "image/bayer_image.h"
#include "lsc/shading_settings.h"

namespace config {

// Reads below the "config" node; `image` gives width, height and bit depth.
// Throws the getters' errors, std::range_error for delta-ab block counts that
// leave a block empty, std::runtime_error for an image without bit depth.
// The quiet flag stays false (it comes from the command line).
lsc::ShadingSettings load_fit_settings(const config_node& config, const img::BayerImage& image);

} // namespace config
