#include <cstdlib>
#include <ctime>
#include <limits>
#include <string>

#include <gtest/gtest.h>

#include "blob/utc_date_text.h"

namespace blob {
namespace {

TEST(UtcDateText, FormatsSecondsAsMinutes) {
    EXPECT_EQ(utcDateText(0), "1970-01-01T00:00");
    EXPECT_EQ(utcDateText(1335868200), "2012-05-01T10:30");
    EXPECT_EQ(utcDateText(1335868259), "2012-05-01T10:30"); // seconds dropped
    EXPECT_EQ(utcDateText(951782400), "2000-02-29T00:00");
    EXPECT_EQ(utcDateText(2147483647), "2038-01-19T03:14");
}

TEST(UtcDateText, DatesBeyond32BitsAndBefore1970) {
    EXPECT_EQ(utcDateText(4102444800), "2100-01-01T00:00");
    EXPECT_EQ(utcDateText(-1), "1969-12-31T23:59");
    EXPECT_EQ(utcDateText(-2208988800), "1900-01-01T00:00");
}

TEST(UtcDateText, FourDigitYearsOnly) {
    EXPECT_EQ(utcDateText(-62167219200), "0000-01-01T00:00");
    EXPECT_EQ(utcDateText(253402300799), "9999-12-31T23:59");
    EXPECT_FALSE(utcDateText(-62167219201).has_value());
    EXPECT_FALSE(utcDateText(253402300800).has_value());
    EXPECT_FALSE(utcDateText(std::numeric_limits<std::int64_t>::min()).has_value());
    EXPECT_FALSE(utcDateText(std::numeric_limits<std::int64_t>::max()).has_value());
}

TEST(UtcDateText, IgnoresTheTimeZone) {
    const char* old = std::getenv("TZ");
    const std::string saved = old ? old : "";
    setenv("TZ", "Asia/Kolkata", 1);
    tzset();
    EXPECT_EQ(utcDateText(1335868200), "2012-05-01T10:30");
    if (old)
        setenv("TZ", saved.c_str(), 1);
    else
        unsetenv("TZ");
    tzset();
}

} // namespace
} // namespace blob
