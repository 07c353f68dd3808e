#pragma once
// Helpers of the lens-shading, driver and report tests. caught(): runs a
// callable that must throw apan::exception and hands it back, so a test can
// check its code and both texts; runtimeError(): the text of the
// std::runtime_error a callable throws, or "" when it throws none;
// expectGolden(): compares a formatted output with its reviewed copy under
// tests/data/, or with LSC_GOLDEN_UPDATE=1 in the environment rewrites the copy
// (then `git diff tests/data` shows what changed); makeImage(), kOrders and
// channelLevels(): REAL32 Bayer working images filled in code, in the four
// Bayer orders.

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "image/bayer_image.h"
#include "image/image_buffer.h"
#include "lsc/apan_exception.h"

namespace lsc_test {

template <typename F> apan::exception caught(F f) {
    try {
        f();
    } catch (const apan::exception& e) {
        return e;
    }
    ADD_FAILURE() << "no apan::exception";
    return apan::exception(0, "", "");
}

template <typename F> std::string runtimeError(F f) {
    try {
        f();
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "";
}

inline void expectGolden(const std::string& name, const std::string& text) {
    const std::string path = std::string(LSC_SOURCE_DIR) + "/tests/data/" + name;
    if (std::getenv("LSC_GOLDEN_UPDATE")) {
        std::ofstream(path, std::ios::binary) << text;
        return;
    }
    std::stringstream in;
    in << std::ifstream(path, std::ios::binary).rdbuf();
    const std::string kept = in.str();
    const auto at = std::mismatch(text.begin(), text.end(), kept.begin(), kept.end()).first;
    const std::size_t differs = static_cast<std::size_t>(at - text.begin());
    EXPECT_TRUE(kept == text) << path << " differs from byte " << differs << ": "
                              << text.substr(differs > 40 ? differs - 40 : 0, 120);
}

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
