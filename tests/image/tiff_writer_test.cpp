#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tiffio.h>

#include "image/image_buffer.h"
#include "image/tiff_ptr.h"
#include "image/tiff_writer.h"
#include "tests/image/export_test_image.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::TempDir;

using img::TiffPtr;

std::uint16_t tag16(TIFF* tiff, ttag_t tag) {
    std::uint16_t value = 0;
    EXPECT_EQ(TIFFGetField(tiff, tag, &value), 1) << "tag " << tag;
    return value;
}

std::uint32_t tag32(TIFF* tiff, ttag_t tag) {
    std::uint32_t value = 0;
    EXPECT_EQ(TIFFGetField(tiff, tag, &value), 1) << "tag " << tag;
    return value;
}

std::string description(TIFF* tiff) {
    const char* text = nullptr;
    EXPECT_EQ(TIFFGetField(tiff, TIFFTAG_IMAGEDESCRIPTION, &text), 1);
    return text ? text : "";
}

std::vector<std::uint8_t> scanline(TIFF* tiff, std::uint32_t row, std::uint16_t plane = 0) {
    std::vector<std::uint8_t> bytes(static_cast<std::size_t>(TIFFScanlineSize(tiff)));
    EXPECT_EQ(TIFFReadScanline(tiff, bytes.data(), row, plane), 1);
    return bytes;
}

TEST(TiffWriter, WritesAnRgbImageWithItsTagsAndDescription) {
    TempDir dir;
    const ImagePtr image = makeImage(3, 2, 8, 3, 0, kPixelRgb, kBufferInterleaved, kDataUint8);
    auto* data = static_cast<std::uint8_t*>(image->data);
    for (int i = 0; i < 18; ++i)
        data[i] = static_cast<std::uint8_t>(10 + i);
    ASSERT_EQ(tiffWrite(dir.file("rgb.tif").c_str(), image.get()), 0);

    const TiffPtr tiff(TIFFOpen(dir.file("rgb.tif").c_str(), "r"));
    ASSERT_TRUE(tiff);
    EXPECT_EQ(tag32(tiff.get(), TIFFTAG_IMAGEWIDTH), 3u);
    EXPECT_EQ(tag32(tiff.get(), TIFFTAG_IMAGELENGTH), 2u);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_BITSPERSAMPLE), 8);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_SAMPLESPERPIXEL), 3);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_PHOTOMETRIC), 2);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_COMPRESSION), 1);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_ORIENTATION), 1);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_FILLORDER), 1);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_PLANARCONFIG), 1);
    EXPECT_EQ(description(tiff.get()),
              "MCF_IMAGE: NumberOfImages=1, PixelType=RGB, BufferType=INTERLEAVED, "
              "DataType=UINT8, BlackVal=0.000000 0.000000 0.000000, "
              "WhiteVal=256.000000 256.000000 256.000000, MinClip=0.000000 0.000000 0.000000, "
              "MaxClip=256.000000 256.000000 256.000000");
    EXPECT_EQ(scanline(tiff.get(), 1),
              (std::vector<std::uint8_t>{19, 20, 21, 22, 23, 24, 25, 26, 27}));
}

TEST(TiffWriter, DescribesARawImageWithPatternLevelsAndMetadata) {
    TempDir dir;
    const ImagePtr image = makeImage(4, 2, 10, 1, kCfaGbrg, kPixelRaw, kBufferRawCfa, kDataUint16);
    image->level[0].blackVal = 64.0f;
    image->clip[0].maxClip = 1000.5f;
    auto* data = static_cast<std::uint16_t*>(image->data);
    for (int i = 0; i < 8; ++i)
        data[i] = static_cast<std::uint16_t>(1023 - i);
    ASSERT_EQ(imageSetMetadata(image.get(), "SerialNumber", "0a1b"), 0);
    ASSERT_EQ(imageSetMetadata(image.get(), "Mode", "still"), 0);
    ASSERT_EQ(tiffWrite(dir.file("raw.tif").c_str(), image.get()), 0);

    const TiffPtr tiff(TIFFOpen(dir.file("raw.tif").c_str(), "r"));
    ASSERT_TRUE(tiff);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_PHOTOMETRIC), 1);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_SAMPLESPERPIXEL), 1);
    EXPECT_EQ(description(tiff.get()),
              "MCF_IMAGE: NumberOfImages=1, PixelType=RAW, CFA=GBRG, BufferType=RAW_CFA, "
              "DataType=UINT16, BlackVal=64.000000, WhiteVal=1024.000000, MinClip=0.000000, "
              "MaxClip=1000.500000, Metadata=\"SerialNumber\" 4,0a1b, Metadata=\"Mode\" 5,still");
    // Ten significant bits are stored in their 16-bit containers, values unchanged.
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_BITSPERSAMPLE), 16);
    const std::vector<std::uint8_t> row = scanline(tiff.get(), 1);
    std::uint16_t first = 0;
    std::memcpy(&first, row.data(), 2);
    EXPECT_EQ(first, 1019);
}

TEST(TiffWriter, WritesPlanarImagesAsSeparatePlanes) {
    TempDir dir;
    const ImagePtr image = makeImage(2, 1, 8, 3, 0, kPixelRgb, kBufferPlanar, kDataUint8);
    const std::uint8_t planes[6] = {1, 2, 3, 4, 5, 6};
    std::memcpy(image->data, planes, 6);
    ASSERT_EQ(tiffWrite(dir.file("planar.tif").c_str(), image.get()), 0);

    const TiffPtr tiff(TIFFOpen(dir.file("planar.tif").c_str(), "r"));
    ASSERT_TRUE(tiff);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_PLANARCONFIG), 2);
    EXPECT_EQ(scanline(tiff.get(), 0, 2), (std::vector<std::uint8_t>{5, 6}));
}

TEST(TiffWriter, MarksFloatSamplesAsFloatingPoint) {
    TempDir dir;
    const ImagePtr image = makeImage(2, 2, 32, 1, kCfaRggb, kPixelRaw, kBufferRawCfa, kDataReal32);
    auto* data = static_cast<float*>(image->data);
    for (int i = 0; i < 4; ++i)
        data[i] = 0.25f * static_cast<float>(i);
    ASSERT_EQ(tiffWrite(dir.file("float.tif").c_str(), image.get()), 0);

    const TiffPtr tiff(TIFFOpen(dir.file("float.tif").c_str(), "r"));
    ASSERT_TRUE(tiff);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_SAMPLEFORMAT), SAMPLEFORMAT_IEEEFP);
    EXPECT_EQ(tag16(tiff.get(), TIFFTAG_BITSPERSAMPLE), 32);
    const std::vector<std::uint8_t> row = scanline(tiff.get(), 1);
    float values[2];
    std::memcpy(values, row.data(), sizeof values);
    EXPECT_EQ(values[1], 0.75f);
}

TEST(TiffWriter, RefusesSubsampledChromaPlanes) {
    TempDir dir;
    const ImagePtr image = makeImage(4, 4, 8, 3, 0, kPixelYuv420, kBufferPlanar, kDataUint8);
    EXPECT_EQ(tiffWrite(dir.file("yuv.tif").c_str(), image.get()), -6);
    EXPECT_FALSE(testing_support::fileExists(dir.file("yuv.tif")));
}

TEST(TiffWriter, ReportsOpenAndWriteFailures) {
    TempDir dir;
    const ImagePtr image = makeImage(2, 2, 8, 1, 0, kPixelMono, kBufferInterleaved, kDataUint8);
    EXPECT_EQ(tiffWrite(dir.file("none/a.tif").c_str(), image.get()), -1);
    EXPECT_EQ(tiffWrite("/dev/full", image.get()), -2);
}

} // namespace
} // namespace img
