#include "report/report_text.h"

#include <cstddef>
#include <iomanip>
#include <locale>
#include <sstream>

namespace report {

namespace {

std::ostringstream numberStream() {
    std::ostringstream text;
    text.imbue(std::locale::classic());
    return text;
}

constexpr char kReplacement[] = "\xEF\xBF\xBD"; // U+FFFD

// Length of the well-formed UTF-8 sequence at text[i], or 0.
std::size_t utf8Length(std::string_view text, std::size_t i) {
    const auto byte = [&](std::size_t k) { return static_cast<unsigned char>(text[k]); };
    const unsigned char lead = byte(i);
    std::size_t length = 0;
    unsigned char low = 0x80, high = 0xBF; // range of the first continuation byte
    if (lead < 0x80)
        return 1;
    if (lead >= 0xC2 && lead <= 0xDF)
        length = 2;
    else if (lead >= 0xE0 && lead <= 0xEF) {
        length = 3;
        low = lead == 0xE0 ? 0xA0 : 0x80;  // no overlong forms
        high = lead == 0xED ? 0x9F : 0xBF; // no surrogates
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        length = 4;
        low = lead == 0xF0 ? 0x90 : 0x80;
        high = lead == 0xF4 ? 0x8F : 0xBF;
    } else
        return 0;
    if (length > text.size() - i)
        return 0;
    if (byte(i + 1) < low || byte(i + 1) > high)
        return 0;
    for (std::size_t k = 2; k < length; ++k)
        if (byte(i + k) < 0x80 || byte(i + k) > 0xBF)
            return 0;
    return length;
}

} // namespace

std::string htmlEscape(std::string_view text) {
    std::string escaped;
    escaped.reserve(text.size());
    for (std::size_t i = 0; i < text.size();) {
        const std::size_t length = utf8Length(text, i);
        if (length == 0) {
            escaped += kReplacement;
            ++i;
            continue;
        }
        if (length > 1) {
            escaped.append(text.substr(i, length));
            i += length;
            continue;
        }
        const char c = text[i++];
        const bool control =
            (static_cast<unsigned char>(c) < 0x20 && c != '\t' && c != '\n') || c == '\x7F';
        if (control) {
            escaped += kReplacement;
            continue;
        }
        switch (c) {
        case '&':
            escaped += "&amp;";
            break;
        case '<':
            escaped += "&lt;";
            break;
        case '>':
            escaped += "&gt;";
            break;
        case '"':
            escaped += "&quot;";
            break;
        case '\'':
            escaped += "&#39;";
            break;
        default:
            escaped += c;
        }
    }
    return escaped;
}

std::string formatGeneral(double value, int precision) {
    std::ostringstream text = numberStream();
    text << std::setprecision(precision) << value;
    return text.str();
}

std::string formatFixed(double value, int decimals) {
    std::ostringstream text = numberStream();
    text << std::fixed << std::setprecision(decimals) << value;
    return text.str();
}

} // namespace report
