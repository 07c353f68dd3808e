#pragma once
// The fixed-point code of the lens-shading control points: sign and
// magnitude in intBits + fracBits + 1 bits, the sign in the top bit, then the
// integer part, then the fraction rounded to the nearest 2^-fracBits (a tie
// goes to the lower value). The text form is "s3.8" or "u3.8"; the letter
// does not change the code, both forms carry a sign bit.

#include <cstdint>
#include <string>

namespace blob {

struct ValueFormat {
    unsigned intBits = 0;
    unsigned fracBits = 0;

    unsigned codeBits() const { return intBits + fracBits + 1; }
};

// Widest code the encoder and decoder handle (one 32-bit word).
inline constexpr unsigned kMaxCodeBits = 32;

// Parses "s<I>.<F>" or "u<I>.<F>"; "s" and "s3." are read with the missing
// numbers as 0. Throws std::invalid_argument "invalid float encoding format".
// Very large bit counts saturate at 65535, so that width checks reject them.
ValueFormat parseValueFormat(const std::string& text);

// "s" I "." F, the form in which a format read back from a blob is shown.
std::string valueFormatText(const ValueFormat& format);

// Largest magnitude the format holds, 2^I - 2^-F; the step is 2^-F.
double valueFormatMaximum(const ValueFormat& format);
double valueFormatStep(const ValueFormat& format);

// Both need format.codeBits() <= kMaxCodeBits. The encoder keeps the low I
// bits of the integer part, so values outside the range wrap; callers check
// the range first. A value that is not finite codes as 0.
std::uint32_t encodeValue(double value, const ValueFormat& format);
double decodeValue(std::uint32_t code, const ValueFormat& format);

} // namespace blob
