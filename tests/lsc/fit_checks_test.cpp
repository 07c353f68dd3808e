#include <algorithm>
#include <cmath>
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
#include "lsc_test_image.h"

namespace lsc {

using img::BayerImage;
using img::kCfaRggb;
namespace {

using lsc_test::channelLevels;
using lsc_test::makeImage;

template <typename F> std::string runtimeError(F f) {
    try {
        f();
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "(passed)";
}

// ---- the figures and their line ---------------------------------------------

TEST(FitDeviation, LineShowsBothFiguresWithFiveDecimals) {
    EXPECT_EQ(deviationLine(0, 0.00412f, 0.00131f), "red deviation max, rms: 0.00412 0.00131");
    EXPECT_EQ(deviationLine(2, 1.5f, 0.0f), "green/blue deviation max, rms: 1.50000 0.00000");
    EXPECT_EQ(deviationLine(3, 0.123456f, 12.0f), "blue deviation max, rms: 0.12346 12.00000");
}

// ---- bounds -----------------------------------------------------------------

TEST(FitDeviationBounds, RmsIsCheckedBeforeMaxOverAllChannels) {
    const float rms[4] = {0.01f, 0.01f, 0.01f, 0.3f};
    const float max[4] = {0.5f, 0.1f, 0.1f, 0.1f};
    EXPECT_EQ(runtimeError([&] { checkDeviationBounds(rms, max, 0.2f, 0.2f); }),
              "RMS error bound exceeded.");
    EXPECT_EQ(runtimeError([&] { checkDeviationBounds(rms, max, 0.3f, 0.2f); }),
              "MAX error bound exceeded.");
    EXPECT_EQ(runtimeError([&] { checkDeviationBounds(rms, max, 0.3f, 0.5f); }), "(passed)");
}

TEST(FitDeviationBounds, NotANumberExceedsEveryBound) {
    const float nan = std::nanf("");
    const float small[4] = {0, 0, 0, 0};
    const float broken[4] = {0, nan, 0, 0};
    EXPECT_EQ(runtimeError([&] { checkDeviationBounds(broken, small, 1.0f, 1.0f); }),
              "RMS error bound exceeded.");
    EXPECT_EQ(runtimeError([&] { checkDeviationBounds(small, broken, 1.0f, 1.0f); }),
              "MAX error bound exceeded.");
}

// ---- gain ceiling -------------------------------------------------------------

TEST(GainCeiling, NamesTheLargestGainOfTheFirstChannelAboveIt) {
    const std::vector<shadingSample> samples = {
        {0, 0, {6.5f, 1.0f, 1.0f, 8.0f}},
        {2, 0, {7.31f, 1.0f, 1.0f, 1.0f}},
        {100, 0, {50.0f, 1.0f, 1.0f, 1.0f}}, // not fitted
    };
    EXPECT_EQ(runtimeError([&] { checkGainSamples(samples, 64, 48, 6.0f); }),
              "Gain 7.31 of the red channel is above lsc.max_gain (6). Likely a dark corner, a "
              "missing diffuser or a configuration that does not match the sensor.");
    EXPECT_EQ(runtimeError([&] { checkGainSamples(samples, 64, 48, 7.5f); }),
              "Gain 8 of the blue channel is above lsc.max_gain (7.5). Likely a dark corner, a "
              "missing diffuser or a configuration that does not match the sensor.");
    EXPECT_EQ(runtimeError([&] { checkGainSamples(samples, 64, 48, 8.0f); }), "(passed)");
}

TEST(GainCeiling, AppliesToTheControlPoints) {
    float grids[kChannels][kGridPoints];
    for (auto& grid : grids)
        for (float& g : grid)
            g = 1.0f;
    grids[2][99] = 6.25f;
    EXPECT_EQ(runtimeError([&] { checkControlPoints(grids, 6.0f); }),
              "Gain 6.25 of the green/blue channel is above lsc.max_gain (6). Likely a dark "
              "corner, a missing diffuser or a configuration that does not match the sensor.");
    EXPECT_EQ(runtimeError([&] { checkControlPoints(grids, 6.25f); }), "(passed)");
}

// ---- in the fit ---------------------------------------------------------------

const float kLevels[4] = {0.2f, 0.4f, 0.5f, 0.7f};

// Channel levels falling off like a lens towards the corners of a 160 x 120 image.
float vignetted(int x, int y) {
    const double dx = (x - 80) / 100.0, dy = (y - 60) / 100.0;
    return static_cast<float>(kLevels[(x & 1) + (y & 1) * 2] * (1.0 - 0.4 * (dx * dx + dy * dy)));
}

class FitChecks : public ::testing::Test {
protected:
    void collect(const std::function<float(int, int)>& value) {
        makeImage(image, 160, 120, kCfaRggb, value);
        settings.sampleAngleStep = 8;
        settings.quiet = true;
        levelled = levelledImage(image, settings.blackLevel);
        samples = collectSamples(levelled, settings, messages);
        settings.quiet = false;
    }
    std::string fitError() {
        messages.str("");
        fit.reset();
        return runtimeError([&] {
            fit = fitLensShading(samples, {levelled, true}, settings, messages, deviations);
        });
    }
    // A fit a check ends gives no correction.
    bool gridsUntouched() const { return !fit; }

    BayerImage image, levelled;
    ShadingSettings settings;
    SampleSet samples;
    FitDeviations deviations;
    std::optional<FitResult> fit;
    std::ostringstream messages;
};

TEST_F(FitChecks, LogFlagAddsEachChannelsDeviationAfterItsFit) {
    collect(vignetted);
    settings.logFitError = true;
    ASSERT_EQ(fitError(), "(passed)");
    std::istringstream lines(messages.str());
    std::vector<std::string> text;
    for (std::string line; std::getline(lines, line);)
        text.push_back(line);
    ASSERT_EQ(text.size(), 12u);
    for (int k = 0; k < 4; ++k) {
        EXPECT_EQ(text[4 + 2 * k], std::string("Fitting surface : ") + kChannelNames[k]);
        EXPECT_EQ(text[5 + 2 * k], deviationLine(k, deviations.max[k], deviations.rms[k]));
    }
    EXPECT_TRUE(deviations.measured);
    // A smooth shading bends little between neighbouring points, even one
    // this steep for its size (the corners at 60 %).
    for (int k = 0; k < 4; ++k) {
        EXPECT_LT(deviations.max[k], 0.05f) << k;
        EXPECT_LE(deviations.rms[k], deviations.max[k]) << k;
    }
}

TEST_F(FitChecks, QuietOrNoFlagPrintsNoDeviation) {
    collect(vignetted);
    ASSERT_EQ(fitError(), "(passed)");
    EXPECT_EQ(messages.str().find("deviation"), std::string::npos);
    settings.logFitError = true;
    settings.quiet = true;
    ASSERT_EQ(fitError(), "(passed)");
    EXPECT_EQ(messages.str(), "");
    EXPECT_TRUE(deviations.measured);
}

TEST_F(FitChecks, ABlotchOnTheSamplesEndsTheFitBeforeTheGridsChange) {
    // Twice as bright: its gains are half those around it.
    collect([](int x, int y) {
        return (x >= 76 && x < 84 && y >= 56 && y < 64 ? 2.0f : 1.0f) * vignetted(x, y);
    });
    EXPECT_EQ(fitError(), "MAX error bound exceeded.");
    EXPECT_TRUE(gridsUntouched());
    EXPECT_TRUE(deviations.measured);
    EXPECT_GT(deviations.max[0], 0.2f);
    settings.maxRmsError = 0.01f;
    EXPECT_EQ(fitError(), "RMS error bound exceeded.");
    settings.maxRmsError = 1.0f;
    settings.maxError = 1.0f;
    EXPECT_EQ(fitError(), "(passed)");
    EXPECT_FALSE(gridsUntouched());
}

TEST_F(FitChecks, GainsAboveTheCeilingEndTheFitBeforeTheGridsChange) {
    collect(vignetted);
    settings.maxGain = 1.2f; // the corners need about 1.67 (normalised to the centre)
    const std::string error = fitError();
    EXPECT_EQ(error.rfind("Gain 1.66", 0), 0u) << error;
    EXPECT_NE(error.find(" of the red channel is above lsc.max_gain (1.2). Likely"),
              std::string::npos)
        << error;
    EXPECT_TRUE(gridsUntouched());
    EXPECT_FALSE(deviations.measured);
}

TEST_F(FitChecks, WithGreenBalanceTheCeilingSeesAbsoluteGains) {
    const float* levels = kLevels;
    collect(channelLevels(kCfaRggb, levels));
    settings.maxGain = 1.2f;
    EXPECT_EQ(fitError(), "(passed)"); // every normalised gain is 1
    settings.greenBalance = true;      // green/red: 0.5 / 0.4
    EXPECT_EQ(fitError(),
              "Gain 1.25 of the green/red channel is above lsc.max_gain (1.2). Likely a dark "
              "corner, a missing diffuser or a configuration that does not match the sensor.");
}

TEST_F(FitChecks, ControlPointsThatOvershootTheSampledGainsMeetTheCeilingToo) {
    settings.sampleMargin = 60; // the surface reaches the corners beyond the samples
    collect(vignetted);
    settings.maxGain = 100.0f;
    ASSERT_EQ(fitError(), "(passed)");
    // The target is flat: the largest red gain is the brightest red sample
    // over the darkest.
    float brightest = 0.0f, darkest = 1.0f, largestPoint = 0.0f;
    for (const shadingSample& s : samples.samples) {
        brightest = std::max(brightest, s.value[0]);
        darkest = std::min(darkest, s.value[0]);
    }
    const float largestGain = brightest / darkest;
    for (float point : fit->correction.controlGrids[0])
        largestPoint = std::max(largestPoint, point);
    ASSERT_GT(largestPoint, largestGain + 0.01f);

    settings.maxGain = (largestGain + largestPoint) / 2;
    const std::string error = fitError();
    EXPECT_NE(error.find(" of the red channel is above lsc.max_gain ("), std::string::npos)
        << error;
    EXPECT_TRUE(gridsUntouched());
}

} // namespace
} // namespace lsc
