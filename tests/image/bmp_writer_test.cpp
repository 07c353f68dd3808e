#include <cstdint>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "image/bmp_writer.h"
#include "image/image_buffer.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::TempDir;

ImagePtr eightBitImage(std::int32_t width, std::int32_t height, std::uint32_t pixelType,
                       std::uint16_t samples, const std::vector<std::uint8_t>& values) {
    int result = 0;
    ImagePtr image(imageCreate(width, height, 8, samples, 1, 0, 0, pixelType, kBufferInterleaved,
                               kDataUint8, &result));
    EXPECT_EQ(result, 0);
    std::copy(values.begin(), values.end(), static_cast<std::uint8_t*>(image->data));
    return image;
}

std::vector<std::uint8_t> fileBytes(const std::string& path) {
    const std::string text = testing_support::readFile(path);
    return {text.begin(), text.end()};
}

void appendLe(std::vector<std::uint8_t>& bytes, std::uint32_t value, int count) {
    for (int i = 0; i < count; ++i)
        bytes.push_back(static_cast<std::uint8_t>(value >> (8 * i)));
}

std::vector<std::uint8_t> headers(std::uint32_t fileSize, std::uint32_t offset, std::int32_t width,
                                  std::int32_t height, std::uint16_t bits) {
    std::vector<std::uint8_t> bytes = {'B', 'M'};
    appendLe(bytes, fileSize, 4);
    appendLe(bytes, 0, 4);
    appendLe(bytes, offset, 4);
    appendLe(bytes, 40, 4);
    appendLe(bytes, static_cast<std::uint32_t>(width), 4);
    appendLe(bytes, static_cast<std::uint32_t>(height), 4);
    appendLe(bytes, 1, 2);
    appendLe(bytes, bits, 2);
    for (int i = 0; i < 6; ++i)
        appendLe(bytes, 0, 4);
    return bytes;
}

TEST(BmpWriter, WritesRgbAsBottomUpBgrRowsPaddedToFourBytes) {
    TempDir dir;
    // Two rows of three pixels: 9 data bytes and 3 padding bytes a row.
    const ImagePtr image = eightBitImage(
        3, 2, kPixelRgb, 3, {1, 2, 3, 4, 5, 6, 7, 8, 9, 11, 12, 13, 14, 15, 16, 17, 18, 19});
    ASSERT_EQ(bmpWrite(dir.file("rgb.bmp").c_str(), image.get()), 0);

    std::vector<std::uint8_t> expected = headers(54 + 2 * 12, 54, 3, 2, 24);
    const std::vector<std::uint8_t> rows = {13, 12, 11, 16, 15, 14, 19, 18, 17, 0, 0, 0,
                                            3,  2,  1,  6,  5,  4,  9,  8,  7,  0, 0, 0};
    expected.insert(expected.end(), rows.begin(), rows.end());
    EXPECT_EQ(fileBytes(dir.file("rgb.bmp")), expected);
}

TEST(BmpWriter, WritesGreyWithPaletteAndA1078ByteHeader) {
    TempDir dir;
    const ImagePtr image = eightBitImage(2, 2, kPixelMono, 1, {10, 20, 30, 40});
    ASSERT_EQ(bmpWrite(dir.file("grey.bmp").c_str(), image.get()), 0);

    std::vector<std::uint8_t> expected = headers(1078 + 2 * 4, 1078, 2, 2, 8);
    for (int i = 0; i < 256; ++i) {
        const auto grey = static_cast<std::uint8_t>(i);
        expected.insert(expected.end(), {grey, grey, grey, 0});
    }
    ASSERT_EQ(expected.size(), 1078u);
    expected.insert(expected.end(), {30, 40, 0, 0, 10, 20, 0, 0});
    EXPECT_EQ(fileBytes(dir.file("grey.bmp")), expected);
}

TEST(BmpWriter, RowsOfAWidthThatIsAMultipleOfFourHaveNoPadding) {
    TempDir dir;
    const ImagePtr image = eightBitImage(4, 1, kPixelRgb, 3, std::vector<std::uint8_t>(12, 7));
    ASSERT_EQ(bmpWrite(dir.file("four.bmp").c_str(), image.get()), 0);
    EXPECT_EQ(fileBytes(dir.file("four.bmp")).size(), 54u + 12u);
}

TEST(BmpWriter, RefusesImagesItCannotRepresent) {
    TempDir dir;
    int result = 0;
    const ImagePtr wide(
        imageCreate(2, 2, 16, 1, 1, 0, 0, kPixelMono, kBufferInterleaved, kDataUint16, &result));
    EXPECT_EQ(bmpWrite(dir.file("a.bmp").c_str(), wide.get()), -6);
    EXPECT_EQ(bmpWrite(dir.file("a.bmp").c_str(), nullptr), -5);
    EXPECT_FALSE(testing_support::fileExists(dir.file("a.bmp")));
}

TEST(BmpWriter, ReportsAFileThatCannotBeCreated) {
    TempDir dir;
    const ImagePtr image = eightBitImage(1, 1, kPixelMono, 1, {0});
    EXPECT_EQ(bmpWrite(dir.file("missing/dir/a.bmp").c_str(), image.get()), -1);
}

TEST(BmpWriter, ReportsAWriteThatFails) {
    const ImagePtr image = eightBitImage(1, 1, kPixelMono, 1, {0});
    EXPECT_EQ(bmpWrite("/dev/full", image.get()), -2);
}

} // namespace
} // namespace img
