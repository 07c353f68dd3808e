#pragma once
// White balance of the flattened (corrected) Bayer image and the measurement
// of its channel levels afterwards.

#include <cstdint>

#include "image/bayer_image.h"
#include "lsc/shading_sample.h"

namespace prep {

// Columns x0..x1 and rows y0..y1 (inclusive) of the window of up to 201 x 201
// pixels around the image centre in which the levels are measured when no
// target levels are known.
struct CentreWindow {
    std::int32_t x0, x1, y0, y1;
};
CentreWindow centreWindow(std::int32_t width, std::int32_t height);

// Mean of each channel over the centre window. Throws std::runtime_error
// when the window misses a channel.
void centreLevels(const img::BayerImage& image, float (&levels)[lsc::kChannels]);

// The levels the flattened image is balanced to: the fit's target levels, or,
// when the red one is 0 (a sample file may hold that), the channel means
// over the image's centre window.
void balanceLevels(const float (&targetLevels)[lsc::kChannels], const img::BayerImage& image,
                   float (&levels)[lsc::kChannels]);

// Scales the channels of the flattened Bayer image to a common level: each
// channel is multiplied by (largest level / its level). Throws
// std::runtime_error when a level is not positive, leaving the image as it
// was.
void whiteBalance(img::BayerImage& image, const float (&levels)[lsc::kChannels]);

// Odd box side for a filter size given in full-resolution pixels, on planes of
// an image prepared with `samplingFactor`: k = filterSize / (2 * factor), made
// odd by setting its lowest bit; at least 1.
int boxSide(int filterSize, int samplingFactor);

// The four channel levels of an image: each channel's half-resolution plane
// smoothed by a box mean (odd side from lsc.awb_avg_filter_size and the
// preparation sampling factor, shrinking at the borders), its largest value;
// the rule of the fit's target levels. Throws std::runtime_error for an image
// smaller than 2 x 2.
void measureLevels(float (&levels)[lsc::kChannels], const img::BayerImage& image, int awbFilterSize,
                   int samplingFactor);

} // namespace prep
