#pragma once
// Reads the numbers of one text line, such as "12,-3,0.5e1", without regard
// to the locale. Each read skips blanks (space, tab, CR, VT, FF) before the
// number; every failed read leaves ok() false for good, so a caller can read a
// whole record and check once.

#include <cstdint>
#include <string_view>

namespace prep {

class NumberLine {
public:
    explicit NumberLine(std::string_view line) : text_(line) {}

    bool ok() const { return ok_; }

    // A decimal integer with an optional sign, within the 32-bit signed range.
    std::int32_t integer();
    // A finite decimal number: sign, digits with an optional point, optional
    // exponent. Infinities, NaN and hexadecimal forms are refused.
    float decimal();
    // The next character must be `separator` (no blanks before it).
    void expect(char separator);
    // Only blanks may remain.
    void expectEnd();

private:
    void skipBlanks();
    bool fail() {
        ok_ = false;
        return false;
    }

    std::string_view text_;
    std::size_t pos_ = 0;
    bool ok_ = true;
};

} // namespace prep
