// The --report option as a station uses it: a page after a good run and after
// a failed one, nothing without the option.

#include "tests/e2e/e2e_fixture.h"

namespace e2e {
namespace {

using ReportOption = ToolRun;

TEST_F(ReportOption, NeedsKq) {
    prepare();
    const auto result = calibrate({"--report", "report.html"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.out, "ERROR: unrecognised option '--report'\n  --report needs --kq\n");
}

TEST_F(ReportOption, IsWrittenBeforeCompletedAndAddsOnlyItsOwnLine) {
    prepare();
    const auto plain = calibrate();
    const auto withReport = calibrate({"--kq", "--report", "report.html"});
    ASSERT_EQ(withReport.status, 0) << withReport.out;
    auto expected = plain.out;
    expected.insert(expected.rfind("Completed."), "Writing calibration report.\n");
    EXPECT_EQ(withReport.out, expected);
    const std::string page = read("report.html");
    EXPECT_EQ(page.rfind("<!DOCTYPE html>", 0), 0u);
    EXPECT_NE(page.find("data-verdict=\"pass\""), std::string::npos);
}

TEST_F(ReportOption, FailedRunStillWritesThePageWithTheFailure) {
    prepare("apply_lsc.max_delta_ab = 0.001;");
    const auto result = calibrate({"--kq", "--report", "report.html"});
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "Writing calibration report."));
    const std::string page = read("report.html");
    EXPECT_NE(page.find("data-verdict=\"fail\""), std::string::npos);
    EXPECT_NE(page.find("Maximum delta ab is greater than threshold of 0.001"), std::string::npos);
}

TEST_F(ReportOption, UnwritableReportDoesNotHideTheRunsOwnError) {
    prepare("apply_lsc.max_delta_ab = 0.001;");
    const auto result = calibrate({"--kq", "--report", "no-dir/report.html"});
    EXPECT_EQ(result.status, 1);
    const auto text = lines(result.out);
    ASSERT_GE(text.size(), 3u);
    EXPECT_EQ(text[text.size() - 3], "ERROR: Cannot write report file: no-dir/report.html");
    EXPECT_EQ(text[text.size() - 2], "ERROR: Maximum delta ab is greater than threshold of 0.001");
}

TEST_F(ReportOption, UnwritableReportFailsAGoodRun) {
    prepare();
    const auto result = calibrate({"--kq", "--report", "no-dir/report.html"});
    EXPECT_EQ(result.status, 1);
    EXPECT_FALSE(hasLine(result.out, "Completed."));
    EXPECT_EQ(lines(result.out).back(), "ERROR: Cannot write report file: no-dir/report.html");
}

} // namespace
} // namespace e2e
