#pragma once
// Drawing pieces of the calibration report's inline SVG figures: colour
// scales, grids of coloured cells and colour bars. Every piece is plain SVG
// markup without scripts, fonts or references outside the page.

#include <limits>
#include <string>
#include <vector>

namespace report {

// Sequential: dark violet through teal to yellow, for levels and gains.
// Diverging: blue below the middle, near white at it, red above, for signed deviations.
enum class ScaleKind { Sequential, Diverging };

// The scale divides low..high into kColourSteps equal steps; values outside
// are drawn in the end colours.
struct ColourScale {
    ScaleKind kind = ScaleKind::Sequential;
    double low = 0.0;
    double high = 1.0;
};
inline constexpr int kColourSteps = 64;

// Step 0..kColourSteps - 1 of a value; -1 for a value that is not a number.
int colourStep(const ColourScale& scale, double value);
// "#rrggbb" of a step; the no-data grey for -1.
std::string stepColour(ScaleKind kind, int step);

// A coordinate or length in user units: at most two decimals, no trailing zeros.
std::string svgNumber(double value);

// Every figure is drawn at one scale, so labels and lines print at one size
// in all of them: 400 user units across a figure in a 76 mm column.
inline constexpr double kUnitsPerMm = 400.0 / 76.0;

// Opening tag of a figure drawing of viewWidth x viewHeight user units, sized
// in millimetres at kUnitsPerMm; `label` is its accessible name.
std::string svgOpen(double viewWidth, double viewHeight, const std::string& label);

// A row-major grid of values as coloured cells filling a rectangle.
struct CellGrid {
    int columns = 0;
    int rows = 0;
    const float* values = nullptr;
};
struct CellStyle {
    // With titles, every cell is its own rectangle whose tooltip shows its
    // value with this many decimals; without (and without outlines), runs of
    // cells of one colour along a row are drawn together.
    bool titles = false;
    int titleDecimals = 3;
    // Cells above this value get an outline (none when not a number).
    double outlineAbove = std::numeric_limits<double>::quiet_NaN();
};
std::string svgCells(const CellGrid& grid, const ColourScale& scale, double x, double y,
                     double width, double height, const CellStyle& style = {});

// A horizontal colour bar with tick labels under it and an optional marked
// value (a line across the bar, labelled above it).
struct ScaleTick {
    double value;
    std::string label;
};
struct ScaleMark {
    bool present = false;
    double value = 0.0;
    std::string label;
};
std::string svgColourBar(const ColourScale& scale, double x, double y, double width, double height,
                         const std::vector<ScaleTick>& ticks, const ScaleMark& mark = {});

// Size of every label in the figures, in user units: about 6.5 pt.
inline constexpr double kLabelSize = 12.0;

// Height a colour bar of `height` needs with its labels (and its mark label).
double colourBarExtent(double height, bool marked);

// Text at (x, y) in user units, escaped; anchor is "start", "middle" or "end".
std::string svgText(double x, double y, const std::string& text, double size,
                    const char* anchor = "start", const char* cssClass = nullptr);

} // namespace report
