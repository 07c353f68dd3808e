#pragma once
// Small builders for the raw reader tests: whole files as byte strings, so
// each case shows the bytes it feeds in.

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "image/image_buffer.h"
#include "image/raw_reader.h"

namespace rawtest {

inline void putU32(std::string& bytes, std::size_t offset, std::uint32_t value) {
    for (int i = 0; i < 4; ++i)
        bytes[offset + i] = static_cast<char>(value >> (8 * i));
}

inline std::uint32_t getU32(const std::string& bytes, std::size_t offset) {
    std::uint32_t value = 0;
    for (int i = 0; i < 4; ++i)
        value |= std::uint32_t{static_cast<std::uint8_t>(bytes[offset + i])} << (8 * i);
    return value;
}

inline void putFloat(std::string& bytes, std::size_t offset, float value) {
    std::uint32_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    putU32(bytes, offset, bits);
}

inline float getFloat(const std::string& bytes, std::size_t offset) {
    const std::uint32_t bits = getU32(bytes, offset);
    float value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

inline std::string samplesLE(const std::vector<std::uint16_t>& samples) {
    std::string bytes;
    for (std::uint16_t s : samples) {
        bytes += static_cast<char>(s & 0xFF);
        bytes += static_cast<char>(s >> 8);
    }
    return bytes;
}

inline std::string u32(std::uint32_t value) {
    std::string bytes(4, '\0');
    putU32(bytes, 0, value);
    return bytes;
}

// A fixed-header file: version 1, the given revision, magic and end marker.
inline std::string fixedHeaderFile(std::uint32_t width, std::uint32_t height,
                                   const std::vector<std::uint16_t>& samples,
                                   std::uint32_t revision = 1) {
    std::string bytes(298672, '\0');
    putU32(bytes, 0, 1);
    putU32(bytes, 4, revision);
    putU32(bytes, 8, width);
    putU32(bytes, 12, height);
    putU32(bytes, 16, 0x52474742); // RGGB
    putU32(bytes, 104, 0xDEADBEEF);
    putU32(bytes, 298668, 0xCAFEFEED);
    return bytes + samplesLE(samples);
}

// An NKRAW file with the fields the tool reads.
inline std::string nkrawFile(std::uint32_t width, std::uint32_t height,
                             const std::vector<std::uint16_t>& samples) {
    std::string bytes(102572, '\0');
    bytes.replace(0, 8, "NKRAWHDR");
    putU32(bytes, 8, width);
    putU32(bytes, 12, height);
    putU32(bytes, 16, 0x47524247); // GRBG
    putU32(bytes, 20, 33000);      // exposure, microseconds
    putU32(bytes, 24, 12);         // gain step
    putU32(bytes, 28, 3);
    putU32(bytes, 32, 2);
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

inline std::vector<std::uint16_t> ramp(std::size_t count, std::uint16_t top) {
    std::vector<std::uint16_t> samples(count);
    for (std::size_t i = 0; i < count; ++i)
        samples[i] = static_cast<std::uint16_t>(i * top / (count > 1 ? count - 1 : 1));
    return samples;
}

} // namespace rawtest
