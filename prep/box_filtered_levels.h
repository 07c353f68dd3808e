#pragma once
// The level of each Bayer channel as the brightest spot of its plane: the
// half-resolution plane of each channel is smoothed with a box mean and its
// largest smoothed value is taken.

#include "image/bayer_image.h"

namespace prep {

// Odd box side for a filter size given in full-resolution pixels, on planes of
// an image prepared with `samplingFactor`: k = filterSize / (2 * factor), made
// odd by setting its lowest bit; at least 1.
int boxSide(int filterSize, int samplingFactor);

// Plane k holds the pixels of channel k (Bayer phase rule), (W / 2) x (H / 2).
// The mean at each position covers the part of the side x side window that
// lies inside the plane. Throws std::runtime_error for an image smaller than
// 2 x 2.
void boxFilteredLevels(const BayerImage& image, int side, float (&levels)[4]);

} // namespace prep
