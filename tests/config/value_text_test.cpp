#include <cmath>
#include <limits>

#include <gtest/gtest.h>

#include "config/value_text.h"

namespace config {
namespace {

TEST(DoubleText, WritesSeventeenSignificantDigits) {
    EXPECT_EQ(doubleText(static_cast<double>(0.1f)), "0.10000000149011612");
    EXPECT_EQ(doubleText(0.5), "0.5");
    EXPECT_EQ(doubleText(2.0), "2");
    EXPECT_EQ(doubleText(-1e300), "-1.0000000000000001e+300");
    EXPECT_EQ(doubleText(1e-5), "1.0000000000000001e-05");
}

TEST(DoubleText, WritesNonFiniteValuesAsWords) {
    const double inf = std::numeric_limits<double>::infinity();
    const double nan = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(doubleText(inf), "inf");
    EXPECT_EQ(doubleText(-inf), "-inf");
    EXPECT_EQ(doubleText(nan), "nan");
    EXPECT_EQ(doubleText(std::copysign(nan, -1.0)), "-nan");
}

TEST(IntegerText, WritesPlainDecimal) {
    EXPECT_EQ(integerText(0), "0");
    EXPECT_EQ(integerText(-2147483648LL), "-2147483648");
    EXPECT_EQ(integerText(1014), "1014");
}

} // namespace
} // namespace config
