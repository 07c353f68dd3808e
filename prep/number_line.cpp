#include "prep/number_line.h"

#include "image/number_scan.h"

namespace prep {
namespace {

bool isBlank(char c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\v' || c == '\f';
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
    std::int32_t value = 0;
    const std::size_t length = img::scanInteger(text_.substr(pos_), value);
    if (length == 0)
        return fail();
    pos_ += length;
    return value;
}

float NumberLine::decimal() {
    if (!ok_)
        return 0.0f;
    skipBlanks();
    // Only finite numbers within the float range: a sample value too small
    // for a float is as wrong as one too large.
    const img::DecimalScan scan = img::scanDecimal(text_.substr(pos_));
    if (scan.length == 0 || scan.range != img::DecimalRange::kFinite)
        return fail();
    pos_ += scan.length;
    return scan.value;
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
