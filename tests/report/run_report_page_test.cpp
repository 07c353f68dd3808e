// The calibration report page, byte for byte against the pages kept under
// tests/data/report/ (LSC_GOLDEN_UPDATE=1 rewrites them), in any locale, and
// how it is written.

#include <cmath>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <iterator>
#include <locale>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "report/run_report_html.h"
#include "tests/lsc/test_helpers.h"
#include "tests/support/temp_dir.h"

namespace report {
namespace {

// A plausible passing run: a 640 x 480 RGGB capture prepared to 160 x 120,
// bowl-shaped gain surfaces, shading falling off towards the corners, a small
// residual and a delta ab grid under the threshold. Each case changes a part.
ChannelBlockMeans exampleBlocks(int columns, int rows, float (*value)(int k, double u, double v)) {
    ChannelBlockMeans means;
    means.columns = columns;
    means.rows = rows;
    for (int k = 0; k < lsc::kChannels; ++k)
        for (int r = 0; r < rows; ++r)
            for (int c = 0; c < columns; ++c)
                means.mean[k].push_back(value(k, (c + 0.5) / columns, (r + 0.5) / rows));
    return means;
}

RunReport exampleRunReport() {
    RunReport report;
    report.finished = true;
    report.toolVersion = "3.8.1";
    report.commandLine = "--config lsc.cfg --input flatfield.kqraw --calibrate calibration.txt "
                         "--kq --report report.html";
    report.changedSettings = {{"shared.block_name", "CAM0"}, {"apply_lsc.max_delta_ab", "8.0"}};
    report.haveInput = true;
    report.inputPath = "captures/flatfield.kqraw";
    report.width = 640;
    report.height = 480;
    report.bayerOrder = "RGGB";
    report.bitDepth = 10;
    report.exposureTime = 0.0333f;
    for (float& gain : report.gains)
        gain = 1.0f;
    report.havePrepared = true;
    report.preparedWidth = 160;
    report.preparedHeight = 120;
    report.shadingBefore = exampleBlocks(4, 3, [](int k, double u, double v) {
        const double r2 = (u - 0.5) * (u - 0.5) + (v - 0.5) * (v - 0.5);
        return static_cast<float>(1.0 - (0.9 + 0.1 * k) * r2 * 1.4);
    });
    report.haveFit = true;
    for (int k = 0; k < lsc::kChannels; ++k)
        for (int r = 0; r < 10; ++r)
            for (int c = 0; c < 10; ++c)
                report.controlGrids[k][r * 10 + c] = static_cast<float>(
                    1.0 + (0.5 + 0.1 * k) * ((r - 4.5) * (r - 4.5) + (c - 4.5) * (c - 4.5)) / 40.5);
    for (std::uint32_t y = 0; y < 120; y += 40)
        for (std::uint32_t x = 0; x < 160; x += 40)
            report.samplePoints.emplace_back(x, y);
    report.targetLevels[0] = 0.41f;
    report.targetLevels[1] = report.targetLevels[2] = 0.62f;
    report.targetLevels[3] = 0.37f;
    report.maxGain = 6.0f;
    report.haveResidual = true;
    report.residualAfter = exampleBlocks(4, 3, [](int k, double u, double v) {
        return static_cast<float>(0.006 * std::sin(6.0 * u + k) * std::cos(5.0 * v));
    });
    report.haveWhiteBalance = true;
    report.measuredRatios[0] = 0.661290f;
    report.measuredRatios[1] = 0.596774f;
    report.flattenedRatios[0] = 1.000124f;
    report.flattenedRatios[1] = 0.999871f;
    report.haveDelta = true;
    report.deltaColumns = 6;
    report.deltaRows = 4;
    for (int r = 0; r < 4; ++r)
        for (int c = 0; c < 6; ++c)
            report.delta.push_back(
                static_cast<float>(0.4 + 2.5 * std::fabs(std::sin(0.3 * c) * std::cos(0.25 * r))));
    report.threshold = 8.0f;
    report.maxDelta = 2.891234f;
    report.meanChroma = 1.23457f;
    report.deltaStdDev = 0.654321f;
    return report;
}

struct PageCase {
    const char* name;
    std::function<void(RunReport&)> change;
};

const PageCase kPages[] = {
    {"passed", [](RunReport&) {}},
    {"passed_details",
     [](RunReport& r) {
         r.shadingBefore.mean[2][5] = 0.2f;     // darkest green/blue block
         r.residualAfter.mean[3][7] = -0.0125f; // largest blue residual
         r.haveLuma = true;
         r.lumaResidual = 0.0234f;
         r.lumaBound = 3.0f;
         r.inspectionInFixedNotation = true;
         r.gains[3] = 1.5f;
         r.serialNumber = "SN<1>";
         r.framesAveraged = 4;
         r.inputFiles = {{"--input", "a&b.kqraw"}, {"--config", "lsc.cfg"}};
         r.outputs = {{"--calibrate", "calibration.txt"}};
         r.inputPath = "in<put>&\"\xFF.kqraw"; // markup and a broken byte stay text
         // Points are drawn once and only inside the prepared image.
         r.samplePoints = {{0, 0}, {0, 0}, {158, 118}, {160, 0}, {0, 500}};
     }},
    {"failed",
     [](RunReport& r) {
         r.finished = false;
         r.failedStage = "Delta ab";
         r.failureMessage = "Maximum delta ab is greater than threshold of 8\n"
                            "<light> & \"diffuser\"";
         r.exitStatus = 1;
         r.maxDelta = 9.5f;
         r.delta[17] = 9.5f;
         r.haveLuma = true;
         r.lumaResidual = 0.0234f;
         r.lumaBound = 2.0f; // above the bound
         r.haveFitError = true;
         r.maxErrorBound = 0.2f;
         r.maxRmsBound = 0.05f;
         r.deviationMax[0] = 0.25f;
         r.deviationRms[0] = 0.0123f;
         r.deviationMax[3] = 0.125f;
         r.deviationRms[3] = 0.0625f;
         r.deviationRms[2] = std::nanf(""); // a broken figure never passes
     }},
    {"ended_before_loading",
     [](RunReport& r) {
         r = RunReport();
         r.toolVersion = "3.8.1";
         r.commandLine = "--config missing.cfg";
         r.failedStage = "Configuration";
         r.failureMessage = "Cannot open file : missing.cfg";
         r.exitStatus = 2;
     }},
    {"unfinished", [](RunReport& r) { r.finished = false; }},
    {"failed_in_correction",
     [](RunReport& r) { // shading before, nothing after
         r.finished = r.haveResidual = r.haveWhiteBalance = r.haveDelta = false;
         r.failedStage = "Correction";
         r.failureMessage = "apply_lsc.sampling_factor must be at least 1.";
     }},
    {"xtest_without_delta",
     [](RunReport& r) {
         r.xtest = true;
         r.warnings = {"X-test run: <test surface>", "Unknown configuration key a.b (ignored)"};
         r.haveDelta = false;
     }},
    {"patch_without_pixels", [](RunReport& r) { r.fractions[0] = 0.0; }},
};

// A locale that writes a decimal comma and groups thousands.
struct CommaDecimal : std::numpunct<char> {
    char do_decimal_point() const override { return ','; }
    char do_thousands_sep() const override { return '.'; }
    std::string do_grouping() const override { return "\3"; }
};

class ReportPage : public ::testing::TestWithParam<PageCase> {};

// The page without its style sheet and its drawings' outlines (<path>
// elements): every page but the passing one keeps its text, numbers and
// figures' frames, and the passing page alone carries what is the same on
// every page.
std::string withoutSharedParts(std::string page) {
    const std::size_t style = page.find("<style>");
    if (style != std::string::npos)
        page.erase(style, page.find("</style>", style) + 8 - style);
    for (std::size_t at = 0; (at = page.find("<path ", at)) != std::string::npos;)
        page.erase(at, page.find("/>", at) + 2 - at);
    return page;
}

TEST_P(ReportPage, MatchesTheKeptPageInAnyLocale) {
    RunReport report = exampleRunReport();
    GetParam().change(report);
    const std::string page = runReportHtml(report), name = GetParam().name;
    lsc_test::expectGolden("report/" + name + ".html",
                           name == "passed" ? page : withoutSharedParts(page));
    const std::locale previous =
        std::locale::global(std::locale(std::locale::classic(), new CommaDecimal));
    const std::string again = runReportHtml(report);
    std::locale::global(previous);
    EXPECT_TRUE(page == again);
}

INSTANTIATE_TEST_SUITE_P(Runs, ReportPage, ::testing::ValuesIn(kPages),
                         [](const ::testing::TestParamInfo<PageCase>& page) {
                             return std::string(page.param.name);
                         });

TEST(WriteRunReport, WritesThePageAloneOrNamesTheFileItCannotWrite) {
    testing_support::TempDir dir;
    const RunReport report = exampleRunReport();
    writeRunReport(dir.file("r.html"), report);
    EXPECT_EQ(testing_support::readFile(dir.file("r.html")), runReportHtml(report));
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(dir.path()), {}),
              1); // no leftovers
    for (const std::string& path : {dir.file("no/such/dir/r.html"), std::string("/dev/full")}) {
        EXPECT_EQ(lsc_test::runtimeError([&] { writeRunReport(path, report); }),
                  "Cannot write report file: " + path);
    }
}

} // namespace
} // namespace report
