#pragma once
// Which of the four lens-shading channels (0 red, 1 green/red, 2 green/blue,
// 3 blue) a pixel of a Bayer image belongs to.

#include "image/image_buffer.h"

#include <cstdint>

namespace prep {

// RGGB 0, GRBG 1, GBRG 2, BGGR 3; any other pattern 0.
inline int bayerPhase(std::uint32_t cfa1) {
    switch (cfa1) {
    case kCfaGrbg: return 1;
    case kCfaGbrg: return 2;
    case kCfaBggr: return 3;
    default: return 0;
    }
}

inline int channelAt(std::uint64_t x, std::uint64_t y, int phase) {
    return static_cast<int>(((x + static_cast<unsigned>(phase)) & 1) +
                            ((y + (static_cast<unsigned>(phase) >> 1)) & 1) * 2);
}

// Offset (dx, dy) within each 2 x 2 block of the pixel of `channel`.
inline void channelOffset(int channel, int phase, int& dx, int& dy) {
    dx = (channel & 1) ^ (phase & 1);
    dy = ((channel >> 1) & 1) ^ ((phase >> 1) & 1);
}

} // namespace prep
