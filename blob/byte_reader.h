#pragma once
// Bounds-checked big-endian reads from memory, on top of the image library's
// reader: after the first read past the end ok() stays false and every
// further read gives 0, so a block can be read whole and checked once.

#include <cstddef>
#include <cstdint>

#include "image/byte_reader.h"

namespace blob {

class ByteReader {
public:
    ByteReader(const std::uint8_t* data, std::size_t size) : in_(data, size) {}

    bool ok() const { return in_.ok(); }
    std::size_t position() const { return in_.position(); }
    std::size_t remaining() const { return in_.remaining(); }

    std::uint8_t u8() { return in_.u8(); }
    std::uint16_t u16() { return static_cast<std::uint16_t>(bigEndian(2)); }
    std::uint32_t u32() { return static_cast<std::uint32_t>(bigEndian(4)); }
    std::uint64_t u64() { return bigEndian(8); }

    // The next `count` bytes, stepped over; nullptr (and ok() false) when
    // fewer remain.
    const std::uint8_t* bytes(std::size_t count) { return in_.take(count); }

private:
    std::uint64_t bigEndian(std::size_t count) {
        const std::uint8_t* p = in_.take(count);
        std::uint64_t value = 0;
        for (std::size_t i = 0; p && i < count; ++i)
            value = value << 8 | p[i];
        return value;
    }

    img::ByteReader in_;
};

// True when [offset, offset + count) lies inside a buffer of `size` bytes;
// computed so that it cannot overflow.
inline bool rangeInside(std::uint64_t offset, std::uint64_t count, std::uint64_t size) {
    return offset <= size && count <= size - offset;
}

} // namespace blob
