#include <functional>
#include <limits>
#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "prep/image_checks.h"
#include "test_images.h"

using prep_test::fill;
using prep_test::makeImage;

using img::BayerImage;

namespace {

const std::string kCauses =
    "Some possible causes include light is not on, light in bad position, missing diffuser, "
    "poor quality flat field input image, damaged sensor, or invalid configuration for the "
    "sensor being used.";

std::string failureText(const std::function<void()>& check) {
    try {
        check();
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "(no error)";
}

TEST(FullScale, PowerOfTwoMinusOne) {
    EXPECT_EQ(prep::fullScale(10), 1023u);
    EXPECT_EQ(prep::fullScale(12), 4095u);
    EXPECT_EQ(prep::fullScale(16), 65535u);
    EXPECT_EQ(prep::fullScale(32), 4294967295u);
}

TEST(Statistics, ThreeLinesLastOneOpen) {
    BayerImage image = makeImage(2, 2);
    const float values[4] = {0.0f, 1.0f, 0.5f, 0.25f};
    std::copy(values, values + 4, image.pixels());
    std::ostringstream out;
    prep::writeStatistics(image, 10, out);
    EXPECT_EQ(out.str(), "Minimum pixel value = 0\n"
                         "Maximum pixel value = 1023\n"
                         "Average pixel value = 447.56");
}

TEST(Statistics, TwelveBitScale) {
    BayerImage image = makeImage(2, 1);
    image.pixels()[0] = 100.0f / 4095.0f;
    image.pixels()[1] = 4000.0f / 4095.0f;
    std::ostringstream out;
    prep::writeStatistics(image, 12, out);
    EXPECT_EQ(out.str(), "Minimum pixel value = 100\n"
                         "Maximum pixel value = 4000\n"
                         "Average pixel value = 2050.00");
}

TEST(Statistics, LeavesStreamFixedWithTwoDecimals) {
    BayerImage image = makeImage(1, 1);
    image.pixels()[0] = 0.5f;
    std::ostringstream out;
    prep::writeStatistics(image, 8, out);
    out.str("");
    out << 1.0 / 3.0;
    EXPECT_EQ(out.str(), "0.33");
}

TEST(Statistics, CountsEveryChannel) {
    BayerImage image = makeImage(1, 1, 4);
    const float values[4] = {0.0f, 0.0f, 0.0f, 1.0f};
    std::copy(values, values + 4, image.pixels());
    std::ostringstream out;
    prep::writeStatistics(image, 8, out);
    EXPECT_NE(out.str().find("Average pixel value = 63.75"), std::string::npos) << out.str();
}

TEST(RangeScan, AllInsideGivesNoRow) {
    BayerImage image = makeImage(3, 3, 4);
    fill(image, 0.5f);
    const prep::OutOfRangePosition found = prep::scanRange(image, 0.1f, 0.9f);
    EXPECT_EQ(found.row, -1);
    EXPECT_EQ(found.column, -1);
    EXPECT_EQ(found.channel, 0xFFFF);
}

TEST(RangeScan, LimitsAreInclusive) {
    BayerImage image = makeImage(2, 1);
    image.pixels()[0] = 0.25f;
    image.pixels()[1] = 0.75f;
    EXPECT_EQ(prep::scanRange(image, 0.25f, 0.75f).row, -1);
}

TEST(RangeScan, ReportsLastOffenderInRowColumnChannelOrder) {
    BayerImage image = makeImage(3, 2, 4);
    fill(image, 0.5f);
    image.pixels()[(0 * 3 + 2) * 4 + 3] = 0.0f; // row 0, column 2, channel 3
    image.pixels()[(1 * 3 + 0) * 4 + 1] = 1.0f; // row 1, column 0, channel 1
    image.pixels()[(1 * 3 + 1) * 4 + 0] = 1.0f; // row 1, column 1, channel 0: last
    const prep::OutOfRangePosition found = prep::scanRange(image, 0.1f, 0.9f);
    EXPECT_EQ(found.row, 1);
    EXPECT_EQ(found.column, 1);
    EXPECT_EQ(found.channel, 0);
}

TEST(RangeScan, NotANumberIsOutside) {
    BayerImage image = makeImage(2, 1);
    fill(image, 0.5f);
    image.pixels()[1] = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(prep::scanRange(image, 0.0f, 1.0f).column, 1);
}

TEST(SampleUnits, RoundsAndCapsAtFullScale) {
    EXPECT_EQ(prep::sampleUnits(0.5f, 1023), 512u);
    EXPECT_EQ(prep::sampleUnits(1.5f, 1023), 1023u);
    EXPECT_EQ(prep::sampleUnits(100.0f, 65535), 65535u);
    EXPECT_EQ(prep::sampleUnits(-0.5f, 1023), 0u);
}

TEST(PixelChecks, DarkImagePassesWithZeroLimits) {
    BayerImage image = makeImage(4, 4);
    fill(image, 0.0f);
    std::ostringstream out;
    prep::checkPixels(image, {0.0f, 1023.0f, 0.0f}, 1023, out);
    EXPECT_EQ(out.str(), "Image pixels within specified parameters.\n"
                         "Image pixels within specified parameters.\n");
}

TEST(PixelChecks, RangeFailureExplainsLastOffender) {
    BayerImage image = makeImage(4, 3);
    fill(image, 0.5f);
    image.pixels()[0 * 4 + 1] = 0.0f;
    image.pixels()[2 * 4 + 3] = 2.0f; // above full scale: printed capped
    std::ostringstream out;
    const std::string text = failureText([&] {
        prep::checkPixelRange(image, {20.0f, 1000.5f, 0.0f}, 1023, out);
    });
    EXPECT_EQ(text, "Image pixels are not within specified parameters of 20 to 1000.5.\n" +
                        kCauses + "\nOut of range value: (2,3) = 1023.\n");
    EXPECT_EQ(out.str(), "");
}

TEST(PixelChecks, PeakBelowMinimumFails) {
    BayerImage image = makeImage(2, 2);
    fill(image, 0.25f);
    image.pixels()[3] = 0.5f;
    std::ostringstream out;
    const std::string text = failureText([&] {
        prep::checkPeakLevel(image, {0.0f, 1023.0f, 600.0f}, 1023, out);
    });
    EXPECT_EQ(text, "Peak image pixel value below specified required minimum peak value of "
                    "600.\n" +
                        kCauses + "\nPeak image pixel value: 512.\n");
}

TEST(PixelChecks, PeakEqualToMinimumPasses) {
    BayerImage image = makeImage(2, 2);
    fill(image, 0.5f);
    std::ostringstream out;
    prep::checkPeakLevel(image, {0.0f, 1023.0f, 0.5f * 1023.0f}, 1023, out);
    EXPECT_EQ(out.str(), "Image pixels within specified parameters.\n");
}

} // namespace
