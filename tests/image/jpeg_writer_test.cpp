#include <csetjmp>
#include <cstdint>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <jpeglib.h>

#include "image/image_buffer.h"
#include "image/jpeg_writer.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::TempDir;

ImagePtr eightBitImage(std::int32_t width, std::int32_t height, std::uint32_t pixelType,
                       std::uint16_t samples) {
    int result = 0;
    ImagePtr image(imageCreate(width, height, 8, samples, 1, 0, 0, pixelType, kBufferInterleaved,
                               kDataUint8, &result));
    EXPECT_EQ(result, 0);
    auto* data = static_cast<std::uint8_t*>(image->data);
    for (std::uint64_t i = 0; i < imageTotalSamples(image.get(), -1); ++i)
        data[i] = static_cast<std::uint8_t>(i * 7);
    return image;
}

struct DecodedJpeg {
    bool ok = false;
    unsigned width = 0;
    unsigned height = 0;
    int components = 0;
    std::vector<std::string> comments;
    unsigned firstLuminanceStep = 0; // first entry of quantisation table 0
    std::vector<JSAMPLE> row;        // scratch, kept out of the decoding frame
};

struct DecodeErrors {
    jpeg_error_mgr base;
    std::jmp_buf jump;
};

void failDecode(j_common_ptr common) {
    std::longjmp(reinterpret_cast<DecodeErrors*>(common->err)->jump, 1);
}

// Decodes the whole file with libjpeg; the result is filled in through a
// pointer so that nothing in this frame needs to survive the long jump.
void decodeInto(const std::string& bytes, DecodedJpeg* out) {
    jpeg_decompress_struct decoder;
    DecodeErrors errors;
    decoder.err = jpeg_std_error(&errors.base);
    errors.base.error_exit = failDecode;
    if (setjmp(errors.jump)) {
        jpeg_destroy_decompress(&decoder);
        out->ok = false;
        return;
    }
    jpeg_create_decompress(&decoder);
    jpeg_mem_src(&decoder, reinterpret_cast<const unsigned char*>(bytes.data()),
                 static_cast<unsigned long>(bytes.size()));
    jpeg_save_markers(&decoder, JPEG_COM, 0xFFFF);
    jpeg_read_header(&decoder, TRUE);
    for (jpeg_saved_marker_ptr marker = decoder.marker_list; marker; marker = marker->next)
        out->comments.emplace_back(reinterpret_cast<const char*>(marker->data),
                                   marker->data_length);
    out->firstLuminanceStep = decoder.quant_tbl_ptrs[0]->quantval[0];
    jpeg_start_decompress(&decoder);
    out->width = decoder.output_width;
    out->height = decoder.output_height;
    out->components = decoder.output_components;
    out->row.resize(static_cast<std::size_t>(decoder.output_width) *
                    static_cast<std::size_t>(decoder.output_components));
    while (decoder.output_scanline < decoder.output_height) {
        JSAMPROW rows[1] = {out->row.data()};
        jpeg_read_scanlines(&decoder, rows, 1);
    }
    jpeg_finish_decompress(&decoder);
    jpeg_destroy_decompress(&decoder);
    out->ok = true;
}

DecodedJpeg decode(const std::string& path) {
    DecodedJpeg decoded;
    decodeInto(testing_support::readFile(path), &decoded);
    return decoded;
}

TEST(JpegWriter, WritesAnRgbImageThatDecodesToItsSize) {
    TempDir dir;
    const ImagePtr image = eightBitImage(37, 21, kPixelRgb, 3);
    ASSERT_EQ(jpegWrite(dir.file("rgb.jpg").c_str(), image.get(), 90), 0);
    const DecodedJpeg decoded = decode(dir.file("rgb.jpg"));
    ASSERT_TRUE(decoded.ok);
    EXPECT_EQ(decoded.width, 37u);
    EXPECT_EQ(decoded.height, 21u);
    EXPECT_EQ(decoded.components, 3);
    EXPECT_TRUE(decoded.comments.empty());
}

TEST(JpegWriter, WritesAMonoImageAsGreyscale) {
    TempDir dir;
    const ImagePtr image = eightBitImage(8, 3, kPixelMono, 1);
    ASSERT_EQ(jpegWrite(dir.file("grey.jpg").c_str(), image.get(), 75), 0);
    const DecodedJpeg decoded = decode(dir.file("grey.jpg"));
    ASSERT_TRUE(decoded.ok);
    EXPECT_EQ(decoded.components, 1);
    EXPECT_EQ(decoded.width, 8u);
}

TEST(JpegWriter, CarriesOneCommentPerMetadataEntryInListOrder) {
    TempDir dir;
    const ImagePtr image = eightBitImage(4, 4, kPixelRgb, 3);
    ASSERT_EQ(imageSetMetadata(image.get(), "SerialNumber", "0a1b"), 0);
    ASSERT_EQ(imageSetMetadata(image.get(), "Lens", "wide angle"), 0);
    ASSERT_EQ(jpegWrite(dir.file("meta.jpg").c_str(), image.get(), 90), 0);
    const DecodedJpeg decoded = decode(dir.file("meta.jpg"));
    ASSERT_TRUE(decoded.ok);
    ASSERT_EQ(decoded.comments.size(), 2u);
    EXPECT_EQ(decoded.comments[0], "# MCF_MetadataBegin = \"SerialNumber\" 4\n0a1b\n"
                                   "# MCF_MetadataEnd = \"SerialNumber\"\n");
    EXPECT_EQ(decoded.comments[1], "# MCF_MetadataBegin = \"Lens\" 10\nwide angle\n"
                                   "# MCF_MetadataEnd = \"Lens\"\n");
}

TEST(JpegWriter, ScalesTheTablesByTheQuality) {
    TempDir dir;
    const ImagePtr image = eightBitImage(8, 8, kPixelRgb, 3);
    // The standard luminance table starts at 16: quality 50 keeps it, 90 scales it by 0.2.
    ASSERT_EQ(jpegWrite(dir.file("q50.jpg").c_str(), image.get(), 50), 0);
    ASSERT_EQ(jpegWrite(dir.file("q90.jpg").c_str(), image.get(), 90), 0);
    EXPECT_EQ(decode(dir.file("q50.jpg")).firstLuminanceStep, 16u);
    EXPECT_EQ(decode(dir.file("q90.jpg")).firstLuminanceStep, 3u);
}

TEST(JpegWriter, ClampsAQualityOutsideTheRange) {
    TempDir dir;
    const ImagePtr image = eightBitImage(8, 8, kPixelRgb, 3);
    // 300 would be 44 if it wrapped as a byte; clamped it is 100, a step of 1.
    ASSERT_EQ(jpegWrite(dir.file("high.jpg").c_str(), image.get(), 300), 0);
    EXPECT_EQ(decode(dir.file("high.jpg")).firstLuminanceStep, 1u);
    // Baseline tables: the coarsest step stays within one byte.
    ASSERT_EQ(jpegWrite(dir.file("low.jpg").c_str(), image.get(), -20), 0);
    EXPECT_EQ(decode(dir.file("low.jpg")).firstLuminanceStep, 255u);
}

TEST(JpegWriter, LibraryErrorLeavesNoFileBehind) {
    TempDir dir;
    const ImagePtr image = eightBitImage(4, 4, kPixelRgb, 3);
    // A comment marker holds at most 65533 bytes.
    ASSERT_EQ(imageSetMetadata(image.get(), "Huge", std::string(70000, 'x').c_str()), 0);
    EXPECT_EQ(jpegWrite(dir.file("huge.jpg").c_str(), image.get(), 90), -2);
    EXPECT_FALSE(testing_support::fileExists(dir.file("huge.jpg")));
}

TEST(JpegWriter, ReportsOpenAndWriteFailures) {
    TempDir dir;
    const ImagePtr image = eightBitImage(4, 4, kPixelMono, 1);
    EXPECT_EQ(jpegWrite(dir.file("none/a.jpg").c_str(), image.get(), 90), -1);
    EXPECT_EQ(jpegWrite("/dev/full", image.get(), 90), -2);
}

TEST(JpegWriter, RefusesImagesWithoutEightBitSamples) {
    TempDir dir;
    int result = 0;
    const ImagePtr wide(
        imageCreate(4, 4, 16, 1, 1, 0, 0, kPixelMono, kBufferInterleaved, kDataUint16, &result));
    EXPECT_EQ(jpegWrite(dir.file("a.jpg").c_str(), wide.get(), 90), -6);
    EXPECT_EQ(jpegWrite(dir.file("a.jpg").c_str(), nullptr, 90), -5);
}

} // namespace
} // namespace img
