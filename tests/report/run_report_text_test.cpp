// Text pieces of the calibration report: escaping and number formats.

#include <locale>

#include <gtest/gtest.h>

#include "report/report_text.h"

namespace report {
namespace {

TEST(ReportText, EscapesMarkupAndQuotes) {
    EXPECT_EQ(htmlEscape("a<b>&\"c'd"), "a&lt;b&gt;&amp;&quot;c&#39;d");
    EXPECT_EQ(htmlEscape("plain/path_1.kqraw"), "plain/path_1.kqraw");
}

TEST(ReportText, KeepsUtf8AndTabsButReplacesBrokenBytesAndControls) {
    const std::string replacement = "\xEF\xBF\xBD";
    EXPECT_EQ(htmlEscape("Gr\xC3\xBC\xC3\x9F"
                         "e\t1\n2"),
              "Gr\xC3\xBC\xC3\x9F"
              "e\t1\n2");
    EXPECT_EQ(htmlEscape("\xF0\x9F\x93\xB7"), "\xF0\x9F\x93\xB7"); // four-byte sequence
    EXPECT_EQ(htmlEscape("a\xFF"
                         "b"),
              "a" + replacement + "b");
    EXPECT_EQ(htmlEscape("a\x01\x7F"
                         "b"),
              "a" + replacement + replacement + "b");
    EXPECT_EQ(htmlEscape("\xC0\xAF"), replacement + replacement);                   // overlong '/'
    EXPECT_EQ(htmlEscape("\xED\xA0\x80"), replacement + replacement + replacement); // surrogate
    EXPECT_EQ(htmlEscape("end\xE2\x82"), "end" + replacement + replacement);        // cut short
}

TEST(ReportText, FormatsNumbersAsTheMessageStreamPrintsThem) {
    EXPECT_EQ(formatGeneral(0.0333f, 3), "0.0333");
    EXPECT_EQ(formatGeneral(1.0f, 3), "1");
    EXPECT_EQ(formatGeneral(1234.5, 3), "1.23e+03");
    EXPECT_EQ(formatGeneral(10.0f, 6), "10");
    EXPECT_EQ(formatFixed(0.6612903f, 6), "0.661290");
    EXPECT_EQ(formatFixed(2.0f, 3), "2.000");
}

// A locale that writes a decimal comma and groups thousands.
struct CommaDecimal : std::numpunct<char> {
    char do_decimal_point() const override { return ','; }
    char do_thousands_sep() const override { return '.'; }
    std::string do_grouping() const override { return "\3"; }
};

TEST(ReportText, NumbersIgnoreTheGlobalLocale) {
    const std::locale previous =
        std::locale::global(std::locale(std::locale::classic(), new CommaDecimal));
    const std::string fixed = formatFixed(1234.5, 2);
    const std::string general = formatGeneral(0.5, 6);
    std::locale::global(previous);
    EXPECT_EQ(fixed, "1234.50");
    EXPECT_EQ(general, "0.5");
}

} // namespace
} // namespace report
