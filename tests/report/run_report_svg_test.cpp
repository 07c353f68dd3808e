// Drawing pieces of the report's figures: colour scales, cells and colour bars.

#include <cmath>
#include <cstdlib>
#include <string>

#include <gtest/gtest.h>

#include "report/report_svg.h"

namespace report {
namespace {

std::size_t count(const std::string& text, const std::string& part) {
    std::size_t n = 0;
    for (std::size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + 1))
        ++n;
    return n;
}

double luminance(const std::string& colour) {
    const auto rgb = static_cast<int>(std::strtol(colour.c_str() + 1, nullptr, 16));
    return 0.2126 * ((rgb >> 16) & 0xff) + 0.7152 * ((rgb >> 8) & 0xff) + 0.0722 * (rgb & 0xff);
}

TEST(ColourScale, StepsSpanTheScaleAndClampOutsideIt) {
    const ColourScale scale{ScaleKind::Sequential, 1.0, 2.0};
    EXPECT_EQ(colourStep(scale, 1.0), 0);
    EXPECT_EQ(colourStep(scale, 1.5), 32);
    EXPECT_EQ(colourStep(scale, 2.0), 63);
    EXPECT_EQ(colourStep(scale, -7.0), 0);
    EXPECT_EQ(colourStep(scale, 9.0), 63);
    EXPECT_EQ(colourStep(scale, std::nan("")), -1);
    EXPECT_EQ(stepColour(ScaleKind::Sequential, -1), "#bdbdbd");
}

TEST(ColourScale, AScaleWithoutSpanDrawsItsValueInTheMiddle) {
    const ColourScale flat{ScaleKind::Sequential, 1.0, 1.0};
    EXPECT_EQ(colourStep(flat, 1.0), 32);
    EXPECT_EQ(colourStep(flat, 0.5), 0);
    EXPECT_EQ(colourStep(flat, 1.5), 63);
}

TEST(ColourScale, SequentialColoursBrightenStepByStepSoTheyReadInGrey) {
    for (int step = 1; step < kColourSteps; ++step)
        EXPECT_GT(luminance(stepColour(ScaleKind::Sequential, step)),
                  luminance(stepColour(ScaleKind::Sequential, step - 1)))
            << step;
}

TEST(ColourScale, DivergingColoursAreNearWhiteInTheMiddleAndColouredAtTheEnds) {
    EXPECT_GT(luminance(stepColour(ScaleKind::Diverging, 32)), 235.0);
    const std::string low = stepColour(ScaleKind::Diverging, 0);
    const std::string high = stepColour(ScaleKind::Diverging, 63);
    // Blue dominates the low end, red the high end.
    EXPECT_GT(std::strtol(low.substr(5, 2).c_str(), nullptr, 16),
              std::strtol(low.substr(1, 2).c_str(), nullptr, 16));
    EXPECT_GT(std::strtol(high.substr(1, 2).c_str(), nullptr, 16),
              std::strtol(high.substr(5, 2).c_str(), nullptr, 16));
}

TEST(SvgNumber, RoundsToTwoDecimalsWithoutTrailingZeros) {
    EXPECT_EQ(svgNumber(1.0), "1");
    EXPECT_EQ(svgNumber(2.5), "2.5");
    EXPECT_EQ(svgNumber(0.125), "0.13");
    EXPECT_EQ(svgNumber(-0.001), "0");
    EXPECT_EQ(svgNumber(std::nan("")), "0");
}

TEST(SvgCells, RunsOfOneColourAlongARowAreDrawnTogether) {
    const float values[] = {0.0f, 0.0f, 1.0f, 1.0f, 1.0f, 0.0f};
    const std::string cells =
        svgCells({3, 2, values}, {ScaleKind::Sequential, 0.0, 1.0}, 0, 0, 30, 20);
    EXPECT_EQ(count(cells, "<path"), 2u); // one path per colour
    EXPECT_EQ(count(cells, "z"), 4u);     // two runs in each row
    EXPECT_NE(cells.find("M0 0h2v1h-2z"), std::string::npos);
}

TEST(SvgCells, CellsWithTitlesCarryTheirValues) {
    const float values[] = {0.5f, 12.25f};
    CellStyle style;
    style.titles = true;
    style.titleDecimals = 5;
    style.outlineAbove = 10.0;
    const std::string cells =
        svgCells({2, 1, values}, {ScaleKind::Sequential, 0.0, 20.0}, 0, 0, 20, 10, style);
    EXPECT_NE(cells.find("<title>0.50000</title>"), std::string::npos);
    EXPECT_NE(cells.find("<title>12.25000</title>"), std::string::npos);
    EXPECT_EQ(count(cells, "class=\"outlines\""), 1u);
    EXPECT_EQ(count(cells, "stroke=\"#e0001b\""), 1u); // only the cell above 10
}

TEST(SvgColourBar, HasEveryStepTheTicksAndTheMark) {
    ScaleMark mark;
    mark.present = true;
    mark.value = 8.0;
    mark.label = "threshold <8>";
    const std::string bar = svgColourBar({ScaleKind::Sequential, 0.0, 10.0}, 0, 0, 200, 12,
                                         {{0.0, "0"}, {10.0, "10"}}, mark);
    EXPECT_EQ(bar.rfind("<g class=\"legend\">", 0), 0u);
    EXPECT_EQ(count(bar, "<rect"), static_cast<std::size_t>(kColourSteps) + 1); // steps, frame
    EXPECT_NE(bar.find(">10</text>"), std::string::npos);
    EXPECT_NE(bar.find(">threshold &lt;8&gt;</text>"), std::string::npos);
    EXPECT_NE(bar.find("class=\"mark\" x1=\"160\""), std::string::npos); // 8 of 10 across 200
}

TEST(SvgOpen, SizesTheDrawingInMillimetresAtTheCommonScale) {
    const std::string open = svgOpen(398, 98, "Gain \"red\"");
    EXPECT_NE(open.find("width=\"76mm\""), std::string::npos);
    EXPECT_NE(open.find("viewBox=\"-1 -1 400 100\""), std::string::npos);
    EXPECT_NE(open.find("aria-label=\"Gain &quot;red&quot;\""), std::string::npos);
}

} // namespace
} // namespace report
