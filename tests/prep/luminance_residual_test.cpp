#include <optional>
#include <string>

#include "prep/luminance_residual.h"
#include "tests/prep/test_images.h"

namespace {

// A 16 x 8 grey mosaic of 2 x 2 delta-ab blocks (4 x 2 RGB pixels each) with
// the mosaic pixel (x, y) doubled; nothing measured gives -1.
float residualWithPixel(int x, int y, float factor, int columns = 2, int rows = 2) {
    img::BayerImage balanced = prep_test::makeImage(16, 8, 1, img::kCfaRggb, {0.5f});
    balanced.pixels()[y * 16 + x] *= factor;
    lsc::ShadingSettings settings;
    settings.deltaAbBlocks[0] = columns;
    settings.deltaAbBlocks[1] = rows;
    return prep::luminanceResidual(balanced, settings).value_or(-1.0f);
}

// Grey 0.5 gives every RGB pixel luminance 0.5 and every block (8 RGB pixels)
// 4. Doubling one sample adds 0.5 w (w: its channel's weight, half of green's
// for a green sample); the mean of the four blocks rises by 0.125 w.
TEST(LuminanceResidual, WeighsEachChannelByItsShareOfTheLuminance) {
    const struct {
        int x, y;
        double weight;
    } cases[] = {{0, 0, 0.2126}, {1, 0, 0.7152 / 2}, {0, 1, 0.7152 / 2}, {1, 1, 0.0722}};
    for (const auto& c : cases)
        EXPECT_NEAR(residualWithPixel(c.x, c.y, 2.0f), 0.375 * c.weight / (4 + 0.125 * c.weight),
                    1e-6)
            << c.x << c.y;
    EXPECT_NEAR(residualWithPixel(0, 0, 1.0f), 0.0, 1e-7);
    EXPECT_EQ(residualWithPixel(0, 0, 1.0f, 0, 2), -1.0f);
    EXPECT_EQ(residualWithPixel(0, 0, 1.0f, 9, 2), -1.0f); // blocks of no RGB pixel
}

TEST(LuminanceResidual, BoundInPerCentFailsPastItAndZeroIsOff) {
    const std::string causes =
        "\nSome possible causes include light is not on, light in bad position, missing diffuser, "
        "poor quality flat field input image, damaged sensor, or invalid configuration for the "
        "sensor being used.";
    const struct {
        std::optional<float> residual;
        float bound;
        std::string message;
    } cases[] = {
        {0.03f, 3.0f, ""},
        {0.5f, 0.0f, ""},
        {std::nullopt, 0.0f, ""},
        {0.031f, 3.0f, "Maximum luminance residual is greater than threshold of 3 %" + causes},
        {std::nullopt, 3.0f,
         "The luminance residual cannot be measured: the flattened image does not fill the delta "
         "ab block grid or holds no light."},
    };
    for (const auto& c : cases)
        EXPECT_EQ(case_data::errorOf([&] { prep::checkLuminanceResidual(c.residual, c.bound); }),
                  c.message);
}

} // namespace
