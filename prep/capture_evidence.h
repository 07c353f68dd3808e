#pragma once
// What a flat-field capture tells about likely set-up mistakes, measured
// robustly enough that a good flat never draws a warning: a declared Bayer
// order that does not fit the data, and a black level (pedestal) left in the
// samples that proc.black_level does not take out.

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "image/bayer_image.h"
#include "image/mosaic_rows.h"

namespace prep {

// Mean level of each channel (0 R, 1 GR, 2 GB, 3 B, as the declared Bayer
// order assigns them) over the middle third of a mosaic in each direction,
// where the lens shading is weakest, less `blackLevel` (fractions of full
// scale). `valid` is false when the centre holds no light.
struct CentreLevels {
    double level[4] = {0, 0, 0, 0};
    bool valid = false;
};
CentreLevels centreLevels(const img::BayerImage& mosaic, float blackLevel);

// Why the declared order `orderName` looks wrong, empty when it does not:
// the two greens of the centre differ by more than kGreenMismatch, or red or
// blue is brighter than kBrighterThanGreen x the larger green.
inline constexpr double kGreenMismatch = 0.05;
inline constexpr double kBrighterThanGreen = 1.2;
std::string bayerOrderDoubt(const CentreLevels& levels, const std::string& orderName);

// The photon-transfer evidence of a pedestal. Shot noise makes a pixel's
// noise variance grow in proportion to its signal above the black level:
// variance = gain x (mean - pedestal) + read noise^2. Over the blocks of a
// shaded flat field (bright centre, dark corners) the variance is fitted as
// a straight line of the mean; where it reaches the read noise lies the
// pedestal, and since the read noise is not negative, the mean at which the
// line reaches zero is a lower bound of the pedestal.
struct PedestalEvidence {
    bool measured = false;   // enough blocks, enough spread and clear shot noise
    double lowerBound = 0.0; // pedestal at least this, in sample units, less 3 standard errors
    double estimate = 0.0;   // the line's zero, in sample units
    double standardError = 0.0;
    int blocks = 0;
};

// Gathers the blocks' means and noise from the rows of a full-resolution
// mosaic as they pass (a strip of 16 rows held at a time), whether the
// capture is read as a stream or held whole; evidence() then fits the line.
class NoiseSampler final : public img::MosaicRowSink {
public:
    void start(std::int32_t width, std::int32_t height) override;
    void addRow(const std::uint16_t* samples) override;
    // Whether any row came (a reader that loads the image whole sends none).
    bool started() const { return width_ > 0; }
    PedestalEvidence evidence() const;

private:
    void measureStrip();

    std::int32_t width_ = 0, height_ = 0;
    int stepX_ = 1, stepY_ = 1;                     // every n-th block along each axis
    std::int32_t row_ = 0;                          // rows received
    std::vector<std::uint16_t> strip_;              // the rows of the current block row
    std::vector<std::pair<double, double>> points_; // (mean, variance) per block and channel
};
// Minimum excess of the lower bound over proc.black_level before the run
// warns: 2 % of full scale.
inline constexpr double kPedestalTolerance = 0.02;

} // namespace prep
