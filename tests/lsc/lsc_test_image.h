#pragma once
// Working images for the lens-shading tests: REAL32 Bayer images made with the
// image library and filled in code, and the four Bayer orders written out.

#include <cstdint>
#include <functional>

#include <gtest/gtest.h>

#include "image/bayer_image.h"
#include "image/image_buffer.h"

namespace lsc_test {

// Gives `image` a width x height REAL32 Bayer image of pattern `cfa` whose
// pixel (x, y) is value(x, y).
inline void makeImage(img::BayerImage& image, int width, int height, std::uint32_t cfa,
                      const std::function<float(int, int)>& value, std::uint16_t bits = 10) {
    int rc = 0;
    image.reset(img::imageCreate(width, height, bits, 1, 1, 0, cfa, img::kPixelRaw,
                                 img::kBufferRawCfa, img::kDataReal32, &rc));
    ASSERT_NE(image.buffer(), nullptr) << rc;
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            image.pixels()[y * width + x] = value(x, y);
}

// channelAt[(y & 1) * 2 + (x & 1)]: the channel (0 red, 1 green/red, 2 green/blue,
// 3 blue) of pixel (x, y).
struct Order {
    const char* name;
    std::uint32_t cfa;
    int channelAt[4];
};
inline const Order kOrders[] = {{"RGGB", img::kCfaRggb, {0, 1, 2, 3}},
                                {"GRBG", img::kCfaGrbg, {1, 0, 3, 2}},
                                {"GBRG", img::kCfaGbrg, {2, 3, 0, 1}},
                                {"BGGR", img::kCfaBggr, {3, 2, 1, 0}}};

// A flat field whose channels sit at levels[channel].
inline std::function<float(int, int)> channelLevels(const Order& order, const float levels[4]) {
    const float l[4] = {levels[0], levels[1], levels[2], levels[3]};
    return [order, l0 = l[0], l1 = l[1], l2 = l[2], l3 = l[3]](int x, int y) {
        const int k = order.channelAt[(y & 1) * 2 + (x & 1)];
        return k == 0 ? l0 : k == 1 ? l1 : k == 2 ? l2 : l3;
    };
}

} // namespace lsc_test
