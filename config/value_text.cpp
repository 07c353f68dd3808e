#include "config/value_text.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <limits>
#include <system_error>

#include "image/number_scan.h"

namespace config {

namespace {

bool equalsIgnoringCase(std::string_view text, std::string_view lowerWord) {
    return text.size() == lowerWord.size() &&
           std::equal(text.begin(), text.end(), lowerWord.begin(), [](char a, char b) {
               return std::tolower(static_cast<unsigned char>(a)) == b;
           });
}

} // namespace

bool parseIntegerText(std::string_view text, std::int32_t& value) {
    std::int32_t scanned = 0;
    if (text.empty() || img::scanInteger(text, scanned) != text.size())
        return false;
    value = scanned;
    return true;
}

bool parseFloatText(std::string_view text, float& value) {
    std::string_view word = text;
    bool negative = false;
    if (!word.empty() && (word.front() == '-' || word.front() == '+')) {
        negative = word.front() == '-';
        word.remove_prefix(1);
    }
    const bool nan = equalsIgnoringCase(word, "nan");
    if (nan || equalsIgnoringCase(word, "inf") || equalsIgnoringCase(word, "infinity")) {
        const float special =
            nan ? std::numeric_limits<float>::quiet_NaN() : std::numeric_limits<float>::infinity();
        value = negative ? -special : special;
        return true;
    }
    // Values below the smallest float are taken as the nearest one.
    const img::DecimalScan scan = img::scanDecimal(text);
    if (scan.length == 0 || scan.length != text.size() ||
        scan.range == img::DecimalRange::kOverflow)
        return false;
    value = scan.value;
    return true;
}

std::string integerText(std::int64_t value) {
    char buffer[24];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
    return std::string(buffer, result.ptr);
}

std::string doubleText(double value) {
    char buffer[40];
    const auto result =
        std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::general, 17);
    return std::string(buffer, result.ptr);
}

} // namespace config
