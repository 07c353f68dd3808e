#include <functional>
#include <stdexcept>

#include <gtest/gtest.h>

#include "image/bayer_image.h"
#include "image/kqraw_container.h"
#include "raw_test_files.h"
#include "tests/support/flat_field.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::KqRawBuilder;
using testing_support::readFile;
using testing_support::TempDir;
using testing_support::writeFile;

class BayerImageTest : public testing::Test {
protected:
    BayerImage load(const std::string& bytes) {
        const std::string path = dir_.file("in-" + std::to_string(files_++));
        writeFile(path, bytes);
        BayerImage image;
        image.read(path);
        return image;
    }
    std::string store(const BayerImage& image) {
        const std::string path = dir_.file("out-" + std::to_string(files_++));
        image.storeKqraw(path);
        return readFile(path);
    }
    // The samples of a stored file, as the raw reader finds them.
    static std::vector<std::uint16_t> storedSamples(const std::string& bytes) {
        int rc = 0;
        ImagePtr raw = rawtest::readBytes(bytes, &rc);
        return raw ? rawtest::samplesOf(raw.get()) : std::vector<std::uint16_t>{};
    }
    TempDir dir_;
    int files_ = 0;
};

void expectThrows(const std::function<void()>& action, const std::string& text) {
    try {
        action();
        ADD_FAILURE() << "no exception, expected: " << text;
    } catch (const std::runtime_error& error) {
        EXPECT_EQ(std::string(error.what()), text);
    }
}

const float kGains[4] = {1.25f, 1.0f, 1.0f, 2.5f};

std::string tenBitContainer(const std::vector<std::uint16_t>& samples) {
    return KqRawBuilder()
        .header(2, 2, 0x52474742)
        .pixels(samples)
        .capture(12.5f, kGains)
        .sensorInfo("model", "0a1b2c3d4e", "x")
        .bytes();
}

TEST_F(BayerImageTest, ReadNormalisesByTheBitDepth) {
    BayerImage image = load(tenBitContainer({0, 1023, 512, 0xFC00 | 1}));
    EXPECT_EQ(image.buffer()->dataType, kDataReal32);
    EXPECT_EQ(image.bitsPerSample(), 16); // 0xFC01 is a 16-bit sample
    image = load(tenBitContainer({0, 1023, 512, 700}));
    EXPECT_EQ(image.bitsPerSample(), 10);
    EXPECT_EQ(image.pixels()[0], 0.0f);
    EXPECT_EQ(image.pixels()[1], 1.0f);
    EXPECT_EQ(image.pixels()[2], 512.0f / 1023.0f);
    EXPECT_EQ(image.cfa(), kCfaRggb);
    EXPECT_EQ(image.buffer()->fileType, kFileKqRaw2);
}

TEST_F(BayerImageTest, FailedReadLeavesNoImage) {
    BayerImage image = load(tenBitContainer({1, 2, 3, 4}));
    EXPECT_FALSE(image.empty());
    writeFile(dir_.file("short"), tenBitContainer({1, 2, 3, 4}).substr(0, 100));
    expectThrows([&] { image.read(dir_.file("short")); }, "Cannot read kqraw image.");
    EXPECT_TRUE(image.empty());
}

TEST_F(BayerImageTest, StoreRoundsAndClampsToTheBitDepth) {
    BayerImage image = load(tenBitContainer({0, 1023, 0, 0}));
    float* p = image.pixels();
    p[0] = 1.0f;
    p[1] = 1.2f;
    p[2] = -0.1f;
    p[3] = 0.5f; // 0.5 * 1023 + 0.5 = 512
    EXPECT_EQ(storedSamples(store(image)), (std::vector<std::uint16_t>{1023, 1023, 0, 512}));
}

TEST_F(BayerImageTest, SixteenBitHalfStoresAs32768) {
    BayerImage image = load(tenBitContainer({0, 65535, 0, 0}));
    image.pixels()[0] = 0.5f;
    EXPECT_EQ(storedSamples(store(image))[0], 32768);
}

TEST_F(BayerImageTest, ContainerInputIsStoredBackAsContainerWithItsBlocks) {
    const std::string input =
        KqRawBuilder()
            .header(2, 2, 0x52474742)
            .pixels({10, 20, 30, 1000})
            .capture(12.5f, kGains)
            .block(std::string("CAMSTATE__120118", 16), "state", 5, "RESERVED-BYTES!!")
            .sensorInfo("model", "0a1b2c3d4e", "x")
            .comment("a comment")
            .bytes();
    BayerImage image = load(input);
    const std::string out = store(image);
    // Same blocks in the same order, pixel block now last; pixels equal.
    EXPECT_EQ(storedSamples(out), (std::vector<std::uint16_t>{10, 20, 30, 1000}));
    int rc = 0;
    ImagePtr raw = rawtest::readBytes(out, &rc);
    ASSERT_TRUE(raw);
    const auto* c = static_cast<const KqRawContainer*>(raw->rawHeader);
    ASSERT_EQ(c->count, 6);
    EXPECT_EQ(c->headerIndex, 0);
    EXPECT_TRUE(kqrawBlockHasTag(c->blocks[1], img::kqtag::kCapture));
    EXPECT_TRUE(kqrawBlockHasTag(c->blocks[2], "CAMSTATE__120118"));
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(c->blocks[2]->reserved), 16),
              "RESERVED-BYTES!!");
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(c->blocks[2]->payload), 5), "state");
    EXPECT_TRUE(kqrawBlockHasTag(c->blocks[3], img::kqtag::kSensorInfo));
    EXPECT_STREQ(c->blocks[4]->strings[0].text, "a comment");
    EXPECT_EQ(c->pixelIndex, 5);
    const BayerImage again = load(out);
    EXPECT_TRUE(again.samePixels(image));
    EXPECT_EQ(again.exposureTime(), 12.5f);
    EXPECT_EQ(again.channelGain(0), 1.25f);
    EXPECT_EQ(again.channelGain(3), 2.5f);
    EXPECT_EQ(again.serialNumber(0), "0a1b2c3d4e");
    EXPECT_EQ(again.serialNumber(4), "0a1b");
}

TEST_F(BayerImageTest, FixedHeaderInputIsStoredBackAsFixedHeaderFile) {
    std::string input = rawtest::fixedHeaderFile(2, 2, {5, 6, 7, 800}, 1);
    rawtest::putFloat(input, 36, 8.0f);
    rawtest::putFloat(input, 68 + 4, 1.5f);
    input.replace(88, 4, std::string("\x01\xab\x00\xff", 4));
    const BayerImage image = load(input);
    EXPECT_EQ(image.buffer()->fileType, kFileKqRaw);
    EXPECT_EQ(image.exposureTime(), 8.0f);
    EXPECT_EQ(image.channelGain(1), 1.5f);
    EXPECT_EQ(image.serialNumber(8), "01ab00ff");
    EXPECT_EQ(image.serialNumber(0), "");
    EXPECT_EQ(image.serialNumber(100), "01ab00ff000000000000000000000000");
    EXPECT_EQ(store(image), input);
}

TEST_F(BayerImageTest, FixedPointExposureFromRevisionTwoOn) {
    std::string input = rawtest::fixedHeaderFile(1, 1, {5}, 2);
    rawtest::putU32(input, 32, 3 * 65536 + 32768);
    rawtest::putFloat(input, 36, 99.0f);
    EXPECT_EQ(load(input).exposureTime(), 3.5f);
}

TEST_F(BayerImageTest, ContainerWithoutCaptureBlockReportsZeros) {
    const BayerImage image = load(KqRawBuilder().header(1, 1, 0).pixels({1}).bytes());
    EXPECT_EQ(image.exposureTime(), 0.0f);
    for (int c = 0; c < 4; ++c)
        EXPECT_EQ(image.channelGain(c), 0.0f);
    EXPECT_EQ(image.channelGain(4), 0.0f);
    EXPECT_EQ(image.serialNumber(0), "");
}

TEST_F(BayerImageTest, CopyMetadataIntoAnImageWithAFileTypeFails) {
    const BayerImage source = load(tenBitContainer({1, 2, 3, 4}));
    BayerImage target;
    target.createLike(source, 2, 2, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa);
    expectThrows([&] { target.copyMetadata(source); },
                 "Cannot copy metadata, image already has file type.");
    BayerImage empty;
    expectThrows([&] { empty.copyMetadata(source); }, "Cannot copy image metadata.");
}

TEST_F(BayerImageTest, CreateLikeAndCopyCarryTheCaptureData) {
    const BayerImage source = load(tenBitContainer({1, 2, 3, 4}));
    BayerImage like;
    like.createLike(source, 3, 1, 1, 0, kCfaBggr, kPixelRaw, kBufferRawCfa);
    EXPECT_EQ(like.width(), 3);
    EXPECT_EQ(like.bitsPerSample(), source.bitsPerSample());
    EXPECT_EQ(like.exposureTime(), 12.5f);
    EXPECT_FALSE(like.samePixels(source));
    BayerImage copy;
    copy.copy(source);
    EXPECT_TRUE(copy.samePixels(source));
    EXPECT_EQ(copy.serialNumber(0), "0a1b2c3d4e");
    copy.pixels()[3] = 0.25f;
    EXPECT_FALSE(copy.samePixels(source));
    BayerImage none;
    expectThrows([&] { copy.copy(none); }, "Unable to copy image.");
}

TEST_F(BayerImageTest, HeaderlessDetailsGoIntoAContainer) {
    BayerImage image;
    image.createFromHeaderless(2, 1, 12, kCfaGbrg, 40.0f, 2.0f, "00ff", "", false);
    image.pixels()[0] = 1.0f;
    image.pixels()[1] = 0.0f;
    EXPECT_EQ(image.exposureTime(), 40.0f);
    EXPECT_EQ(image.channelGain(2), 2.0f);
    EXPECT_EQ(image.serialNumber(0), "00ff");
    const std::string out = store(image);
    EXPECT_EQ(rawtest::getU32(out, 36 + 8), 0x47425247u);
    EXPECT_EQ(rawtest::getU32(out, 36 + 12), 12u);
    const BayerImage back = load(out);
    EXPECT_EQ(back.exposureTime(), 40.0f);
    EXPECT_EQ(back.serialNumber(0), "00ff");
    EXPECT_EQ(back.pixels()[0], 1.0f);
}

TEST_F(BayerImageTest, HeaderlessDetailsGoIntoAFixedHeader) {
    BayerImage image;
    image.createFromHeaderless(1, 1, 10, kCfaRggb, 40.0f, 2.0f, "0123456789abcdef0123456789ABCDEF",
                               "0x1122334455667788", true);
    const std::string out = store(image);
    ASSERT_EQ(out.size(), 298672u + 2);
    EXPECT_EQ(rawtest::getFloat(out, 36), 40.0f);
    EXPECT_EQ(rawtest::getFloat(out, 80), 2.0f);
    EXPECT_EQ(rawtest::getU32(out, 24), 0x55667788u);
    EXPECT_EQ(rawtest::getU32(out, 28), 0x11223344u);
    EXPECT_EQ(out.substr(88, 16),
              "\x01\x23\x45\x67\x89\xab\xcd\xef\x01\x23\x45\x67\x89\xab\xcd\xef");
    EXPECT_EQ(image.serialNumber(32), "0123456789abcdef0123456789abcdef");
    image.setSensorGuid("abc");
    EXPECT_EQ(rawtest::getU32(store(image), 24), 0xABCu);
}

TEST_F(BayerImageTest, StoreFailuresCarryTheirMessages) {
    BayerImage image = load(tenBitContainer({1, 2, 3, 4}));
    expectThrows([&] { image.storeKqraw("/nonexistent/dir/out.kqraw"); },
                 "Cannot store kqraw image.");
    expectThrows([&] { image.storeBmp("/nonexistent/dir/out.bmp"); }, "Cannot store BMP image.");
    expectThrows([&] { image.storeJpeg("/nonexistent/dir/out.jpg", 90); },
                 "Cannot store jpeg image.");
    image.buffer()->cfa[1] = 0x11110000;
    expectThrows([&] { image.storeJpeg(dir_.file("x.jpg"), 90); },
                 "Invalid Bayer pattern in image file.");
    BayerImage rgb;
    rgb.createLike(image, 2, 2, 3, 0, 0, kPixelRgb, kBufferInterleaved);
    expectThrows([&] { rgb.storeBmp(dir_.file("x.bmp")); },
                 "Image configuration cannot be stored as a jpeg image.");
    BayerImage eightBit = load(tenBitContainer({1, 2, 3, 4}));
    eightBit.buffer()->bitsPerSample = 8;
    expectThrows([&] { eightBit.storeKqraw(dir_.file("y.kqraw")); }, "Cannot store kqraw image.");
}

TEST_F(BayerImageTest, StoresJpegAndBmp) {
    const BayerImage image = load(tenBitContainer({1, 1000, 500, 4}));
    image.storeBmp(dir_.file("a.bmp"));
    image.storeJpeg(dir_.file("a.jpg"), 80);
    EXPECT_EQ(readFile(dir_.file("a.bmp")).substr(0, 2), "BM");
    EXPECT_EQ(readFile(dir_.file("a.jpg")).substr(0, 2), "\xFF\xD8");
}

} // namespace
} // namespace img
