#pragma once
// Codes of a fixed width packed without gaps, most significant bit first;
// the last byte is filled with zero bits.

#include <cstddef>
#include <cstdint>
#include <vector>

namespace blob {

// Bytes needed for `count` codes of `bits` bits (64-bit: no overflow for any
// width a blob can name).
std::uint64_t packedSize(std::uint64_t count, unsigned bits);

// Appends the low `bits` bits (1..32) of each code.
void packCodes(const std::vector<std::uint32_t>& codes, unsigned bits,
               std::vector<std::uint8_t>& out);

// Reads `count` codes of `bits` bits (1..32) from data[0, size). False, with
// nothing read, when the data is shorter than packedSize(count, bits).
[[nodiscard]] bool unpackCodes(const std::uint8_t* data, std::size_t size, unsigned bits,
                               std::size_t count, std::vector<std::uint32_t>& codes);

} // namespace blob
