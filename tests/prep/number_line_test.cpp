#include <gtest/gtest.h>

#include "prep/number_line.h"

namespace {

TEST(NumberLine, ReadsIntegersWithSignsAndBlanks) {
    prep::NumberLine line(" 12,-3,\t+7 \r");
    EXPECT_EQ(line.integer(), 12);
    line.expect(',');
    EXPECT_EQ(line.integer(), -3);
    line.expect(',');
    EXPECT_EQ(line.integer(), 7);
    line.expectEnd();
    EXPECT_TRUE(line.ok());
}

TEST(NumberLine, IntegerRangeIsThirtyTwoBits) {
    prep::NumberLine low("-2147483648");
    EXPECT_EQ(low.integer(), INT32_MIN);
    EXPECT_TRUE(low.ok());
    prep::NumberLine high("2147483648");
    high.integer();
    EXPECT_FALSE(high.ok());
    prep::NumberLine huge("99999999999999999999999");
    huge.integer();
    EXPECT_FALSE(huge.ok());
}

TEST(NumberLine, ReadsDecimalForms) {
    prep::NumberLine line("0.5,+2,-.25,1e2,3.E-1,7.");
    const float expected[] = {0.5f, 2.0f, -0.25f, 100.0f, 0.3f, 7.0f};
    for (int i = 0; i < 6; ++i) {
        if (i > 0)
            line.expect(',');
        EXPECT_EQ(line.decimal(), expected[i]) << i;
    }
    line.expectEnd();
    EXPECT_TRUE(line.ok());
}

TEST(NumberLine, RefusesNonFiniteAndMalformedDecimals) {
    for (const char* text :
         {"nan", "inf", "-infinity", "1e", "1e+", ".", "-", "0x1p3", "1e40", ""}) {
        prep::NumberLine line(text);
        line.decimal();
        line.expectEnd();
        EXPECT_FALSE(line.ok()) << text;
    }
}

TEST(NumberLine, SeparatorMustFollowDirectly) {
    prep::NumberLine line("1 ,2");
    line.integer();
    line.expect(',');
    EXPECT_FALSE(line.ok());
}

} // namespace
