#include "report/run_result_json.h"

#include <charconv>
#include <stdexcept>

#include "image/output_file.h"
#include "report/report_data.h"

#include <nlohmann/json.hpp>
#include <sys/stat.h>

namespace report {

using img::writeWholeFile;

using lsc::kChannels;

namespace {

using nlohmann::ordered_json;

constexpr const char* kChannelKeys[kChannels] = {"red", "green_red", "green_blue", "blue"};

// A figure as the run prints it: `digits` significant digits (general) or
// decimals (fixed), read back as a number, so the document and the printed
// line agree whatever the locale.
ordered_json printed(double value, int digits, bool fixed = false) {
    if (!std::isfinite(value))
        return nullptr;
    char text[64];
    const auto written =
        std::to_chars(text, text + sizeof text, value,
                      fixed ? std::chars_format::fixed : std::chars_format::general, digits);
    double number = 0.0;
    std::from_chars(text, written.ptr, number);
    return number;
}

ordered_json perChannel(const float (&values)[kChannels], int digits, bool fixed = false) {
    ordered_json object = ordered_json::object();
    for (int c = 0; c < kChannels; ++c)
        object[kChannelKeys[c]] = printed(values[c], digits, fixed);
    return object;
}

ordered_json ratios(const float (&pair)[2]) {
    return {{"r_g", printed(pair[0], 6)}, {"b_g", printed(pair[1], 6)}};
}

// The size of a stored file; null for a device or pipe (or a file gone since).
ordered_json storedSize(const std::string& path) {
    struct stat info;
    if (stat(path.c_str(), &info) != 0 || !S_ISREG(info.st_mode))
        return nullptr;
    return static_cast<std::uint64_t>(info.st_size);
}

ordered_json gainRange(const RunReport& report) {
    ordered_json ranges = ordered_json::object();
    if (!report.haveFit || report.preparedWidth <= 0 || report.preparedHeight <= 0)
        return nullptr;
    try {
        for (int c = 0; c < kChannels; ++c) {
            const GainSurface surface = sampleGainSurface(
                report.controlGrids[c], static_cast<std::uint32_t>(report.preparedWidth),
                static_cast<std::uint32_t>(report.preparedHeight), report.fractions, 16, 12);
            ranges[kChannelKeys[c]] = {{"min", printed(surface.minimum, 6)},
                                       {"max", printed(surface.maximum, 6)}};
        }
    } catch (const std::runtime_error&) {
        return nullptr; // a geometry the correction could not apply
    }
    return ranges;
}

ordered_json inputs(const RunReport& report) {
    ordered_json files = ordered_json::array();
    for (const auto& [option, path] : report.inputFiles)
        files.push_back({{"option", option}, {"path", path}});
    ordered_json object = {{"files", files}};
    if (report.haveInput) {
        object["frames_averaged"] = report.framesAveraged;
        object["width"] = report.width;
        object["height"] = report.height;
        object["bayer_order"] = report.bayerOrder;
        object["bit_depth"] = report.bitDepth;
        object["serial"] = report.serialNumber;
        object["exposure_time"] = printed(report.exposureTime, 3);
        object["gains"] = {printed(report.gains[0], 3), printed(report.gains[1], 3),
                           printed(report.gains[2], 3), printed(report.gains[3], 3)};
    }
    return object;
}

ordered_json measurements(const RunReport& report) {
    ordered_json object = ordered_json::object();
    if (report.havePrepared)
        object["prepared_size"] = {report.preparedWidth, report.preparedHeight};
    if (report.haveFit) {
        object["ratios_before"] = ratios(report.measuredRatios);
        object["target_levels"] = perChannel(report.targetLevels, 6);
        object["patch_factors"] = {{"left", printed(report.fractions[0], 6)},
                                   {"center", printed(report.fractions[1], 6)},
                                   {"top", printed(report.fractions[2], 6)},
                                   {"middle", printed(report.fractions[3], 6)}};
        object["sample_points"] = report.samplePoints.size();
        object["gain_range"] = gainRange(report);
    }
    if (report.haveFitError)
        object["fit_deviation"] = {{"max", perChannel(report.deviationMax, 5, true)},
                                   {"rms", perChannel(report.deviationRms, 5, true)}};
    if (report.haveWhiteBalance)
        object["ratios_after"] = ratios(report.flattenedRatios);
    if (report.haveLuma)
        object["luminance_residual_percent"] = printed(100.0 * report.lumaResidual, 2, true);
    if (report.haveDelta) {
        object["max_delta_ab"] = printed(report.maxDelta, 6);
        object["mean_delta_ab"] = printed(report.meanChroma, 6);
        object["delta_ab_std_dev"] = printed(report.deltaStdDev, 6);
        object["delta_ab_blocks"] = {report.deltaColumns, report.deltaRows};
    }
    return object;
}

ordered_json verdict(const RunReport& report) {
    const bool failed = !report.failureMessage.empty() || !report.finished;
    ordered_json object = {{"result", failed         ? "failed"
                                      : report.xtest ? "xtest"
                                                     : "completed"},
                           {"exit_status", failed ? report.exitStatus : 0}};
    if (failed) {
        object["failed_stage"] = report.failedStage;
        object["message"] = report.failureMessage;
    }
    return object;
}

} // namespace

std::string runResultJson(const RunReport& report) {
    ordered_json settings = ordered_json::object();
    for (const auto& [key, value] : report.changedSettings)
        settings[key] = value;
    ordered_json outputs = ordered_json::array();
    for (const auto& [option, path] : report.outputs)
        outputs.push_back({{"option", option}, {"path", path}, {"bytes", storedSize(path)}});

    const ordered_json document = {{"schema_version", kResultSchemaVersion},
                                   {"tool", {{"name", "lsc"}, {"version", report.toolVersion}}},
                                   {"command_line", report.commandLine},
                                   {"verdict", verdict(report)},
                                   {"inputs", inputs(report)},
                                   {"settings_changed", settings},
                                   {"measurements", measurements(report)},
                                   {"warnings", report.warnings},
                                   {"outputs", outputs}};
    // Invalid UTF-8 in a path or message is replaced, never a reason to lose the result.
    return document.dump(2, ' ', false, ordered_json::error_handler_t::replace);
}

void writeRunResult(const std::string& path, const RunReport& report) {
    const std::string text = runResultJson(report) + "\n";
    if (!writeWholeFile(path, text.data(), text.size()))
        throw std::runtime_error("Cannot write result file: " + path);
}

} // namespace report
