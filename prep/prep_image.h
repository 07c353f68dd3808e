#pragma once
// Allocation and checks shared by the preparation stages. Every image made
// here holds REAL32 samples; a failed allocation throws std::runtime_error
// "Unable to allocate image memory." as the image object does.

#include <cstddef>
#include <cstdint>

#include "image/bayer_image.h"

namespace prep {

img::BayerImage createFloatImage(std::int32_t width, std::int32_t height,
                                 std::uint16_t bitsPerSample, std::uint16_t channels,
                                 std::uint32_t cfa0, std::uint32_t cfa1, std::uint32_t pixelType,
                                 std::uint32_t bufferType);

// Throws std::invalid_argument unless the image holds REAL32 samples with a
// positive size and one image in its block.
void requireFloatImage(const img::BayerImage& image);

// width x height x channels of a checked float image.
std::size_t sampleCount(const img::BayerImage& image);

} // namespace prep
