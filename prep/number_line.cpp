#include "prep/number_line.h"

#include <charconv>
#include <cmath>
#include <system_error>

namespace prep {
namespace {

bool isBlank(char c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\v' || c == '\f';
}

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

} // namespace

void NumberLine::skipBlanks() {
    while (pos_ < text_.size() && isBlank(text_[pos_]))
        ++pos_;
}

std::int32_t NumberLine::integer() {
    if (!ok_)
        return 0;
    skipBlanks();
    bool negative = false;
    if (pos_ < text_.size() && (text_[pos_] == '+' || text_[pos_] == '-'))
        negative = text_[pos_++] == '-';
    const std::size_t start = pos_;
    std::int64_t value = 0;
    while (pos_ < text_.size() && isDigit(text_[pos_])) {
        value = value * 10 + (text_[pos_++] - '0');
        if (value > std::int64_t{INT32_MAX} + 1)
            return fail();
    }
    if (pos_ == start)
        return fail();
    if (negative)
        value = -value;
    if (value > INT32_MAX)
        return fail();
    return static_cast<std::int32_t>(value);
}

float NumberLine::decimal() {
    if (!ok_)
        return 0.0f;
    skipBlanks();
    std::size_t start = pos_;
    if (pos_ < text_.size() && text_[pos_] == '+')
        start = ++pos_; // from_chars takes a minus sign only
    else if (pos_ < text_.size() && text_[pos_] == '-')
        ++pos_;
    std::size_t digits = 0;
    while (pos_ < text_.size() && isDigit(text_[pos_]))
        ++pos_, ++digits;
    if (pos_ < text_.size() && text_[pos_] == '.') {
        ++pos_;
        while (pos_ < text_.size() && isDigit(text_[pos_]))
            ++pos_, ++digits;
    }
    if (digits == 0)
        return fail();
    if (pos_ < text_.size() && (text_[pos_] == 'e' || text_[pos_] == 'E')) {
        std::size_t exponent = pos_ + 1;
        if (exponent < text_.size() && (text_[exponent] == '+' || text_[exponent] == '-'))
            ++exponent;
        if (exponent >= text_.size() || !isDigit(text_[exponent]))
            return fail();
        pos_ = exponent;
        while (pos_ < text_.size() && isDigit(text_[pos_]))
            ++pos_;
    }
    float value = 0.0f;
    const char* first = text_.data() + start;
    const char* last = text_.data() + pos_;
    const std::from_chars_result result = std::from_chars(first, last, value);
    if (result.ec != std::errc() || result.ptr != last || !std::isfinite(value))
        return fail();
    return value;
}

void NumberLine::expect(char separator) {
    if (!ok_)
        return;
    if (pos_ < text_.size() && text_[pos_] == separator)
        ++pos_;
    else
        fail();
}

void NumberLine::expectEnd() {
    if (!ok_)
        return;
    skipBlanks();
    if (pos_ != text_.size())
        fail();
}

} // namespace prep
