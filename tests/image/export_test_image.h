#pragma once
// An image of any layout for the export writers' tests.

#include <cstdint>

#include <gtest/gtest.h>

#include "image/image_buffer.h"

inline img::ImagePtr makeImage(std::int32_t width, std::int32_t height, std::uint16_t bits,
                               std::uint16_t samples, std::uint32_t cfa1, std::uint32_t pixelType,
                               std::uint32_t bufferType, std::uint32_t dataType) {
    int result = 0;
    img::ImagePtr image(img::imageCreate(width, height, bits, samples, 1, 0, cfa1, pixelType,
                                         bufferType, dataType, &result));
    EXPECT_EQ(result, 0);
    return image;
}
