#pragma once
// Working images for the lens-shading tests: REAL32 Bayer images made with the
// image library and filled in code.

#include <cstdint>
#include <functional>

#include <gtest/gtest.h>

#include "image/bayer_image.h"
#include "image/image_buffer.h"
#include "lsc/shading_sample.h"

namespace lsc_test {

// Gives `image` a width x height REAL32 Bayer image of pattern `cfa` whose
// pixel (x, y) is value(x, y).
inline void makeImage(img::BayerImage& image, int width, int height, std::uint32_t cfa,
                      const std::function<float(int, int)>& value, std::uint16_t bits = 10) {
    int rc = 0;
    image.reset(img::imageCreate(width, height, bits, 1, 1, 0, cfa, img::kPixelRaw,
                                 img::kBufferRawCfa, img::kDataReal32, &rc));
    ASSERT_NE(image.buffer(), nullptr) << rc;
    float* p = image.pixels();
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            p[y * width + x] = value(x, y);
}

// Pixel value of a flat field whose channels (in channel order) sit at levels[k].
inline std::function<float(int, int)> channelLevels(std::uint32_t cfa, const float levels[4]) {
    const int phase = cfa == img::kCfaGrbg   ? 1
                      : cfa == img::kCfaGbrg ? 2
                      : cfa == img::kCfaBggr ? 3
                                             : 0;
    const float l0 = levels[0], l1 = levels[1], l2 = levels[2], l3 = levels[3];
    return [=](int x, int y) {
        const int k = ((x + phase) & 1) + ((y + (phase >> 1)) & 1) * 2;
        return k == 0 ? l0 : k == 1 ? l1 : k == 2 ? l2 : l3;
    };
}

} // namespace lsc_test
