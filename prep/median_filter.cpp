#include "prep/median_filter.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <stdexcept>

#include "prep/bayer_planes.h"
#include "prep/median_tree.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"
#include "prep/window_mirror.h"

namespace prep {

using img::BayerImage;
using img::kBufferInterleaved;
using img::kPixelOther;
namespace {

constexpr std::size_t kTreeChannels = 4; // channels filtered side by side

} // namespace

void medianFilterDownsample(const BayerImage& planes, int size, int factor, BayerImage& target) {
    requireFloatImage(planes);
    if (size < 1 || size > kMaxMedianSize)
        throw std::invalid_argument(msg::kBadMedianSize);
    const std::int32_t width = downsampledSize(planes.width(), factor);
    const std::int32_t height = downsampledSize(planes.height(), factor);
    target = createFloatImage(width, height, planes.bitsPerSample(), planes.channels(), 0, 0,
                              kPixelOther, kBufferInterleaved);

    const float* in = planes.pixels();
    float* out = target.pixels();
    const std::size_t channels = planes.channels();
    const std::size_t sourceWidth = static_cast<std::size_t>(planes.width());
    const std::int64_t half = size / 2;
    const std::size_t window = static_cast<std::size_t>(size);

    MedianTree trees[kTreeChannels];
    std::size_t rowOffsets[kMaxMedianSize];
    std::size_t columnOffsets[kMaxMedianSize];
    for (std::int64_t y = 0; y < height; ++y) {
        for (std::size_t i = 0; i < window; ++i)
            rowOffsets[i] =
                mirrorIndex(factor * y - half + static_cast<std::int64_t>(i), planes.height()) *
                sourceWidth;
        for (std::int64_t x = 0; x < width; ++x) {
            for (std::size_t i = 0; i < window; ++i)
                columnOffsets[i] =
                    mirrorIndex(factor * x - half + static_cast<std::int64_t>(i), planes.width());
            for (std::size_t first = 0; first < channels; first += kTreeChannels) {
                const std::size_t group = std::min(kTreeChannels, channels - first);
                for (std::size_t k = 0; k < group; ++k)
                    trees[k].clear();
                for (std::size_t r = 0; r < window; ++r) {
                    for (std::size_t c = 0; c < window; ++c) {
                        const float* pixel =
                            in + (rowOffsets[r] + columnOffsets[c]) * channels + first;
                        for (std::size_t k = 0; k < group; ++k)
                            trees[k].insert(pixel[k]);
                    }
                }
                for (std::size_t k = 0; k < group; ++k)
                    out[first + k] = trees[k].median();
            }
            out += channels;
        }
    }
}

} // namespace prep
