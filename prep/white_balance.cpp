#include "prep/white_balance.h"

#include <cmath>
#include <cstddef>
#include <stdexcept>

#include "image/bayer_phase.h"
#include "lsc/target_levels.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"

namespace prep {

using img::BayerImage;

using lsc::kChannels;
using lsc::targetLevelsOf;
using lsc::WorkingImage;
namespace {

void requireBayerImage(const BayerImage& image) {
    requireFloatImage(image);
    if (image.channels() != 1)
        throw std::invalid_argument(msg::kNotBayerImage);
}

} // namespace

CentreWindow centreWindow(std::int32_t width, std::int32_t height) {
    const std::int32_t cx = width / 2;
    const std::int32_t cy = height / 2;
    return {cx > 100 ? cx - 100 : 0, cx < width - 100 ? cx + 100 : width - 1,
            cy > 100 ? cy - 100 : 0, cy < height - 100 ? cy + 100 : height - 1};
}

// Mean of each channel over the centre window. The window of an image of at
// least 2 x 2 pixels holds every channel; a smaller one is refused.
void centreLevels(const BayerImage& image, float (&levels)[kChannels]) {
    const CentreWindow window = centreWindow(image.width(), image.height());
    const int phase = img::bayerPhase(image.cfa());
    const std::size_t width = static_cast<std::size_t>(image.width());
    float sums[kChannels] = {0, 0, 0, 0};
    std::uint64_t counts[kChannels] = {0, 0, 0, 0};
    for (std::int32_t y = window.y0; y <= window.y1; ++y) {
        const float* row = image.pixels() + static_cast<std::size_t>(y) * width;
        for (std::int32_t x = window.x0; x <= window.x1; ++x) {
            const int channel = img::bayerChannel(static_cast<std::uint64_t>(x),
                                                  static_cast<std::uint64_t>(y), phase);
            sums[channel] += row[x];
            ++counts[channel];
        }
    }
    for (int k = 0; k < kChannels; ++k) {
        if (counts[k] == 0)
            throw std::runtime_error(msg::kNoCentrePixels);
        levels[k] = sums[k] / static_cast<float>(counts[k]);
    }
}

void balanceLevels(const float (&targetLevels)[kChannels], const BayerImage& image,
                   float (&levels)[kChannels]) {
    requireBayerImage(image);
    if (targetLevels[0] != 0.0f)
        std::copy(targetLevels, targetLevels + kChannels, levels);
    else
        centreLevels(image, levels);
}

void whiteBalance(BayerImage& image, const float (&levels)[kChannels]) {
    requireBayerImage(image);

    float largest = levels[0];
    for (float level : levels) {
        // A level of zero or below would turn the channel into infinities.
        if (!(level > 0.0f) || !std::isfinite(level))
            throw std::runtime_error(msg::kBadChannelLevel);
        if (level > largest)
            largest = level;
    }
    float gains[kChannels];
    for (int k = 0; k < kChannels; ++k)
        gains[k] = largest / levels[k];

    const int phase = img::bayerPhase(image.cfa());
    const std::size_t width = static_cast<std::size_t>(image.width());
    const std::size_t height = static_cast<std::size_t>(image.height());
    float* pixel = image.pixels();
    for (std::size_t y = 0; y < height; ++y) {
        const float rowGains[2] = {gains[img::bayerChannel(0, y, phase)],
                                   gains[img::bayerChannel(1, y, phase)]};
        for (std::size_t x = 0; x < width; ++x, ++pixel)
            *pixel *= rowGains[x & 1];
    }
}

int boxSide(int filterSize, int samplingFactor) {
    if (samplingFactor < 1)
        throw std::invalid_argument(msg::kBadSamplingFactor);
    const int k = filterSize / (2 * samplingFactor);
    return k < 1 ? 1 : (k & ~1) | 1;
}

void measureLevels(float (&levels)[kChannels], const BayerImage& image, int awbFilterSize,
                   int samplingFactor) {
    requireBayerImage(image);
    // Planes without a pixel would give levels of 0, and the R/G and B/G
    // ratios reported from them would divide by zero.
    if (image.width() < 2 || image.height() < 2)
        throw std::runtime_error(msg::kImageTooSmallForLevels);
    // The same rule as the target levels of the fit; it only reads the pixels.
    const WorkingImage view{static_cast<std::uint32_t>(image.width()),
                            static_cast<std::uint32_t>(image.height()), image.cfa(),
                            const_cast<float*>(image.pixels())};
    targetLevelsOf(view, boxSide(awbFilterSize, samplingFactor), levels);
}

} // namespace prep
