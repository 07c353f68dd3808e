#pragma once
// Small float images for the preparation tests.

#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include "image/bayer_image.h"
#include "image/image_buffer.h"

namespace prep_test {

inline img::BayerImage makeImage(std::int32_t width, std::int32_t height,
                                 std::uint16_t channels = 1, std::uint32_t cfa1 = img::kCfaRggb,
                                 std::uint16_t bits = 10) {
    int result = 0;
    img::BayerImage image;
    const bool raw = channels == 1;
    image.reset(img::imageCreate(
        width, height, bits, channels, 1, 0, cfa1, raw ? img::kPixelRaw : img::kPixelOther,
        raw ? img::kBufferRawCfa : img::kBufferInterleaved, img::kDataReal32, &result));
    EXPECT_EQ(result, 0);
    return image;
}

// Fills every sample with its index scaled into 0..1.
inline void fillRamp(img::BayerImage& image) {
    const std::size_t count =
        static_cast<std::size_t>(image.width()) * image.height() * image.channels();
    for (std::size_t i = 0; i < count; ++i)
        image.pixels()[i] = static_cast<float>(i) / static_cast<float>(count);
}

inline void fill(img::BayerImage& image, float value) {
    const std::size_t count =
        static_cast<std::size_t>(image.width()) * image.height() * image.channels();
    for (std::size_t i = 0; i < count; ++i)
        image.pixels()[i] = value;
}

inline std::vector<float> samplesOf(const img::BayerImage& image) {
    const std::size_t count =
        static_cast<std::size_t>(image.width()) * image.height() * image.channels();
    return std::vector<float>(image.pixels(), image.pixels() + count);
}

} // namespace prep_test
