#pragma once
// The whole preparation of a flat-field mosaic in one pass: split into colour
// planes, median-filter (or only down-sample) and weave back. The result is
// the one of
//     weave(medianFilterDownsample(split(mosaic), size, factor), p, cfa0, cfa1)
// (downsample instead of the median filter when it is off), sample for
// sample, but the full-resolution plane image is never made: a 50-megapixel
// capture would otherwise hold a second 200 MB float image and pay for
// touching all of it.

#include "image/bayer_image.h"

namespace prep {

struct MosaicPreparation {
    bool medianFilter = true;
    int medianSize = 3;     // window side, 1..kMaxMedianSize
    int samplingFactor = 4; // down-sampling of the planes, 1 or more
};

// The prepared mosaic of a REAL32 image: one channel, pixel type RAW with the
// mosaic's cfa words, plane-sized dimensions times the pattern size. Metadata
// is not copied. Throws std::invalid_argument as the three steps do (not a
// float image, a window size outside 1..10, a factor below 1, an image smaller
// than its pattern, a multi-channel mosaic that cannot be woven back).
img::BayerImage prepareMosaic(const img::BayerImage& mosaic, const MosaicPreparation& settings);

} // namespace prep
