#pragma once
// Bounds-checked big-endian reads from memory. Non-owning. After the first
// read past the end ok() stays false and every further read gives 0, so a
// block can be read whole and checked once.

#include <cstddef>
#include <cstdint>

namespace blob {

class ByteReader {
public:
    ByteReader(const std::uint8_t* data, std::size_t size) : data_(data), size_(size) {}

    bool ok() const { return ok_; }
    std::size_t position() const { return pos_; }
    std::size_t remaining() const { return ok_ ? size_ - pos_ : 0; }

    std::uint8_t u8() { return static_cast<std::uint8_t>(take(1)); }
    std::uint16_t u16() { return static_cast<std::uint16_t>(take(2)); }
    std::uint32_t u32() { return static_cast<std::uint32_t>(take(4)); }
    std::uint64_t u64() { return take(8); }

    // The next `count` bytes, stepped over; nullptr (and ok() false) when
    // fewer remain.
    const std::uint8_t* bytes(std::size_t count);

private:
    std::uint64_t take(std::size_t count);

    const std::uint8_t* data_;
    std::size_t size_;
    std::size_t pos_ = 0;
    bool ok_ = true;
};

// True when [offset, offset + count) lies inside a buffer of `size` bytes;
// computed so that it cannot overflow.
inline bool rangeInside(std::uint64_t offset, std::uint64_t count, std::uint64_t size) {
    return offset <= size && count <= size - offset;
}

} // namespace blob
