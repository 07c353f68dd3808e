// The surface fit: gains, progress lines, the checks that end a fit before
// the grids change, and the deviation and gain-ceiling checks themselves.

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <functional>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "lsc/fit_checks.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/sample_collection.h"
#include "test_helpers.h"

namespace lsc {
namespace {

using lsc_test::makeImage;
using lsc_test::runtimeError;

const float kLevels[4] = {0.2f, 0.4f, 0.5f, 0.7f};
const std::function<float(int, int)> kFlat = lsc_test::channelLevels(lsc_test::kOrders[0], kLevels);

// RGGB channel levels falling off like a lens towards the corners of a 160 x 120 image.
float vignetted(int x, int y) {
    const double dx = (x - 80) / 100.0, dy = (y - 60) / 100.0;
    return static_cast<float>(kLevels[(x & 1) + (y & 1) * 2] * (1.0 - 0.4 * (dx * dx + dy * dy)));
}

class Fit : public ::testing::Test {
protected:
    void collect(const std::function<float(int, int)>& value, int width = 160, int height = 120) {
        makeImage(image, width, height, img::kCfaRggb, value);
        settings.sampleAngleStep = 8;
        settings.quiet = true;
        levelled = levelledImage(image, settings.blackLevel);
        samples = collectSamples(levelled, settings, messages);
        settings.quiet = false;
    }
    // The fit's error text, "" when it gave a correction.
    std::string fitError() {
        messages.str("");
        fit.reset();
        return runtimeError([&] {
            fit = fitLensShading(samples, {levelled, true}, settings, messages, deviations);
        });
    }

    img::BayerImage image, levelled;
    ShadingSettings settings;
    SampleSet samples;
    FitDeviations deviations;
    std::optional<FitResult> fit;
    std::ostringstream messages;
};

TEST_F(Fit, FalloffLineShowsEachCheckPointAgainstItsWantedValue) {
    collect(kFlat, 64, 48);
    settings.falloff = 0.5f; // fx = 0.5 * 32 / 40, fy = 0.5 * 24 / 40
    ASSERT_EQ(fitError(), "");
    EXPECT_EQ(messages.str().substr(0, messages.str().find('\n')),
              "Target value[red]  center :0.2 / 0.2  corner :0.1 / 0.1  hedge :0.12 / 0.12  "
              "vedge :0.14 / 0.14");
}

// The gains are relative to the brightest sample (about 1 at the centre, more
// towards the corners); with the log flag each channel's deviation follows its
// fit. Lines and grids are kept in tests/data/lsc/vignetted_fit.txt; quiet
// leaves out every line.
TEST_F(Fit, VignettedFieldGivesTheKeptGridsAndDeviationLinesUnlessQuiet) {
    collect(vignetted);
    settings.logFitError = true;
    ASSERT_EQ(fitError(), "");
    std::string text = messages.str();
    char value[16];
    for (int k = 0; k < 4; ++k)
        for (int i = 0; i < 100; ++i) {
            std::snprintf(value, sizeof value, "%.6f%c",
                          static_cast<double>(fit->correction.controlGrids[k][i]),
                          i % 10 == 9 ? '\n' : ' ');
            text += value;
        }
    lsc_test::expectGolden("lsc/vignetted_fit.txt", text);
    settings.quiet = true; // no line at all, the deviations still measured
    ASSERT_EQ(fitError(), "");
    EXPECT_EQ(messages.str(), "");
    EXPECT_TRUE(deviations.measured);
    settings.averageChannels = true;
    ASSERT_EQ(fitError(), "");
    for (int i = 0; i < 100; ++i)
        for (int k = 1; k < 4; ++k)
            ASSERT_EQ(fit->correction.controlGrids[k][i], fit->correction.controlGrids[0][i]) << i;
}

TEST_F(Fit, GreenBalanceKeepsAbsoluteGainsAndTheCeilingSeesThem) {
    collect(kFlat);
    settings.maxGain = 1.2f;
    EXPECT_EQ(fitError(), "");    // every normalised gain is 1
    settings.greenBalance = true; // green/red: 0.5 / 0.4
    EXPECT_EQ(
        fitError().rfind("Gain 1.25 of the green/red channel is above lsc.max_gain (1.2). ", 0),
        0u);
    settings.maxGain = 6.0f;
    ASSERT_EQ(fitError(), "");
    EXPECT_EQ(fit->targetLevels[1], 0.5f);
    EXPECT_EQ(fit->targetLevels[2], 0.5f);
    EXPECT_NEAR(fit->correction.controlGrids[1][55], 1.25f, 1e-4f);
    EXPECT_NEAR(fit->correction.controlGrids[2][55], 1.0f, 1e-4f);
    const float brighterGreenRed[4] = {0.2f, 0.5f, 0.4f, 0.7f};
    collect(lsc_test::channelLevels(lsc_test::kOrders[0], brighterGreenRed));
    ASSERT_EQ(fitError(), "");
    EXPECT_EQ(fit->targetLevels[1] + fit->targetLevels[2], 1.0f); // both 0.5
}

TEST_F(Fit, UnusableSamplesAndGeometryEndTheFitBeforeAnythingIsPrinted) {
    const std::string zero =
        "A value of zero in the input cannot be corrected (i.e. gained up to unity).";
    const struct {
        std::size_t sample;
        int channel;
        float value;
    } broken[] = {{3, 2, 0.0f}, {7, 0, -0.1f}, {5, 3, 1e-45f}}; // 0.7 / 1e-45 overflows
    for (const auto& b : broken) {
        collect(kFlat);
        samples.samples[b.sample].value[b.channel] = b.value;
        EXPECT_EQ(fitError(), zero) << b.value;
    }
    collect(kFlat);
    settings.layout.center = 0.75; // left 0.25 + centre 0.75 leaves no right patch
    EXPECT_EQ(fitError().rfind("Patch geometry leaves a patch without pixels", 0), 0u);
    EXPECT_EQ(messages.str(), "");
    settings.layout.center = 0.5;
    samples.samples.resize(99);
    EXPECT_EQ(lsc_test::caught([&] { fitError(); }).code(), 220);
}

TEST_F(Fit, SamplesOutsideTheImageAreNotFitted) {
    collect(kFlat);
    shadingSample outside = samples.samples[0];
    outside.x = 400;
    outside.value[0] = 0.01f; // a gain of 20 if it were used
    samples.samples.push_back(outside);
    ASSERT_EQ(fitError(), "");
    EXPECT_NEAR(fit->correction.controlGrids[0][99], 1.0f, 1e-4f);
}

TEST_F(Fit, ABlotchOnTheSamplesEndsTheFitBeforeTheGridsChange) {
    collect([](int x, int y) { // twice as bright: its gains are half those around it
        return (x >= 76 && x < 84 && y >= 56 && y < 64 ? 2.0f : 1.0f) * vignetted(x, y);
    });
    EXPECT_EQ(fitError(), "MAX error bound exceeded.");
    EXPECT_FALSE(fit);
    EXPECT_TRUE(deviations.measured);
    EXPECT_GT(deviations.max[0], 0.2f);
    settings.maxRmsError = 0.01f;
    EXPECT_EQ(fitError(), "RMS error bound exceeded.");
    settings.maxRmsError = 1.0f;
    settings.maxError = 1.0f;
    EXPECT_EQ(fitError(), "");
}

TEST_F(Fit, GainsAndControlPointsAboveTheCeilingEndTheFitBeforeTheGridsChange) {
    collect(vignetted);
    settings.maxGain = 1.2f; // the corners need about 1.67 (normalised to the centre)
    const std::string error = fitError();
    EXPECT_EQ(error.rfind("Gain 1.66", 0), 0u) << error;
    EXPECT_NE(error.find(" of the red channel is above lsc.max_gain (1.2). Likely"),
              std::string::npos);
    EXPECT_FALSE(fit);
    EXPECT_FALSE(deviations.measured);

    settings.sampleMargin = 60; // the surface reaches the corners beyond the samples
    collect(vignetted);
    settings.maxGain = 100.0f;
    ASSERT_EQ(fitError(), "");
    float brightest = 0.0f, darkest = 1.0f; // the largest red gain is brightest / darkest
    for (const shadingSample& s : samples.samples) {
        brightest = std::max(brightest, s.value[0]);
        darkest = std::min(darkest, s.value[0]);
    }
    const float largestPoint =
        *std::max_element(fit->correction.controlGrids[0], fit->correction.controlGrids[0] + 100);
    ASSERT_GT(largestPoint, brightest / darkest + 0.01f);
    settings.maxGain = (brightest / darkest + largestPoint) / 2;
    EXPECT_NE(fitError().find(" of the red channel is above lsc.max_gain ("), std::string::npos);
    EXPECT_FALSE(fit);
}

// Their texts are kept in tests/data/lsc/fit_checks.txt, a line per case.
TEST(FitChecks, DeviationLineBoundsAndCeilingTexts) {
    std::string text =
        deviationLine(0, 0.00412f, 0.00131f) + "\n" + deviationLine(3, 0.123456f, 12.0f) + "\n";
    const float nan = std::nanf("");
    const float rms[4] = {0.01f, 0.01f, 0.01f, 0.3f}, max[4] = {0.5f, 0.1f, 0.1f, 0.1f};
    const float zeros[4] = {0, 0, 0, 0}, broken[4] = {0, nan, 0, 0};
    const struct {
        const float *rms, *max;
        float maxRms, maxError;
    } bounds[] = {{rms, max, 0.2f, 0.2f}, // RMS first
                  {rms, max, 0.3f, 0.2f},
                  {rms, max, 0.3f, 0.5f},      // passes: an empty line
                  {broken, zeros, 1.0f, 1.0f}, // NaN exceeds
                  {zeros, broken, 1.0f, 1.0f}};
    for (const auto& b : bounds)
        text +=
            runtimeError([&] { checkDeviationBounds(b.rms, b.max, b.maxRms, b.maxError); }) + "\n";
    const std::vector<shadingSample> samples = {{0, 0, {6.5f, 1.0f, 1.0f, 8.0f}},
                                                {2, 0, {7.31f, 1.0f, 1.0f, 1.0f}},
                                                {100, 0, {50.0f, 1.0f, 1.0f, 1.0f}}}; // outside
    for (float ceiling : {6.0f, 7.5f, 8.0f})
        text += runtimeError([&] { checkGainSamples(samples, 64, 48, ceiling); }) + "\n";
    float grids[kChannels][kGridPoints];
    std::fill(&grids[0][0], &grids[0][0] + kChannels * kGridPoints, 1.0f);
    grids[2][99] = 6.25f;
    for (float ceiling : {6.0f, 6.25f})
        text += runtimeError([&] { checkControlPoints(grids, ceiling); }) + "\n";
    lsc_test::expectGolden("lsc/fit_checks.txt", text);
}

} // namespace
} // namespace lsc
