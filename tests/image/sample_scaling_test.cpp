// Widening raw samples to normalised floats in their own block.

#include <cstdint>
#include <cstring>
#include <vector>

#include <gtest/gtest.h>

#include "image/image_buffer.h"
#include "image/image_result.h"
#include "image/sample_memory.h"
#include "image/sample_scaling.h"

namespace img {
namespace {

// A raw image; with `room`, its block is the kind the raw readers allocate.
ImagePtr rawImage(std::int32_t width, std::int32_t height, std::uint16_t bits, std::uint32_t type,
                  bool room = false) {
    int rc = img::kOk;
    ImagePtr image(imageCreate(width, height, bits, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa,
                               room ? kDataNone : type, &rc));
    EXPECT_EQ(rc, img::kOk);
    if (room) {
        image->data = img::allocateWidenableSamples(std::uint64_t(width) * height,
                                                    type == kDataUint16 ? 2 : 1);
        image->dataType = type;
    }
    return image;
}

// Widening gives exactly what the copying conversion gives, for every sample
// (the image spans several of the in-place chunks and ends in a partial one).
void expectWideningMatchesCopy(int bits, std::uint32_t type, bool room) {
    ImagePtr image = rawImage(131, 97, static_cast<std::uint16_t>(bits), type, room);
    const std::size_t count = 131 * 97;
    for (std::size_t i = 0; i < count; ++i) {
        const auto value = static_cast<std::uint32_t>(i * 2654435761u >> 7);
        if (type == kDataUint16)
            static_cast<std::uint16_t*>(image->data)[i] = static_cast<std::uint16_t>(value);
        else
            static_cast<std::uint8_t*>(image->data)[i] = static_cast<std::uint8_t>(value);
    }
    std::vector<float> copied(count);
    ASSERT_TRUE(img::normaliseSamples(image.get(), copied.data()));

    const void* before = image->data;
    ASSERT_EQ(img::widenSamplesToFloat(image.get()), img::kOk);
    EXPECT_EQ(image->dataType, kDataReal32);
    EXPECT_EQ(std::memcmp(image->data, copied.data(), count * sizeof(float)), 0);
    if (room) {
        EXPECT_EQ(image->data, before) << "converted where the samples lie";
    }
}

TEST(WidenSamplesToFloat, MatchesTheCopyingConversionInPlaceOrNot) {
    for (bool room : {true, false}) {
        for (int bits : {1, 10, 12, 16})
            expectWideningMatchesCopy(bits, kDataUint16, room);
        for (int bits : {4, 8})
            expectWideningMatchesCopy(bits, kDataUint8, room);
    }
}

TEST(WidenSamplesToFloat, FullScaleIsOneAndBitsAboveTheDepthAreMasked) {
    ImagePtr image = rawImage(3, 1, 10, kDataUint16);
    auto* samples = static_cast<std::uint16_t*>(image->data);
    samples[0] = 1023;
    samples[1] = 0xFFFF;
    samples[2] = 0;
    ASSERT_EQ(img::widenSamplesToFloat(image.get()), img::kOk);
    const auto* values = static_cast<const float*>(image->data);
    EXPECT_EQ(values[0], 1.0f);
    EXPECT_EQ(values[1], 1.0f);
    EXPECT_EQ(values[2], 0.0f);
}

TEST(WidenSamplesToFloat, RefusesOtherDataTypesAndLeavesThemAlone) {
    ImagePtr floats = rawImage(4, 4, 32, kDataReal32);
    EXPECT_EQ(img::widenSamplesToFloat(floats.get()), img::kUnsupported);
    EXPECT_EQ(floats->dataType, kDataReal32);
    ImagePtr empty = rawImage(4, 4, 16, kDataNone);
    EXPECT_EQ(img::widenSamplesToFloat(empty.get()), img::kUnsupported);
    EXPECT_EQ(img::widenSamplesToFloat(nullptr), img::kUnsupported);
}

} // namespace
} // namespace img
