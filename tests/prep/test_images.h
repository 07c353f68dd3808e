#pragma once
// Small float images for the preparation tests.

#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include "image/bayer_image.h"
#include "image/image_buffer.h"
#include "tests/config/case_data.h"

namespace prep_test {

// A float image holding `samples` (or zeros), row by row, channel by channel.
inline img::BayerImage makeImage(std::int32_t width, std::int32_t height,
                                 std::uint16_t channels = 1, std::uint32_t cfa1 = img::kCfaRggb,
                                 const std::vector<float>& samples = {}, std::uint16_t bits = 10) {
    int result = 0;
    img::BayerImage image;
    const bool raw = channels == 1;
    image.reset(img::imageCreate(
        width, height, bits, channels, 1, 0, cfa1, raw ? img::kPixelRaw : img::kPixelOther,
        raw ? img::kBufferRawCfa : img::kBufferInterleaved, img::kDataReal32, &result));
    EXPECT_EQ(result, 0);
    const std::size_t count = static_cast<std::size_t>(width) * height * channels;
    for (std::size_t i = 0; i < count; ++i)
        image.pixels()[i] = samples.empty() ? 0.0f : samples[i % samples.size()];
    return image;
}

inline std::vector<float> samplesOf(const img::BayerImage& image) {
    const std::size_t count =
        static_cast<std::size_t>(image.width()) * image.height() * image.channels();
    return std::vector<float>(image.pixels(), image.pixels() + count);
}

} // namespace prep_test
