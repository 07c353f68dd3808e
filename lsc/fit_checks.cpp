#include "lsc/fit_checks.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <stdexcept>

#include "lsc/lsc_messages.h"

namespace lsc {

namespace {

// Numbers for people, the same in every locale. The buffer holds any double
// in fixed-point with a few decimals (309 integer digits at most).
std::string numberText(double value, std::chars_format format, int precision) {
    char buffer[352];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value, format, precision);
    if (result.ec != std::errc())
        return "?";
    return std::string(buffer, result.ptr);
}

// Up to six significant digits, as a stream writes a number by default.
std::string gainText(float value) {
    return numberText(value, std::chars_format::general, 6);
}

[[noreturn]] void throwGainAbove(int channel, float gain, float maxGain) {
    throw std::runtime_error(lsc::msg::kGainAbovePrefix + gainText(gain) +
                             lsc::msg::kGainAboveChannel + kChannelNames[channel] +
                             lsc::msg::kGainAboveLimit + gainText(maxGain) +
                             lsc::msg::kGainAboveSuffix);
}

} // namespace

std::string deviationLine(int channel, float max, float rms) {
    return kChannelNames[channel] + std::string(lsc::msg::kDeviationLine) + " " +
           numberText(max, std::chars_format::fixed, 5) + " " +
           numberText(rms, std::chars_format::fixed, 5);
}

void checkDeviationBounds(const float rms[kChannels], const float max[kChannels], float maxRms,
                          float maxError) {
    for (int k = 0; k < kChannels; ++k)
        if (!(rms[k] <= maxRms))
            throw std::runtime_error(lsc::msg::kRmsBoundExceeded);
    for (int k = 0; k < kChannels; ++k)
        if (!(max[k] <= maxError))
            throw std::runtime_error(lsc::msg::kMaxBoundExceeded);
}

void checkGainSamples(const std::vector<shadingSample>& samples, std::uint32_t width,
                      std::uint32_t height, float maxGain) {
    for (int k = 0; k < kChannels; ++k) {
        bool any = false;
        float largest = 0.0f;
        for (const shadingSample& s : samples)
            if (s.x < width && s.y < height && (!any || s.value[k] > largest)) {
                largest = s.value[k];
                any = true;
            }
        if (any && largest > maxGain)
            throwGainAbove(k, largest, maxGain);
    }
}

void checkControlPoints(const float grids[kChannels][kGridPoints], float maxGain) {
    for (int k = 0; k < kChannels; ++k) {
        const float largest = *std::max_element(grids[k], grids[k] + kGridPoints);
        if (largest > maxGain)
            throwGainAbove(k, largest, maxGain);
    }
}

} // namespace lsc
