#include "lsc/sample_window.h"

#include <algorithm>
#include <cstddef>
#include <stdexcept>

#include "image/bayer_phase.h"

namespace lsc {

namespace {

// Orders NaN after every number, so that the selection below always sees a
// strict weak order (working images hold finite values; this is a guard).
bool lessNanLast(float a, float b) {
    return a < b || (a == a && b != b);
}

float medianOf(float* values, std::size_t count) {
    float* middle = values + count / 2;
    std::nth_element(values, middle, values + count, lessNanLast);
    if (count % 2 == 1)
        return *middle;
    // The lower middle value is the largest of the lower half.
    const float lower = *std::max_element(values, middle, lessNanLast);
    return lower + (*middle - lower) * 0.5f;
}

// First and last block coordinate (even) of a window side, clipped so that
// every block lies wholly inside a side of `size` pixels. Near the border the
// window keeps its inner part rather than shrinking around the sample: its
// median then comes from slightly inside, but the border samples (the sample
// grid is densest there) keep most of their noise reduction; on noisy flat
// fields that leaves the corrected image flatter than a symmetric shrink.
void clippedRange(std::uint32_t centre, std::uint32_t size, int window, std::int64_t* first,
                  std::int64_t* last) {
    const std::int64_t reach = 2 * static_cast<std::int64_t>(window / 2);
    const std::int64_t lastBlock = static_cast<std::int64_t>(size & ~1u) - 2;
    *first = std::max<std::int64_t>(0, centre - reach);
    *last = std::min<std::int64_t>(lastBlock, centre + reach);
}

} // namespace

bool sampleWindowUsable(int window) {
    return window >= 1 && window <= kMaxSampleWindow && window % 2 == 1;
}

void windowMedians(const WorkingImage& image, int phase, std::uint32_t blockX, std::uint32_t blockY,
                   int window, float medians[kChannels]) {
    // The work area holds at most 15 x 15 values.
    if (!sampleWindowUsable(window))
        throw std::invalid_argument("sample window must be odd and 1 to 15 blocks");
    std::int64_t x0, x1, y0, y1;
    clippedRange(blockX, image.width, window, &x0, &x1);
    clippedRange(blockY, image.height, window, &y0, &y1);
    const std::size_t stride = image.width;

    // Offset of each channel's pixel inside a 2x2 block.
    std::size_t offset[kChannels];
    for (std::uint32_t dy = 0; dy < 2; ++dy)
        for (std::uint32_t dx = 0; dx < 2; ++dx)
            offset[img::bayerChannel(dx, dy, phase)] = dy * stride + dx;

    float values[kMaxSampleWindow * kMaxSampleWindow];
    for (int k = 0; k < kChannels; ++k) {
        std::size_t count = 0;
        for (std::int64_t y = y0; y <= y1; y += 2) {
            const float* row = image.pixels + static_cast<std::size_t>(y) * stride + offset[k];
            for (std::int64_t x = x0; x <= x1; x += 2)
                values[count++] = row[x];
        }
        medians[k] = medianOf(values, count);
    }
}

} // namespace lsc
