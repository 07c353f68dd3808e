#include "image/number_scan.h"

#include <algorithm>
#include <charconv>
#include <system_error>

namespace img {

namespace {

bool isDigit(char c) {
    return c >= '0' && c <= '9';
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

std::size_t scanInteger(std::string_view text, std::int32_t& value) {
    std::size_t pos = 0;
    bool negative = false;
    if (pos < text.size() && (text[pos] == '-' || text[pos] == '+'))
        negative = text[pos++] == '-';
    const std::size_t start = pos;
    const std::uint64_t limit = negative ? 2147483648u : 2147483647u;
    std::uint64_t magnitude = 0;
    for (; pos < text.size() && isDigit(text[pos]); ++pos) {
        magnitude = magnitude * 10 + static_cast<unsigned>(text[pos] - '0');
        if (magnitude > limit)
            return 0;
    }
    if (pos == start)
        return 0;
    value = negative ? static_cast<std::int32_t>(-static_cast<std::int64_t>(magnitude))
                     : static_cast<std::int32_t>(magnitude);
    return pos;
}

DecimalScan scanDecimal(std::string_view text) {
    std::size_t pos = 0;
    bool negative = false;
    if (pos < text.size() && (text[pos] == '-' || text[pos] == '+'))
        negative = text[pos++] == '-';
    const std::size_t start = pos;
    std::size_t digits = 0;
    while (pos < text.size() && isDigit(text[pos]))
        ++pos, ++digits;
    if (pos < text.size() && text[pos] == '.') {
        ++pos;
        while (pos < text.size() && isDigit(text[pos]))
            ++pos, ++digits;
    }
    if (digits == 0)
        return {};
    const std::string_view mantissa = text.substr(start, pos - start);
    long long exponent = 0;
    if (pos < text.size() && (text[pos] == 'e' || text[pos] == 'E')) {
        ++pos;
        bool negativeExponent = false;
        if (pos < text.size() && (text[pos] == '-' || text[pos] == '+'))
            negativeExponent = text[pos++] == '-';
        if (pos == text.size() || !isDigit(text[pos]))
            return {};
        // Clamped: only its side of the float range matters past this.
        for (; pos < text.size() && isDigit(text[pos]); ++pos)
            exponent = std::min(exponent * 10 + (text[pos] - '0'), 1000000LL);
        if (negativeExponent)
            exponent = -exponent;
    }

    DecimalScan scan;
    scan.length = pos;
    const char* first = text.data() + start;
    const char* last = text.data() + pos;
    float magnitude = 0.0f;
    const auto result = std::from_chars(first, last, magnitude, std::chars_format::general);
    if (result.ec == std::errc::result_out_of_range) {
        if (decimalMagnitude(mantissa, exponent) >= 0) {
            scan.range = DecimalRange::kOverflow;
            return scan;
        }
        scan.range = DecimalRange::kUnderflow;
        double small = 0.0; // the nearest float, possibly subnormal
        const auto again = std::from_chars(first, last, small, std::chars_format::general);
        magnitude = again.ec == std::errc() ? static_cast<float>(small) : 0.0f;
    } else if (result.ec != std::errc() || result.ptr != last) {
        return {};
    }
    scan.value = negative ? -magnitude : magnitude;
    return scan;
}

} // namespace img
