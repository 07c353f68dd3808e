#include "prep/capture_evidence.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <vector>

#include "image/bayer_phase.h"
#include "lsc/shading_sample.h"
#include "prep/prep_image.h"

namespace prep {

using img::BayerImage;

using lsc::kChannelNames;

namespace {

// Blocks of 16 x 16 sensor pixels (8 x 8 of each channel); at most this many
// along each axis are measured, spread evenly, so the cost does not grow with
// the image.
constexpr int kBlockSide = 16;
constexpr int kMaxBlocksPerAxis = 64;
constexpr std::size_t kMinBlocks = 200;
constexpr double kMinSlopeSignificance = 20.0; // slope / its standard error
constexpr double kMinLevelSpread = 1.3;        // brightest / darkest block mean

std::string percentText(double fraction) {
    char text[32];
    std::snprintf(text, sizeof text, "%.1f", 100.0 * fraction);
    return text;
}

std::string ratioText(double ratio) {
    char text[32];
    std::snprintf(text, sizeof text, "%.2f", ratio);
    return text;
}

// Noise variance of one channel in one block, from the differences of
// horizontally adjacent pixels of that channel (the shading barely changes
// over two pixels). The largest tenth of the differences is left out, so a
// defect does not count; that scales every block's figure alike, which
// moves neither the line's zero nor its significance.
void blockNoise(const std::uint16_t* strip, std::size_t stride, std::int32_t x0, int y0,
                double& mean, double& variance) {
    constexpr int kLeftOut = 5;          // the largest tenth of the 56 differences
    std::int32_t largest[kLeftOut] = {}; // ascending
    std::int64_t sum = 0, squares = 0;
    int pixels = 0, count = 0;
    for (int row = y0; row < kBlockSide; row += 2) {
        const std::uint16_t* line = strip + static_cast<std::size_t>(row) * stride + x0;
        for (int column = 0; column < kBlockSide; column += 2) {
            sum += line[column];
            ++pixels;
            if (column + 2 >= kBlockSide)
                continue;
            const std::int32_t d =
                std::abs(static_cast<std::int32_t>(line[column + 2]) - line[column]);
            squares += std::int64_t{d} * d;
            ++count;
            if (d > largest[0]) {
                int at = 0;
                while (at + 1 < kLeftOut && largest[at + 1] < d) {
                    largest[at] = largest[at + 1];
                    ++at;
                }
                largest[at] = d;
            }
        }
    }
    for (std::int32_t d : largest)
        squares -= std::int64_t{d} * d;
    mean = static_cast<double>(sum) / pixels;
    variance = static_cast<double>(squares) / (count - kLeftOut) / 2.0;
}

} // namespace

CentreLevels centreLevels(const BayerImage& mosaic, float blackLevel) {
    requireFloatImage(mosaic);
    CentreLevels levels;
    const std::int32_t width = mosaic.width();
    const std::int32_t height = mosaic.height();
    if (mosaic.channels() != 1 || width < 6 || height < 6)
        return levels;
    const int phase = img::bayerPhase(mosaic.cfa());
    double sum[4] = {0, 0, 0, 0};
    std::size_t count[4] = {0, 0, 0, 0};
    const float* samples = mosaic.pixels();
    for (std::int32_t y = height / 3; y < height - height / 3; ++y)
        for (std::int32_t x = width / 3; x < width - width / 3; ++x) {
            const int channel = img::bayerChannel(static_cast<std::uint64_t>(x),
                                                  static_cast<std::uint64_t>(y), phase);
            sum[channel] += samples[static_cast<std::size_t>(y) * width + x];
            ++count[channel];
        }
    levels.valid = true;
    for (int c = 0; c < 4; ++c) {
        levels.level[c] = count[c] ? sum[c] / static_cast<double>(count[c]) - blackLevel : 0.0;
        if (!(levels.level[c] > 0.0))
            levels.valid = false;
    }
    return levels;
}

std::string bayerOrderDoubt(const CentreLevels& levels, const std::string& orderName) {
    if (!levels.valid)
        return std::string();
    const double green = std::max(levels.level[1], levels.level[2]);
    const double greens = std::fabs(levels.level[1] - levels.level[2]) / green;
    const std::string question = ": is the Bayer order " + orderName + " right?";
    if (greens > kGreenMismatch)
        return "The two green channels differ by " + percentText(greens) +
               " % in the centre of the image (a sensor's greens differ by a few per cent at "
               "most)" +
               question;
    for (int c : {0, 3})
        if (levels.level[c] > kBrighterThanGreen * green)
            return std::string("The ") + kChannelNames[c] + " channel is " +
                   ratioText(levels.level[c] / green) +
                   " x green in the centre of the image (no usual illuminant makes it brighter "
                   "than green)" +
                   question;
    return std::string();
}

void NoiseSampler::start(std::int32_t width, std::int32_t height) {
    width_ = std::max(width, 0);
    height_ = std::max(height, 0);
    row_ = 0;
    points_.clear();
    const int blocksX = std::max(1, width / kBlockSide);
    const int blocksY = std::max(1, height / kBlockSide);
    stepX_ = std::max(1, (blocksX + kMaxBlocksPerAxis - 1) / kMaxBlocksPerAxis);
    stepY_ = std::max(1, (blocksY + kMaxBlocksPerAxis - 1) / kMaxBlocksPerAxis);
    strip_.resize(static_cast<std::size_t>(std::max(width, 0)) * kBlockSide);
}

void NoiseSampler::addRow(const std::uint16_t* samples) {
    if (width_ <= 0)
        return;
    const std::int32_t blockRow = row_ / kBlockSide;
    const int inBlock = row_ % kBlockSide;
    ++row_;
    // Only the rows of the block rows measured are kept; a last partial
    // block row is left out.
    if (blockRow % stepY_ != 0 || (blockRow + 1) * kBlockSide > height_)
        return;
    std::copy(samples, samples + width_,
              strip_.begin() + static_cast<std::ptrdiff_t>(inBlock) * width_);
    if (inBlock == kBlockSide - 1)
        measureStrip();
}

void NoiseSampler::measureStrip() {
    const std::size_t stride = static_cast<std::size_t>(width_);
    for (std::int32_t bx = 0; (bx + 1) * kBlockSide <= width_; bx += stepX_)
        for (int channel = 0; channel < 4; ++channel) {
            // The channel's pixels start at its offset in the 2 x 2 cell; the
            // block's last column pair is then one to the right, still inside
            // the strip unless the block is the last of the row.
            const std::int32_t x0 = bx * kBlockSide + (channel & 1);
            if (x0 + kBlockSide - 2 >= width_)
                continue;
            double mean = 0.0, variance = 0.0;
            blockNoise(strip_.data(), stride, x0, channel >> 1, mean, variance);
            points_.emplace_back(mean, variance);
        }
}

PedestalEvidence NoiseSampler::evidence() const {
    PedestalEvidence evidence;
    // Clipped or black blocks tell nothing about the noise: the brightest
    // block sets the scale (full scale is not known from the rows alone).
    double brightest = 0.0;
    for (const auto& point : points_)
        brightest = std::max(brightest, point.first);
    std::vector<std::pair<double, double>> points;
    for (const auto& point : points_)
        if (point.first > 0.05 * brightest && point.first < 0.98 * brightest + 1e-9)
            points.push_back(point);
    evidence.blocks = static_cast<int>(points.size());
    if (points.size() < kMinBlocks)
        return evidence;

    double meanX = 0.0, meanY = 0.0, low = points[0].first, high = points[0].first;
    for (const auto& [x, y] : points) {
        meanX += x;
        meanY += y;
        low = std::min(low, x);
        high = std::max(high, x);
    }
    const double n = static_cast<double>(points.size());
    meanX /= n;
    meanY /= n;
    double sxx = 0.0, sxy = 0.0;
    for (const auto& [x, y] : points) {
        sxx += (x - meanX) * (x - meanX);
        sxy += (x - meanX) * (y - meanY);
    }
    if (!(sxx > 0.0) || !(high >= kMinLevelSpread * low))
        return evidence;
    const double slope = sxy / sxx;
    const double intercept = meanY - slope * meanX;
    double residual = 0.0;
    for (const auto& [x, y] : points) {
        const double r = y - slope * x - intercept;
        residual += r * r;
    }
    const double sigma = std::sqrt(residual / (n - 2.0));
    const double slopeError = sigma / std::sqrt(sxx);
    const double interceptError = sigma * std::sqrt(1.0 / n + meanX * meanX / sxx);
    if (!(slope > kMinSlopeSignificance * slopeError))
        return evidence;
    evidence.measured = true;
    evidence.estimate = -intercept / slope;
    evidence.standardError =
        std::sqrt(interceptError * interceptError +
                  evidence.estimate * evidence.estimate * slopeError * slopeError) /
        slope;
    evidence.lowerBound = evidence.estimate - 3.0 * evidence.standardError;
    return evidence;
}

} // namespace prep
