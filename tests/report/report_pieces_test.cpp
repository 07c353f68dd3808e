// Pieces of the report page that the kept pages do not reach: escaping of
// every kind of broken text, number formats and the colour scale's ends.

#include <cmath>
#include <string>

#include <gtest/gtest.h>

#include "report/report_svg.h"
#include "report/report_text.h"

namespace report {
namespace {

const std::string kBad = "\xEF\xBF\xBD"; // U+FFFD

TEST(ReportText, EscapesMarkupKeepsUtf8AndReplacesBrokenBytes) {
    const std::pair<std::string, std::string> cases[] = {
        {"a<b>&\"c'd", "a&lt;b&gt;&amp;&quot;c&#39;d"},
        {"Gr\xC3\xBC\xC3\x9F"
         "e\t1\n2",
         "Gr\xC3\xBC\xC3\x9F"
         "e\t1\n2"},
        {"\xF0\x9F\x93\xB7", "\xF0\x9F\x93\xB7"}, // four bytes
        {"\xC2\xB1\xDF\xBF", "\xC2\xB1\xDF\xBF"}, // the ends of the two-byte leads
        {"a\xFF"
         "b",
         "a" + kBad + "b"},
        {"a\x01\x7F"
         "b",
         "a" + kBad + kBad + "b"},
        {"\xC0\xAF", kBad + kBad},            // overlong '/'
        {"\xED\xA0\x80", kBad + kBad + kBad}, // surrogate
        {"end\xE2\x82", "end" + kBad + kBad}, // cut short
    };
    for (const auto& [text, escaped] : cases)
        EXPECT_EQ(htmlEscape(text), escaped) << text;
}

TEST(ReportText, FormatsNumbersAsTheMessageStreamPrintsThem) {
    EXPECT_EQ(formatGeneral(0.0333f, 3), "0.0333");
    EXPECT_EQ(formatGeneral(1.0f, 3), "1");
    EXPECT_EQ(formatGeneral(1234.5, 3), "1.23e+03");
    EXPECT_EQ(formatGeneral(10.0f, 6), "10");
    EXPECT_EQ(formatFixed(0.6612903f, 6), "0.661290");
    EXPECT_EQ(formatFixed(1234.5, 2), "1234.50");
}

TEST(ColourScale, StepsSpanTheScaleAndClampOutsideIt) {
    const ColourScale scale{ScaleKind::Sequential, 1.0, 2.0};
    const ColourScale flat{ScaleKind::Sequential, 1.0, 1.0}; // its value in the middle
    const std::pair<double, int> cases[] = {{1.0, 0}, {1.5, 32}, {2.0, 63}, {-7.0, 0}, {9.0, 63}};
    for (const auto& [value, step] : cases)
        EXPECT_EQ(colourStep(scale, value), step) << value;
    EXPECT_EQ(colourStep(scale, std::nan("")), -1);
    EXPECT_EQ(stepColour(ScaleKind::Sequential, -1), "#bdbdbd");
    EXPECT_EQ(colourStep(flat, 1.0), 32);
    EXPECT_EQ(colourStep(flat, 0.5), 0);
    EXPECT_EQ(colourStep(flat, 1.5), 63);
    EXPECT_EQ(svgNumber(0.125), "0.13");
    EXPECT_EQ(svgNumber(-0.001), "0");
    EXPECT_EQ(svgNumber(std::nan("")), "0");
}

} // namespace
} // namespace report
