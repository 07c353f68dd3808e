#include "report/report_sections.h"

#include <algorithm>
#include <cstddef>
#include <vector>

#include "lsc/patch_geometry.h"
#include "report/report_data.h"
#include "report/report_figures.h"
#include "report/report_text.h"

namespace report {

using lsc::kChannelNames;
using lsc::kChannels;
using lsc::PatchBreakpoints;
using lsc::patchBreakpoints;
using lsc::patchGeometryUsable;

namespace {

constexpr int kSurfaceCells = 64; // gain surface cells along the longer side
constexpr const char* kChannelIds[kChannels] = {"red", "green-red", "green-blue", "blue"};

std::string factRow(const std::string& name, const std::string& id, const std::string& html) {
    return "<tr><th scope=\"row\">" + name + "</th><td id=\"" + id + "\">" + html + "</td></tr>";
}

std::string note(const std::string& text) {
    return "<p class=\"note\">" + text + "</p>";
}

std::string section(const std::string& id, const std::string& title, const std::string& body) {
    return "<section id=\"" + id + "\"><h2>" + title + "</h2>" + body + "</section>\n";
}

std::string span(const std::string& id, const std::string& text) {
    return "<span id=\"" + id + "\" class=\"num\">" + text + "</span>";
}

std::string size(std::int64_t width, std::int64_t height) {
    return std::to_string(width) + " x " + std::to_string(height);
}

// Values scaled by `factor` (fractions to per cent for the page).
ChannelBlockMeans scaled(const ChannelBlockMeans& means, float factor) {
    ChannelBlockMeans out = means;
    for (std::vector<float>& channel : out.mean)
        for (float& value : channel)
            value *= factor;
    return out;
}

bool complete(const ChannelBlockMeans& means) {
    const std::size_t blocks =
        static_cast<std::size_t>(std::max(means.columns, 0)) * std::max(means.rows, 0);
    if (blocks == 0)
        return false;
    for (const std::vector<float>& channel : means.mean)
        if (channel.size() != blocks)
            return false;
    return true;
}

double aspectOf(const RunReport& report) {
    if (report.preparedWidth > 0 && report.preparedHeight > 0)
        return static_cast<double>(report.preparedWidth) / report.preparedHeight;
    if (report.width > 0 && report.height > 0)
        return static_cast<double>(report.width) / report.height;
    return 4.0 / 3.0;
}

std::string percent(double value, int decimals) {
    return formatFixed(value, decimals) + " %";
}

// The run's warnings, under the verdict; nothing when there are none.
std::string warningList(const RunReport& report) {
    if (report.warnings.empty())
        return std::string();
    std::string html = "<ul id=\"warnings\" class=\"note\">";
    for (const std::string& text : report.warnings)
        html += "<li>WARNING: " + htmlEscape(text) + "</li>";
    return html + "</ul>\n";
}

std::string verdictOnly(const RunReport& report) {
    // The X-test surface is no calibration: such a run never reads as a pass.
    if (report.finished && report.failureMessage.empty() && report.xtest)
        return "<div id=\"verdict\" class=\"verdict fail\" data-verdict=\"xtest\">"
               "<span class=\"badge\">X-TEST</span> X-test run: the register file holds a test "
               "surface, not a calibration.</div>\n";
    if (report.finished && report.failureMessage.empty())
        return "<div id=\"verdict\" class=\"verdict pass\" data-verdict=\"pass\">"
               "<span class=\"badge\">PASS</span> Calibration completed.</div>\n";
    if (report.failureMessage.empty())
        return "<div id=\"verdict\" class=\"verdict fail\" data-verdict=\"incomplete\">"
               "<span class=\"badge\">INCOMPLETE</span> The run did not finish.</div>\n";
    const std::string stage =
        report.failedStage.empty() ? "The run failed." : "Failed at: " + report.failedStage;
    return "<div id=\"verdict\" class=\"verdict fail\" data-verdict=\"fail\">"
           "<span class=\"badge\">FAIL</span> <span id=\"failed-stage\">" +
           htmlEscape(stage) + "</span><pre id=\"failure-message\" class=\"message\">" +
           htmlEscape(report.failureMessage) + "</pre></div>\n";
}

} // namespace

std::string verdictSection(const RunReport& report) {
    return verdictOnly(report) + warningList(report);
}

std::string runSection(const RunReport& report) {
    std::string capture = "<table class=\"facts\">";
    capture += factRow(
        "Input file", "input-file",
        report.inputPath.empty() ? "none" : "<code>" + htmlEscape(report.inputPath) + "</code>");
    if (report.haveInput) {
        capture += factRow("Image size", "image-size", size(report.width, report.height));
        capture += factRow("Bayer order", "bayer-order", htmlEscape(report.bayerOrder));
        capture += factRow("Bit depth", "bit-depth", std::to_string(report.bitDepth));
        // As the exposure and gain line printed them: three digits.
        const auto inspection = [&](float value) {
            return report.inspectionInFixedNotation ? formatFixed(value, 3)
                                                    : formatGeneral(value, 3);
        };
        capture += factRow("Exposure time", "exposure-time", inspection(report.exposureTime));
        capture +=
            factRow("Sensor gain", "sensor-gains",
                    "{ " + inspection(report.gains[0]) + ", " + inspection(report.gains[1]) + ", " +
                        inspection(report.gains[2]) + ", " + inspection(report.gains[3]) + " }");
    } else {
        capture += factRow("Image", "image-size", "not loaded");
    }
    capture += "</table>";

    std::string run = "<table class=\"facts\">";
    if (report.havePrepared)
        run += factRow("Prepared image", "prepared-size",
                       size(report.preparedWidth, report.preparedHeight));
    run += factRow("Tool version", "tool-version", htmlEscape(report.toolVersion));
    run += factRow("Command line", "command-line",
                   "<code>" + htmlEscape(report.commandLine) + "</code>");
    run += "</table>";

    // Three columns of "key = value": a configuration that sets many keys
    // still leaves room for the surfaces on the first page.
    std::string settings;
    if (report.changedSettings.empty()) {
        settings = "<p id=\"changed-settings\" class=\"note\">Every setting is at its default.</p>";
    } else {
        settings = "<div id=\"changed-settings\" class=\"settings\"><h3>Settings changed from "
                   "their defaults</h3><ul>";
        for (const auto& [key, value] : report.changedSettings)
            settings += "<li><code>" + htmlEscape(key) + "</code> = <code>" + htmlEscape(value) +
                        "</code></li>";
        settings += "</ul></div>";
    }
    return section("run", "Run", "<div class=\"columns\">" + capture + run + "</div>" + settings);
}

std::string surfacesSection(const RunReport& report) {
    const char* title = "Gain surfaces";
    if (!report.haveFit)
        return section("surfaces", title,
                       note("No surface: the run ended before a fit was accepted."));
    const std::uint32_t width = static_cast<std::uint32_t>(std::max(report.preparedWidth, 0));
    const std::uint32_t height = static_cast<std::uint32_t>(std::max(report.preparedHeight, 0));
    const PatchBreakpoints breaks =
        patchBreakpoints(width, height, report.fractions[0], report.fractions[1],
                         report.fractions[2], report.fractions[3]);
    if (width < 2 || height < 2 || !patchGeometryUsable(breaks))
        return section("surfaces", title,
                       note("The patch geometry leaves a patch without pixels; the surfaces "
                            "cannot be drawn."));

    const BlockGrid grid = blockGridFor(width, height, kSurfaceCells);
    GainSurface surfaces[kChannels];
    for (int k = 0; k < kChannels; ++k)
        surfaces[k] = sampleGainSurface(report.controlGrids[k], width, height, report.fractions,
                                        grid.columns, grid.rows);
    // One scale for the four, so the channels compare by colour.
    ColourScale scale{ScaleKind::Sequential, surfaces[0].minimum, surfaces[0].maximum};
    for (const GainSurface& surface : surfaces) {
        scale.low = std::min<double>(scale.low, surface.minimum);
        scale.high = std::max<double>(scale.high, surface.maximum);
    }
    if (!(scale.high - scale.low > 1e-6)) {
        scale.low -= 0.05;
        scale.high += 0.05;
    }
    const double middle = (scale.low + scale.high) / 2;
    const std::vector<ScaleTick> ticks = {{scale.low, formatFixed(scale.low, 3)},
                                          {middle, formatFixed(middle, 3)},
                                          {scale.high, formatFixed(scale.high, 3)}};

    const std::string points = samplePointsDefinition(report.samplePoints, width, height);
    std::string body = points + "<div class=\"figures\">";
    for (int k = 0; k < kChannels; ++k) {
        const std::string id = kChannelIds[k];
        body += "<figure id=\"surface-" + id + "\" class=\"chart\">" +
                gainSurfaceFigure(surfaces[k], scale, ticks, width, height, breaks, !points.empty(),
                                  std::string("Gain surface ") + kChannelNames[k]) +
                "<figcaption><b>" + kChannelNames[k] + "</b>: gain " +
                span("gain-min-" + id, formatFixed(surfaces[k].minimum, 3)) + " to " +
                span("gain-max-" + id, formatFixed(surfaces[k].maximum, 3)) +
                "</figcaption></figure>";
    }
    body += "</div>";
    body += "<p id=\"patch-borders\" class=\"note\">Patch borders (dashed) at x = " +
            std::to_string(breaks.x[1]) + ", " + std::to_string(breaks.x[2]) +
            " and y = " + std::to_string(breaks.y[1]) + ", " + std::to_string(breaks.y[2]) +
            " of the " + size(width, height) + " prepared image; " +
            std::to_string(report.samplePoints.size()) + " sample points (dots).</p>";
    return section("surfaces", title, body);
}

std::string shadingSection(const RunReport& report) {
    const bool before = report.havePrepared && complete(report.shadingBefore);
    const bool after = report.haveResidual && complete(report.residualAfter);
    const char* title = "Shading before and after correction";
    if (!before && !after)
        return section("shading", title,
                       note("Not measured: the run ended before the image was prepared."));
    const double aspect = aspectOf(report);
    std::string body;
    if (before) {
        const ChannelBlockMeans percentOfPeak = scaled(report.shadingBefore, 100.0f);
        ColourScale scale{ScaleKind::Sequential, 100.0, 100.0};
        for (int k = 0; k < kChannels; ++k)
            scale.low = std::min<double>(scale.low, channelRange(percentOfPeak, k).minimum);
        // At least a 10 % span, so a well-lit field does not look like strong shading.
        scale.low = std::min(scale.low, 90.0);
        const double middle = (scale.low + scale.high) / 2;
        body += "<figure id=\"shading-before\" class=\"chart wide\">" +
                channelMapsFigure(percentOfPeak, scale,
                                  {{scale.low, percent(scale.low, 0)},
                                   {middle, percent(middle, 0)},
                                   {scale.high, percent(scale.high, 0)}},
                                  aspect, "Shading before correction") +
                "<figcaption><b>Before correction</b>: block means of the prepared image in "
                "per cent of each channel's brightest block.</figcaption></figure>";
    }
    if (after) {
        const ChannelBlockMeans percentDeviation = scaled(report.residualAfter, 100.0f);
        double span = 0.0;
        for (const std::vector<float>& channel : percentDeviation.mean)
            span = std::max<double>(span, largestAbsolute(channel));
        // At least +-2 %, so a flat result stays pale instead of showing noise at full colour.
        span = std::max(span, 2.0);
        body +=
            "<figure id=\"residual-after\" class=\"chart wide\">" +
            channelMapsFigure(percentDeviation, {ScaleKind::Diverging, -span, span},
                              {{-span, percent(-span, 1)}, {0.0, "0 %"}, {span, percent(span, 1)}},
                              aspect, "Residual after correction") +
            "<figcaption><b>After correction</b>: deviation of each block from its "
            "channel's mean, in per cent.</figcaption></figure>";
    }

    // Channels across, so the table takes three lines.
    std::string header = "<tr><th></th>";
    std::string darkest = "<tr><th scope=\"row\">Darkest block before</th>";
    std::string residual = "<tr><th scope=\"row\">Largest residual after</th>";
    for (int k = 0; k < kChannels; ++k) {
        const std::string id = kChannelIds[k];
        header += std::string("<th>") + kChannelNames[k] + "</th>";
        darkest +=
            "<td id=\"shading-min-" + id + "\">" +
            (before ? percent(100.0 * channelRange(report.shadingBefore, k).minimum, 1) : "-") +
            "</td>";
        residual +=
            "<td id=\"residual-max-" + id + "\">" +
            (after ? "&#177;" + percent(100.0 * largestAbsolute(report.residualAfter.mean[k]), 2)
                   : "-") +
            "</td>";
    }
    body += "<table id=\"shading-figures\" class=\"numbers\"><thead>" + header +
            "</tr></thead><tbody>" + darkest + "</tr>" + residual + "</tr>";
    body += "</tbody></table>";
    if (report.haveLuma) {
        const bool within =
            report.lumaBound <= 0.0f || report.lumaResidual * 100.0f <= report.lumaBound;
        body += "<p id=\"luma-residual\">Largest luminance residual over the delta ab blocks: "
                "&#177;<span id=\"luma-residual-value\">" +
                percent(100.0 * report.lumaResidual, 2) + "</span> (" +
                (report.lumaBound > 0.0f
                     ? "bound <span id=\"luma-bound\">" + formatGeneral(report.lumaBound, 6) +
                           " %</span>, " +
                           (within ? "<span id=\"luma-result\" class=\"ok\">within</span>"
                                   : "<span id=\"luma-result\" class=\"bad\">above the "
                                     "bound</span>")
                     : std::string("no bound set")) +
                ").</p>";
    }
    return section("shading", title, body);
}

namespace {

std::string colourRatios(const RunReport& report) {
    // Both ratio lines are printed in fixed notation with six decimals.
    const auto ratio = [](bool have, float value) { return have ? formatFixed(value, 6) : "-"; };
    const bool measured = report.haveFit || report.haveWhiteBalance;
    const bool flattened = report.haveWhiteBalance;
    std::string table = "<table id=\"colour-ratios\" class=\"numbers\"><thead><tr><th></th>"
                        "<th>Flat field</th><th>Corrected and white-balanced</th></tr></thead>"
                        "<tbody>";
    table += "<tr><th scope=\"row\">R/G</th><td id=\"measured-rg\">" +
             ratio(measured, report.measuredRatios[0]) + "</td><td id=\"flattened-rg\">" +
             ratio(flattened, report.flattenedRatios[0]) + "</td></tr>";
    table += "<tr><th scope=\"row\">B/G</th><td id=\"measured-bg\">" +
             ratio(measured, report.measuredRatios[1]) + "</td><td id=\"flattened-bg\">" +
             ratio(flattened, report.flattenedRatios[1]) + "</td></tr>";
    return table + "</tbody></table>";
}

std::string deltaStatistics(const RunReport& report, const std::string& thresholdText) {
    std::size_t above = 0;
    for (float value : report.delta)
        above += value > report.threshold ? 1 : 0;
    const bool within = report.maxDelta <= report.threshold;
    std::string table = "<table id=\"delta-ab\" class=\"facts\">";
    table += factRow("Maximum delta ab", "max-delta", formatFixed(report.maxDelta, 6));
    table += factRow("Threshold", "delta-threshold", thresholdText);
    table += factRow("Result", "delta-result",
                     within ? "<span class=\"ok\">within the threshold</span>"
                            : "<span class=\"bad\">above the threshold</span>");
    table += factRow("Mean chroma", "mean-chroma", formatGeneral(report.meanChroma, 6));
    table += factRow("Standard deviation", "delta-std-dev", formatGeneral(report.deltaStdDev, 6));
    table += factRow("Blocks", "delta-blocks", size(report.deltaColumns, report.deltaRows));
    table += factRow("Blocks above the threshold", "delta-above", std::to_string(above));
    return table + "</table>";
}

} // namespace

std::string colourSection(const RunReport& report) {
    const char* title = "Colour balance and colour error";
    if (!report.haveFit && !report.haveWhiteBalance)
        return section("colour", title,
                       note("Not measured: the run ended before a fit was accepted."));
    if (!report.haveDelta)
        return section("colour", title,
                       colourRatios(report) +
                           "<p id=\"delta-ab\" class=\"note\">Delta ab: not measured in this "
                           "run.</p>");
    // The delta ab map on the left; the ratios and the statistics beside it.
    const std::string thresholdText = formatGeneral(report.threshold, 6);
    const std::string map =
        "<figure id=\"delta-map\" class=\"chart\">" +
        deltaFigure(report.deltaColumns, report.deltaRows, report.delta, report.threshold,
                    thresholdText, aspectOf(report), "Delta ab per block") +
        "<figcaption><b>Delta ab per block</b>: distance from the mean colour; "
        "outlined above the threshold.</figcaption></figure>";
    return section("colour", title,
                   "<div class=\"figures\">" + map + "<div>" + colourRatios(report) +
                       deltaStatistics(report, thresholdText) + "</div></div>");
}

std::string fitErrorSection(const RunReport& report) {
    if (!report.haveFitError)
        return "";
    const auto number = [](float value) { return formatGeneral(value, 6); };
    // The deviation lines print five decimals.
    const auto deviation = [](float value) { return formatFixed(value, 5); };
    std::string body = "<table id=\"deviations\" class=\"numbers\"><thead><tr><th>Channel</th>"
                       "<th>Deviation max<br>(bound <span id=\"max-error-bound\">" +
                       number(report.maxErrorBound) +
                       "</span>)</th><th>RMS<br>(bound <span id=\"max-rms-bound\">" +
                       number(report.maxRmsBound) +
                       "</span>)</th><th>Result</th></tr></thead><tbody>";
    for (int k = 0; k < kChannels; ++k) {
        const std::string id = kChannelIds[k];
        // As the check decides: a figure that is not a number exceeds its bound.
        const bool maxOver = !(report.deviationMax[k] <= report.maxErrorBound);
        const bool rmsOver = !(report.deviationRms[k] <= report.maxRmsBound);
        std::string result = "<span class=\"ok\">within</span>";
        if (maxOver || rmsOver) {
            result = "<span class=\"bad\">";
            if (rmsOver)
                result += "RMS error bound exceeded.";
            if (maxOver)
                result += std::string(rmsOver ? "<br>" : "") + "MAX error bound exceeded.";
            result += "</span>";
        }
        body += std::string("<tr><th scope=\"row\">") + kChannelNames[k] +
                "</th><td id=\"deviation-max-" + id + "\">" + deviation(report.deviationMax[k]) +
                "</td><td id=\"deviation-rms-" + id + "\">" + deviation(report.deviationRms[k]) +
                "</td><td id=\"fit-result-" + id + "\">" + result + "</td></tr>";
    }
    body += "</tbody></table>";
    body += "<p class=\"note\">Largest gain allowed: <span id=\"max-gain-bound\">" +
            number(report.maxGain) + "</span>.</p>";
    return section("fit-error", "Fit error", body);
}

} // namespace report
