#include "lsc/target_levels.h"

#include <algorithm>
#include <cstddef>
#include <vector>

#include "image/bayer_phase.h"

namespace lsc {

namespace {

// Plane of one channel read in place: pixel (px, py) of the plane is image
// pixel (2 px + dx, 2 py + dy).
struct ChannelPlane {
    const float* first; // image pixel of plane pixel (0, 0)
    std::size_t rowStride;
    std::size_t width;
    std::size_t height;
    float at(std::size_t px, std::size_t py) const { return first[py * rowStride + 2 * px]; }
};

// Largest box mean of radius r, from running column sums (down the rows) and
// a running sum along each row over them; `columnSums` holds plane.width entries.
float largestBoxMean(const ChannelPlane& plane, std::size_t r, std::vector<double>& columnSums) {
    const std::size_t w = plane.width, h = plane.height;
    std::fill(columnSums.begin(), columnSums.end(), 0.0);
    for (std::size_t y = 0; y <= std::min(r, h - 1); ++y)
        for (std::size_t x = 0; x < w; ++x)
            columnSums[x] += plane.at(x, y);

    double largest = 0.0;
    bool first = true;
    for (std::size_t y = 0; y < h; ++y) {
        const std::size_t rows = std::min(y + r, h - 1) - (y > r ? y - r : 0) + 1;
        double rowSum = 0.0;
        for (std::size_t x = 0; x <= std::min(r, w - 1); ++x)
            rowSum += columnSums[x];
        for (std::size_t x = 0; x < w; ++x) {
            const std::size_t columns = std::min(x + r, w - 1) - (x > r ? x - r : 0) + 1;
            const double mean = rowSum / static_cast<double>(rows * columns);
            if (first || mean > largest) {
                largest = mean;
                first = false;
            }
            if (x + r + 1 < w)
                rowSum += columnSums[x + r + 1];
            if (x >= r)
                rowSum -= columnSums[x - r];
        }
        // Move the column window one row down.
        if (y + r + 1 < h)
            for (std::size_t x = 0; x < w; ++x)
                columnSums[x] += plane.at(x, y + r + 1);
        if (y >= r)
            for (std::size_t x = 0; x < w; ++x)
                columnSums[x] -= plane.at(x, y - r);
    }
    return static_cast<float>(largest);
}

} // namespace

void targetLevelsOf(const WorkingImage& image, int windowSize, float levels[4]) {
    const std::size_t width = image.width / 2, height = image.height / 2;
    if (width == 0 || height == 0) {
        std::fill(levels, levels + 4, 0.0f);
        return;
    }
    const std::size_t radius = windowSize > 1 ? static_cast<std::size_t>(windowSize) / 2 : 0;
    std::vector<double> columnSums(width);
    const int phase = img::bayerPhase(image.cfa);
    for (int dy = 0; dy < 2; ++dy)
        for (int dx = 0; dx < 2; ++dx) {
            const ChannelPlane plane{image.pixels + static_cast<std::size_t>(dy) * image.width + dx,
                                     2 * static_cast<std::size_t>(image.width), width, height};
            levels[img::bayerChannel(static_cast<unsigned>(dx), static_cast<unsigned>(dy), phase)] =
                largestBoxMean(plane, radius, columnSums);
        }
}

} // namespace lsc
