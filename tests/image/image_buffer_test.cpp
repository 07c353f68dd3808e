#include <cstdio>
#include <cstring>

#include <gtest/gtest.h>

#include "image/image_buffer.h"
#include "image/image_result.h"

namespace img {
namespace {

ImagePtr create(std::int32_t w, std::int32_t h, std::uint16_t bits, std::uint16_t spp,
                std::uint32_t pixelType, std::uint32_t dataType, int* rc,
                std::uint32_t images = 1) {
    return ImagePtr(
        imageCreate(w, h, bits, spp, images, 0, kCfaRggb, pixelType, kBufferRawCfa, dataType, rc));
}

TEST(ImageCreate, SixteenBitRawHasFullScaleLevelsOnAllChannels) {
    int rc = 1;
    ImagePtr image = create(4, 2, 16, 1, kPixelRaw, kDataUint16, &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(rc, 0);
    for (int c = 0; c < 4; ++c) {
        EXPECT_EQ(image->level[c].whiteVal, 65536.0f);
        EXPECT_EQ(image->clip[c].maxClip, 65536.0f);
        EXPECT_EQ(image->level[c].blackVal, 0.0f);
        EXPECT_EQ(image->clip[c].minClip, 0.0f);
    }
    EXPECT_EQ(image->cfa[1], kCfaRggb);
    EXPECT_EQ(image->fileType, kFileNone);
    EXPECT_NE(image->data, nullptr);
}

TEST(ImageCreate, RefusesSamplesPerPixelThatDoNotSuitThePixelType) {
    int rc = 0;
    EXPECT_FALSE(create(4, 4, 8, 1, kPixelRgb, kDataUint8, &rc));
    EXPECT_EQ(rc, -6);
    EXPECT_FALSE(create(4, 4, 8, 3, kPixelRaw, kDataUint8, &rc));
    EXPECT_EQ(rc, -6);
    EXPECT_TRUE(create(4, 4, 8, 7, kPixelOther, kDataUint8, &rc));
}

TEST(ImageCreate, RefusesEmptyDimensions) {
    int rc = 0;
    EXPECT_FALSE(create(0, 4, 8, 1, kPixelRaw, kDataUint8, &rc));
    EXPECT_EQ(rc, -1);
    EXPECT_FALSE(create(4, -1, 8, 1, kPixelRaw, kDataUint8, &rc));
    EXPECT_EQ(rc, -1);
}

TEST(ImageCreate, CutsBitsToTheDataTypeAndLevelsFollow) {
    int rc = 0;
    ImagePtr image = create(2, 2, 12, 1, kPixelRaw, kDataUint8, &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(image->bitsPerSample, 8);
    EXPECT_EQ(image->level[0].whiteVal, 256.0f);
    image = create(2, 2, 40, 1, kPixelRaw, kDataReal32, &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(image->bitsPerSample, 32);
    EXPECT_EQ(image->level[0].whiteVal, 0.0f);
}

TEST(ImageCreate, KeepsCfaOnlyForRawImages) {
    int rc = 0;
    ImagePtr image(
        imageCreate(2, 2, 8, 1, 1, 5, kCfaGbrg, kPixelMono, kBufferRawCfa, kDataUint8, &rc));
    ASSERT_TRUE(image);
    EXPECT_EQ(image->cfa[0], 0u);
    EXPECT_EQ(image->cfa[1], 0u);
}

TEST(ImageCreate, DataTypeNoneHasNoBlockAndOtherIsRefused) {
    int rc = 0;
    ImagePtr image = create(2, 2, 8, 1, kPixelRaw, kDataNone, &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(image->data, nullptr);
    EXPECT_FALSE(create(2, 2, 8, 1, kPixelRaw, kDataOther, &rc));
}

TEST(ImageCreate, RefusesBlocksTooLargeToAddressInsteadOfWrapping) {
    int rc = 0;
    // 2^31-1 squared times 2^32-1 images wraps 64 bits; it must not become a small block.
    EXPECT_FALSE(create(0x7FFFFFFF, 0x7FFFFFFF, 16, 1, kPixelRaw, kDataUint16, &rc, 0xFFFFFFFFu));
    EXPECT_EQ(rc, -3);
    EXPECT_FALSE(imageCreate(0x7FFFFFFF, 0x7FFFFFFF, 8, 0xFFFF, 0xFFFFFFFFu, 0, 0, kPixelOther,
                             kBufferPlanar, kDataReal32, &rc));
    EXPECT_EQ(rc, -3);
    EXPECT_FALSE(create(2, 2, 8, 1, kPixelRaw, kDataUint8, &rc, 0));
    EXPECT_EQ(rc, -3);
}

TEST(ImagePlanes, Yuv420ChromaPlanesAreHalfSizeRoundedAsSpecified) {
    int rc = 0;
    ImagePtr image(imageCreate(5, 3, 8, 3, 1, 0, 0, kPixelYuv420, kBufferPlanar, kDataUint8, &rc));
    ASSERT_TRUE(image);
    std::int32_t w = 0, h = 0;
    EXPECT_EQ(imagePlaneSize(image.get(), 1, &w, &h), 0);
    EXPECT_EQ(w, 3);
    EXPECT_EQ(h, 2);
    EXPECT_EQ(imagePlaneSize(image.get(), 2, &w, &h), 0);
    EXPECT_EQ(w, 2);
    EXPECT_EQ(h, 2);
    EXPECT_EQ(imagePlaneSize(image.get(), 3, &w, &h), -1);
    EXPECT_EQ(imageTotalSamples(image.get(), -1), 15u + 6u + 4u);
}

TEST(ImagePlanes, Yuv422ChromaPlanesKeepTheHeight) {
    int rc = 0;
    ImagePtr image(imageCreate(5, 3, 8, 3, 2, 0, 0, kPixelYuv422, kBufferPlanar, kDataUint8, &rc));
    ASSERT_TRUE(image);
    EXPECT_EQ(imageTotalSamples(image.get(), 1), 9u);
    EXPECT_EQ(imageTotalSamples(image.get(), -1), 2u * (15 + 9 + 6));
}

TEST(ImageMetadata, KeysCompareWithoutCaseAndTheLastValueWins) {
    int rc = 0;
    ImagePtr image = create(1, 1, 8, 1, kPixelRaw, kDataUint8, &rc);
    EXPECT_EQ(imageSetMetadata(image.get(), "Exposure", "1"), 0);
    EXPECT_EQ(imageSetMetadata(image.get(), "Gain", "2"), 0);
    EXPECT_EQ(imageSetMetadata(image.get(), "EXPOSURE", "3"), 0);
    const MetadataEntry* entry = imageFindMetadata(image.get(), "exposure");
    ASSERT_NE(entry, nullptr);
    EXPECT_STREQ(entry->value, "3");
    ASSERT_NE(entry->next, nullptr);
    EXPECT_STREQ(entry->next->key, "Gain");
    EXPECT_EQ(entry->next->next, nullptr);
}

TEST(ImageMetadata, CopyTakesEntriesAndAFixedHeaderByteForByte) {
    int rc = 0;
    ImagePtr source = create(1, 1, 8, 1, kPixelRaw, kDataUint8, &rc);
    ImagePtr target = create(1, 1, 8, 1, kPixelRaw, kDataUint8, &rc);
    ASSERT_EQ(imageSetMetadata(target.get(), "old", "gone"), img::kOk);
    ASSERT_EQ(imageSetMetadata(source.get(), "a", "1"), img::kOk);
    auto* header = static_cast<unsigned char*>(std::malloc(kKqRawFixedHeaderSize));
    for (std::size_t i = 0; i < kKqRawFixedHeaderSize; ++i)
        header[i] = static_cast<unsigned char>(i * 7);
    source->rawHeader = header;
    source->fileType = kFileKqRaw;
    EXPECT_EQ(imageCopyMetadata(target.get(), source.get()), 0);
    EXPECT_EQ(imageFindMetadata(target.get(), "old"), nullptr);
    EXPECT_NE(imageFindMetadata(target.get(), "A"), nullptr);
    ASSERT_NE(target->rawHeader, nullptr);
    EXPECT_NE(target->rawHeader, source->rawHeader);
    EXPECT_EQ(std::memcmp(target->rawHeader, header, kKqRawFixedHeaderSize), 0);
    EXPECT_EQ(imageCopyMetadata(source.get(), source.get()), 0);
    EXPECT_NE(imageFindMetadata(source.get(), "a"), nullptr);
}

TEST(ImageMetadata, ClearReleasesEntriesAndTheRawHeader) {
    int rc = 0;
    ImagePtr image = create(1, 1, 8, 1, kPixelRaw, kDataUint8, &rc);
    ASSERT_EQ(imageSetMetadata(image.get(), "k", "v"), img::kOk);
    image->rawHeader = std::malloc(kNkRawHeaderSize);
    image->fileType = kFileNkRaw;
    imageClearMetadata(image.get());
    EXPECT_EQ(image->metadata, nullptr);
    EXPECT_EQ(image->rawHeader, nullptr);
}

TEST(ImageDisplay, EightBitTestNeedsMonoOrInterleavedRgbWithPlainLevels) {
    int rc = 0;
    ImagePtr rgb(imageCreate(2, 2, 8, 3, 1, 0, 0, kPixelRgb, kBufferInterleaved, kDataUint8, &rc));
    EXPECT_TRUE(imageIsEightBitDisplay(rgb.get()));
    rgb->level[2].blackVal = 1.0f;
    EXPECT_FALSE(imageIsEightBitDisplay(rgb.get()));
    ImagePtr planar(imageCreate(2, 2, 8, 3, 1, 0, 0, kPixelRgb, kBufferPlanar, kDataUint8, &rc));
    EXPECT_FALSE(imageIsEightBitDisplay(planar.get()));
    ImagePtr raw = create(2, 2, 8, 1, kPixelRaw, kDataUint8, &rc);
    EXPECT_FALSE(imageIsEightBitDisplay(raw.get()));
    ImagePtr mono(imageCreate(2, 2, 8, 1, 1, 0, 0, kPixelMono, kBufferRawCfa, kDataUint8, &rc));
    EXPECT_TRUE(imageIsEightBitDisplay(mono.get()));
}

TEST(ImageNames, EnumsAndPatternsPrintTheirNames) {
    EXPECT_STREQ(pixelTypeName(7), "YUV420");
    EXPECT_STREQ(pixelTypeName(8), "NEW-UNKNOWN");
    EXPECT_STREQ(bufferTypeName(3), "RAW_SPLIT");
    EXPECT_STREQ(bufferTypeName(6), "NEW-UNKNOWN");
    EXPECT_STREQ(dataTypeName(5), "REAL32");
    EXPECT_STREQ(fileTypeName(5), "NKRAW");
    EXPECT_STREQ(fileTypeName(6), "NEW-UNKNOWN");
    EXPECT_STREQ(cfaPatternName(0x23340000), "RGGB");
    EXPECT_STREQ(cfaPatternName(0x43320000), "BGGR");
    EXPECT_STREQ(cfaPatternName(0x1560A000), "OECX");
    EXPECT_STREQ(cfaPatternName(0x789F0000), "MYWX");
}

TEST(ImageStreamIo, ScalarsRoundTripInBothByteOrders) {
    std::FILE* file = std::tmpfile();
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(streamWrite16(file, true, 0x1234), 0);
    EXPECT_EQ(streamWrite32(file, false, 0xA1B2C3D4u), 0);
    EXPECT_EQ(streamWrite64(file, true, 0x0102030405060708ull), 0);
    EXPECT_EQ(streamWriteFloat(file, false, 1.5f), 0);
    EXPECT_EQ(streamWrite8(file, 0xEE), 0);
    std::rewind(file);
    unsigned char first[2];
    ASSERT_EQ(std::fread(first, 1, 2, file), 2u);
    EXPECT_EQ(first[0], 0x12); // big-endian: most significant byte first
    std::rewind(file);
    std::uint16_t v16 = 0;
    std::uint32_t v32 = 0;
    std::uint64_t v64 = 0;
    float f = 0;
    std::uint8_t v8 = 0;
    EXPECT_EQ(streamRead16(file, true, &v16), 0);
    EXPECT_EQ(streamRead32(file, false, &v32), 0);
    EXPECT_EQ(streamRead64(file, true, &v64), 0);
    EXPECT_EQ(streamReadFloat(file, false, &f), 0);
    EXPECT_EQ(streamRead8(file, &v8), 0);
    EXPECT_EQ(v16, 0x1234);
    EXPECT_EQ(v32, 0xA1B2C3D4u);
    EXPECT_EQ(v64, 0x0102030405060708ull);
    EXPECT_EQ(f, 1.5f);
    EXPECT_EQ(v8, 0xEE);
    EXPECT_EQ(streamRead32(file, false, &v32), -1);
    std::fclose(file);
}

} // namespace
} // namespace img
