#include "prep/image_checks.h"

#include <cmath>
#include <cstdio>
#include <iomanip>
#include <limits>
#include <locale>
#include <sstream>
#include <stdexcept>

#include "image/error_detail.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"

namespace prep {

using img::BayerImage;
using img::DetailedError;
namespace {

double roundHalfUp(double x) {
    return std::floor(x + 0.5);
}

// Messages format their numbers the same way in any locale.
std::ostringstream messageText() {
    std::ostringstream text;
    text.imbue(std::locale::classic());
    return text;
}

// One side of the pixel window: how many pixels lie beyond it and the worst.
struct SideCount {
    std::size_t count = 0;
    float worst = 0.0f;
    std::int32_t row = 0, column = 0;
};

// "too dark: 120 pixels (2.35 %) below 50 (darkest 3 at sensor x 0, y 0)"
// and/or the same for "too bright", joined by "; ". Only on the failure path.
std::string rangeDetail(const BayerImage& image, const PixelLimits& limits,
                        std::uint32_t fullScale) {
    const float scale = static_cast<float>(fullScale);
    const float low = limits.minPixel / scale;
    const float high = limits.maxPixel / scale;
    SideCount dark, bright;
    const float* sample = image.pixels();
    const std::uint16_t channels = image.channels();
    for (std::int32_t row = 0; row < image.height(); ++row)
        for (std::int32_t column = 0; column < image.width(); ++column)
            for (std::uint16_t channel = 0; channel < channels; ++channel, ++sample) {
                const float v = *sample;
                if (v < low) {
                    if (dark.count++ == 0 || v < dark.worst)
                        dark = {dark.count, v, row, column};
                } else if (!(v <= high)) { // above, or not a number
                    if (bright.count++ == 0 || v > bright.worst)
                        bright = {bright.count, v, row, column};
                }
            }
    const double total = static_cast<double>(sampleCount(image));
    std::ostringstream text = messageText();
    text << std::fixed << std::setprecision(2);
    const auto side = [&](const char* name, const char* relation, float limit,
                          const char* worstName, const SideCount& found) {
        if (found.count == 0)
            return;
        if (text.tellp() > 0)
            text << "; ";
        char share[32];
        std::snprintf(share, sizeof share, "%.3g",
                      100.0 * static_cast<double>(found.count) / total);
        text << name << ": " << found.count << (found.count == 1 ? " pixel (" : " pixels (")
             << share << " %) " << relation << ' ' << std::setprecision(0) << limit << " ("
             << worstName << ' ' << sampleUnits(found.worst, fullScale) << " at sensor x "
             << sensorCoordinate(found.column, limits.samplingFactor) << ", y "
             << sensorCoordinate(found.row, limits.samplingFactor) << ')' << std::setprecision(2);
    };
    side("too dark", "below", limits.minPixel, "darkest", dark);
    side("too bright", "above", limits.maxPixel, "brightest", bright);
    return text.str();
}

} // namespace

std::int64_t sensorCoordinate(std::int32_t reduced, int factor) {
    return static_cast<std::int64_t>(reduced / 2) * 2 * factor + (reduced & 1);
}

std::uint32_t fullScale(int depth) {
    const std::uint32_t power = depth >= 32 || depth < 0 ? 0u : std::uint32_t{1} << depth;
    return power - 1u;
}

SampleStatistics sampleStatistics(const BayerImage& image) {
    requireFloatImage(image);
    const float* samples = image.pixels();
    SampleStatistics statistics;
    statistics.count = sampleCount(image);
    statistics.minimum = samples[0];
    statistics.maximum = samples[0];
    for (std::size_t i = 0; i < statistics.count; ++i) {
        const float v = samples[i];
        if (v < statistics.minimum)
            statistics.minimum = v;
        if (v > statistics.maximum)
            statistics.maximum = v;
        statistics.sum += v;
    }
    return statistics;
}

void writeStatistics(const BayerImage& image, int depth, std::ostream& out) {
    writeStatistics(sampleStatistics(image), depth, out);
}

void writeStatistics(const SampleStatistics& statistics, int depth, std::ostream& out) {
    const double scale = fullScale(depth);
    out << std::fixed << std::setprecision(0);
    out << msg::kMinimumPixel << roundHalfUp(statistics.minimum * scale) << std::endl;
    out << msg::kMaximumPixel << roundHalfUp(statistics.maximum * scale) << std::endl;
    out << std::setprecision(2) << msg::kAveragePixel
        << statistics.sum * scale / static_cast<double>(statistics.count);
}

OutOfRangePosition scanRange(const BayerImage& image, float low, float high) {
    requireFloatImage(image);
    OutOfRangePosition found;
    const float* sample = image.pixels();
    const std::int32_t width = image.width();
    const std::int32_t height = image.height();
    const std::uint16_t channels = image.channels();
    for (std::int32_t row = 0; row < height; ++row) {
        for (std::int32_t column = 0; column < width; ++column) {
            for (std::uint16_t channel = 0; channel < channels; ++channel, ++sample) {
                if (!(*sample >= low && *sample <= high))
                    found = {row, column, channel};
            }
        }
    }
    return found;
}

float peakSample(const BayerImage& image) {
    requireFloatImage(image);
    const float* samples = image.pixels();
    const std::size_t count = sampleCount(image);
    // Starting below every number keeps a leading NaN from hiding the peak.
    float peak = -std::numeric_limits<float>::infinity();
    for (std::size_t i = 0; i < count; ++i)
        if (samples[i] > peak)
            peak = samples[i];
    return peak;
}

std::uint32_t sampleUnits(float sample, std::uint32_t fullScale) {
    const double units = static_cast<double>(sample) * fullScale + 0.5;
    if (!(units > 0.0))
        return 0;
    if (units >= fullScale)
        return fullScale;
    return static_cast<std::uint32_t>(units);
}

void checkPixelRange(const BayerImage& image, const PixelLimits& limits, std::uint32_t fullScale,
                     std::ostream& out) {
    const float scale = static_cast<float>(fullScale);
    const OutOfRangePosition position =
        scanRange(image, limits.minPixel / scale, limits.maxPixel / scale);
    if (position.row >= 0) {
        const std::size_t index =
            (static_cast<std::size_t>(position.row) * static_cast<std::size_t>(image.width()) +
             static_cast<std::size_t>(position.column)) *
                image.channels() +
            position.channel;
        std::ostringstream text = messageText();
        text << msg::kPixelsNotWithin << limits.minPixel << " to " << limits.maxPixel << ".\n"
             << msg::kPossibleCauses << '\n'
             << msg::kOutOfRangeValue << position.row << ',' << position.column
             << ") = " << sampleUnits(image.pixels()[index], fullScale) << ".\n";
        throw DetailedError<std::runtime_error>(rangeDetail(image, limits, fullScale), text.str());
    }
    out << msg::kPixelsWithin << std::endl;
}

void checkPeakLevel(const BayerImage& image, const PixelLimits& limits, std::uint32_t fullScale,
                    std::ostream& out) {
    const float peak = peakSample(image);
    if (limits.peakMinimum / static_cast<float>(fullScale) > peak) {
        std::ostringstream text = messageText();
        text << msg::kPeakBelowMinimum << limits.peakMinimum << ".\n"
             << msg::kPossibleCauses << '\n'
             << msg::kPeakValue << sampleUnits(peak, fullScale) << ".\n";
        throw std::runtime_error(text.str());
    }
    out << msg::kPixelsWithin << std::endl;
}

void checkPixels(const BayerImage& image, const PixelLimits& limits, std::uint32_t fullScale,
                 std::ostream& out) {
    checkPixelRange(image, limits, fullScale, out);
    checkPeakLevel(image, limits, fullScale, out);
}

} // namespace prep
