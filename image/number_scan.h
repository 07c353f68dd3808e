#pragma once
// Decimal numbers at the front of a text, without regard to the locale: the
// point is always "." and no grouping is taken. The configuration's values
// and the lines of the sample files are both read with these.

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace img {

// "[+|-]digits" at the front of `text`. Returns the characters read and sets
// `value`; 0 when there are no digits or the number lies outside
// -2147483648..2147483647.
[[nodiscard]] std::size_t scanInteger(std::string_view text, std::int32_t& value);

enum class DecimalRange {
    kFinite,
    kUnderflow, // below the smallest float: the value is the nearest float, possibly 0
    kOverflow,  // beyond the largest float: no value
};

struct DecimalScan {
    std::size_t length = 0; // characters read; 0: no number
    float value = 0.0f;
    DecimalRange range = DecimalRange::kFinite;
};

// "[+|-]digits[.digits][(e|E)[+|-]digits]" at the front of `text`, with at
// least one digit before the exponent. An "e" without exponent digits makes
// it no number at all. Hexadecimal forms, infinities and NaN are not numbers.
[[nodiscard]] DecimalScan scanDecimal(std::string_view text);

} // namespace img
