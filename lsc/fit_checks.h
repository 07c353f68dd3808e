#pragma once
// The checks that keep a bad flat field or a bad fit from becoming a
// calibration: how far each fitted surface lies from its gain samples, and a
// ceiling on the gains.

#include <cstdint>
#include <iosfwd>
#include <string>
#include <vector>

#include "lsc/shading_sample.h"

namespace lsc {

// The largest and the RMS deviation of one channel (see sample_deviation.h).
struct FitDeviation {
    double max = 0.0;
    double rms = 0.0;
};

// "<channel name> deviation max, rms: <max> <rms>", both figures in
// fixed-point with five decimals, e.g.
// "red deviation max, rms: 0.00412 0.00131".
std::string deviationLine(int channel, float max, float rms);

// Throws std::runtime_error "RMS error bound exceeded." when the RMS
// deviation of any channel exceeds maxRms; otherwise "MAX error bound
// exceeded." when the largest deviation of any channel exceeds maxError. A
// figure that is not a number counts as exceeding.
void checkDeviationBounds(const float rms[kChannels], const float max[kChannels], float maxRms,
                          float maxError);

// Throw std::runtime_error naming the channel, the gain and the limit when a
// gain lies above maxGain: checkGainSamples looks at the gains the fit uses
// (samples inside width x height) and reports the largest gain of the first
// channel, in channel order, that has one above the limit; checkControlPoints
// does the same for the fitted control points.
void checkGainSamples(const std::vector<shadingSample>& samples, std::uint32_t width,
                      std::uint32_t height, float maxGain);
void checkControlPoints(const float grids[kChannels][kGridPoints], float maxGain);

} // namespace lsc
