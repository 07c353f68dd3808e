#include "config/value_text.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <limits>
#include <system_error>

namespace {

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool equalsIgnoringCase(std::string_view text, std::string_view lowerWord) {
    return text.size() == lowerWord.size() &&
           std::equal(text.begin(), text.end(), lowerWord.begin(), [](char a, char b) {
               return std::tolower(static_cast<unsigned char>(a)) == b;
           });
}

// Where a decimal number's first significant digit stands: 0 for the units,
// positive above, negative below. Only called for numbers that are not zero.
long long decimalMagnitude(std::string_view mantissa, long long exponent) {
    const std::size_t point = std::min(mantissa.find('.'), mantissa.size());
    const std::size_t first = mantissa.find_first_of("123456789");
    if (first < point)
        return static_cast<long long>(point - first - 1) + exponent;
    return exponent - static_cast<long long>(first - point);
}

} // namespace

bool parseIntegerText(std::string_view text, std::int32_t& value) {
    bool negative = false;
    if (!text.empty() && (text.front() == '-' || text.front() == '+')) {
        negative = text.front() == '-';
        text.remove_prefix(1);
    }
    if (text.empty())
        return false;
    const std::uint64_t limit = negative ? 2147483648u : 2147483647u;
    std::uint64_t magnitude = 0;
    for (char c : text) {
        if (!isDigit(c))
            return false;
        magnitude = magnitude * 10 + static_cast<unsigned>(c - '0');
        if (magnitude > limit)
            return false;
    }
    value = negative ? static_cast<std::int32_t>(-static_cast<std::int64_t>(magnitude))
                     : static_cast<std::int32_t>(magnitude);
    return true;
}

bool parseFloatText(std::string_view text, float& value) {
    bool negative = false;
    if (!text.empty() && (text.front() == '-' || text.front() == '+')) {
        negative = text.front() == '-';
        text.remove_prefix(1);
    }
    float magnitude = 0.0f;
    if (equalsIgnoringCase(text, "nan")) {
        magnitude = std::numeric_limits<float>::quiet_NaN();
    } else if (equalsIgnoringCase(text, "inf") || equalsIgnoringCase(text, "infinity")) {
        magnitude = std::numeric_limits<float>::infinity();
    } else {
        // Check the shape first: from_chars alone would also take hexadecimal
        // floats and the nan(...) forms.
        std::size_t pos = 0, digits = 0;
        while (pos < text.size() && isDigit(text[pos]))
            ++pos, ++digits;
        if (pos < text.size() && text[pos] == '.') {
            ++pos;
            while (pos < text.size() && isDigit(text[pos]))
                ++pos, ++digits;
        }
        if (digits == 0)
            return false;
        const std::string_view mantissa = text.substr(0, pos);
        long long exponent = 0;
        if (pos < text.size() && (text[pos] == 'e' || text[pos] == 'E')) {
            ++pos;
            bool negativeExponent = false;
            if (pos < text.size() && (text[pos] == '-' || text[pos] == '+'))
                negativeExponent = text[pos++] == '-';
            if (pos == text.size())
                return false;
            for (; pos < text.size() && isDigit(text[pos]); ++pos)
                exponent = std::min(exponent * 10 + (text[pos] - '0'), 1000000LL);
            if (negativeExponent)
                exponent = -exponent;
        }
        if (pos != text.size())
            return false;
        const char* end = text.data() + text.size();
        const auto result =
            std::from_chars(text.data(), end, magnitude, std::chars_format::general);
        if (result.ec == std::errc::result_out_of_range) {
            if (decimalMagnitude(mantissa, exponent) >= 0)
                return false;   // beyond the largest float
            double small = 0.0; // underflow: the nearest float, possibly subnormal
            const auto again = std::from_chars(text.data(), end, small, std::chars_format::general);
            magnitude = again.ec == std::errc() ? static_cast<float>(small) : 0.0f;
        } else if (result.ec != std::errc() || result.ptr != end) {
            return false;
        }
    }
    value = negative ? -magnitude : magnitude;
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
