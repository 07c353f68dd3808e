// The calibration report page: its structure, checked with a real HTML
// parser (tests/report/check_report.py), the numbers as the tool prints them,
// and how it is written.

#include <cmath>
#include <cstdlib>
#include <locale>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "report/run_report_html.h"
#include "tests/report/run_report_example.h"
#include "tests/support/temp_dir.h"

#include <dirent.h>
#include <unistd.h>

namespace report {
namespace {

using testing_support::readFile;
using testing_support::TempDir;

// Debian's interpreter (scripts/install-deps.sh installs it) starts in a
// fraction of the time a version manager's shim takes; any python3 will do.
std::string python() {
    return access("/usr/bin/python3", X_OK) == 0 ? "/usr/bin/python3" : "python3";
}

std::string shellQuoted(const std::string& text) {
    std::string quoted = "'";
    for (char c : text)
        quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return quoted + "'";
}

class ReportPage : public ::testing::Test {
protected:
    // Runs the structure checker on a page file; returns its exit status and
    // leaves its findings in `findings`.
    int check(const std::string& page, const std::vector<std::string>& arguments,
              std::string& findings) {
        std::string command =
            python() + " " +
            shellQuoted(std::string(LSC_SOURCE_DIR) + "/tests/report/check_report.py") + " " +
            shellQuoted(page);
        for (const std::string& argument : arguments)
            command += " " + shellQuoted(argument);
        const std::string output = dir_.file("findings.txt");
        const int status = std::system((command + " > " + shellQuoted(output) + " 2>&1").c_str());
        findings = readFile(output);
        return status;
    }

    // Writes the report and expects the checker to pass it.
    void expectValidPage(const RunReport& report, const std::vector<std::string>& arguments) {
        const std::string page = dir_.file("report.html");
        writeRunReport(page, report);
        std::string findings;
        EXPECT_EQ(check(page, arguments, findings), 0) << findings;
    }

    // Expects the checker to refuse a page, naming `finding`.
    void expectRefused(const std::string& html, const std::string& finding) {
        const std::string page = dir_.file("broken.html");
        testing_support::writeFile(page, html);
        std::string findings;
        EXPECT_NE(check(page, {}, findings), 0) << html;
        EXPECT_NE(findings.find(finding), std::string::npos) << findings;
    }

    TempDir dir_;
};

TEST_F(ReportPage, CheckerRefusesWhatAPageMustNotHave) {
    const std::string head = "<!DOCTYPE html><html lang=\"en\"><head><meta charset=\"utf-8\">"
                             "<title>t</title></head><body>";
    expectRefused(head + "<div><p>text</div></body></html>", "</div> closes <p>");
    expectRefused(head + "<script>1</script></body></html>", "forbidden element <script>");
    expectRefused(head + "<a href=\"http://example.invalid/\">x</a></body></html>",
                  "reference outside the page");
    expectRefused(head + "<p id=\"a\"></p><p id=\"a\"></p></body></html>", "duplicate id");
    expectRefused(head + "<figure><svg viewBox=\"0 0 1 1\" aria-label=\"x\"></svg>"
                         "<figcaption>c</figcaption></figure></body></html>",
                  "no legend");
    expectRefused(head + "<p>\xFF</p></body></html>", "not UTF-8");
}

TEST_F(ReportPage, PassingRunShowsEverySectionWithTheNumbersAsPrinted) {
    expectValidPage(report::test::exampleRunReport(),
                    {"--verdict=pass",
                     "--figures=7",
                     "--section=run",
                     "--section=surfaces",
                     "--section=shading",
                     "--section=colour",
                     "--absent=fit-error",
                     "--expect=input-file=captures/flatfield.kqraw",
                     "--expect=image-size=640 x 480",
                     "--expect=bayer-order=RGGB",
                     "--expect=bit-depth=10",
                     "--expect=exposure-time=0.0333",
                     "--expect=sensor-gains={ 1, 1, 1, 1 }",
                     "--expect=prepared-size=160 x 120",
                     "--expect=tool-version=3.8.1",
                     "--expect=gain-max-red=1.500",
                     "--expect=gain-max-blue=1.800",
                     "--expect=measured-rg=0.661290",
                     "--expect=measured-bg=0.596774",
                     "--expect=flattened-rg=1.000124",
                     "--expect=flattened-bg=0.999871",
                     "--expect=max-delta=2.891234",
                     "--expect=delta-threshold=8",
                     "--expect=mean-chroma=1.23457",
                     "--expect=delta-std-dev=0.654321",
                     "--expect=delta-blocks=20 x 15",
                     "--expect=delta-above=0",
                     "--expect=patch-borders=Patch borders (dashed) at x = 40, 120 and y = 30, "
                     "90 of the 160 x 120 prepared image; 300 sample points (dots)."});
}

TEST_F(ReportPage, ShowsTheShadingBeforeAndTheResidualAfterInPerCent) {
    RunReport report = report::test::exampleRunReport();
    report.shadingBefore.mean[2][5] = 0.2f;     // darkest green/blue block: a fifth of the peak
    report.residualAfter.mean[3][7] = -0.0125f; // largest blue residual
    expectValidPage(report,
                    {"--expect=shading-min-green-blue=20.0 %", "--expect=residual-max-blue=\xC2\xB1"
                                                               "1.25 %"});
}

TEST_F(ReportPage, ShowsTheLuminanceResidualAgainstItsBound) {
    RunReport report = report::test::exampleRunReport();
    report.haveLuma = true;
    report.lumaResidual = 0.0234f;
    report.lumaBound = 3.0f;
    expectValidPage(report, {"--expect=luma-residual-value=2.34 %", "--expect=luma-bound=3 %",
                             "--expect=luma-result=within"});
    report.lumaBound = 2.0f;
    expectValidPage(report, {"--expect=luma-result=above the bound"});
}

TEST_F(ReportPage, InDebugModeExposureAndGainsShowThreeDecimals) {
    RunReport report = report::test::exampleRunReport();
    report.inspectionInFixedNotation = true;
    report.gains[3] = 1.5f;
    expectValidPage(report, {"--expect=exposure-time=0.033",
                             "--expect=sensor-gains={ 1.000, 1.000, 1.000, 1.500 }"});
}

TEST_F(ReportPage, FailedRunNamesTheStageAndKeepsTheMessageAsText) {
    RunReport report = report::test::exampleRunReport();
    report.finished = false;
    report.failedStage = "Delta ab";
    report.failureMessage =
        "Maximum delta ab is greater than threshold of 8\n<light> & \"diffuser\"";
    report.maxDelta = 9.5f;
    report.delta[17] = 9.5f;
    expectValidPage(report,
                    {"--verdict=fail", "--expect=failed-stage=Failed at: Delta ab",
                     "--expect=failure-message=Maximum delta ab is greater than threshold of 8 "
                     "<light> & \"diffuser\"",
                     "--expect=delta-above=1"});
    const std::string page = runReportHtml(report);
    EXPECT_NE(page.find("threshold of 8\n&lt;light&gt; &amp; &quot;diffuser&quot;</pre>"),
              std::string::npos);
}

TEST_F(ReportPage, RunThatEndedBeforeLoadingShowsWhatItKnows) {
    RunReport report;
    report.toolVersion = "3.8.1";
    report.commandLine = "--config missing.cfg";
    report.failedStage = "Configuration";
    report.failureMessage = "Cannot open file : missing.cfg";
    expectValidPage(report, {"--verdict=fail", "--figures=0", "--expect=input-file=none",
                             "--expect=image-size=not loaded",
                             "--expect=changed-settings=Every setting is at its default.",
                             "--section=surfaces", "--section=colour", "--absent=surface-red",
                             "--absent=sample-points"});
}

TEST_F(ReportPage, UnfinishedRunWithoutAMessageIsNotAPass) {
    RunReport report = report::test::exampleRunReport();
    report.finished = false;
    expectValidPage(report, {"--verdict=incomplete"});
}

TEST_F(ReportPage, XTestRunIsNeverAPassAndWarningsStandUnderTheVerdict) {
    RunReport report = report::test::exampleRunReport();
    report.xtest = true;
    report.warnings = {"X-test run: <test surface>", "Unknown configuration key a.b (ignored)"};
    expectValidPage(report, {"--verdict=xtest",
                             "--expect=warnings=WARNING: X-test run: <test surface>WARNING: "
                             "Unknown configuration key a.b (ignored)"});
}

TEST_F(ReportPage, SkippedDeltaAbStageSaysSo) {
    RunReport report = report::test::exampleRunReport();
    report.haveDelta = false;
    expectValidPage(report, {"--verdict=pass", "--figures=6", "--absent=delta-map",
                             "--expect=delta-ab=Delta ab: not measured in this run.",
                             "--expect=flattened-rg=1.000124"});
}

TEST_F(ReportPage, FitErrorCheckShowsEachChannelAgainstItsBounds) {
    RunReport report = report::test::exampleRunReport();
    report.haveFitError = true;
    report.maxErrorBound = 0.2f;
    report.maxRmsBound = 0.05f;
    report.deviationMax[0] = 0.25f;
    report.deviationRms[0] = 0.0123f;
    report.deviationMax[3] = 0.125f;
    report.deviationRms[3] = 0.0625f;
    report.deviationRms[2] = std::nanf(""); // a broken figure never passes
    expectValidPage(report, {"--section=fit-error", "--expect=deviation-max-red=0.25000",
                             "--expect=deviation-rms-red=0.01230", "--expect=max-error-bound=0.2",
                             "--expect=max-rms-bound=0.05", "--expect=max-gain-bound=6",
                             "--expect=fit-result-red=MAX error bound exceeded.",
                             "--expect=fit-result-green-red=within",
                             "--expect=fit-result-green-blue=RMS error bound exceeded.",
                             "--expect=fit-result-blue=RMS error bound exceeded."});
}

TEST_F(ReportPage, SamplePointsAreWrittenOnceAndOnlyThoseInsideTheImage) {
    RunReport report = report::test::exampleRunReport();
    report.samplePoints = {{0, 0}, {0, 0}, {158, 118}, {160, 0}, {0, 500}};
    const std::string page = runReportHtml(report);
    EXPECT_NE(page.find("d=\"M1 1h0M159 119h0\""), std::string::npos);
    expectValidPage(report, {"--figures=7"});
}

TEST_F(ReportPage, PatchGeometryWithoutPixelsIsReportedNotDrawn) {
    RunReport report = report::test::exampleRunReport();
    report.fractions[0] = 0.0;
    expectValidPage(report, {"--figures=3", "--absent=surface-red"});
    EXPECT_NE(runReportHtml(report).find("The patch geometry leaves a patch without pixels"),
              std::string::npos);
}

TEST(ReportFileNames, MarkupAndBrokenBytesStayText) {
    RunReport report = report::test::exampleRunReport();
    report.inputPath = "in<put>&\"\xFF.kqraw";
    const std::string page = runReportHtml(report);
    EXPECT_NE(page.find("<code>in&lt;put&gt;&amp;&quot;\xEF\xBF\xBD.kqraw</code>"),
              std::string::npos);
    EXPECT_EQ(page.find("in<put>"), std::string::npos);
}

struct CommaDecimal : std::numpunct<char> {
    char do_decimal_point() const override { return ','; }
};

TEST(ReportBytes, SameReportGivesTheSamePageInAnyLocale) {
    const RunReport report = report::test::exampleRunReport();
    const std::string first = runReportHtml(report);
    const std::locale previous =
        std::locale::global(std::locale(std::locale::classic(), new CommaDecimal));
    const std::string second = runReportHtml(report);
    std::locale::global(previous);
    EXPECT_EQ(first, second);
}

std::vector<std::string> entries(const std::string& path) {
    std::vector<std::string> names;
    DIR* dir = opendir(path.c_str());
    if (!dir)
        return names;
    while (const dirent* entry = readdir(dir))
        if (std::string(entry->d_name) != "." && std::string(entry->d_name) != "..")
            names.push_back(entry->d_name);
    closedir(dir);
    return names;
}

TEST(WriteRunReport, WritesThePageAndLeavesNothingElse) {
    TempDir dir;
    const RunReport report = report::test::exampleRunReport();
    writeRunReport(dir.file("r.html"), report);
    EXPECT_EQ(readFile(dir.file("r.html")), runReportHtml(report));
    EXPECT_EQ(entries(dir.path()), std::vector<std::string>{"r.html"});
}

TEST(WriteRunReport, NamesTheFileItCannotWrite) {
    TempDir dir;
    const std::string missing = dir.file("no/such/dir/r.html");
    try {
        writeRunReport(missing, report::test::exampleRunReport());
        ADD_FAILURE() << "no error";
    } catch (const std::runtime_error& error) {
        EXPECT_EQ(std::string(error.what()), "Cannot write report file: " + missing);
    }
    try {
        writeRunReport("/dev/full", report::test::exampleRunReport());
        ADD_FAILURE() << "no error";
    } catch (const std::runtime_error& error) {
        EXPECT_EQ(std::string(error.what()), "Cannot write report file: /dev/full");
    }
}

} // namespace
} // namespace report
