#pragma once
// Hexadecimal text of the module identity fields; no locale involved.

#include <cstddef>
#include <cstdint>
#include <string>

namespace img {

// The value of one hexadecimal digit (either case), -1 for any other character.
int hexDigit(char c) noexcept;

// Reads text as a hexadecimal number as scanf's %llx does: blanks, an
// optional 0x, then hex digits up to the first other character. No digits
// give 0; a value beyond 64 bits gives the largest 64-bit value.
std::uint64_t parseHex64(const char* text) noexcept;

// Takes the text two characters at a time, each pair read as a hexadecimal
// byte (leading hex digits only, 0 when there are none), at most `capacity`
// bytes. Returns the number of bytes stored.
std::size_t parseHexBytes(const char* text, std::uint8_t* bytes, std::size_t capacity) noexcept;

// True when `text` can be a sensor GUID of a fixed-header file: 1 to 16
// hexadecimal digits (the 64-bit field), nothing else.
bool isHexGuid(const std::string& text) noexcept;

// Two lowercase hexadecimal digits a byte.
std::string hexOfBytes(const std::uint8_t* bytes, std::size_t count);

} // namespace img
