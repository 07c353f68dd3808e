#include <cmath>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "prep/delta_ab_report.h"
#include "tests/support/temp_dir.h"

using testing_support::TempDir;

namespace {

const std::string kCauses =
    "Some possible causes include light is not on, light in bad position, missing diffuser, "
    "poor quality flat field input image, damaged sensor, or invalid configuration for the "
    "sensor being used.";

prep::DeltaAbResult results() {
    prep::DeltaAbResult result;
    result.columns = 3;
    result.rows = 2;
    result.deltaImage = {0.5f, 1.25f, 2.0f, 0.000004f, 10.123456f, 0.0f};
    result.meanChroma = 1.5f;
    result.maxDelta = 2.25f;
    result.deltaStdDev = 1.0f / 3.0f;
    return result;
}

template <typename Write> std::string stringThrown(Write write) {
    try {
        write();
    } catch (const std::string& text) {
        return text;
    }
    return "(nothing thrown)";
}

TEST(DeltaFile, RowsOfFiveDecimalValuesEachFollowedByComma) {
    EXPECT_EQ(prep::formatDeltaFile(results()), "0.50000,1.25000,2.00000,\n"
                                                "0.00000,10.12346,0.00000,\n"
                                                "\n");
}

TEST(DeltaFile, SingleRowGrid) {
    prep::DeltaAbResult result;
    result.columns = 3;
    result.rows = 1;
    result.deltaImage = {1.0f, 2.0f, 3.0f};
    EXPECT_EQ(prep::formatDeltaFile(result), "1.00000,2.00000,3.00000,\n\n");
}

TEST(DeltaFile, WrittenByteForByte) {
    TempDir dir;
    prep::writeDeltaFile(dir.file("delta.csv"), results());
    EXPECT_EQ(testing_support::readFile(dir.file("delta.csv")),
              "0.50000,1.25000,2.00000,\n0.00000,10.12346,0.00000,\n\n");
}

TEST(DeltaFile, UnopenablePathThrowsString) {
    TempDir dir;
    const std::string path = dir.file("no/such/dir/delta.csv");
    EXPECT_EQ(stringThrown([&] { prep::writeDeltaFile(path, results()); }),
              "Cannot open file : " + path);
}

TEST(DeltaFile, FullDeviceThrowsWriteError) {
    EXPECT_EQ(stringThrown([&] { prep::writeDeltaFile("/dev/full", results()); }),
              "Cannot write file : /dev/full");
}

TEST(StatsFile, ThreeValuesCommaBlankSeparated) {
    EXPECT_EQ(prep::formatStatsFile(results()), "1.5, 2.25, 0.333333\n");
}

TEST(StatsFile, UnopenablePathThrowsString) {
    TempDir dir;
    const std::string path = dir.file("no/stats.csv");
    EXPECT_EQ(stringThrown([&] { prep::writeStatsFile(path, results()); }),
              "Cannot open file : " + path);
}

TEST(DeltaThreshold, EqualPasses) {
    EXPECT_NO_THROW(prep::checkDeltaThreshold(10.0f, 10.0f));
    EXPECT_NO_THROW(prep::checkDeltaThreshold(0.0f, 0.0f));
}

TEST(DeltaThreshold, LargerFailsWithTwoLines) {
    try {
        prep::checkDeltaThreshold(10.5f, 10.0f);
        FAIL();
    } catch (const std::range_error& e) {
        EXPECT_EQ(std::string(e.what()),
                  "Maximum delta ab is greater than threshold of 10\n" + kCauses);
    }
}

TEST(DeltaThreshold, NotANumberFails) {
    EXPECT_THROW(prep::checkDeltaThreshold(std::nanf(""), 10.0f), std::range_error);
}

} // namespace
