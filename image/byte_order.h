#pragma once
// Little-endian loads and stores built from shifts, so they read the same on
// every host. The raw files of the image library are little-endian throughout.

#include <cstdint>
#include <cstring>

namespace img {

#if defined(__BYTE_ORDER__) && __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
constexpr bool kHostIsLittleEndian = false;
#else
constexpr bool kHostIsLittleEndian = true;
#endif

inline std::uint16_t loadLE16(const std::uint8_t* p) {
    return static_cast<std::uint16_t>(p[0] | p[1] << 8);
}
inline std::uint32_t loadLE32(const std::uint8_t* p) {
    return std::uint32_t{p[0]} | std::uint32_t{p[1]} << 8 | std::uint32_t{p[2]} << 16 |
           std::uint32_t{p[3]} << 24;
}
inline std::uint64_t loadLE64(const std::uint8_t* p) {
    return std::uint64_t{loadLE32(p)} | std::uint64_t{loadLE32(p + 4)} << 32;
}
inline float loadLEFloat(const std::uint8_t* p) {
    const std::uint32_t bits = loadLE32(p);
    float value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

inline void storeLE16(std::uint8_t* p, std::uint16_t v) {
    p[0] = static_cast<std::uint8_t>(v);
    p[1] = static_cast<std::uint8_t>(v >> 8);
}
inline void storeLE32(std::uint8_t* p, std::uint32_t v) {
    for (int i = 0; i < 4; ++i)
        p[i] = static_cast<std::uint8_t>(v >> (8 * i));
}
inline void storeLE64(std::uint8_t* p, std::uint64_t v) {
    storeLE32(p, static_cast<std::uint32_t>(v));
    storeLE32(p + 4, static_cast<std::uint32_t>(v >> 32));
}
inline void storeLEFloat(std::uint8_t* p, float value) {
    std::uint32_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    storeLE32(p, bits);
}

inline std::uint16_t swap16(std::uint16_t v) {
    return static_cast<std::uint16_t>(v << 8 | v >> 8);
}

} // namespace img
