#include "report/report_svg.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <vector>

#include "report/report_text.h"

namespace report {

namespace {

struct Rgb {
    double r, g, b;
};

// Nine evenly spaced stops of each scale. The sequential one follows the
// perceptually even violet-teal-yellow ramp, which stays readable printed in
// grey; the diverging one is a blue-white-red ramp.
constexpr Rgb kSequential[9] = {{0x44, 0x01, 0x54}, {0x47, 0x2d, 0x7b}, {0x3b, 0x52, 0x8b},
                                {0x2c, 0x72, 0x8e}, {0x21, 0x91, 0x8c}, {0x28, 0xae, 0x80},
                                {0x5e, 0xc9, 0x62}, {0xad, 0xdc, 0x30}, {0xfd, 0xe7, 0x25}};
constexpr Rgb kDiverging[9] = {{0x21, 0x66, 0xac}, {0x43, 0x93, 0xc3}, {0x92, 0xc5, 0xde},
                               {0xd1, 0xe5, 0xf0}, {0xf7, 0xf7, 0xf7}, {0xfd, 0xdb, 0xc7},
                               {0xf4, 0xa5, 0x82}, {0xd6, 0x60, 0x4d}, {0xb2, 0x18, 0x2b}};
constexpr char kNoDataColour[] = "#bdbdbd";
constexpr char kOutlineColour[] = "#e0001b";

std::string hexColour(const Rgb& c) {
    char text[8];
    std::snprintf(text, sizeof text, "#%02x%02x%02x", static_cast<int>(std::lround(c.r)),
                  static_cast<int>(std::lround(c.g)), static_cast<int>(std::lround(c.b)));
    return text;
}

std::string rect(double x, double y, double width, double height, const std::string& fill) {
    return "<rect x=\"" + svgNumber(x) + "\" y=\"" + svgNumber(y) + "\" width=\"" +
           svgNumber(width) + "\" height=\"" + svgNumber(height) + "\" fill=\"" + fill + "\"";
}

} // namespace

int colourStep(const ColourScale& scale, double value) {
    if (std::isnan(value))
        return -1;
    const double span = scale.high - scale.low;
    if (!(span > 0.0))
        return value < scale.low ? 0 : value > scale.high ? kColourSteps - 1 : kColourSteps / 2;
    const double position = (value - scale.low) / span * kColourSteps;
    if (!(position > 0.0))
        return 0;
    return static_cast<int>(std::min<double>(position, kColourSteps - 1));
}

std::string stepColour(ScaleKind kind, int step) {
    if (step < 0 || step >= kColourSteps)
        return kNoDataColour;
    const Rgb* stops = kind == ScaleKind::Sequential ? kSequential : kDiverging;
    const double position = (step + 0.5) / kColourSteps * 8.0;
    const int index = std::min(7, static_cast<int>(position));
    const double t = position - index;
    const Rgb& a = stops[index];
    const Rgb& b = stops[index + 1];
    return hexColour({a.r + (b.r - a.r) * t, a.g + (b.g - a.g) * t, a.b + (b.b - a.b) * t});
}

std::string svgNumber(double value) {
    if (!std::isfinite(value))
        return "0";
    std::string text = formatFixed(std::round(value * 100.0) / 100.0, 2);
    text.erase(text.find_last_not_of('0') + 1);
    if (text.back() == '.')
        text.pop_back();
    return text == "-0" ? "0" : text;
}

std::string svgOpen(double viewWidth, double viewHeight, const std::string& label) {
    // A unit of margin all round, so frame strokes on the edges are not cut.
    const double width = viewWidth + 2;
    const double height = viewHeight + 2;
    return "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"" + svgNumber(width / kUnitsPerMm) +
           "mm\" height=\"" + svgNumber(height / kUnitsPerMm) + "mm\" viewBox=\"-1 -1 " +
           svgNumber(width) + " " + svgNumber(height) + "\" role=\"img\" aria-label=\"" +
           htmlEscape(label) + "\">";
}

std::string svgCells(const CellGrid& grid, const ColourScale& scale, double x, double y,
                     double width, double height, const CellStyle& style) {
    if (grid.columns < 1 || grid.rows < 1 || !grid.values)
        return "<g class=\"cells\"></g>";
    const double cellWidth = width / grid.columns;
    const double cellHeight = height / grid.rows;
    const auto value = [&](int r, int c) {
        return grid.values[static_cast<std::size_t>(r) * grid.columns + c];
    };

    if (!style.titles && std::isnan(style.outlineAbove)) {
        // One path per colour, in cell units: runs of one colour along a row
        // are one rectangle each. A few bytes per run instead of a rectangle
        // element per cell.
        std::vector<std::string> paths(kColourSteps + 1);
        for (int r = 0; r < grid.rows; ++r)
            for (int c = 0; c < grid.columns;) {
                const int step = colourStep(scale, value(r, c));
                int end = c + 1;
                while (end < grid.columns && colourStep(scale, value(r, end)) == step)
                    ++end;
                paths[step + 1] += "M" + std::to_string(c) + " " + std::to_string(r) + "h" +
                                   std::to_string(end - c) + "v1h-" + std::to_string(end - c) + "z";
                c = end;
            }
        std::string out = "<g class=\"cells\" transform=\"translate(" + svgNumber(x) + " " +
                          svgNumber(y) + ") scale(" + formatFixed(cellWidth, 5) + " " +
                          formatFixed(cellHeight, 5) + ")\">";
        for (int step = -1; step < kColourSteps; ++step)
            if (!paths[step + 1].empty())
                // A thin outline in the same colour covers the hairlines that
                // some renderers leave between neighbouring runs.
                out += "<path fill=\"" + stepColour(scale.kind, step) + "\" stroke=\"" +
                       stepColour(scale.kind, step) + "\" stroke-width=\"0.08\" d=\"" +
                       paths[step + 1] + "\"/>";
        return out + "</g>";
    }

    std::string out = "<g class=\"cells\">";
    std::string outlines;
    for (int r = 0; r < grid.rows; ++r) {
        // Edges from the cell index, not a running sum, so no error adds up.
        const double top = y + r * cellHeight;
        for (int c = 0; c < grid.columns; ++c) {
            const double left = x + c * cellWidth;
            const double right = x + (c + 1) * cellWidth;
            // Overlapping the next cells by a fraction of a unit, as above.
            out += rect(left, top, right - left + 0.3, cellHeight + 0.3,
                        stepColour(scale.kind, colourStep(scale, value(r, c))));
            if (style.titles)
                out +=
                    "><title>" + formatFixed(value(r, c), style.titleDecimals) + "</title></rect>";
            else
                out += "/>";
            if (value(r, c) > style.outlineAbove)
                outlines +=
                    rect(left + 0.6, top + 0.6, right - left - 1.2, cellHeight - 1.2, "none") +
                    " stroke=\"" + kOutlineColour + "\" stroke-width=\"1.2\"/>";
        }
    }
    out += "</g>";
    if (!outlines.empty())
        out += "<g class=\"outlines\">" + outlines + "</g>";
    return out;
}

double colourBarExtent(double height, bool marked) {
    return height + kLabelSize + 5.0 + (marked ? kLabelSize + 3.0 : 0.0);
}

std::string svgColourBar(const ColourScale& scale, double x, double y, double width, double height,
                         const std::vector<ScaleTick>& ticks, const ScaleMark& mark) {
    const double barTop = y + (mark.present ? kLabelSize + 3.0 : 0.0);
    std::string out = "<g class=\"legend\">";
    out += "<g shape-rendering=\"crispEdges\">";
    for (int step = 0; step < kColourSteps; ++step) {
        const double left = x + width * step / kColourSteps;
        const double right = x + width * (step + 1) / kColourSteps;
        out += rect(left, barTop, right - left, height, stepColour(scale.kind, step)) + "/>";
    }
    out +=
        "</g>" + rect(x, barTop, width, height, "none") + " stroke=\"#444\" stroke-width=\"0.5\"/>";
    const double span = scale.high - scale.low;
    const auto positionOf = [&](double value) {
        const double t = span > 0.0 ? (value - scale.low) / span : 0.5;
        return x + width * std::clamp(t, 0.0, 1.0);
    };
    for (const ScaleTick& tick : ticks) {
        const double px = positionOf(tick.value);
        out += "<line x1=\"" + svgNumber(px) + "\" y1=\"" + svgNumber(barTop + height) +
               "\" x2=\"" + svgNumber(px) + "\" y2=\"" + svgNumber(barTop + height + 3) +
               "\" stroke=\"#444\" stroke-width=\"0.6\"/>";
        const char* anchor = px - x < 12 ? "start" : x + width - px < 12 ? "end" : "middle";
        out += svgText(px, barTop + height + kLabelSize + 3.0, tick.label, kLabelSize, anchor);
    }
    if (mark.present) {
        const double px = positionOf(mark.value);
        out += "<line class=\"mark\" x1=\"" + svgNumber(px) + "\" y1=\"" + svgNumber(barTop - 2) +
               "\" x2=\"" + svgNumber(px) + "\" y2=\"" + svgNumber(barTop + height + 2) +
               "\" stroke=\"" + kOutlineColour + "\" stroke-width=\"1.6\"/>";
        const char* anchor = px - x < 40 ? "start" : x + width - px < 40 ? "end" : "middle";
        out += svgText(px, y + kLabelSize - 2.0, mark.label, kLabelSize, anchor, "mark-label");
    }
    return out + "</g>";
}

std::string svgText(double x, double y, const std::string& text, double size, const char* anchor,
                    const char* cssClass) {
    std::string out = "<text x=\"" + svgNumber(x) + "\" y=\"" + svgNumber(y) + "\" font-size=\"" +
                      svgNumber(size) + "\"";
    if (std::string(anchor) != "start")
        out += std::string(" text-anchor=\"") + anchor + "\"";
    if (cssClass)
        out += std::string(" class=\"") + cssClass + "\"";
    return out + ">" + htmlEscape(text) + "</text>";
}

} // namespace report
