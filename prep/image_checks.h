#pragma once
// Acceptance checks of a flat-field image: the statistics lines, the range
// scan against the configured pixel window and the peak level check. Images
// are float images of any channel count with samples in 0..1 of full scale;
// for more than one channel the samples of a pixel lie together (plane image
// layout, prep/bayer_planes.h).

#include <cstddef>
#include <cstdint>
#include <ostream>

#include "image/bayer_image.h"

namespace prep {

// Full scale of a bit depth: 2^depth - 1, computed in 32-bit unsigned
// arithmetic (0 - 1 = 4294967295 for depths of 32 and more).
std::uint32_t fullScale(int depth);

// Writes "Minimum pixel value = ", "Maximum pixel value = " (both rounded to
// whole units of full scale) and "Average pixel value = " (two decimals) into
// `out`, the first two ended with std::endl, the last left open for the caller
// to end. The stream stays in fixed notation with precision 2.
void writeStatistics(const img::BayerImage& image, int depth, std::ostream& out);

// The figures behind those lines: extremes and the sum (in double, sample
// after sample in storage order) of the float samples.
struct SampleStatistics {
    float minimum = 0.0f;
    float maximum = 0.0f;
    double sum = 0.0;
    std::size_t count = 0;
};
SampleStatistics sampleStatistics(const img::BayerImage& image);
void writeStatistics(const SampleStatistics& statistics, int depth, std::ostream& out);

// Position of an out-of-range sample; row -1 when there is none.
struct OutOfRangePosition {
    std::int32_t row = -1;
    std::int32_t column = -1;
    std::uint16_t channel = 0xFFFF;
};

// Visits rows, then columns, then channels and returns the last sample below
// `low` or above `high` (a sample equal to a limit is inside). A sample that
// is not a number is outside.
OutOfRangePosition scanRange(const img::BayerImage& image, float low, float high);

// Largest sample of the whole image.
float peakSample(const img::BayerImage& image);

// A sample as a whole number of full-scale units, sample * M + 0.5 truncated,
// kept within 0..M.
std::uint32_t sampleUnits(float sample, std::uint32_t fullScale);

// The configured limits, in whole units of full scale.
struct PixelLimits {
    float minPixel = 0.0f;    // proc.min_pixel_val
    float maxPixel = 0.0f;    // proc.max_pixel_val
    float peakMinimum = 0.0f; // proc.peak_pixel_min
    // The image's reduction (shared.proc_sampling_factor): the detail line of
    // a failed range check gives positions in sensor pixels.
    int samplingFactor = 1;
};

// Where a Bayer mosaic reduced by `factor` per colour plane puts its pixel
// (x, y) on the sensor: the first sensor pixel of that colour in the block.
std::int64_t sensorCoordinate(std::int32_t reduced, int factor);

// The range check then the peak check. After each passed check
// "Image pixels within specified parameters." is written to `out` as a line
// of its own; a failed check throws std::runtime_error with the three-line
// explanation (every line ended by '\n'); a failed range check carries an
// ErrorDetail: which side, the share of pixels beyond it and where the worst
// one lies on the sensor.
void checkPixelRange(const img::BayerImage& image, const PixelLimits& limits,
                     std::uint32_t fullScale, std::ostream& out);
void checkPeakLevel(const img::BayerImage& image, const PixelLimits& limits,
                    std::uint32_t fullScale, std::ostream& out);
// Both, in that order.
void checkPixels(const img::BayerImage& image, const PixelLimits& limits, std::uint32_t fullScale,
                 std::ostream& out);

} // namespace prep
