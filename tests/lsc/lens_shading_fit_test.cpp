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
        makeImage(context, 160, 120, cfa, channelLevels(cfa, kLevels));
        context.sampleAngleStep = 8;
        collectSamples(context, messages);
        messages.str("");
    }

    std::string zeroValueMessage() {
        try {
            fitLensShading(context, messages);
        } catch (const std::runtime_error& e) {
            return e.what();
        }
        return "no exception";
    }

    ProcessingContext context;
    std::ostringstream messages;
};

TEST_F(LensShadingFit, FlatFieldGivesUnitGainsAndTheProgressLines) {
    collectFlat();
    fitLensShading(context, messages);
    for (int k = 0; k < 4; ++k)
        for (int i = 0; i < 100; ++i)
            ASSERT_NEAR(context.controlGrids[k][i], 1.0f, 1e-5f) << k << ", " << i;
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
    makeImage(context, 64, 48, kCfaRggb, channelLevels(kCfaRggb, kLevels));
    context.sampleAngleStep = 8;
    context.quiet = true;
    collectSamples(context, messages);
    context.quiet = false;
    context.falloff = 0.5f; // fx = 0.5 * 32 / 40, fy = 0.5 * 24 / 40
    fitLensShading(context, messages);
    std::istringstream lines(messages.str());
    std::string red;
    std::getline(lines, red);
    EXPECT_EQ(red, "Target value[red]  center :0.2 / 0.2  corner :0.1 / 0.1  hedge :0.12 / 0.12  "
                   "vedge :0.14 / 0.14");
}

TEST_F(LensShadingFit, QuietPrintsNothing) {
    collectFlat();
    context.quiet = true;
    fitLensShading(context, messages);
    EXPECT_EQ(messages.str(), "");
}

TEST_F(LensShadingFit, SmallestGainOfEachChannelBecomesOne) {
    makeImage(context, 160, 120, kCfaRggb, vignetted);
    context.sampleAngleStep = 8;
    context.quiet = true;
    collectSamples(context, messages);
    fitLensShading(context, messages);
    for (int k = 0; k < 4; ++k) {
        float smallest = 1e9f;
        for (const shadingSample& s : context.samples)
            smallest = std::min(smallest, s.value[k]);
        EXPECT_EQ(smallest, 1.0f) << k;
    }
    // The corners need more gain than the centre.
    EXPECT_GT(context.controlGrids[0][0], context.controlGrids[0][44] * 1.2f);
}

TEST_F(LensShadingFit, GreenBalanceKeepsAbsoluteGainsAgainstTheBrighterGreen) {
    collectFlat();
    context.greenBalance = true;
    context.quiet = true;
    fitLensShading(context, messages);
    EXPECT_EQ(context.targetLevels[1], 0.5f);
    EXPECT_EQ(context.targetLevels[2], 0.5f);
    EXPECT_NEAR(context.samples[0].value[1], 1.25f, 1e-5f); // 0.5 / 0.4
    EXPECT_NEAR(context.samples[0].value[2], 1.0f, 1e-5f);
    EXPECT_NEAR(context.controlGrids[1][55], 1.25f, 1e-4f);
}

TEST_F(LensShadingFit, AveragedChannelsShareOneGrid) {
    makeImage(context, 160, 120, kCfaRggb, vignetted);
    context.sampleAngleStep = 8;
    context.quiet = true;
    collectSamples(context, messages);
    context.averageChannels = true;
    fitLensShading(context, messages);
    for (int i = 0; i < 100; ++i)
        for (int k = 1; k < 4; ++k)
            ASSERT_EQ(context.controlGrids[k][i], context.controlGrids[0][i]) << i;
}

TEST_F(LensShadingFit, AZeroMeasuredValueCannotBeCorrected) {
    collectFlat();
    context.samples[3].value[2] = 0.0f;
    EXPECT_EQ(zeroValueMessage(),
              "A value of zero in the input cannot be corrected (i.e. gained up to unity).");
}

TEST_F(LensShadingFit, ANegativeSmallestGainIsRefusedLikeAZeroOne) {
    collectFlat();
    context.samples[7].value[0] = -0.1f;
    EXPECT_EQ(zeroValueMessage(),
              "A value of zero in the input cannot be corrected (i.e. gained up to unity).");
}

TEST_F(LensShadingFit, ANonFiniteGainIsRefused) {
    collectFlat();
    context.samples[5].value[3] = 1e-45f; // 0.7 / 1e-45 overflows
    EXPECT_EQ(zeroValueMessage(),
              "A value of zero in the input cannot be corrected (i.e. gained up to unity).");
}

TEST_F(LensShadingFit, APatchWithoutPixelsIsRefusedBeforeAnythingChanges) {
    collectFlat();
    context.centerFraction = 0.75; // left 0.25 + centre 0.75 leaves no right patch
    const float measured = context.samples[0].value[0];
    EXPECT_EQ(zeroValueMessage(),
              "Patch geometry leaves a patch without pixels: the patch factors (or patch sizes) "
              "must give left and top patches of at least one pixel and leave room for the right "
              "and bottom patches.");
    EXPECT_EQ(context.samples[0].value[0], measured);
    EXPECT_EQ(messages.str(), "");
}

TEST_F(LensShadingFit, FewerSamplesThanControlPointsThrow220AndKeepTheGrids) {
    collectFlat();
    context.samples.resize(99);
    for (auto& grid : context.controlGrids)
        for (float& g : grid)
            g = 7.0f;
    EXPECT_EQ(lsc_test::caught([&] { fitLensShading(context, messages); }).code(), 220);
    EXPECT_EQ(context.controlGrids[2][50], 7.0f);
}

TEST_F(LensShadingFit, SamplesOutsideTheImageAreNotFitted) {
    collectFlat();
    shadingSample outside = context.samples[0];
    outside.x = 400;
    outside.value[0] = 0.01f; // a gain of 20 if it were used
    context.samples.push_back(outside);
    context.quiet = true;
    fitLensShading(context, messages);
    EXPECT_EQ(messages.str(), "");
    EXPECT_NEAR(context.controlGrids[0][99], 1.0f, 1e-4f);
}

} // namespace
