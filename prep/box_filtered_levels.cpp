#include "prep/box_filtered_levels.h"

#include "prep/bayer_phase.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"

#include <algorithm>
#include <cstddef>
#include <stdexcept>
#include <vector>

namespace prep {
namespace {

// Number of positions of 0..size-1 within `radius` of `at`.
std::size_t windowCount(std::size_t at, std::size_t radius, std::size_t size) {
    const std::size_t first = at > radius ? at - radius : 0;
    const std::size_t last = std::min(at + radius, size - 1);
    return last - first + 1;
}

} // namespace

int boxSide(int filterSize, int samplingFactor) {
    if (samplingFactor < 1)
        throw std::invalid_argument(msg::kBadSamplingFactor);
    const int k = filterSize / (2 * samplingFactor);
    return k < 1 ? 1 : (k & ~1) | 1;
}

void boxFilteredLevels(const BayerImage& image, int side, float (&levels)[4]) {
    requireFloatImage(image);
    if (image.channels() != 1)
        throw std::invalid_argument(msg::kNotBayerImage);
    const std::size_t width = static_cast<std::size_t>(image.width()) / 2;
    const std::size_t height = static_cast<std::size_t>(image.height()) / 2;
    if (width == 0 || height == 0)
        throw std::runtime_error(msg::kImageTooSmallForLevels);
    const std::size_t radius = static_cast<std::size_t>(side < 1 ? 0 : side / 2);
    const std::size_t imageWidth = static_cast<std::size_t>(image.width());
    const int phase = bayerPhase(image.cfa());

    // Running sums: along each row into rowSums, then down the columns.
    std::vector<double> rowSums(width * height);
    std::vector<double> columnSums(width);
    std::vector<double> columnCounts(width);
    for (std::size_t x = 0; x < width; ++x)
        columnCounts[x] = static_cast<double>(windowCount(x, radius, width));

    for (int channel = 0; channel < 4; ++channel) {
        int dx, dy;
        channelOffset(channel, phase, dx, dy);
        const float* first = image.pixels() + static_cast<std::size_t>(dy) * imageWidth + dx;
        for (std::size_t y = 0; y < height; ++y) {
            const float* row = first + 2 * y * imageWidth;
            double* out = rowSums.data() + y * width;
            double sum = 0.0;
            for (std::size_t x = 0; x < std::min(radius, width); ++x)
                sum += row[2 * x];
            for (std::size_t x = 0; x < width; ++x) {
                if (x + radius < width)
                    sum += row[2 * (x + radius)];
                if (x > radius)
                    sum -= row[2 * (x - radius - 1)];
                out[x] = sum;
            }
        }

        std::fill(columnSums.begin(), columnSums.end(), 0.0);
        for (std::size_t y = 0; y < std::min(radius, height); ++y)
            for (std::size_t x = 0; x < width; ++x)
                columnSums[x] += rowSums[y * width + x];
        double best = 0.0;
        bool any = false;
        for (std::size_t y = 0; y < height; ++y) {
            if (y + radius < height)
                for (std::size_t x = 0; x < width; ++x)
                    columnSums[x] += rowSums[(y + radius) * width + x];
            if (y > radius)
                for (std::size_t x = 0; x < width; ++x)
                    columnSums[x] -= rowSums[(y - radius - 1) * width + x];
            const double rows = static_cast<double>(windowCount(y, radius, height));
            for (std::size_t x = 0; x < width; ++x) {
                const double mean = columnSums[x] / (rows * columnCounts[x]);
                if (!any || mean > best) {
                    best = mean;
                    any = true;
                }
            }
        }
        levels[channel] = static_cast<float>(best);
    }
}

} // namespace prep
