#pragma once
// White balance of the flattened (corrected) Bayer image and the measurement
// of its channel levels afterwards.

#include <cstdint>

#include "lsc/processing_context.h"

namespace prep {

// Columns x0..x1 and rows y0..y1 (inclusive) of the window of up to 201 x 201
// pixels around the image centre in which the levels are measured when no
// target levels are known.
struct CentreWindow {
    std::int32_t x0, x1, y0, y1;
};
CentreWindow centreWindow(std::int32_t width, std::int32_t height);

// Scales the channels of context.corrected to a common level: the levels are
// context.targetLevels, or, when targetLevels[0] is 0, the channel means over
// the centre window; each channel is multiplied by (largest level / its level).
// Throws std::runtime_error when the window misses a channel or a level is
// not positive, leaving the image as it was.
void whiteBalance(ProcessingContext& context);

// Odd box side for a filter size given in full-resolution pixels, on planes of
// an image prepared with `samplingFactor`: k = filterSize / (2 * factor), made
// odd by setting its lowest bit; at least 1.
int boxSide(int filterSize, int samplingFactor);

// The four channel levels of context.corrected: each channel's half-resolution
// plane smoothed by a box mean (odd side from lsc.awb_avg_filter_size and the
// preparation sampling factor, shrinking at the borders), its largest value;
// the rule of the fit's target levels. Throws std::runtime_error for an image
// smaller than 2 x 2.
void measureLevels(float (&levels)[kChannels], const ProcessingContext& context);

} // namespace prep
