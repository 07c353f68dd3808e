#include "report/report_data.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <stdexcept>

#include "image/bayer_phase.h"
#include "lsc/eval_patch.h"
#include "report/report_messages.h"

namespace report {

using img::BayerImage;
using img::ImageBuffer;
using img::kDataReal32;

using lsc::AxisPosition;
using lsc::axisPosition;
using lsc::evalPatch;
using lsc::kChannels;
using lsc::kGridPoints;
using lsc::PatchBreakpoints;
using lsc::patchStart;
using lsc::usablePatchBreakpoints;

namespace {

// Pixel at fraction (index + offset) / count of a size, inside 0..size - 1.
std::uint32_t pixelAt(std::uint64_t index2, std::uint64_t count2, std::uint32_t size) {
    const std::uint64_t p = index2 * size / count2;
    return static_cast<std::uint32_t>(std::min<std::uint64_t>(p, size - 1));
}

} // namespace

BlockGrid blockGridFor(std::int64_t width, std::int64_t height, int longSide) {
    BlockGrid grid;
    if (width <= 0 || height <= 0 || longSide < 1)
        return grid;
    const std::int64_t longer = std::max(width, height);
    const std::int64_t shorter = std::min(width, height);
    const int across = static_cast<int>(
        std::max<std::int64_t>(1, (2 * shorter * longSide + longer) / (2 * longer)));
    grid.columns = width >= height ? longSide : across;
    grid.rows = width >= height ? across : longSide;
    return grid;
}

ChannelBlockMeans blockMeans(const BayerImage& mosaic, int columns, int rows) {
    const ImageBuffer* image = mosaic.buffer();
    if (!image || image->dataType != kDataReal32 || image->samplesPerPixel != 1 || !image->data ||
        image->width < 2 || image->height < 2)
        throw std::runtime_error(msg::kReportNeedsBayerImage);
    if (columns < 1 || rows < 1)
        throw std::runtime_error(msg::kReportBadBlockGrid);

    const std::uint64_t width = static_cast<std::uint64_t>(image->width);
    const std::uint64_t cellsX = width / 2;
    const std::uint64_t cellsY = static_cast<std::uint64_t>(image->height) / 2;
    ChannelBlockMeans means;
    means.columns =
        static_cast<int>(std::min<std::uint64_t>(static_cast<unsigned>(columns), cellsX));
    means.rows = static_cast<int>(std::min<std::uint64_t>(static_cast<unsigned>(rows), cellsY));
    const std::size_t blocks = static_cast<std::size_t>(means.columns) * means.rows;

    // First cell of each block column (cell cx belongs to block column
    // cx * columns / cellsX), worked out once for all rows.
    std::vector<std::uint64_t> firstCell(static_cast<std::size_t>(means.columns) + 1);
    for (std::size_t b = 0; b <= static_cast<std::size_t>(means.columns); ++b)
        firstCell[b] = (b * cellsX + means.columns - 1) / means.columns;
    std::vector<double> sums(blocks * kChannels, 0.0);
    std::vector<std::uint64_t> cells(blocks, 0);

    const int phase = img::bayerPhase(image->cfa[1]);
    const float* pixels = static_cast<const float*>(image->data);
    for (std::uint64_t y = 0; y < 2 * cellsY; ++y) {
        const std::size_t blockRow = static_cast<std::size_t>((y / 2) * means.rows / cellsY);
        const float* row = pixels + y * width;
        const int channels[2] = {img::bayerChannel(0, y, phase), img::bayerChannel(1, y, phase)};
        for (std::size_t b = 0; b < static_cast<std::size_t>(means.columns); ++b) {
            // A row's share of one block in single precision, gathered in double.
            float even = 0.0f, odd = 0.0f;
            for (std::uint64_t cx = firstCell[b]; cx < firstCell[b + 1]; ++cx) {
                even += row[2 * cx];
                odd += row[2 * cx + 1];
            }
            double* blockSums = sums.data() + (blockRow * means.columns + b) * kChannels;
            blockSums[channels[0]] += even;
            blockSums[channels[1]] += odd;
            if (y % 2 == 0)
                cells[blockRow * means.columns + b] += firstCell[b + 1] - firstCell[b];
        }
    }

    for (int k = 0; k < kChannels; ++k) {
        means.mean[k].resize(blocks);
        for (std::size_t b = 0; b < blocks; ++b)
            means.mean[k][b] =
                static_cast<float>(sums[b * kChannels + k] / static_cast<double>(cells[b]));
    }
    return means;
}

void scaleToPeak(ChannelBlockMeans& means, float blackLevel) {
    for (std::vector<float>& channel : means.mean) {
        if (channel.empty())
            continue;
        for (float& value : channel)
            value = std::max(0.0f, value - blackLevel);
        const float peak = *std::max_element(channel.begin(), channel.end());
        if (!(peak > 0.0f))
            continue;
        for (float& value : channel)
            value /= peak;
    }
}

void deviationFromMean(ChannelBlockMeans& means) {
    for (std::vector<float>& channel : means.mean) {
        if (channel.empty())
            continue;
        double sum = 0.0;
        for (float value : channel)
            sum += value;
        const double mean = sum / static_cast<double>(channel.size());
        if (!(mean > 0.0))
            continue;
        for (float& value : channel)
            value = static_cast<float>(value / mean - 1.0);
    }
}

ValueRange channelRange(const ChannelBlockMeans& means, int channel) {
    ValueRange range;
    const std::vector<float>& values = means.mean[channel];
    if (values.empty())
        return range;
    const auto [low, high] = std::minmax_element(values.begin(), values.end());
    range.minimum = *low;
    range.maximum = *high;
    return range;
}

float largestAbsolute(const std::vector<float>& values) {
    float largest = 0.0f;
    for (float value : values)
        largest = std::max(largest, std::fabs(value));
    return largest;
}

float gainAt(const float (&grid)[kGridPoints], const PatchBreakpoints& breaks, std::uint32_t x,
             std::uint32_t y) {
    const AxisPosition column = axisPosition(x, breaks.x);
    const AxisPosition row = axisPosition(y, breaks.y);
    return evalPatch(grid, patchStart(row.patch, column.patch), column.local, row.local);
}

GainSurface sampleGainSurface(const float (&grid)[kGridPoints], std::uint32_t width,
                              std::uint32_t height, const double (&fractions)[4], int columns,
                              int rows) {
    if (width == 0 || height == 0)
        throw std::runtime_error(msg::kReportNeedsBayerImage);
    if (columns < 1 || rows < 1)
        throw std::runtime_error(msg::kReportBadBlockGrid);
    const PatchBreakpoints breaks = usablePatchBreakpoints(
        width, height, fractions[0], fractions[1], fractions[2], fractions[3]);
    GainSurface surface;
    surface.columns = columns;
    surface.rows = rows;
    surface.gain.reserve(static_cast<std::size_t>(columns) * rows);
    for (int r = 0; r < rows; ++r) {
        const std::uint32_t y = pixelAt(2 * std::uint64_t(r) + 1, 2 * std::uint64_t(rows), height);
        for (int c = 0; c < columns; ++c) {
            const std::uint32_t x =
                pixelAt(2 * std::uint64_t(c) + 1, 2 * std::uint64_t(columns), width);
            surface.gain.push_back(gainAt(grid, breaks, x, y));
        }
    }

    // Extremes over a lattice twice as fine whose outer nodes are the first
    // and last pixels, where the largest gains of a shading correction lie.
    const std::uint64_t nodesX = 2 * std::uint64_t(columns) + 1;
    const std::uint64_t nodesY = 2 * std::uint64_t(rows) + 1;
    surface.minimum = surface.maximum = gainAt(grid, breaks, 0, 0);
    for (std::uint64_t j = 0; j < nodesY; ++j) {
        const std::uint32_t y = static_cast<std::uint32_t>(j * (height - 1) / (nodesY - 1));
        for (std::uint64_t i = 0; i < nodesX; ++i) {
            const std::uint32_t x = static_cast<std::uint32_t>(i * (width - 1) / (nodesX - 1));
            const float gain = gainAt(grid, breaks, x, y);
            surface.minimum = std::min(surface.minimum, gain);
            surface.maximum = std::max(surface.maximum, gain);
        }
    }
    for (float gain : surface.gain) {
        surface.minimum = std::min(surface.minimum, gain);
        surface.maximum = std::max(surface.maximum, gain);
    }
    return surface;
}

} // namespace report
