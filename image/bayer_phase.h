#pragma once
// Where each colour of a 2 x 2 Bayer pattern lies. Channels are numbered in
// the order of all lens-shading data: 0 red, 1 green/red, 2 green/blue,
// 3 blue; the phase says which of them the pixel at (0, 0) is.

#include <cstdint>

#include "image/image_buffer.h"

namespace img {

// Bayer phase of a cfa pattern word: RGGB 0, GRBG 1, GBRG 2, BGGR 3, -1 for
// any other word.
inline int knownBayerPhase(std::uint32_t cfa) {
    switch (cfa) {
    case kCfaRggb:
        return 0;
    case kCfaGrbg:
        return 1;
    case kCfaGbrg:
        return 2;
    case kCfaBggr:
        return 3;
    default:
        return -1;
    }
}

// As knownBayerPhase, with any other word taken as RGGB.
inline int bayerPhase(std::uint32_t cfa) {
    const int phase = knownBayerPhase(cfa);
    return phase < 0 ? 0 : phase;
}

// Channel of the pixel at (x, y) for a Bayer phase.
inline int bayerChannel(std::uint64_t x, std::uint64_t y, int phase) {
    return static_cast<int>(((x + static_cast<unsigned>(phase)) & 1) +
                            ((y + (static_cast<unsigned>(phase) >> 1)) & 1) * 2);
}

// Where a channel lies in each 2 x 2 block: the inverse of bayerChannel.
struct BlockOffset {
    int x;
    int y;
};
inline BlockOffset channelOffset(int channel, int phase) {
    return {(channel & 1) ^ (phase & 1), ((channel >> 1) & 1) ^ ((phase >> 1) & 1)};
}

} // namespace img
