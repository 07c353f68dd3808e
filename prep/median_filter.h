#pragma once
// Median filter combined with down-sampling, for plane images (layout in
// prep/bayer_planes.h). Only the target positions are filtered: each target
// sample is the median of the s x s window of its channel around
// (factor * x, factor * y), the window starting s / 2 before that position in
// both directions (so it is centred for odd s). Window positions outside the
// image are mirrored with the edge sample repeated (-1 reads 0, n reads n - 1).

#include "image/bayer_image.h"

namespace prep {

// The largest window side: its values must fit the median tree's node pool.
inline constexpr int kMaxMedianSize = 10;

// Creates `target` with the down-sampled size of `planes` and fills it.
// Throws std::invalid_argument for a size outside 1..10 or a factor below 1.
void medianFilterDownsample(const img::BayerImage& planes, int size, int factor,
                            img::BayerImage& target);

} // namespace prep
