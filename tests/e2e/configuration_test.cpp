// Reading, validating and reporting the configuration, as the tool does it
// before any image is touched.

#include "tests/e2e/e2e_fixture.h"

namespace e2e {
namespace {

using Configuration = ToolRun;

struct ErrorCase {
    std::string config;
    std::string message; // the whole of standard output
};

TEST_F(Configuration, ErrorsEndTheRunWithStatusOneBeforeTheImage) {
    prepare();
    const ErrorCase cases[] = {
        {"shared.bit_res = 3;",
         "ERROR: Value specified for shared.bit_res is too low, value must be between 4 and 15.\n"},
        {"shared.bit_res = 16;",
         "ERROR: Value specified for shared.bit_res is too high, value must be between 4 and "
         "15.\n"},
        {"shared.light_source = -2;",
         "ERROR: Value specified for shared.light_source is too low, value must be between -1 and "
         "255.\n"},
        {"lsc.leftPatchFactor = 0.6;",
         "ERROR: Value specified for lsc.leftPatchFactor is too high, value must be between 0 and "
         "0.5.\n"},
        {"lsc.max_gain = 1001;",
         "ERROR: Value specified for lsc.max_gain is too high, value must be between 0 and "
         "1000.\n"},
        // Not a number is outside every range: it would switch the threshold off.
        {"apply_lsc.max_delta_ab = nan;",
         "ERROR: Value specified for apply_lsc.max_delta_ab is too high, value must be between 0 "
         "and 10.\n"},
        {"proc.median_filter_size = 11;",
         "ERROR: Value specified for proc.median_filter_size is too high, value must be between 1 "
         "and 10.\n"},
        {"shared.block_name = 9abc;",
         "ERROR: Value for shared.block_name may only consist of letters, digits, dashes, and "
         "underscores and must start with a letter.\n"},
        {"shared.block_name = \"reference\";",
         "ERROR: Value for shared.block_name may only consist of letters, digits, dashes, and "
         "underscores and must start with a letter.\n"},
        {"shared.block_name = \"\";",
         "ERROR: Value for shared.block_name may only consist of letters, digits, dashes, and "
         "underscores and must start with a letter.\n"},
        {"shared.jpeg_quality = 7.5;",
         "ERROR: bad lexical cast: source type value could not be interpreted as target\n"
         "  shared.jpeg_quality = 7.5: not a whole number (32 bits)\n"},
        {"lsc.max_gain = 6", "ERROR: Failed to parse configuration file parameters, expecting "
                             "\";\":\nlsc.max_gain = 6\n  lsc.cfg, line 1\n"},
        {"lsc.max_gain = 6;\n9 = 1;\nlsc.falloff_factor = 1;\n",
         "ERROR: Failed to parse configuration file parameters.\nStopped at: \"9 = 1;\"\n"
         "\n  lsc.cfg, line 2\n"},
    };
    for (const ErrorCase& c : cases) {
        write("lsc.cfg", c.config);
        const auto result = calibrate();
        EXPECT_EQ(result.status, 1) << c.config;
        EXPECT_EQ(result.out, c.message) << c.config;
        EXPECT_FALSE(exists("cal.txt"));
    }
}

TEST_F(Configuration, MissingFileIsReported) {
    prepare();
    const auto result = run({"-c", "nothing.cfg", "-i", "flat.kqraw", "-l", "cal.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.out,
              "ERROR: Unable to open configuration file.\n  nothing.cfg: No such file or "
              "directory\n");
}

TEST_F(Configuration, CarriageReturnLineEndsKeepEverySetting) {
    // A comment ends at any line end: the setting after it must still count.
    prepare("# comment\rshared.bit_res = 3;\r");
    const auto result = calibrate();
    EXPECT_EQ(result.out,
              "ERROR: Value specified for shared.bit_res is too low, value must be between 4 and "
              "15.\n");
}

TEST_F(Configuration, DebugModeStartsWithTheStartLine) {
    for (const auto& setup :
         {std::pair<std::string, std::vector<std::string>>{"", {"--kq", "--debug"}},
          {"proc.debug = 1;", {}}}) {
        prepare(setup.first);
        const auto result = calibrate(setup.second);
        ASSERT_EQ(result.status, 0) << result.out;
        const auto text = lines(result.out);
        ASSERT_GE(text.size(), 3u);
        // "Start: 2026-Dec-06 10:50:43.249917"
        EXPECT_EQ(text[0].rfind("Start: ", 0), 0u) << text[0];
        EXPECT_EQ(text[0].size(), std::string("Start: 2026-Dec-06 10:50:43.249917").size())
            << text[0];
        EXPECT_EQ(text[1].rfind("Reading configuration: ", 0), 0u);
        EXPECT_EQ(text[2], "lsc version 3.8.1");
        EXPECT_EQ(text.back(), "Completed.");
        EXPECT_EQ(text[text.size() - 2].rfind("Execution time:", 0), 0u);
    }
}

TEST_F(Configuration, WithoutDebugThereAreNoTimerLines) {
    prepare();
    const auto result = calibrate();
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_EQ(result.out.find(" sec\n"), std::string::npos);
    EXPECT_EQ(result.out.find("Start:"), std::string::npos);
    EXPECT_EQ(result.out.find("Execution time:"), std::string::npos);
    EXPECT_EQ(lines(result.out).front(), "lsc version 3.8.1");
}

TEST_F(Configuration, InputIsNeededEvenWithSamples) {
    prepare();
    write("samples.txt", "");
    const auto result = run({"--kq", "-c", "lsc.cfg", "-s", "samples.txt", "-l", "cal.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.out,
              "lsc version 3.8.1\nERROR: An input flat field image must be specified.\n");
}

TEST_F(Configuration, QuietLogFileStaysEmptyWhateverHappens) {
    prepare();
    auto result = calibrate({"--kq", "--quiet", "--log", "info.txt"});
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(read("info.txt"), "");

    write("info.txt", "stale");
    write("lsc.cfg", "lsc.leftPatchFactor = 0.5; lsc.imageWidth = 1; lsc.imageHeight = 1;");
    result = calibrate({"--kq", "-q", "--log", "info.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(read("info.txt"), "");
}

TEST_F(Configuration, LogFileReceivesEveryLineFromTheVersionOn) {
    prepare();
    const auto viaLog = calibrate({"--kq", "--log", "info.txt"});
    const auto viaStdout = calibrate({"--kq", "--log", "-"});
    const auto plain = calibrate();
    EXPECT_EQ(viaLog.status, 0);
    EXPECT_EQ(viaLog.out, "");
    EXPECT_EQ(read("info.txt"), plain.out);
    EXPECT_EQ(viaStdout.out, plain.out);
}

TEST_F(Configuration, UnwritableLogEndsWith240) {
    prepare();
    const auto result = calibrate({"--kq", "--log", "missing-dir/info.txt"});
    EXPECT_EQ(result.status, 240);
    EXPECT_EQ(result.out,
              "ERROR(240): Unable to output information file.\nLikely a file protection issue.\n");
}

TEST_F(Configuration, SensorSizeMustMatchTheImage) {
    prepare("lsc.imageWidth = 640; lsc.imageHeight = 479;");
    auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: Input image dimensions (640x480) do not match "
                                    "expected dimensions for sensor (640x479)."))
        << result.out;
    // Only one of the two given: not compared.
    write("lsc.cfg", "lsc.imageWidth = 100;");
    result = calibrate();
    EXPECT_EQ(result.status, 0) << result.out;
}

TEST_F(Configuration, SettingsAreCheckedAgainstTheImageSize) {
    prepare();
    const ErrorCase cases[] = {
        {"lsc.left_patch_width = 321;",
         "ERROR: Value specified for lsc.left_patch_width is too high, value must be between 0 and "
         "320."},
        {"lsc.left_patch_width = 160; lsc.center_patch_width = 320; lsc.top_patch_height = 241;",
         "ERROR: Value specified for lsc.top_patch_height is too high, value must be between 0 "
         "and 240."},
        {"lsc.awb_avg_filter_size = 161;",
         "ERROR: Value specified for lsc.awb_avg_filter_size is too high, value must be between 1 "
         "and 160."},
        {"proc.black_level = 1024;",
         "ERROR: Value specified for proc.black_level is too high, value must be between 0 and "
         "1023."},
        {"shared.bit_res = 12; proc.peak_pixel_min = 4096;",
         "ERROR: Value specified for proc.peak_pixel_min is too high, value must be between 0 and "
         "4095."},
    };
    for (const ErrorCase& c : cases) {
        write("lsc.cfg", c.config);
        const auto result = calibrate();
        EXPECT_EQ(result.status, 1) << c.config;
        EXPECT_TRUE(hasLine(result.out, c.message)) << result.out;
    }
}

TEST_F(Configuration, SixteenBitDepthDoesNotRefuseThePixelLimits) {
    // 2^16 - 1 taken as a signed 16-bit number would be -1 and refuse every limit.
    FlatFieldShape shape = smallShape();
    shape.bits = 16;
    prepare("proc.min_pixel_val = 100; proc.max_pixel_val = 65000; proc.peak_pixel_min = 1000;",
            shape);
    const auto result = calibrate();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Completed.")) << result.out;
}

} // namespace
} // namespace e2e
