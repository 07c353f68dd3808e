// End-to-end quality of the fit: a synthetic flat field with strong
// vignetting, colour shading, noise and defective pixels must come out flat.

#include <algorithm>
#include <cmath>
#include <sstream>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "lsc/lens_shading_correction.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/sample_collection.h"
#include "lsc_test_image.h"
#include "tests/support/flat_field.h"

namespace lsc {

using img::BayerImage;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;
namespace {

using testing_support::FlatField;
using testing_support::FlatFieldShape;

// 3 x 3 median over the pixels of the same colour (two pixels apart), as the
// image preparation does before the fit sees the image; it removes the
// defective pixels. Neighbours outside the image are left out.
std::vector<float> sameColourMedian(const std::vector<float>& in, int width, int height) {
    std::vector<float> out(in.size());
    float window[9];
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            int n = 0;
            for (int dy = -2; dy <= 2; dy += 2)
                for (int dx = -2; dx <= 2; dx += 2) {
                    const int sx = x + dx, sy = y + dy;
                    if (sx >= 0 && sx < width && sy >= 0 && sy < height)
                        window[n++] = in[static_cast<std::size_t>(sy) * width + sx];
                }
            std::nth_element(window, window + n / 2, window + n);
            out[static_cast<std::size_t>(y) * width + x] = window[n / 2];
        }
    return out;
}

// Largest relative deviation of a channel's 8 x 8 block means from the mean
// of those blocks, leaving out the outermost ring of blocks.
double worstBlockDeviation(const BayerImage& image, int channel, int phase) {
    const int width = image.width(), height = image.height();
    const int columns = width / 8, rows = height / 8;
    std::vector<double> means;
    for (int by = 1; by + 1 < rows; ++by)
        for (int bx = 1; bx + 1 < columns; ++bx) {
            double sum = 0;
            int count = 0;
            for (int y = by * 8; y < by * 8 + 8; ++y)
                for (int x = bx * 8; x < bx * 8 + 8; ++x)
                    if (((x + phase) & 1) + ((y + (phase >> 1)) & 1) * 2 == channel) {
                        sum += image.pixels()[static_cast<std::size_t>(y) * width + x];
                        ++count;
                    }
            means.push_back(sum / count);
        }
    double mean = 0;
    for (double m : means)
        mean += m;
    mean /= static_cast<double>(means.size());
    double worst = 0;
    for (double m : means)
        worst = std::max(worst, std::fabs(m / mean - 1.0));
    return worst;
}

class CorrectedFlatField : public ::testing::TestWithParam<std::tuple<std::uint32_t, int, int>> {};

TEST_P(CorrectedFlatField, EveryChannelIsFlatWithinOnePercent) {
    const auto [cfa, bits, blackLevel] = GetParam();
    FlatFieldShape shape;
    shape.width = 640;
    shape.height = 480;
    shape.cfa = cfa;
    shape.bits = bits;
    shape.cornerLevel = 0.5;
    shape.colourShading = 0.08;
    shape.noise = 0.002; // about 2 codes at 10 bits
    shape.defects = 200;
    shape.blackLevel = blackLevel;
    shape.seed = 7 + bits;
    const FlatField field = testing_support::makeFlatField(shape);
    const std::vector<float> prepared =
        sameColourMedian(field.normalized(), shape.width, shape.height);

    ShadingSettings settings;
    settings.blackLevel = static_cast<float>(blackLevel) / static_cast<float>(field.fullScale());
    settings.sampleAngleStep = 8;
    settings.procSamplingFactor = 4;
    settings.quiet = true;
    BayerImage image;
    lsc_test::makeImage(
        image, shape.width, shape.height, cfa,
        [&](int x, int y) { return prepared[static_cast<std::size_t>(y) * shape.width + x]; },
        static_cast<std::uint16_t>(bits));
    std::ostringstream messages;
    const BayerImage levelled = levelledImage(image, settings.blackLevel);
    const SampleSet samples = collectSamples(levelled, settings, messages);
    FitDeviations deviations;
    const FitResult fit = fitLensShading(samples, {levelled, true}, settings, messages, deviations);
    // The correction gets the prepared image, black level included.
    const BayerImage corrected =
        applyLensShading(image, fit.correction, settings.blackLevel, settings.applyStep);

    const int phase = cfa == kCfaGrbg ? 1 : cfa == kCfaGbrg ? 2 : cfa == kCfaBggr ? 3 : 0;
    for (int k = 0; k < 4; ++k) {
        const double worst = worstBlockDeviation(corrected, k, phase);
        EXPECT_LT(worst, 0.01) << "channel " << k;
        RecordProperty("worstDeviationChannel" + std::to_string(k),
                       std::to_string(worst * 100) + "%");
    }
}

INSTANTIATE_TEST_SUITE_P(BayerOrdersAndDepths, CorrectedFlatField,
                         ::testing::Values(std::make_tuple(kCfaRggb, 10, 64),
                                           std::make_tuple(kCfaGrbg, 12, 256),
                                           std::make_tuple(kCfaGbrg, 8, 0),
                                           std::make_tuple(kCfaBggr, 14, 1024)));

} // namespace
} // namespace lsc
