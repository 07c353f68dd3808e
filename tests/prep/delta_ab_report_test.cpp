// The delta ab files and the bounds of delta ab and luminance residual.

#include <cmath>
#include <optional>
#include <stdexcept>
#include <string>

#include "prep/delta_ab_report.h"
#include "prep/luminance_residual.h"
#include "tests/prep/test_images.h"
#include "tests/support/temp_dir.h"

namespace {

const std::string kCauses =
    "Some possible causes include light is not on, light in bad position, missing diffuser, "
    "poor quality flat field input image, damaged sensor, or invalid configuration for the "
    "sensor being used.";

TEST(DeltaAbReport, FilesHoldTheGridAndStatistics) {
    prep::DeltaAbResult result;
    result.columns = 3;
    result.rows = 2;
    result.deltaImage = {0.5f, 1.25f, 2.0f, 0.000004f, 10.123456f, 0.0f};
    result.meanChroma = 1.5f;
    result.maxDelta = 2.25f;
    result.deltaStdDev = 1.0f / 3.0f;
    testing_support::TempDir dir;
    prep::writeDeltaFile(dir.file("delta.csv"), result);
    prep::writeStatsFile(dir.file("stats.csv"), result);
    case_data::expectGolden("prep/delta.csv", testing_support::readFile(dir.file("delta.csv")));
    case_data::expectGolden("prep/stats.csv", testing_support::readFile(dir.file("stats.csv")));
    EXPECT_EQ(prep::formatDeltaFile(result), testing_support::readFile(dir.file("delta.csv")));
    EXPECT_EQ(prep::formatStatsFile(result), testing_support::readFile(dir.file("stats.csv")));
    result.rows = 1;
    result.deltaImage.resize(3);
    EXPECT_EQ(prep::formatDeltaFile(result), "0.50000,1.25000,2.00000,\n\n");

    const std::string missing = dir.file("no/such/dir/delta.csv");
    EXPECT_EQ(case_data::errorOf([&] { prep::writeDeltaFile(missing, result); }),
              "Cannot open file : " + missing);
    EXPECT_EQ(case_data::errorOf([&] { prep::writeStatsFile(missing, result); }),
              "Cannot open file : " + missing);
    EXPECT_EQ(case_data::errorOf([&] { prep::writeDeltaFile("/dev/full", result); }),
              "Cannot write file : /dev/full");
}

TEST(DeltaAbReport, ThresholdFailsAboveOrOnNotANumber) {
    EXPECT_NO_THROW(prep::checkDeltaThreshold(10.0f, 10.0f));
    EXPECT_NO_THROW(prep::checkDeltaThreshold(0.0f, 0.0f));
    EXPECT_EQ(case_data::errorOf([] { prep::checkDeltaThreshold(10.5f, 10.0f); }),
              "Maximum delta ab is greater than threshold of 10\n" + kCauses);
    EXPECT_THROW(prep::checkDeltaThreshold(10.5f, 10.0f), std::range_error);
    EXPECT_THROW(prep::checkDeltaThreshold(std::nanf(""), 10.0f), std::range_error);
}

TEST(DeltaAbReport, LuminanceBoundInPerCentFailsPastItAndZeroIsOff) {
    const struct {
        std::optional<float> residual;
        float bound;
        std::string message;
    } cases[] = {
        {0.03f, 3.0f, ""},
        {0.5f, 0.0f, ""},
        {std::nullopt, 0.0f, ""},
        {0.031f, 3.0f, "Maximum luminance residual is greater than threshold of 3 %\n" + kCauses},
        {std::nullopt, 3.0f,
         "The luminance residual cannot be measured: the flattened image does not fill the delta "
         "ab block grid or holds no light."},
    };
    for (const auto& c : cases)
        EXPECT_EQ(case_data::errorOf([&] { prep::checkLuminanceResidual(c.residual, c.bound); }),
                  c.message);
}

} // namespace
