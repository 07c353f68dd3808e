#pragma once
// Collects the sample points of the flat field that the surface fit works on.

#include <iosfwd>

#include "image/bayer_image.h"
#include "lsc/shading_sample.h"
#include "lsc/shading_settings.h"

namespace lsc {

// The prepared image with the black level taken out of every pixel, clamped
// to 0..1: what the samples and their target levels are measured on. Throws
// std::runtime_error for a missing or non-float image.
img::BayerImage levelledImage(const img::BayerImage& prepared, float blackLevel);

// Takes 2x2 Bayer samples of the levelled image on a sine-spaced grid
// (densest at the borders) and along the patch borders of settings.layout
// (with settings.sampleWindow above 1, each value is the channel's median
// over that many blocks per side around the sample's block, see
// windowMedians), computes the target levels and, unless quiet, prints the
// sample count on `messages`. Samples whose 2x2 block would leave the image or
// the margin are not taken. Throws std::runtime_error for a missing or
// non-float image and for settings the sampling cannot use (angle step below
// 1, negative margin, preparation sampling factor below 1, a sample window
// that is even or outside 1..15).
SampleSet collectSamples(const img::BayerImage& levelled, const ShadingSettings& settings,
                         std::ostream& messages);

} // namespace lsc
