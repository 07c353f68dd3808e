// The delta ab evaluation of the balanced flattened mosaic.

#include <cmath>
#include <limits>
#include <stdexcept>

#include "prep/delta_ab.h"
#include "tests/prep/test_images.h"

namespace {

using img::BayerImage;

// A grey (0.5) RGGB mosaic evaluated on columns x rows blocks.
struct Evaluation {
    Evaluation(std::int32_t width, std::int32_t height, int columns, int rows)
        : corrected(prep_test::makeImage(width, height, 1, img::kCfaRggb, {0.5f})) {
        settings.deltaAbBlocks[0] = columns;
        settings.deltaAbBlocks[1] = rows;
    }
    // Makes the RGB pixel (px, py) reddish.
    void tint(int px, int py) { corrected.pixels()[(2 * py) * corrected.width() + 2 * px] = 0.9f; }
    const prep::DeltaAbResult& run() { return result = prep::evaluateDeltaAb(corrected, settings); }

    BayerImage corrected;
    lsc::ShadingSettings settings;
    prep::DeltaAbResult result;
};

TEST(DeltaAb, GreyHasNoColourErrorAndGreenPeaksAtTheLumaFactor) {
    Evaluation grey(64, 48, 4, 3);
    grey.run();
    EXPECT_EQ(grey.result.deltaImage, std::vector<float>(12, 0.0f));
    EXPECT_EQ(grey.result.maxDelta, 0.0f);
    EXPECT_EQ(grey.result.deltaStdDev, 0.0f);
    EXPECT_LT(grey.result.meanChroma, 0.1f);
    for (float v : prep_test::samplesOf(grey.corrected))
        ASSERT_FLOAT_EQ(v, 0.75f);
}

// Display values: gamma 1/2.2, scaled so that the green peak is 0.75.
TEST(DeltaAb, WritesDisplayValuesBackByBayerPosition) {
    Evaluation run(2, 2, 1, 1);
    run.corrected = prep_test::makeImage(2, 2, 1, img::kCfaGbrg, {0.4f, 0.25f, 0.5f, 0.2f});
    run.run(); // G B / R G: green (0.4 + 0.2) / 2
    const std::vector<float> display = prep_test::samplesOf(run.corrected);
    const float expected[4] = {0.75f, 0.6903507f, 0.9460228f, 0.75f};
    for (int i = 0; i < 4; ++i)
        EXPECT_NEAR(display[i], expected[i], 2e-6f) << i;

    Evaluation matrix(2, 2, 1, 1); // the matrix takes a row vector: red feeds green only
    const float ccm[3][3] = {{0, 1, 0}, {0, 0, 0}, {0, 0, 1}};
    std::copy(&ccm[0][0], &ccm[0][0] + 9, &matrix.settings.ccm[0][0]);
    matrix.run();
    EXPECT_EQ(matrix.corrected.pixels()[0], 0.0f);
    EXPECT_FLOAT_EQ(matrix.corrected.pixels()[1], 0.75f);
    EXPECT_GT(matrix.corrected.pixels()[3], 0.0f);

    Evaluation negative(2, 2, 1, 1); // negative colours clip to zero
    negative.settings.ccm[0][0] = -1.0f;
    negative.run();
    EXPECT_EQ(negative.corrected.pixels()[0], 0.0f);
}

TEST(DeltaAb, BlocksCoverWholeBlockPixelsOnly) {
    Evaluation vga(640, 480, 20, 15); // 16-pixel blocks: tint exactly block (1, 1)
    for (int py = 16; py < 32; ++py)
        for (int px = 16; px < 32; ++px)
            vga.tint(px, py);
    const prep::DeltaAbResult& r = vga.run();
    ASSERT_EQ(r.deltaImage.size(), 300u);
    EXPECT_EQ(r.maxDelta, r.deltaImage[21]);
    EXPECT_GT(r.deltaImage[21], 1.0f);
    EXPECT_EQ(r.deltaImage[0], r.deltaImage[2]);
    EXPECT_EQ(r.deltaImage[0], r.deltaImage[299]);
    EXPECT_LT(r.deltaImage[0], r.deltaImage[21] / 100);

    // RGB image 10 x 4 in 3 x 1 blocks of 3 x 4: column 9 belongs to none.
    Evaluation outside(20, 8, 3, 1), inside(20, 8, 3, 1);
    for (int py = 0; py < 4; ++py)
        outside.tint(9, py);
    EXPECT_EQ(outside.run().deltaImage, std::vector<float>(3, 0.0f));
    inside.tint(8, 0);
    inside.run();
    EXPECT_EQ(inside.result.maxDelta, inside.result.deltaImage[2]);
    EXPECT_GT(inside.result.maxDelta, 0.0f);

    Evaluation two(4, 2, 2, 1); // two blocks symmetric about their mean
    two.tint(1, 0);
    two.run();
    EXPECT_FLOAT_EQ(two.result.deltaImage[0], two.result.deltaImage[1]);
    EXPECT_EQ(two.result.maxDelta, std::max(two.result.deltaImage[0], two.result.deltaImage[1]));
    EXPECT_NEAR(two.result.deltaStdDev, 0.0f, 1e-4f);
    EXPECT_GT(two.result.meanChroma, 0.0f);

    Evaluation nan(8, 4, 2, 1);
    nan.corrected.pixels()[0] = std::numeric_limits<float>::quiet_NaN();
    EXPECT_TRUE(std::isnan(nan.run().maxDelta));
}

TEST(DeltaAb, RefusesGridsAndImagesItCannotMeasure) {
    Evaluation empty(8, 8, 0, 2), tooMany(8, 8, 5, 1), black(8, 8, 2, 2);
    black.corrected = prep_test::makeImage(8, 8);
    const std::pair<Evaluation*, std::string> cases[] = {
        {&empty, "The delta ab block counts must be at least 1."},
        {&tooMany, "The flattened image is too small for the delta ab block grid."}, // 4 columns
        {&black, "The flattened image has no green signal; its delta ab cannot be measured."},
    };
    for (const auto& [evaluation, message] : cases) {
        EXPECT_EQ(case_data::errorOf([&] { evaluation->run(); }), message);
        EXPECT_THROW(evaluation->run(), std::runtime_error);
    }
    EXPECT_EQ(tooMany.corrected.pixels()[0], 0.5f);
}

} // namespace
