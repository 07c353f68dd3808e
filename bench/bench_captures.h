#pragma once
// The captures the benchmarks time their stages on: 10-bit RGGB float
// mosaics like a sensor's after loading.

#include <cstddef>
#include <cstdint>

#include "image/bayer_image.h"
#include "image/image_buffer.h"

namespace bench {

// An RGGB mosaic of float samples, its values left to the caller.
inline img::BayerImage tenBitMosaic(std::int32_t width, std::int32_t height) {
    int result = 0;
    img::BayerImage image;
    image.reset(img::imageCreate(width, height, 10, 1, 1, 0, img::kCfaRggb, img::kPixelRaw,
                                 img::kBufferRawCfa, img::kDataReal32, &result));
    return image;
}

// Sensor codes of a flat field at about 600 with noise, so that median
// windows hold distinct values.
template <typename Store> void noisyFlatCodes(std::size_t count, Store store) {
    std::uint32_t state = 12345;
    for (std::size_t i = 0; i < count; ++i) {
        state = state * 1664525u + 1013904223u;
        store(i, static_cast<std::uint16_t>(600 + (state >> 24) % 64));
    }
}

} // namespace bench
