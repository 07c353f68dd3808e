#pragma once
// Conversions between configuration value texts and numbers. Independent of
// the locale: the decimal point is always "." and no grouping is accepted or
// written.

#include <cstdint>
#include <string>
#include <string_view>

namespace config {

// Whole-text signed 32-bit integer: an optional "-" or "+", then one or more
// decimal digits and nothing else. False when the text does not match or the
// number lies outside -2147483648..2147483647.
[[nodiscard]] bool parseIntegerText(std::string_view text, std::int32_t& value);

// Whole-text single-precision number: optional sign, digits with an optional
// fraction and exponent, or one of the spellings nan, inf, infinity in any
// letter case. False when the text does not match or the value overflows the
// float range (values below the smallest float come out as zero).
[[nodiscard]] bool parseFloatText(std::string_view text, float& value);

// Plain decimal with a leading "-" when negative.
std::string integerText(std::int64_t value);

// printf "%.17g" as the "C" locale writes it; "inf", "-inf", "nan", "-nan"
// for the non-finite values.
std::string doubleText(double value);

} // namespace config
