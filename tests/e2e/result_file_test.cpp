// The machine-readable result (--json): checked with a JSON parser and the
// schema in docs/result.schema.json (tests/result/check_result.py), for a
// completed run, failed runs and an X-test run.

#include <cstdlib>
#include <regex>

#include "tests/e2e/e2e_fixture.h"

#include <unistd.h>

namespace e2e {
namespace {

std::string shellQuoted(const std::string& text) {
    std::string quoted = "'";
    for (char c : text)
        quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return quoted + "'";
}

std::string python() {
    return access("/usr/bin/python3", X_OK) == 0 ? "/usr/bin/python3" : "python3";
}

class ResultFile : public ToolRun {
protected:
    // Runs the checker on result.json with the expectations; its findings on failure.
    ::testing::AssertionResult valid(const std::vector<std::string>& expectations) const {
        std::string command =
            python() + " " +
            shellQuoted(std::string(LSC_SOURCE_DIR) + "/tests/result/check_result.py") + " " +
            shellQuoted(path("result.json"));
        for (const std::string& expectation : expectations)
            command += " " + shellQuoted(expectation);
        const int status =
            std::system((command + " > " + shellQuoted(path("findings.txt")) + " 2>&1").c_str());
        if (status == 0)
            return ::testing::AssertionSuccess();
        return ::testing::AssertionFailure() << read("findings.txt");
    }
};

struct ResultCase {
    const char* name;
    std::string config;
    std::vector<std::string> extra;
    int status;
    std::vector<std::string> expectations;
};

TEST_F(ResultFile, DescribesEveryKindOfRun) {
    const ResultCase cases[] = {
        {"completed",
         "lsc.max_gain = 6.5;",
         {"--binary", "cal.bin"},
         0,
         {"verdict/result=completed", "verdict/exit_status=0", "!verdict/message",
          "inputs/files/1/option=input", "inputs/files/1/path=flat.kqraw", "inputs/width=640",
          "inputs/bayer_order=RGGB", "inputs/bit_depth=10", "settings_changed/lsc.max_gain=\"6.5\"",
          "?measurements/max_delta_ab", "?measurements/gain_range/red/max",
          "?measurements/fit_deviation/rms/blue", "measurements/patch_factors/left=0.25",
          "outputs/0/option=calibrate", "outputs/1/option=binary", "!outputs/2", "warnings=[]"}},
        {"failed check",
         "proc.min_pixel_val = 400;",
         {},
         1,
         {"verdict/result=failed", "verdict/exit_status=1",
          "verdict/failed_stage=Checking the prepared image", "inputs/width=640",
          "!measurements/ratios_before", "outputs=[]"}},
        {"failed configuration",
         "lsc.max_gain = six;",
         {},
         1,
         {"verdict/result=failed", "verdict/failed_stage=Reading the configuration",
          "verdict/message=ERROR: bad lexical cast: source type value could not be interpreted "
          "as target\n  lsc.max_gain = six: not a number",
          "!inputs/width"}},
        {"x test",
         "proc.min_pixle_val = 60;",
         {"--xtest"},
         0,
         {"verdict/result=xtest", "verdict/exit_status=0", "!measurements/max_delta_ab",
          "warnings/0=Unknown configuration key proc.min_pixle_val (ignored); did you mean "
          "proc.min_pixel_val?",
          "?warnings/1"}},
    };
    prepare();
    for (const ResultCase& c : cases) {
        write("lsc.cfg", c.config);
        std::vector<std::string> extra = c.extra;
        extra.insert(extra.end(), {"--json", "result.json"});
        const auto result = calibrate(extra);
        EXPECT_EQ(result.status, c.status) << c.name << "\n" << result.out;
        EXPECT_TRUE(valid(c.expectations)) << c.name;
    }
}

TEST_F(ResultFile, FiguresAreThePrintedOnesAndSizesTheFilesOwn) {
    prepare();
    const auto result = calibrate({"--json", "result.json", "--flat", "flat.out"});
    ASSERT_EQ(result.status, 0) << result.out;
    std::smatch ratio;
    const std::string out = result.out;
    ASSERT_TRUE(std::regex_search(out, ratio, std::regex("\nMeasured R/G: ([0-9.]+)\n")));
    std::smatch delta;
    ASSERT_TRUE(std::regex_search(out, delta, std::regex("\nMaximum delta ab: ([0-9.]+)\n")));
    EXPECT_TRUE(
        valid({"measurements/ratios_before/r_g=" + ratio[1].str(),
               "measurements/max_delta_ab=" + delta[1].str(),
               "outputs/0/bytes=" + std::to_string(read("cal.txt").size()), "outputs/1/option=flat",
               "outputs/1/bytes=" + std::to_string(read("flat.out").size())}));
    // The run says where it wrote it, as it does for the report.
    EXPECT_TRUE(hasLine(result.out, "Writing run result."));
}

TEST_F(ResultFile, NeverReplacesAnInputOrAnotherOutput) {
    prepare();
    const auto result = calibrate({"--json", "cal.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.out, "ERROR: Output --json names the same file as output --calibrate: "
                          "cal.txt\n");
    EXPECT_EQ(calibrate({"--json", "lsc.cfg"}).status, 1);
}

} // namespace
} // namespace e2e
