#include "prep/luminance_residual.h"

#include <cmath>
#include <cstddef>
#include <locale>
#include <sstream>
#include <stdexcept>
#include <vector>

#include "image/bayer_phase.h"
#include "prep/prep_messages.h"

namespace prep {

using img::BayerImage;

using lsc::ShadingSettings;

namespace {

// Rec. 709 luminance weights of linear R, G, B.
constexpr double kLumaWeights[3] = {0.2126, 0.7152, 0.0722};

} // namespace

std::optional<float> luminanceResidual(const BayerImage& image, const ShadingSettings& settings) {
    if (image.empty() || image.channels() != 1)
        return std::nullopt;
    const int columns = settings.deltaAbBlocks[0];
    const int rows = settings.deltaAbBlocks[1];
    if (columns < 1 || rows < 1)
        return std::nullopt;
    const std::size_t width = static_cast<std::size_t>(image.width());
    const std::size_t blockWidth = width / 2 / static_cast<std::size_t>(columns);
    const std::size_t blockHeight =
        static_cast<std::size_t>(image.height()) / 2 / static_cast<std::size_t>(rows);
    if (blockWidth == 0 || blockHeight == 0)
        return std::nullopt;

    // One luminance weight per channel of the 2 x 2 block, through the colour
    // matrix: Y = sum over i of w_i * (R m[0][i] + G m[1][i] + B m[2][i]).
    const auto& m = settings.ccm;
    double weightOf[3];
    for (int input = 0; input < 3; ++input)
        weightOf[input] = kLumaWeights[0] * m[input][0] + kLumaWeights[1] * m[input][1] +
                          kLumaWeights[2] * m[input][2];
    const int phase = img::bayerPhase(image.cfa());
    double channelWeight[2][2];
    for (unsigned dy = 0; dy < 2; ++dy)
        for (unsigned dx = 0; dx < 2; ++dx) {
            const int k = img::bayerChannel(dx, dy, phase);
            channelWeight[dy][dx] = k == 0 ? weightOf[0] : k == 3 ? weightOf[2] : 0.5 * weightOf[1];
        }

    std::vector<double> sums(static_cast<std::size_t>(columns) * rows, 0.0);
    const float* pixels = image.pixels();
    for (std::size_t py = 0; py < blockHeight * rows; ++py) {
        const float* top = pixels + 2 * py * width;
        const float* bottom = top + width;
        double* row = sums.data() + py / blockHeight * columns;
        for (std::size_t px = 0; px < blockWidth * columns; ++px)
            row[px / blockWidth] +=
                channelWeight[0][0] * top[2 * px] + channelWeight[0][1] * top[2 * px + 1] +
                channelWeight[1][0] * bottom[2 * px] + channelWeight[1][1] * bottom[2 * px + 1];
    }
    double mean = 0.0;
    for (double sum : sums)
        mean += sum;
    mean /= static_cast<double>(sums.size());
    if (!(mean > 0.0) || !std::isfinite(mean))
        return std::nullopt;
    double largest = 0.0;
    for (double sum : sums)
        largest = std::fmax(largest, std::fabs(sum / mean - 1.0));
    return static_cast<float>(largest);
}

void checkLuminanceResidual(std::optional<float> measured, float boundPercent) {
    if (boundPercent <= 0.0f)
        return;
    if (!measured)
        throw std::runtime_error(msg::kLumaNotMeasured);
    const float residual = *measured;
    if (residual * 100.0f <= boundPercent)
        return;
    std::ostringstream text;
    text.imbue(std::locale::classic());
    text << msg::kLumaAboveThreshold << boundPercent << " %\n" << msg::kPossibleCauses;
    throw std::range_error(text.str());
}

} // namespace prep
