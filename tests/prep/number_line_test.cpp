#include <iomanip>

#include "prep/number_line.h"
#include "tests/prep/test_images.h"

namespace {

// "i" reads an integer, "d" a decimal, any other character is expected as a
// separator; the result lists what was read, or says the line was refused.
std::string readLine(const std::string& text, const std::string& steps) {
    prep::NumberLine line(text);
    std::ostringstream out;
    for (char step : steps) {
        if (step == 'i')
            out << line.integer() << " ";
        else if (step == 'd')
            out << std::setprecision(9) << line.decimal() << " ";
        else
            line.expect(step);
    }
    line.expectEnd();
    return line.ok() ? out.str() + "ok" : "refused";
}

TEST(NumberLine, ReadsIntegersAndDecimalsAndRefusesTheRest) {
    const struct {
        const char* text;
        const char* steps;
        const char* read;
    } cases[] = {
        {" 12,-3,\t+7 \r", "i,i,i", "12 -3 7 ok"},
        {"-2147483648", "i", "-2147483648 ok"},
        {"2147483648", "i", "refused"},
        {"99999999999999999999999", "i", "refused"},
        {"1 ,2", "i,i", "refused"},
        {"0.5,+2,-.25,1e2,3.E-1,7.", "d,d,d,d,d,d", "0.5 2 -0.25 100 0.300000012 7 ok"},
    };
    for (const auto& c : cases)
        EXPECT_EQ(readLine(c.text, c.steps), c.read) << c.text;
    for (const char* text : {"nan", "inf", "-infinity", "1e", "1e+", ".", "-", "0x1p3", "1e40", ""})
        EXPECT_EQ(readLine(text, "d"), "refused") << text;
}

} // namespace
