#pragma once
// Warning lines of the image library, written whole to the error stream.

#include <cstdint>
#include <string>

namespace img {

// printf-style; one line per call, flushed at once.
void warn(const char* format, ...) noexcept __attribute__((format(printf, 1, 2)));

// A 16-byte block tag as printable text (bytes outside ASCII 32..126 as '?').
std::string printableTag(const std::uint8_t* tag);

} // namespace img
