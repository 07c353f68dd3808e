#pragma once
// The console questions for a raw file of no known type: its size, bit depth,
// Bayer order, byte order, image count and header size.

#include <cstdint>
#include <cstdio>

namespace img {

struct RawLayout {
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t bitDepth = 0; // 1..16
    std::uint32_t cfa = 0;      // second cfa word of the chosen Bayer order
    bool littleEndian = true;
    std::uint32_t images = 0;
    std::uint64_t headerSize = 0;
};

// Asks on `out` and reads one answer a line from `in`. A bit depth outside
// 1..16 or a Bayer choice outside 1..4 is asked again after its error line;
// any other answer that is not a number is asked again as it is. Returns 0,
// or -2 when `in` ends (or fails) before every answer is in: then
// "ERROR: No answer on standard input." goes to `err`.
[[nodiscard]] int askRawLayout(std::FILE* in, std::FILE* out, std::FILE* err,
                               RawLayout* layout) noexcept;

} // namespace img
