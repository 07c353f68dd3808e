#include <gtest/gtest.h>

#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "image/raw_writer.h"
#include "raw_test_files.h"
#include "tests/support/flat_field.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::KqRawBuilder;
using testing_support::readFile;
using testing_support::TempDir;

ImagePtr rawImage(std::int32_t w, std::int32_t h, std::uint16_t bits,
                  const std::vector<std::uint16_t>& samples) {
    int rc = 0;
    ImagePtr image(
        imageCreate(w, h, bits, 1, 1, 0, kCfaGbrg, kPixelRaw, kBufferRawCfa, kDataUint16, &rc));
    std::copy(samples.begin(), samples.end(), static_cast<std::uint16_t*>(image->data));
    return image;
}

TEST(RawWriteFixRaw, WritesBareLittleEndianSamples) {
    TempDir dir;
    ImagePtr image = rawImage(2, 1, 8, {0x0102, 0x00FF}); // white 256 is enough for FIXRAW
    EXPECT_EQ(rawWrite(dir.file("a.raw").c_str(), image.get(), kFileFixRaw), 0);
    EXPECT_EQ(readFile(dir.file("a.raw")), std::string("\x02\x01\xFF\x00", 4));
}

TEST(RawWriteKqRaw, FreshHeaderGetsGeometryVersionRevisionAndCode) {
    TempDir dir;
    ImagePtr image = rawImage(2, 1, 10, {7, 1023});
    ASSERT_EQ(rawWrite(dir.file("a.kqraw").c_str(), image.get(), kFileKqRaw), 0);
    const std::string bytes = readFile(dir.file("a.kqraw"));
    ASSERT_EQ(bytes.size(), 298672u + 4);
    EXPECT_EQ(rawtest::getU32(bytes, 0), 1u);
    EXPECT_EQ(rawtest::getU32(bytes, 4), 1u);
    EXPECT_EQ(rawtest::getU32(bytes, 8), 2u);
    EXPECT_EQ(rawtest::getU32(bytes, 12), 1u);
    EXPECT_EQ(rawtest::getU32(bytes, 16), 0x47425247u); // GBRG
    EXPECT_EQ(rawtest::getU32(bytes, 104), 0xDEADBEEFu);
    EXPECT_EQ(rawtest::getU32(bytes, 298668), 0xCAFEFEEDu);
    EXPECT_EQ(bytes.substr(298672), rawtest::samplesLE({7, 1023}));
}

TEST(RawWriteKqRaw, FixedHeaderInputIsStoredBackUnchanged) {
    std::string input = rawtest::fixedHeaderFile(3, 1, {1, 2, 3000});
    for (std::size_t at = 108; at < 16492; at += 997)
        input[at] = static_cast<char>(at); // unnamed fields travel unchanged
    int rc = 0;
    ImagePtr image = rawtest::readBytes(input, &rc);
    ASSERT_TRUE(image);
    TempDir dir;
    ASSERT_EQ(rawWrite(dir.file("b.kqraw").c_str(), image.get(), kFileKqRaw), 0);
    EXPECT_EQ(readFile(dir.file("b.kqraw")), input);
}

TEST(RawWriteKqRaw, KeepsARevisionWhoseExposureIsFixedPoint) {
    std::string input = rawtest::fixedHeaderFile(1, 1, {1}, 3);
    rawtest::putU32(input, 32, 20 * 65536);
    int rc = 0;
    ImagePtr image = rawtest::readBytes(input, &rc);
    ASSERT_TRUE(image);
    TempDir dir;
    ASSERT_EQ(rawWrite(dir.file("c.kqraw").c_str(), image.get(), kFileKqRaw), 0);
    EXPECT_EQ(rawtest::getU32(readFile(dir.file("c.kqraw")), 4), 3u);
}

TEST(RawWriteKqRaw, TranslatesNkrawCaptureData) {
    int rc = 0;
    ImagePtr image = rawtest::readBytes(rawtest::nkrawFile(2, 1, {1, 1500}), &rc);
    ASSERT_TRUE(image);
    TempDir dir;
    ASSERT_EQ(rawWrite(dir.file("n.kqraw").c_str(), image.get(), kFileKqRaw), 0);
    const std::string bytes = readFile(dir.file("n.kqraw"));
    EXPECT_EQ(rawtest::getU32(bytes, 32), (33000u * 65536 + 500000) / 1000000);
    EXPECT_EQ(rawtest::getU32(bytes, 40), (12u - 8) * 16384);
    for (int c = 0; c < 4; ++c)
        EXPECT_EQ(rawtest::getFloat(bytes, 68 + 4 * c), 1.5f);
    EXPECT_EQ(rawtest::getU32(bytes, 16), 0x47524247u);
}

TEST(RawWriteKqRaw2, ContainerInputIsStoredAsContainerWithItsBlocks) {
    const std::string reserved = "0123456789abcdef";
    const std::string input = KqRawBuilder()
                                  .header(2, 1, 0x52474742)
                                  .pixels({3, 2000})
                                  .block(std::string("M3DATA____111107", 16), "m3", 2, reserved)
                                  .sensorInfo("", "SN", "")
                                  .bytes();
    int rc = 0;
    ImagePtr image = rawtest::readBytes(input, &rc);
    ASSERT_TRUE(image);
    static_cast<std::uint16_t*>(image->data)[0] = 99;
    TempDir dir;
    ASSERT_EQ(rawWrite(dir.file("d.kqraw").c_str(), image.get(), kFileKqRaw2), 0);
    const std::string out = readFile(dir.file("d.kqraw"));
    ASSERT_EQ(out.size(), input.size());
    EXPECT_EQ(rawtest::getU32(out, 36 + 12), 11u); // bits of the image
    EXPECT_EQ(out.substr(72, 16), "PIXELDATA_111107");
    EXPECT_EQ(out.substr(72 + 44, 4), rawtest::samplesLE({99, 2000}));
    EXPECT_EQ(out.substr(72 + 48), input.substr(72 + 48)); // later blocks byte for byte
    // The image's own container is left as it was.
    const auto* c = static_cast<const KqRawContainer*>(image->rawHeader);
    std::uint32_t bits = 0;
    kqrawBlockGet32(c->blocks[c->headerIndex], img::kqhdr::kBitsPerSample, &bits);
    EXPECT_EQ(bits, 10u);
}

TEST(RawWriteKqRaw2, ImageWithoutContainerGetsHeaderAndPixelBlocks) {
    ImagePtr image = rawImage(1, 2, 12, {4095, 0});
    TempDir dir;
    ASSERT_EQ(rawWrite(dir.file("e.kqraw").c_str(), image.get(), kFileKqRaw2), 0);
    const std::string out = readFile(dir.file("e.kqraw"));
    ASSERT_EQ(out.size(), 72u + 44 + 4);
    EXPECT_EQ(out.substr(0, 16), "KQRAWFILE_111107");
    EXPECT_EQ(rawtest::getU32(out, 32), 36u);
    EXPECT_EQ(rawtest::getU32(out, 36), 1u);
    EXPECT_EQ(rawtest::getU32(out, 40), 2u);
    EXPECT_EQ(rawtest::getU32(out, 44), 0x47425247u); // GBRG
    EXPECT_EQ(rawtest::getU32(out, 72 + 32), 12u);    // pixel block size
    EXPECT_EQ(rawtest::getU32(out, 72 + 36), 1u);
    EXPECT_EQ(rawtest::getU32(out, 72 + 40), 0u);
}

TEST(RawWritePreconditions, EachRefusalHasItsCode) {
    TempDir dir;
    const std::string path = dir.file("x");
    ImagePtr eightBit = rawImage(1, 1, 8, {1});
    EXPECT_EQ(rawWrite(path.c_str(), eightBit.get(), kFileKqRaw2), -6);
    EXPECT_EQ(rawWrite(path.c_str(), eightBit.get(), kFileKqRaw), -6);
    ImagePtr image = rawImage(1, 1, 10, {1});
    EXPECT_EQ(rawWrite(path.c_str(), image.get(), kFileNkRaw), -4);
    EXPECT_EQ(rawWrite(path.c_str(), nullptr, kFileKqRaw2), -5);
    image->level[3].blackVal = 1.0f;
    EXPECT_EQ(rawWrite(path.c_str(), image.get(), kFileFixRaw), -6);
    image->level[3].blackVal = 0.0f;
    image->clip[1].maxClip = 512.0f;
    EXPECT_EQ(rawWrite(path.c_str(), image.get(), kFileFixRaw), -6);
    image->clip[1].maxClip = 1024.0f;
    EXPECT_EQ(rawWrite("/nonexistent/dir/x", image.get(), kFileKqRaw2), -1);
    EXPECT_EQ(rawWrite("/dev/full", image.get(), kFileKqRaw), -2);
    EXPECT_FALSE(testing_support::fileExists(path));
    std::free(image->data);
    image->data = nullptr;
    EXPECT_EQ(rawWrite(path.c_str(), image.get(), kFileKqRaw2), -5);
}

} // namespace
} // namespace img
