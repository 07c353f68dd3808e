#include <cmath>
#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "caught_exception.h"
#include "lsc/apan_exception.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/sample_collection.h"
#include "lsc_test_image.h"

namespace lsc {

using img::BayerImage;
using img::kCfaRggb;
namespace {

using lsc_test::channelLevels;
using lsc_test::makeImage;

const float kLevels[4] = {0.2f, 0.4f, 0.5f, 0.7f};

// Channel levels falling off like a lens towards the corners of a 160 x 120 image.
float vignetted(int x, int y) {
    const double dx = (x - 80) / 100.0, dy = (y - 60) / 100.0;
    const int channel = (x & 1) + (y & 1) * 2; // RGGB
    return static_cast<float>(kLevels[channel] * (1.0 - 0.4 * (dx * dx + dy * dy)));
}

class LensShadingFit : public ::testing::Test {
protected:
    void collectFlat(std::uint32_t cfa = kCfaRggb) {
        makeImage(image, 160, 120, cfa, channelLevels(cfa, kLevels));
        settings.sampleAngleStep = 8;
        collect();
        messages.str("");
    }
    void collect() {
        levelled = levelledImage(image, settings.blackLevel);
        samples = collectSamples(levelled, settings, messages);
    }
    void fitSamples() {
        fit = fitLensShading(samples, {levelled, true}, settings, messages, deviations);
    }

    std::string zeroValueMessage() {
        try {
            fitSamples();
        } catch (const std::runtime_error& e) {
            return e.what();
        }
        return "no exception";
    }

    BayerImage image, levelled;
    ShadingSettings settings;
    SampleSet samples;
    FitDeviations deviations;
    FitResult fit;
    std::ostringstream messages;
};

TEST_F(LensShadingFit, FlatFieldGivesUnitGainsAndTheProgressLines) {
    collectFlat();
    fitSamples();
    for (int k = 0; k < 4; ++k)
        for (int i = 0; i < 100; ++i)
            ASSERT_NEAR(fit.correction.controlGrids[k][i], 1.0f, 1e-5f) << k << ", " << i;
    EXPECT_EQ(messages.str(), "Target value[red]:0.2\n"
                              "Target value[green/red]:0.4\n"
                              "Target value[green/blue]:0.5\n"
                              "Target value[blue]:0.7\n"
                              "Fitting surface : red\n"
                              "Fitting surface : green/red\n"
                              "Fitting surface : green/blue\n"
                              "Fitting surface : blue\n");
}

TEST_F(LensShadingFit, FalloffLineShowsEachCheckPointAgainstItsWantedValue) {
    makeImage(image, 64, 48, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    settings.sampleAngleStep = 8;
    settings.quiet = true;
    collect();
    settings.quiet = false;
    settings.falloff = 0.5f; // fx = 0.5 * 32 / 40, fy = 0.5 * 24 / 40
    fitSamples();
    std::istringstream lines(messages.str());
    std::string red;
    std::getline(lines, red);
    EXPECT_EQ(red, "Target value[red]  center :0.2 / 0.2  corner :0.1 / 0.1  hedge :0.12 / 0.12  "
                   "vedge :0.14 / 0.14");
}

TEST_F(LensShadingFit, QuietPrintsNothing) {
    collectFlat();
    settings.quiet = true;
    fitSamples();
    EXPECT_EQ(messages.str(), "");
}

TEST_F(LensShadingFit, SmallestGainOfEachChannelBecomesOne) {
    makeImage(image, 160, 120, kCfaRggb, vignetted);
    settings.sampleAngleStep = 8;
    settings.quiet = true;
    collect();
    fitSamples();
    // Normalised to the brightest sample, at the centre: the gains there are
    // about 1 (control points lie off the surface by a few per cent).
    for (int k = 0; k < 4; ++k)
        EXPECT_NEAR(fit.correction.controlGrids[k][44], 1.0f, 0.05f) << k;
    // The corners need more gain than the centre.
    EXPECT_GT(fit.correction.controlGrids[0][0], fit.correction.controlGrids[0][44] * 1.2f);
}

TEST_F(LensShadingFit, GreenBalanceKeepsAbsoluteGainsAgainstTheBrighterGreen) {
    collectFlat();
    settings.greenBalance = true;
    settings.quiet = true;
    fitSamples();
    EXPECT_EQ(fit.targetLevels[1], 0.5f);
    EXPECT_EQ(fit.targetLevels[2], 0.5f);
    EXPECT_NEAR(fit.correction.controlGrids[1][55], 1.25f, 1e-4f); // 0.5 / 0.4
    EXPECT_NEAR(fit.correction.controlGrids[2][55], 1.0f, 1e-4f);
}

TEST_F(LensShadingFit, AveragedChannelsShareOneGrid) {
    makeImage(image, 160, 120, kCfaRggb, vignetted);
    settings.sampleAngleStep = 8;
    settings.quiet = true;
    collect();
    settings.averageChannels = true;
    fitSamples();
    for (int i = 0; i < 100; ++i)
        for (int k = 1; k < 4; ++k)
            ASSERT_EQ(fit.correction.controlGrids[k][i], fit.correction.controlGrids[0][i]) << i;
}

TEST_F(LensShadingFit, AZeroMeasuredValueCannotBeCorrected) {
    collectFlat();
    samples.samples[3].value[2] = 0.0f;
    EXPECT_EQ(zeroValueMessage(),
              "A value of zero in the input cannot be corrected (i.e. gained up to unity).");
}

TEST_F(LensShadingFit, ANegativeSmallestGainIsRefusedLikeAZeroOne) {
    collectFlat();
    samples.samples[7].value[0] = -0.1f;
    EXPECT_EQ(zeroValueMessage(),
              "A value of zero in the input cannot be corrected (i.e. gained up to unity).");
}

TEST_F(LensShadingFit, ANonFiniteGainIsRefused) {
    collectFlat();
    samples.samples[5].value[3] = 1e-45f; // 0.7 / 1e-45 overflows
    EXPECT_EQ(zeroValueMessage(),
              "A value of zero in the input cannot be corrected (i.e. gained up to unity).");
}

TEST_F(LensShadingFit, APatchWithoutPixelsIsRefusedBeforeAnythingChanges) {
    collectFlat();
    settings.layout.center = 0.75; // left 0.25 + centre 0.75 leaves no right patch
    EXPECT_EQ(zeroValueMessage(),
              "Patch geometry leaves a patch without pixels: the patch factors (or patch sizes) "
              "must give left and top patches of at least one pixel and leave room for the right "
              "and bottom patches.");
    EXPECT_EQ(messages.str(), "");
}

TEST_F(LensShadingFit, FewerSamplesThanControlPointsThrow220) {
    collectFlat();
    samples.samples.resize(99);
    EXPECT_EQ(lsc_test::caught([&] { fitSamples(); }).code(), 220);
}

TEST_F(LensShadingFit, SamplesOutsideTheImageAreNotFitted) {
    collectFlat();
    shadingSample outside = samples.samples[0];
    outside.x = 400;
    outside.value[0] = 0.01f; // a gain of 20 if it were used
    samples.samples.push_back(outside);
    settings.quiet = true;
    fitSamples();
    EXPECT_EQ(messages.str(), "");
    EXPECT_NEAR(fit.correction.controlGrids[0][99], 1.0f, 1e-4f);
}

} // namespace
} // namespace lsc
