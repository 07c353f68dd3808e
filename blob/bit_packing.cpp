#include "blob/bit_packing.h"

namespace blob {

std::uint64_t packedSize(std::uint64_t count, unsigned bits) {
    return (count * bits + 7) / 8;
}

void packCodes(const std::vector<std::uint32_t>& codes, unsigned bits,
               std::vector<std::uint8_t>& out) {
    const std::uint64_t mask = (std::uint64_t{1} << bits) - 1;
    std::uint64_t pending = 0; // bits not yet written, right-aligned
    unsigned pendingBits = 0;
    out.reserve(out.size() + static_cast<std::size_t>(packedSize(codes.size(), bits)));
    for (std::uint32_t code : codes) {
        pending = (pending << bits) | (code & mask);
        pendingBits += bits;
        while (pendingBits >= 8) {
            pendingBits -= 8;
            out.push_back(static_cast<std::uint8_t>(pending >> pendingBits));
        }
        pending &= (std::uint64_t{1} << pendingBits) - 1;
    }
    if (pendingBits > 0)
        out.push_back(static_cast<std::uint8_t>(pending << (8 - pendingBits)));
}

bool unpackCodes(const std::uint8_t* data, std::size_t size, unsigned bits, std::size_t count,
                 std::vector<std::uint32_t>& codes) {
    if (packedSize(count, bits) > size)
        return false;
    const std::uint64_t mask = (std::uint64_t{1} << bits) - 1;
    codes.resize(count);
    std::uint64_t pending = 0;
    unsigned pendingBits = 0;
    std::size_t next = 0;
    for (std::size_t i = 0; i < count; ++i) {
        while (pendingBits < bits) {
            pending = (pending << 8) | data[next++];
            pendingBits += 8;
        }
        pendingBits -= bits;
        codes[i] = static_cast<std::uint32_t>((pending >> pendingBits) & mask);
        pending &= (std::uint64_t{1} << pendingBits) - 1;
    }
    return true;
}

} // namespace blob
