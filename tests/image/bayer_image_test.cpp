// The calibration's view of a capture: reading normalised samples and the
// capture details, storing them back in the file's own kind (golden files
// under tests/data/image/bayer/), and the messages of its failures.

#include <functional>
#include <stdexcept>

#include <gtest/gtest.h>

#include "image/bayer_image.h"
#include "raw_test_files.h"
#include "tests/blob/golden_file.h"
#include "tests/support/temp_dir.h"
#include "tools/flatfield/flat_field.h"

namespace img {
namespace {

using flatfield::KqRawBuilder;
using testing_support::readFile;
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
    // The stored file; a container's creation time (bytes 60 to 67) zeroed.
    std::string store(const BayerImage& image) {
        const std::string path = dir_.file("out-" + std::to_string(files_++));
        image.storeKqraw(path);
        std::string bytes = readFile(path);
        if (bytes.compare(0, 9, "KQRAWFILE") == 0)
            bytes.replace(60, 8, 8, '\0');
        return bytes;
    }
    std::vector<std::uint16_t> storedSamples(const BayerImage& image) {
        int rc = 0;
        return rawtest::samplesOf(rawtest::readBytes(store(image), &rc).get());
    }
    testing_support::TempDir dir_;
    int files_ = 0;
};

std::string failure(const std::function<void()>& action) {
    try {
        action();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "(no exception)";
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

TEST_F(BayerImageTest, ReadNormalisesByTheBitDepthAndStoreRoundsAndClamps) {
    BayerImage image = load(tenBitContainer({0, 1023, 512, 0xFC00 | 1}));
    EXPECT_EQ(image.buffer()->dataType, kDataReal32);
    EXPECT_EQ(image.bitsPerSample(), 16); // 0xFC01 is a 16-bit sample
    image.pixels()[0] = 0.5f;
    EXPECT_EQ(storedSamples(image)[0], 32768);
    image = load(tenBitContainer({0, 1023, 512, 700}));
    EXPECT_EQ(image.bitsPerSample(), 10);
    EXPECT_EQ(image.cfa(), kCfaRggb);
    EXPECT_EQ(image.buffer()->fileType, kFileKqRaw2);
    EXPECT_EQ(std::vector<float>(image.pixels(), image.pixels() + 3),
              (std::vector<float>{0.0f, 1.0f, 512.0f / 1023.0f}));
    const float stored[4] = {1.0f, 1.2f, -0.1f, 0.5f}; // 0.5 * 1023 + 0.5 = 512
    std::copy(stored, stored + 4, image.pixels());
    EXPECT_EQ(storedSamples(image), (std::vector<std::uint16_t>{1023, 1023, 0, 512}));
    writeFile(dir_.file("short"), tenBitContainer({1, 2, 3, 4}).substr(0, 100));
    EXPECT_EQ(failure([&] { image.read(dir_.file("short")); }), "Cannot read kqraw image.");
    EXPECT_TRUE(image.empty());
}

TEST_F(BayerImageTest, ContainerIsStoredBackWithItsBlocksAndCaptureDetails) {
    const BayerImage image = load(KqRawBuilder()
                                      .header(2, 2, 0x52474742)
                                      .pixels({10, 20, 30, 1000})
                                      .capture(12.5f, kGains)
                                      .block("CAMSTATE__120118", "state", 5, "RESERVED-BYTES!!")
                                      .sensorInfo("model", "0a1b2c3d4e", "x")
                                      .comment("a comment")
                                      .bytes());
    const std::string out = store(image); // same blocks in the same order, pixels last
    testing_support::expectGolden("image/bayer/container_stored_back.kqraw2", out);
    const BayerImage again = load(out);
    EXPECT_TRUE(again.samePixels(image));
    EXPECT_EQ(again.exposureTime(), 12.5f);
    EXPECT_EQ(again.channelGain(0), 1.25f);
    EXPECT_EQ(again.channelGain(3), 2.5f);
    EXPECT_EQ(again.serialNumber(0), "0a1b2c3d4e");
    EXPECT_EQ(again.serialNumber(4), "0a1b");
    const BayerImage bare = load(KqRawBuilder().header(1, 1, 0).pixels({1}).bytes());
    EXPECT_EQ(bare.exposureTime(), 0.0f); // no capture block
    for (int c = 0; c < 5; ++c)
        EXPECT_EQ(bare.channelGain(c), 0.0f);
    EXPECT_EQ(bare.serialNumber(0), "");
}

TEST_F(BayerImageTest, FixedHeaderFileIsStoredBackAsRead) {
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
    EXPECT_TRUE(store(image) == input);
    std::string fixedPoint = rawtest::fixedHeaderFile(1, 1, {5}, 2); // revision 2 on
    rawtest::putU32(fixedPoint, 32, 3 * 65536 + 32768);
    rawtest::putFloat(fixedPoint, 36, 99.0f);
    EXPECT_EQ(load(fixedPoint).exposureTime(), 3.5f);
}

TEST_F(BayerImageTest, HeaderlessDetailsGoIntoAContainerOrAFixedHeader) {
    BayerImage image;
    image.createFromHeaderless(2, 1, 12, kCfaGbrg, 40.0f, 2.0f, "00ff", "", false);
    image.pixels()[0] = 1.0f;
    image.pixels()[1] = 0.0f;
    EXPECT_EQ(image.exposureTime(), 40.0f);
    EXPECT_EQ(image.channelGain(2), 2.0f);
    EXPECT_EQ(image.serialNumber(0), "00ff");
    testing_support::expectGolden("image/bayer/headerless.kqraw2", store(image));
    EXPECT_EQ(load(store(image)).pixels()[0], 1.0f);
    BayerImage fixed;
    fixed.createFromHeaderless(1, 1, 10, kCfaRggb, 40.0f, 2.0f, "0123456789abcdef0123456789ABCDEF",
                               "0x1122334455667788", true);
    fixed.pixels()[0] = 0.5f; // 512 of 1023
    EXPECT_EQ(fixed.serialNumber(32), "0123456789abcdef0123456789abcdef");
    testing_support::expectGolden("image/bayer/headerless.kqraw", store(fixed));
    fixed.setSensorGuid("abc");
    EXPECT_EQ(rawtest::getU32(store(fixed), 24), 0xABCu);
}

TEST_F(BayerImageTest, CopiesCarryTheCaptureDetails) {
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
    BayerImage target, empty;
    target.createLike(source, 2, 2, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa);
    BayerImage rgb;
    rgb.createLike(source, 2, 2, 3, 0, 0, kPixelRgb, kBufferInterleaved);
    BayerImage badPattern = load(tenBitContainer({1, 2, 3, 4}));
    badPattern.buffer()->cfa[1] = 0x11110000;
    BayerImage eightBit = load(tenBitContainer({1, 2, 3, 4}));
    eightBit.buffer()->bitsPerSample = 8;
    const std::pair<std::function<void()>, const char*> failures[] = {
        {[&] { target.copyMetadata(source); },
         "Cannot copy metadata, image already has file type."},
        {[&] { empty.copyMetadata(source); }, "Cannot copy image metadata."},
        {[&] { copy.copy(empty); }, "Unable to copy image."},
        {[&] { source.storeKqraw("/nonexistent/dir/out.kqraw"); }, "Cannot store kqraw image."},
        {[&] { source.storeBmp("/nonexistent/dir/out.bmp"); }, "Cannot store BMP image."},
        {[&] { source.storeJpeg("/nonexistent/dir/out.jpg", 90); }, "Cannot store jpeg image."},
        {[&] { badPattern.storeJpeg(dir_.file("x.jpg"), 90); },
         "Invalid Bayer pattern in image file."},
        {[&] { rgb.storeBmp(dir_.file("x.bmp")); },
         "Image configuration cannot be stored as a jpeg image."},
        {[&] { eightBit.storeKqraw(dir_.file("y.kqraw")); }, "Cannot store kqraw image."},
        {[&] { source.storeBmp(dir_.file("a.bmp")); }, "(no exception)"},
        {[&] { source.storeJpeg(dir_.file("a.jpg"), 80); }, "(no exception)"},
    };
    for (const auto& [action, message] : failures)
        EXPECT_EQ(failure(action), message);
    EXPECT_EQ(readFile(dir_.file("a.bmp")).substr(0, 2), "BM");
    EXPECT_EQ(readFile(dir_.file("a.jpg")).substr(0, 2), "\xFF\xD8");
}

} // namespace
} // namespace img
