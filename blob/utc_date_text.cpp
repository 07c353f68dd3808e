#include "blob/utc_date_text.h"

#include <cstdio>

namespace blob {

namespace {

constexpr std::int64_t kSecondsPerDay = 86400;
// 0000-01-01T00:00 and 9999-12-31T23:59:59, the four-digit years.
constexpr std::int64_t kFirstSecond = -62167219200;
constexpr std::int64_t kLastSecond = 253402300799;

std::int64_t floorDivide(std::int64_t a, std::int64_t b) {
    const std::int64_t quotient = a / b;
    return (a % b != 0 && (a < 0) != (b < 0)) ? quotient - 1 : quotient;
}

struct CivilDate {
    std::int64_t year;
    unsigned month, day;
};

// Proleptic Gregorian date of a day count from 1970-01-01 (Howard Hinnant's
// days-to-civil algorithm, eras of 400 years).
CivilDate civilFromDays(std::int64_t days) {
    days += 719468; // shift the epoch to 0000-03-01
    const std::int64_t era = floorDivide(days, 146097);
    const std::int64_t dayOfEra = days - era * 146097;
    const std::int64_t yearOfEra =
        (dayOfEra - dayOfEra / 1460 + dayOfEra / 36524 - dayOfEra / 146096) / 365;
    const std::int64_t dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
    const std::int64_t shiftedMonth = (5 * dayOfYear + 2) / 153; // March = 0
    const unsigned day = static_cast<unsigned>(dayOfYear - (153 * shiftedMonth + 2) / 5 + 1);
    const unsigned month =
        static_cast<unsigned>(shiftedMonth < 10 ? shiftedMonth + 3 : shiftedMonth - 9);
    const std::int64_t year = yearOfEra + era * 400 + (month <= 2 ? 1 : 0);
    return {year, month, day};
}

} // namespace

std::optional<std::string> utcDateText(std::int64_t seconds) {
    if (seconds < kFirstSecond || seconds > kLastSecond)
        return std::nullopt;
    const std::int64_t days = floorDivide(seconds, kSecondsPerDay);
    const std::int64_t secondOfDay = seconds - days * kSecondsPerDay;
    const CivilDate date = civilFromDays(days);
    char text[32];
    std::snprintf(text, sizeof text, "%04d-%02u-%02uT%02d:%02d", static_cast<int>(date.year),
                  date.month, date.day, static_cast<int>(secondOfDay / 3600),
                  static_cast<int>(secondOfDay % 3600 / 60));
    return std::string(text);
}

} // namespace blob
