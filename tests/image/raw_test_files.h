#pragma once
// Raw files as byte strings for the image tests, so each case shows the
// bytes it feeds in. Fixed-header and NKRAW fields are little-endian.

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "image/image_buffer.h"
#include "image/raw_reader.h"

namespace rawtest {

inline void putU32(std::string& bytes, std::size_t offset, std::uint32_t value) {
    for (std::size_t i = 0; i < 4; ++i)
        bytes[offset + i] = static_cast<char>(value >> (8 * i));
}

inline std::uint32_t getU32(const std::string& bytes, std::size_t offset) {
    std::uint32_t value = 0;
    for (std::size_t i = 0; i < 4; ++i)
        value |= std::uint32_t{static_cast<std::uint8_t>(bytes[offset + i])} << (8 * i);
    return value;
}

inline void putFloat(std::string& bytes, std::size_t offset, float value) {
    std::uint32_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    putU32(bytes, offset, bits);
}

inline std::string u32(std::uint32_t value) {
    std::string bytes(4, '\0');
    putU32(bytes, 0, value);
    return bytes;
}

inline std::string samplesLE(const std::vector<std::uint16_t>& samples) {
    std::string bytes;
    for (std::uint16_t s : samples)
        bytes += std::string{static_cast<char>(s & 0xFF), static_cast<char>(s >> 8)};
    return bytes;
}

// A fixed-header file (RGGB): version 1, the given revision, magic and end
// marker; or an NKRAW file (GRBG) with the capture fields the tool reads.
inline std::string fixedHeaderFile(std::uint32_t width, std::uint32_t height,
                                   const std::vector<std::uint16_t>& samples,
                                   std::uint32_t revision = 1) {
    std::string bytes(298672, '\0');
    const std::pair<std::size_t, std::uint32_t> fields[] = {
        {0, 1},           {4, revision},     {8, width},          {12, height},
        {16, 0x52474742}, {104, 0xDEADBEEF}, {298668, 0xCAFEFEED}};
    for (const auto& [at, value] : fields)
        putU32(bytes, at, value);
    return bytes + samplesLE(samples);
}

inline std::string nkrawFile(std::uint32_t width, std::uint32_t height,
                             const std::vector<std::uint16_t>& samples) {
    std::string bytes(102572, '\0');
    bytes.replace(0, 8, "NKRAWHDR");
    // Size, Bayer code, exposure in microseconds, gain step, two more words.
    const std::uint32_t fields[] = {width, height, 0x47524247, 33000, 12, 3, 2};
    for (std::size_t i = 0; i < 7; ++i)
        putU32(bytes, 8 + 4 * i, fields[i]);
    return bytes + samplesLE(samples);
}

inline img::ImagePtr readBytes(const std::string& bytes, int* result) {
    return img::ImagePtr(img::rawReadMemory(reinterpret_cast<const std::uint8_t*>(bytes.data()),
                                            bytes.size(), "test.raw", result));
}

inline std::vector<std::uint16_t> samplesOf(const img::ImageBuffer* image) {
    const auto* p = static_cast<const std::uint16_t*>(image->data);
    return std::vector<std::uint16_t>(p, p + img::imageTotalSamples(image, -1));
}

} // namespace rawtest
