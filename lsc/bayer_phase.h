#pragma once
// Which colour channel a Bayer pixel belongs to, in the channel order of all
// lens-shading data: 0 red, 1 green/red, 2 green/blue, 3 blue.

#include <cstdint>

#include "image/image_buffer.h"

// Bayer phase of a cfa pattern word: RGGB 0, GRBG 1, GBRG 2, BGGR 3, any other 0.
inline int bayerPhase(std::uint32_t cfa) {
    switch (cfa) {
    case kCfaGrbg:
        return 1;
    case kCfaGbrg:
        return 2;
    case kCfaBggr:
        return 3;
    default:
        return 0;
    }
}

// Channel of the pixel at (x, y) for a Bayer phase.
inline int bayerChannel(std::uint64_t x, std::uint64_t y, int phase) {
    return static_cast<int>(((x + static_cast<unsigned>(phase)) & 1) +
                            ((y + (static_cast<unsigned>(phase) >> 1)) & 1) * 2);
}
