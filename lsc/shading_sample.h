#pragma once
// The sample points of a flat field that the surface fit works on.

#include <cstdint>
#include <vector>

namespace lsc {

inline constexpr int kChannels = 4;     // red, green/red, green/blue, blue
inline constexpr int kGridPoints = 100; // 10 x 10 control points per channel

// Display names of the four channels, in channel order.
inline constexpr const char* kChannelNames[kChannels] = {"red", "green/red", "green/blue", "blue"};

// One sample point of the flat field: even pixel coordinates of a 2x2 Bayer
// block and one value per channel (measured levels, later the gains).
struct shadingSample {
    std::uint32_t x;
    std::uint32_t y;
    float value[kChannels];
};

// The samples of one run, taken from the image or read from a sample file,
// and the level each channel's surface is fitted to.
struct SampleSet {
    std::vector<shadingSample> samples; // measured levels, black level taken out
    float targetLevels[kChannels] = {0, 0, 0, 0};
};

} // namespace lsc
