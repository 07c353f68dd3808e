#include "image/hex_text.h"

#include <cstring>

namespace img {

int hexDigit(char c) noexcept {
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'a' && c <= 'f')
        return c - 'a' + 10;
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    return -1;
}

std::uint64_t parseHex64(const char* text) noexcept {
    if (!text)
        return 0;
    while (*text == ' ' || *text == '\t' || *text == '\n' || *text == '\r')
        ++text;
    if (text[0] == '0' && (text[1] == 'x' || text[1] == 'X') && hexDigit(text[2]) >= 0)
        text += 2;
    std::uint64_t value = 0;
    for (int digit; (digit = hexDigit(*text)) >= 0; ++text) {
        if (value > (UINT64_MAX >> 4))
            return UINT64_MAX;
        value = value << 4 | static_cast<std::uint64_t>(digit);
    }
    return value;
}

std::size_t parseHexBytes(const char* text, std::uint8_t* bytes, std::size_t capacity) noexcept {
    if (!text)
        return 0;
    const std::size_t length = std::strlen(text);
    std::size_t count = 0;
    for (std::size_t i = 0; i < length && count < capacity; i += 2) {
        const int high = hexDigit(text[i]);
        const int low = i + 1 < length ? hexDigit(text[i + 1]) : -1;
        bytes[count++] = static_cast<std::uint8_t>(high < 0 ? 0 : low < 0 ? high : high * 16 + low);
    }
    return count;
}

std::string hexOfBytes(const std::uint8_t* bytes, std::size_t count) {
    static const char digits[] = "0123456789abcdef";
    std::string text;
    text.reserve(2 * count);
    for (std::size_t i = 0; i < count; ++i) {
        text += digits[bytes[i] >> 4];
        text += digits[bytes[i] & 0xF];
    }
    return text;
}

bool isHexGuid(const std::string& text) noexcept {
    if (text.empty() || text.size() > 16)
        return false;
    for (char c : text)
        if (hexDigit(c) < 0)
            return false;
    return true;
}

} // namespace img
