// The safeguards of the surface fit, run as a station runs them: a default
// run stays exactly as it was, a blotch on the sample points or a corner too
// dark to correct ends the run before the register file is written, and the
// sample window keeps a small blotch out of the samples.

#include <regex>

#include "tests/e2e/e2e_fixture.h"

namespace e2e {
namespace {

// The flat field of the golden default run: noisy, with defective pixels.
FlatFieldShape goldenShape() {
    FlatFieldShape shape = smallShape();
    shape.noise = 0.005;
    shape.defects = 200;
    shape.seed = 3;
    return shape;
}

// A square of `size` x `size` pixels with its top-left corner at (x, y), all
// set to `value` (sample units) or scaled by `factor`.
void paint(FlatField& field, int x, int y, int size, double factor, int value = -1) {
    for (int row = y; row < y + size; ++row)
        for (int column = x; column < x + size; ++column) {
            std::uint16_t& sample =
                field.samples[static_cast<std::size_t>(row) * field.shape.width + column];
            sample = static_cast<std::uint16_t>(value >= 0 ? value : sample * factor);
        }
}

class FitChecks : public ToolRun {
protected:
    // The prepared image is the capture itself, so what is painted on the
    // capture reaches the samples. The sample grid's angles nearest the centre
    // are -2 and 6 degrees: 320 (1 + sin -2) rounds to 309 and 240 (1 + sin -2)
    // to 232, so the block at (308, 232) is a sample.
    void prepareBlotch(const std::string& settings, int size, double factor, int value = -1) {
        prepare("proc.median_filter_flag = 0; shared.proc_sampling_factor = 1;\n" + settings);
        paint(field_, 308, 232, size, factor, value);
        write("flat.kqraw", testing_support::kqraw2FileBytes(field_));
    }
};

TEST_F(FitChecks, DefaultRunKeepsItsRegisterFileAndEveryLine) {
    prepare("", goldenShape());
    const auto result = calibrate();
    ASSERT_EQ(result.status, 0) << result.out;
    expectGolden(result.out, "default_run_stdout.txt");
    expectGolden(read("cal.txt"), "default_run_register.txt");
}

TEST_F(FitChecks, LogFlagOnlyAddsTheDeviationOfEachChannel) {
    prepare("lsc.log_err_flag = 1;", goldenShape());
    const auto result = calibrate();
    ASSERT_EQ(result.status, 0) << result.out;
    expectGolden(read("cal.txt"), "default_run_register.txt");

    // The golden lines, with one deviation line after each channel's fit.
    const std::regex deviation("(red|green/red|green/blue|blue) deviation max, rms: "
                               "0\\.0[0-9]{4} 0\\.0[0-9]{4}");
    std::vector<std::string> rest;
    for (const std::string& line : lines(result.out)) {
        std::smatch match;
        if (std::regex_match(line, match, deviation)) {
            ASSERT_FALSE(rest.empty());
            EXPECT_EQ(rest.back(), "Fitting surface : " + match[1].str());
        } else {
            rest.push_back(line);
        }
    }
    EXPECT_EQ(rest, lines(testing_support::readFile(kGoldenDir + "default_run_stdout.txt")));
    EXPECT_EQ(rest.size() + 4, lines(result.out).size()) << result.out;
}

TEST_F(FitChecks, BrightBlotchOnASamplePointExceedsTheLargestDeviation) {
    prepareBlotch("", 4, 1.0, 1000);
    const auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: MAX error bound exceeded.")) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Fitting surface : blue")) << result.out;
    EXPECT_FALSE(exists("cal.txt"));
}

TEST_F(FitChecks, RmsBoundIsCheckedBeforeTheLargestDeviation) {
    prepareBlotch("lsc.max_rms_err = 0.01;", 4, 1.0, 1000);
    const auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: RMS error bound exceeded.")) << result.out;
    EXPECT_FALSE(exists("cal.txt"));
}

TEST_F(FitChecks, DimClusterOnASamplePointExceedsTheLargestDeviation) {
    prepareBlotch("lsc.log_err_flag = 1;", 6, 0.3);
    const auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: MAX error bound exceeded.")) << result.out;
    EXPECT_TRUE(std::regex_search(result.out,
                                  std::regex("\nred deviation max, rms: [1-9][0-9]*\\.[0-9]{5} ")))
        << result.out;
    EXPECT_FALSE(exists("cal.txt"));
}

TEST_F(FitChecks, SampleWindowKeepsASmallBlotchOutOfTheSamples) {
    prepareBlotch("lsc.sample_window = 5;", 4, 1.0, 1000);
    const auto result = calibrate();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(exists("cal.txt"));
}

TEST_F(FitChecks, CornerTooDarkToCorrectMeetsTheGainCeiling) {
    FlatFieldShape shape = smallShape();
    shape.cornerLevel = 0.15;
    prepare("proc.min_pixel_val = 10;", shape);
    auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(std::regex_search(
        result.out,
        std::regex(
            "\nERROR: Gain [6-9]\\.[0-9]+ of the red channel is above lsc\\.max_gain \\(6\\)\\. "
            "Likely a dark corner, a missing diffuser or a configuration that does not "
            "match the sensor\\.\n")))
        << result.out;
    // Checked before the surfaces are fitted.
    EXPECT_FALSE(hasLine(result.out, "Fitting surface : red")) << result.out;
    EXPECT_FALSE(exists("cal.txt"));

    // A ceiling above the corner's gain lets the same capture through.
    write("lsc.cfg", "proc.min_pixel_val = 10; lsc.max_gain = 12;");
    result = calibrate();
    EXPECT_EQ(result.status, 0) << result.out;
}

TEST_F(FitChecks, SamplesFromAFileAreJudgedOnTheCaptureWithoutItsBlackLevel) {
    FlatFieldShape shape = smallShape();
    shape.blackLevel = 64;
    prepare("proc.black_level = 64;", shape);
    const auto first = calibrate({"--kq", "--outsamples", "samples.txt"});
    ASSERT_EQ(first.status, 0) << first.out;
    const auto second = calibrate({"--kq", "--samples", "samples.txt"});
    EXPECT_EQ(second.status, 0) << second.out;
}

TEST_F(FitChecks, SampleWindowMustBeOddFromOneToFifteen) {
    prepare();
    const std::pair<const char*, const char*> cases[] = {
        {"lsc.sample_window = 4;", "ERROR: Value specified for lsc.sample_window must be odd."},
        {"lsc.sample_window = 17;", "ERROR: Value specified for lsc.sample_window is too high, "
                                    "value must be between 1 and 15."},
        {"lsc.sample_window = 0;", "ERROR: Value specified for lsc.sample_window is too low, "
                                   "value must be between 1 and 15."},
    };
    for (const auto& [config, message] : cases) {
        write("lsc.cfg", config);
        const auto result = calibrate();
        EXPECT_EQ(result.status, 1) << config;
        EXPECT_TRUE(hasLine(result.out, message)) << result.out;
    }
}

} // namespace
} // namespace e2e
