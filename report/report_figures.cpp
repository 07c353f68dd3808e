#include "report/report_figures.h"

#include <algorithm>

#include "report/report_text.h"

namespace report {

using lsc::kChannelNames;
using lsc::kChannels;
using lsc::PatchBreakpoints;

namespace {

constexpr double kFigureWidth = 400.0;  // user units across a figure in a column
constexpr double kMinimumWidth = 240.0; // room for the colour bar's labels
constexpr double kBarHeight = 12.0;

// Width and height of a map of `aspect` (width / height) inside maxWidth x maxHeight.
std::pair<double, double> fitMap(double aspect, double maxWidth, double maxHeight) {
    if (!(aspect > 0.0))
        aspect = 4.0 / 3.0;
    double width = maxWidth;
    double height = width / aspect;
    if (height > maxHeight) {
        height = maxHeight;
        width = height * aspect;
    }
    return {width, height};
}

std::string frame(double x, double y, double width, double height) {
    return "<rect x=\"" + svgNumber(x) + "\" y=\"" + svgNumber(y) + "\" width=\"" +
           svgNumber(width) + "\" height=\"" + svgNumber(height) +
           "\" fill=\"none\" stroke=\"#444\" stroke-width=\"0.8\"/>";
}

std::string line(double x1, double y1, double x2, double y2) {
    return "<line x1=\"" + svgNumber(x1) + "\" y1=\"" + svgNumber(y1) + "\" x2=\"" + svgNumber(x2) +
           "\" y2=\"" + svgNumber(y2) + "\"/>";
}

} // namespace

std::string
samplePointsDefinition(const std::vector<std::pair<std::uint32_t, std::uint32_t>>& points,
                       std::uint32_t width, std::uint32_t height) {
    std::vector<std::pair<std::uint32_t, std::uint32_t>> inside;
    inside.reserve(points.size());
    for (const auto& point : points)
        if (point.first < width && point.second < height)
            inside.push_back(point);
    // Sample sets repeat points (the border lines cross the sine grid).
    std::sort(inside.begin(), inside.end());
    inside.erase(std::unique(inside.begin(), inside.end()), inside.end());
    if (inside.empty())
        return "";
    std::string path;
    path.reserve(inside.size() * 12);
    for (const auto& [x, y] : inside) // the centre of the 2 x 2 block
        path += "M" + std::to_string(std::uint64_t{x} + 1) + " " +
                std::to_string(std::uint64_t{y} + 1) + "h0";
    return "<svg class=\"definitions\" width=\"0\" height=\"0\" aria-hidden=\"true\"><defs>"
           "<path id=\"" +
           std::string(kSamplePointsId) + "\" d=\"" + path + "\"/></defs></svg>";
}

std::string gainSurfaceFigure(const GainSurface& surface, const ColourScale& scale,
                              const std::vector<ScaleTick>& ticks, std::uint32_t width,
                              std::uint32_t height, const PatchBreakpoints& breaks,
                              bool withSamples, const std::string& label) {
    const auto [mapWidth, mapHeight] =
        fitMap(height > 0 ? static_cast<double>(width) / height : 0.0, kFigureWidth, 270.0);
    const double figureWidth = std::max(mapWidth, kMinimumWidth);
    const double barTop = mapHeight + 6.0;
    const double total = barTop + colourBarExtent(kBarHeight, false);
    std::string out = svgOpen(figureWidth, total, label);
    out += svgCells({surface.columns, surface.rows, surface.gain.data()}, scale, 0, 0, mapWidth,
                    mapHeight);

    const double sx = width > 0 ? mapWidth / width : 0.0;
    const double sy = height > 0 ? mapHeight / height : 0.0;
    // Patch borders: a light line under a dark dashed one shows on every colour.
    std::string borders;
    for (int i = 1; i <= 2; ++i) {
        borders += line(breaks.x[i] * sx, 0, breaks.x[i] * sx, mapHeight);
        borders += line(0, breaks.y[i] * sy, mapWidth, breaks.y[i] * sy);
    }
    out += "<g class=\"patch-borders\" stroke=\"#fff\" stroke-width=\"2\">" + borders + "</g>";
    out += "<g class=\"patch-borders\" stroke=\"#111\" stroke-width=\"0.9\" "
           "stroke-dasharray=\"5 3\">" +
           borders + "</g>";
    if (withSamples && sx > 0.0) {
        // The points are in image pixels: the group scales them onto the map,
        // so the dot size is given in pixels too.
        out += "<g class=\"samples\" transform=\"scale(" + formatFixed(sx, 6) +
               ")\"><use href=\"#" + std::string(kSamplePointsId) +
               "\" fill=\"none\" stroke=\"#000\" stroke-opacity=\"0.7\" stroke-linecap=\"round\" "
               "stroke-width=\"" +
               formatFixed(2.4 / sx, 3) + "\"/></g>";
    }
    out += frame(0, 0, mapWidth, mapHeight);
    out += svgColourBar(scale, 0, barTop, figureWidth, kBarHeight, ticks);
    return out + "</svg>";
}

std::string channelMapsFigure(const ChannelBlockMeans& means, const ColourScale& scale,
                              const std::vector<ScaleTick>& ticks, double aspect,
                              const std::string& label) {
    constexpr double kGap = 20.0;
    const auto [panelWidth, panelHeight] = fitMap(aspect, 180.0, 140.0);
    const double figureWidth = std::max(kChannels * panelWidth + 3 * kGap, kMinimumWidth);
    const double mapTop = kLabelSize + 4.0;
    const double barTop = mapTop + panelHeight + 6.0;
    const double total = barTop + colourBarExtent(kBarHeight, false);
    std::string out = svgOpen(figureWidth, total, label);
    for (int k = 0; k < kChannels; ++k) {
        const double left = k * (panelWidth + kGap);
        out += svgText(left, kLabelSize, kChannelNames[k], kLabelSize);
        if (means.mean[k].size() ==
            static_cast<std::size_t>(means.columns) * static_cast<std::size_t>(means.rows))
            out += svgCells({means.columns, means.rows, means.mean[k].data()}, scale, left, mapTop,
                            panelWidth, panelHeight);
        out += frame(left, mapTop, panelWidth, panelHeight);
    }
    out += svgColourBar(scale, 0, barTop, figureWidth, kBarHeight, ticks);
    return out + "</svg>";
}

std::string deltaFigure(int columns, int rows, const std::vector<float>& delta, float threshold,
                        const std::string& thresholdText, double aspect, const std::string& label) {
    const auto [mapWidth, mapHeight] = fitMap(aspect, kFigureWidth, 210.0);
    const double figureWidth = std::max(mapWidth, kMinimumWidth);
    const double barTop = mapHeight + 6.0;
    const double total = barTop + colourBarExtent(kBarHeight, true);
    std::string out = svgOpen(figureWidth, total, label);

    float largest = 0.0f;
    for (float value : delta)
        largest = std::max(largest, value);
    ColourScale scale{ScaleKind::Sequential, 0.0, std::max(largest, threshold)};
    if (!(scale.high > 0.0))
        scale.high = 1.0;
    CellStyle style;
    style.titles = true;
    style.titleDecimals = 5; // as in the delta ab file
    style.outlineAbove = threshold;
    if (columns > 0 && rows > 0 &&
        delta.size() == static_cast<std::size_t>(columns) * static_cast<std::size_t>(rows))
        out += svgCells({columns, rows, delta.data()}, scale, 0, 0, mapWidth, mapHeight, style);
    out += frame(0, 0, mapWidth, mapHeight);

    const std::vector<ScaleTick> ticks = {{0.0, "0"},
                                          {scale.high / 2, formatGeneral(scale.high / 2, 3)},
                                          {scale.high, formatGeneral(scale.high, 3)}};
    ScaleMark mark;
    mark.present = true;
    mark.value = threshold;
    mark.label = "threshold " + thresholdText;
    out += svgColourBar(scale, 0, barTop, figureWidth, kBarHeight, ticks, mark);
    return out + "</svg>";
}

} // namespace report
