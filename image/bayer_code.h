#pragma once
// The Bayer order as raw files store it: four ASCII letters in one 32-bit
// word, first letter in the most significant byte (so the little-endian file
// bytes of RGGB read "BGGR").

#include <cstdint>

#include "image/image_buffer.h"

namespace img {

constexpr std::uint32_t kBayerCodeRggb = 0x52474742;
constexpr std::uint32_t kBayerCodeBggr = 0x42474752;
constexpr std::uint32_t kBayerCodeGrbg = 0x47524247;
constexpr std::uint32_t kBayerCodeGbrg = 0x47425247;

// 0 for any pattern other than the four Bayer orders.
inline std::uint32_t bayerCodeOfCfa(std::uint32_t cfa1) {
    switch (cfa1) {
    case kCfaRggb:
        return kBayerCodeRggb;
    case kCfaBggr:
        return kBayerCodeBggr;
    case kCfaGrbg:
        return kBayerCodeGrbg;
    case kCfaGbrg:
        return kBayerCodeGbrg;
    default:
        return 0;
    }
}

// cfa 0 for any other code.
inline std::uint32_t cfaOfBayerCode(std::uint32_t code) {
    switch (code) {
    case kBayerCodeRggb:
        return kCfaRggb;
    case kBayerCodeBggr:
        return kCfaBggr;
    case kBayerCodeGrbg:
        return kCfaGrbg;
    case kBayerCodeGbrg:
        return kCfaGbrg;
    default:
        return 0;
    }
}

} // namespace img
