#include <cmath>
#include <cstdint>
#include <cstring>
#include <string>

#include <gtest/gtest.h>

#include "image/image_buffer.h"
#include "image/ppm_writer.h"
#include "tests/image/export_test_image.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::TempDir;

std::string written(const TempDir& dir, const ImageBuffer* image) {
    EXPECT_EQ(ppmWrite(dir.file("out.pnm").c_str(), image), 0);
    return testing_support::readFile(dir.file("out.pnm"));
}

TEST(PpmWriter, WritesAGreymapWithItsPropertiesAsComments) {
    TempDir dir;
    const ImagePtr image = makeImage(2, 1, 8, 1, 0, kPixelMono, kBufferInterleaved, kDataUint8);
    static_cast<std::uint8_t*>(image->data)[0] = 'a';
    static_cast<std::uint8_t*>(image->data)[1] = 'b';
    EXPECT_EQ(written(dir, image.get()), "P5\n"
                                         "# MCF_NumberOfImages  = 1\n"
                                         "# MCF_SamplesPerPixel = 1\n"
                                         "# MCF_PixelType  = MONO\n"
                                         "# MCF_BufferType = INTERLEAVED\n"
                                         "# MCF_DataType = UINT8\n"
                                         "# MCF_BlackVal = 0.000000\n"
                                         "# MCF_WhiteVal = 256.000000\n"
                                         "# MCF_MinClip  = 0.000000\n"
                                         "# MCF_MaxClip  = 256.000000\n"
                                         "2 1\n255\nab");
}

TEST(PpmWriter, WritesSixteenBitSensorSamplesMostSignificantByteFirst) {
    TempDir dir;
    const ImagePtr image = makeImage(2, 1, 12, 1, kCfaBggr, kPixelRaw, kBufferRawCfa, kDataUint16);
    static_cast<std::uint16_t*>(image->data)[0] = 0x0123;
    static_cast<std::uint16_t*>(image->data)[1] = 0xFFFF; // above 12 bits: clipped to 4095
    ASSERT_EQ(imageSetMetadata(image.get(), "Note", "two\nlines"), 0);
    const std::string file = written(dir, image.get());
    EXPECT_NE(file.find("#     MCF_CFA    = BGGR\n"), std::string::npos);
    // Every line of a metadata value stays a comment, so the header still parses.
    EXPECT_NE(file.find("# MCF_MetadataBegin = \"Note\" 9\n# two\n# lines\n"
                        "# MCF_MetadataEnd = \"Note\"\n2 1\n4095\n"),
              std::string::npos);
    EXPECT_EQ(file.substr(file.size() - 4), std::string("\x01\x23\x0F\xFF", 4));
}

TEST(PpmWriter, ScalesFloatSamplesToSixteenBits) {
    TempDir dir;
    const ImagePtr image = makeImage(4, 1, 32, 1, kCfaRggb, kPixelRaw, kBufferRawCfa, kDataReal32);
    const float values[4] = {0.5f, 1.5f, -0.25f, std::nanf("")};
    std::memcpy(image->data, values, sizeof values);
    const std::string file = written(dir, image.get());
    EXPECT_NE(file.find("\n4 1\n65535\n"), std::string::npos);
    EXPECT_EQ(file.substr(file.size() - 8), std::string("\x80\x00\xFF\xFF\x00\x00\x00\x00", 8));
}

TEST(PpmWriter, InterleavesPlanarColourImages) {
    TempDir dir;
    const ImagePtr image = makeImage(2, 1, 8, 3, 0, kPixelRgb, kBufferPlanar, kDataUint8);
    std::memcpy(image->data, "RrGgBb", 6);
    const std::string file = written(dir, image.get());
    EXPECT_EQ(file.substr(0, 3), "P6\n");
    EXPECT_EQ(file.substr(file.size() - 6), "RGBrgb");
}

TEST(PpmWriter, RefusesLayoutsWithoutAPortableForm) {
    TempDir dir;
    const ImagePtr yuv = makeImage(4, 4, 8, 3, 0, kPixelYuv422, kBufferPlanar, kDataUint8);
    EXPECT_EQ(ppmWrite(dir.file("a.pnm").c_str(), yuv.get()), -6);
    const ImagePtr twoSamples =
        makeImage(4, 4, 8, 2, 0, kPixelOther, kBufferInterleaved, kDataUint8);
    EXPECT_EQ(ppmWrite(dir.file("a.pnm").c_str(), twoSamples.get()), -6);
    EXPECT_EQ(ppmWrite(dir.file("a.pnm").c_str(), nullptr), -5);
}

TEST(PpmWriter, ReportsAWriteThatFails) {
    const ImagePtr image = makeImage(2, 2, 8, 1, 0, kPixelMono, kBufferInterleaved, kDataUint8);
    EXPECT_EQ(ppmWrite("/dev/full", image.get()), -2);
}

} // namespace
} // namespace img
