// Statistics and pixel checks of the prepared image (values in sensor units).

#include <limits>
#include <sstream>
#include <stdexcept>
#include <string>

#include "prep/image_checks.h"
#include "tests/prep/test_images.h"

namespace {

using img::BayerImage;
using prep_test::makeImage;

const std::string kCauses =
    "Some possible causes include light is not on, light in bad position, missing diffuser, "
    "poor quality flat field input image, damaged sensor, or invalid configuration for the "
    "sensor being used.";

TEST(ImageChecks, StatisticsInSensorUnitsOverEveryChannel) {
    const struct {
        BayerImage image;
        int depth;
        std::string text;
    } cases[] = {
        {makeImage(2, 2, 1, img::kCfaRggb, {0.0f, 1.0f, 0.5f, 0.25f}), 10,
         "Minimum pixel value = 0\nMaximum pixel value = 1023\nAverage pixel value = 447.56"},
        {makeImage(2, 1, 1, img::kCfaRggb, {100.0f / 4095.0f, 4000.0f / 4095.0f}), 12,
         "Minimum pixel value = 100\nMaximum pixel value = 4000\nAverage pixel value = 2050.00"},
        {makeImage(1, 1, 4, 0, {0.0f, 0.0f, 0.0f, 1.0f}), 8,
         "Minimum pixel value = 0\nMaximum pixel value = 255\nAverage pixel value = 63.75"},
    };
    for (const auto& c : cases) {
        std::ostringstream out;
        prep::writeStatistics(c.image, c.depth, out);
        EXPECT_EQ(out.str(), c.text);
        out << " " << 1.0 / 3.0; // the stream is left fixed with two decimals
        EXPECT_EQ(out.str(), c.text + " 0.33");
    }
    const std::pair<int, std::uint32_t> scales[] = {
        {10, 1023u}, {12, 4095u}, {16, 65535u}, {32, 4294967295u}};
    for (const auto& [depth, scale] : scales)
        EXPECT_EQ(prep::fullScale(depth), scale);
    const std::tuple<float, std::uint32_t, std::uint32_t> units[] = {
        {0.5f, 1023, 512}, {1.5f, 1023, 1023}, {100.0f, 65535, 65535}, {-0.5f, 1023, 0}};
    for (const auto& [sample, scale, value] : units)
        EXPECT_EQ(prep::sampleUnits(sample, scale), value) << sample;
}

TEST(ImageChecks, RangeScanFindsTheLastSampleOutsideInclusiveLimits) {
    const auto found = [](const BayerImage& image, float low, float high) {
        const prep::OutOfRangePosition p = prep::scanRange(image, low, high);
        return std::to_string(p.row) + "," + std::to_string(p.column) + "," +
               std::to_string(p.channel);
    };
    EXPECT_EQ(found(makeImage(3, 3, 4, 0, {0.5f}), 0.1f, 0.9f), "-1,-1,65535");
    EXPECT_EQ(found(makeImage(2, 1, 1, img::kCfaRggb, {0.25f, 0.75f}), 0.25f, 0.75f),
              "-1,-1,65535");
    BayerImage image = makeImage(3, 2, 4, 0, {0.5f});
    image.pixels()[(0 * 3 + 2) * 4 + 3] = 0.0f; // row 0, column 2, channel 3
    image.pixels()[(1 * 3 + 0) * 4 + 1] = 1.0f; // row 1, column 0, channel 1
    image.pixels()[(1 * 3 + 1) * 4 + 0] = 1.0f; // row 1, column 1, channel 0: the last
    EXPECT_EQ(found(image, 0.1f, 0.9f), "1,1,0");
    EXPECT_EQ(
        found(makeImage(2, 1, 1, img::kCfaRggb, {0.5f, std::numeric_limits<float>::quiet_NaN()}),
              0.0f, 1.0f),
        "0,1,0");
}

TEST(ImageChecks, PixelChecksPassOrExplainTheFailure) {
    std::ostringstream out;
    prep::checkPixels(makeImage(4, 4), {0.0f, 1023.0f, 0.0f}, 1023, out);
    prep::checkPeakLevel(makeImage(2, 2, 1, img::kCfaRggb, {0.5f}), {0.0f, 1023.0f, 0.5f * 1023.0f},
                         1023, out);
    EXPECT_EQ(out.str(), "Image pixels within specified parameters.\n"
                         "Image pixels within specified parameters.\n"
                         "Image pixels within specified parameters.\n");
    out.str("");
    BayerImage image = makeImage(4, 3, 1, img::kCfaRggb, {0.5f});
    image.pixels()[1] = 0.0f;
    image.pixels()[2 * 4 + 3] = 2.0f; // above full scale: printed capped
    EXPECT_EQ(case_data::errorOf([&] {
                  prep::checkPixelRange(image, {20.0f, 1000.5f, 0.0f}, 1023, out);
              }),
              "Image pixels are not within specified parameters of 20 to 1000.5.\n" + kCauses +
                  "\nOut of range value: (2,3) = 1023.\n");
    EXPECT_THROW(prep::checkPixelRange(image, {20.0f, 1000.5f, 0.0f}, 1023, out),
                 std::runtime_error);
    const BayerImage dim = makeImage(2, 2, 1, img::kCfaRggb, {0.25f, 0.25f, 0.25f, 0.5f});
    EXPECT_EQ(case_data::errorOf([&] {
                  prep::checkPeakLevel(dim, {0.0f, 1023.0f, 600.0f}, 1023, out);
              }),
              "Peak image pixel value below specified required minimum peak value of 600.\n" +
                  kCauses + "\nPeak image pixel value: 512.\n");
    EXPECT_EQ(out.str(), "");
}

} // namespace
