#include "blob/value_code.h"

#include <cmath>
#include <stdexcept>

#include "blob/blob_messages.h"

namespace blob {

namespace {

constexpr unsigned kSaturatedBits = 0xFFFF;

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

// Reads a run of digits starting at `pos`, saturating; returns the count read.
std::size_t readDigits(const std::string& text, std::size_t pos, unsigned* value) {
    std::size_t count = 0;
    unsigned result = 0;
    while (pos + count < text.size() && isDigit(text[pos + count])) {
        result = result * 10 + static_cast<unsigned>(text[pos + count] - '0');
        if (result > kSaturatedBits)
            result = kSaturatedBits;
        ++count;
    }
    *value = result;
    return count;
}

} // namespace

ValueFormat parseValueFormat(const std::string& text) {
    if (text.empty() || (text[0] != 's' && text[0] != 'u'))
        throw std::invalid_argument(msg::kInvalidFormat);
    ValueFormat format;
    std::size_t pos = 1;
    if (pos == text.size())
        return format;
    pos += readDigits(text, pos, &format.intBits);
    if (pos == text.size() || text[pos] != '.')
        throw std::invalid_argument(msg::kInvalidFormat);
    ++pos;
    if (pos == text.size())
        return format;
    const std::size_t digits = readDigits(text, pos, &format.fracBits);
    if (digits == 0 || pos + digits != text.size())
        throw std::invalid_argument(msg::kInvalidFormat);
    return format;
}

std::string valueFormatText(const ValueFormat& format) {
    return "s" + std::to_string(format.intBits) + "." + std::to_string(format.fracBits);
}

double valueFormatMaximum(const ValueFormat& format) {
    return std::ldexp(1.0, static_cast<int>(format.intBits)) - valueFormatStep(format);
}

double valueFormatStep(const ValueFormat& format) {
    return std::ldexp(1.0, -static_cast<int>(format.fracBits));
}

std::uint32_t encodeValue(double value, const ValueFormat& format) {
    if (!std::isfinite(value))
        return 0;
    const int intBits = static_cast<int>(format.intBits);
    const int fracBits = static_cast<int>(format.fracBits);
    const double magnitude = std::fabs(value);
    double integer = std::floor(magnitude);
    const double scaled = std::ldexp(magnitude - integer, fracBits);
    double fraction = std::floor(scaled);
    if (scaled - fraction > 0.5) // a tie stays on the lower value
        fraction += 1.0;
    if (fraction >= std::ldexp(1.0, fracBits)) {
        integer += 1.0;
        fraction = 0.0;
    }
    // Only the low I bits of the integer part are kept.
    integer = std::fmod(integer, std::ldexp(1.0, intBits));
    std::uint64_t code = static_cast<std::uint64_t>(integer) << fracBits;
    code |= static_cast<std::uint64_t>(fraction);
    // signbit rather than "< 0": a negative value that rounds to zero decodes
    // as -0, and -0 must code the same way again when it is read back.
    if (std::signbit(value))
        code |= std::uint64_t{1} << (intBits + fracBits);
    return static_cast<std::uint32_t>(code);
}

double decodeValue(std::uint32_t code, const ValueFormat& format) {
    const unsigned fracBits = format.fracBits;
    const std::uint64_t wide = code;
    const std::uint64_t fractionMask = (std::uint64_t{1} << fracBits) - 1;
    const std::uint64_t integerMask = (std::uint64_t{1} << format.intBits) - 1;
    const double integer = static_cast<double>((wide >> fracBits) & integerMask);
    const double fraction =
        std::ldexp(static_cast<double>(wide & fractionMask), -static_cast<int>(fracBits));
    const bool negative = (wide >> (format.intBits + fracBits)) & 1u;
    const double magnitude = integer + fraction;
    return negative ? -magnitude : magnitude;
}

} // namespace blob
