#pragma once
// Appends big-endian numbers to a byte vector.

#include <cstddef>
#include <cstdint>
#include <vector>

namespace blob {

class ByteWriter {
public:
    explicit ByteWriter(std::vector<std::uint8_t>& bytes) : bytes_(bytes) {}

    std::size_t size() const { return bytes_.size(); }

    void u8(std::uint8_t value) { bytes_.push_back(value); }
    void u16(std::uint16_t value) { put(value, 2); }
    void u32(std::uint32_t value) { put(value, 4); }
    void u64(std::uint64_t value) { put(value, 8); }
    void bytes(const std::uint8_t* data, std::size_t count) {
        bytes_.insert(bytes_.end(), data, data + count);
    }

private:
    void put(std::uint64_t value, unsigned count);

    std::vector<std::uint8_t>& bytes_;
};

} // namespace blob
