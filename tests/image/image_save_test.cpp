#include <cstdint>
#include <string>

#include <gtest/gtest.h>

#include "image/image_buffer.h"
#include "image/image_save.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::TempDir;

ImagePtr rgbImage() {
    int result = 0;
    ImagePtr image(
        imageCreate(8, 8, 8, 3, 1, 0, 0, kPixelRgb, kBufferInterleaved, kDataUint8, &result));
    EXPECT_EQ(result, 0);
    auto* data = static_cast<std::uint8_t*>(image->data);
    for (int i = 0; i < 8 * 8 * 3; ++i)
        data[i] = static_cast<std::uint8_t>(i * 5);
    return image;
}

ImagePtr sensorImage(std::uint32_t dataType) {
    int result = 0;
    ImagePtr image(
        imageCreate(4, 4, 10, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa, dataType, &result));
    EXPECT_EQ(result, 0);
    return image;
}

std::string saved(const TempDir& dir, const ImageBuffer* image, int format,
                  const int* parameters = nullptr, int count = 0) {
    const std::string path = dir.file("out" + std::to_string(format));
    EXPECT_EQ(imageSave(path.c_str(), image, format, parameters, count), 0);
    return testing_support::readFile(path);
}

TEST(ImageSave, PicksTheWriterByFormatNumber) {
    TempDir dir;
    const ImagePtr image = rgbImage();
    const std::string tiff = saved(dir, image.get(), 6);
    EXPECT_TRUE(tiff.compare(0, 4, std::string("II*\0", 4)) == 0 ||
                tiff.compare(0, 4, std::string("MM\0*", 4)) == 0);
    EXPECT_EQ(saved(dir, image.get(), 7).substr(0, 2), "BM");
    EXPECT_EQ(saved(dir, image.get(), 8).substr(0, 2), "\xFF\xD8");
    EXPECT_EQ(saved(dir, image.get(), 9).substr(0, 3), "P6\n");
}

TEST(ImageSave, JpegQualityIsNinetyWithoutParameters) {
    TempDir dir;
    const ImagePtr image = rgbImage();
    const int ninety[] = {90};
    const int fifty[] = {50};
    const std::string byDefault = saved(dir, image.get(), 8);
    EXPECT_EQ(byDefault, saved(dir, image.get(), 8, ninety, 1));
    EXPECT_EQ(byDefault, saved(dir, image.get(), 8, fifty, 0));
    EXPECT_NE(byDefault, saved(dir, image.get(), 8, fifty, 1));
}

TEST(ImageSave, MissingImageOrSamplesGiveMinusFive) {
    TempDir dir;
    EXPECT_EQ(imageSave(dir.file("a").c_str(), nullptr, 7, nullptr, 0), -5);
    int result = 0;
    const ImagePtr empty(
        imageCreate(4, 4, 8, 3, 1, 0, 0, kPixelRgb, kBufferInterleaved, kDataNone, &result));
    ASSERT_TRUE(empty);
    EXPECT_EQ(imageSave(dir.file("a").c_str(), empty.get(), 6, nullptr, 0), -5);
}

TEST(ImageSave, BmpAndJpegNeedAnEightBitDisplayImage) {
    TempDir dir;
    const ImagePtr sensor = sensorImage(kDataReal32);
    EXPECT_EQ(imageSave(dir.file("a.bmp").c_str(), sensor.get(), 7, nullptr, 0), -6);
    EXPECT_EQ(imageSave(dir.file("a.jpg").c_str(), sensor.get(), 8, nullptr, 0), -6);
    const ImagePtr darkened = rgbImage();
    darkened->level[2].whiteVal = 255.0f;
    EXPECT_EQ(imageSave(dir.file("a.bmp").c_str(), darkened.get(), 7, nullptr, 0), -6);
    EXPECT_EQ(imageSave(dir.file("a.jpg").c_str(), darkened.get(), 8, nullptr, 0), -6);
    EXPECT_FALSE(testing_support::fileExists(dir.file("a.bmp")));
    EXPECT_FALSE(testing_support::fileExists(dir.file("a.jpg")));
}

TEST(ImageSave, TiffAndPnmTakeAnyDepth) {
    TempDir dir;
    const ImagePtr sensor = sensorImage(kDataUint16);
    EXPECT_EQ(imageSave(dir.file("a.tif").c_str(), sensor.get(), 6, nullptr, 0), 0);
    EXPECT_EQ(imageSave(dir.file("a.pgm").c_str(), sensor.get(), 9, nullptr, 0), 0);
}

TEST(ImageSave, RawFormatsGoToTheRawWriter) {
    TempDir dir;
    // The raw writer takes 16-bit sensor samples only; an unknown format would give -4.
    const ImagePtr sensor = sensorImage(kDataReal32);
    for (int format : {2, 3, 4})
        EXPECT_EQ(imageSave(dir.file("a.raw").c_str(), sensor.get(), format, nullptr, 0), -6)
            << "format " << format;
}

TEST(ImageSave, RefusesUnknownFormats) {
    TempDir dir;
    const ImagePtr image = rgbImage();
    for (int format : {-1, 0, 1, 5, 10, 255})
        EXPECT_EQ(imageSave(dir.file("a").c_str(), image.get(), format, nullptr, 0), -4)
            << "format " << format;
    EXPECT_FALSE(testing_support::fileExists(dir.file("a")));
}

} // namespace
} // namespace img
