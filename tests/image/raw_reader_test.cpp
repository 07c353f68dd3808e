#include <gtest/gtest.h>

#include "image/byte_source.h"
#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "image/kqraw_fixed_header.h"
#include "image/raw_prompt.h"
#include "image/raw_reader.h"
#include "raw_test_files.h"
#include "tests/support/flat_field.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using rawtest::readBytes;
using testing_support::KqRawBuilder;

std::string container(std::uint32_t w, std::uint32_t h, const std::vector<std::uint16_t>& s) {
    return KqRawBuilder().header(w, h, 0x47524247).pixels(s).bytes();
}

// --- fixed-header files --------------------------------------------------

TEST(RawReadFixedHeader, ReadsPixelsCfaAndCarriesTheHeader) {
    int rc = 1;
    ImagePtr image = readBytes(rawtest::fixedHeaderFile(3, 2, {0, 1, 2, 3, 4, 700}), &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(rc, 0);
    EXPECT_EQ(image->width, 3);
    EXPECT_EQ(image->height, 2);
    EXPECT_EQ(image->cfa[1], kCfaRggb);
    EXPECT_EQ(image->pixelType, kPixelRaw);
    EXPECT_EQ(image->bufferType, kBufferRawCfa);
    EXPECT_EQ(image->dataType, kDataUint16);
    EXPECT_EQ(image->fileType, kFileKqRaw);
    EXPECT_EQ(rawtest::samplesOf(image.get()), (std::vector<std::uint16_t>{0, 1, 2, 3, 4, 700}));
    ASSERT_NE(image->rawHeader, nullptr);
    EXPECT_EQ(kqrawFixedGet32(static_cast<const KqRawFixedHeader*>(image->rawHeader), 104),
              0xDEADBEEFu);
}

TEST(RawReadFixedHeader, TwoBytesTooLongReadsWithTheWarning) {
    int rc = 1;
    testing::internal::CaptureStderr();
    ImagePtr image = readBytes(rawtest::fixedHeaderFile(2, 1, {5, 6}) + "xx", &rc);
    const std::string warning = testing::internal::GetCapturedStderr();
    ASSERT_TRUE(image);
    EXPECT_EQ(rawtest::samplesOf(image.get()), (std::vector<std::uint16_t>{5, 6}));
    EXPECT_EQ(warning, "WARNING: File 'test.raw' is too big for KQRAW.  Ignore extra data\n");
}

TEST(RawReadFixedHeader, TwoBytesTooShortEndsTheReadWithMinus21) {
    std::string bytes = rawtest::fixedHeaderFile(2, 1, {5, 6});
    bytes.resize(bytes.size() - 2);
    int rc = 0;
    EXPECT_FALSE(readBytes(bytes, &rc));
    EXPECT_EQ(rc, -21);
}

TEST(RawReadFixedHeader, AbsurdDimensionsAreRefusedWithoutAllocating) {
    int rc = 0;
    EXPECT_FALSE(readBytes(rawtest::fixedHeaderFile(0xFFFFFFF0u, 0xFFFFFFF0u, {1}), &rc));
    EXPECT_EQ(rc, -21);
    EXPECT_FALSE(readBytes(rawtest::fixedHeaderFile(0, 5, {}), &rc));
    EXPECT_EQ(rc, -21);
}

// --- containers ------------------------------------------------------------

TEST(RawReadContainer, ReadsPixelsAndKeepsTheContainer) {
    int rc = 1;
    ImagePtr image = readBytes(container(2, 2, {1, 2, 3, 4000}), &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(rc, 0);
    EXPECT_EQ(image->cfa[1], kCfaGrbg);
    EXPECT_EQ(image->fileType, kFileKqRaw2);
    EXPECT_EQ(rawtest::samplesOf(image.get()), (std::vector<std::uint16_t>{1, 2, 3, 4000}));
    const auto* c = static_cast<const KqRawContainer*>(image->rawHeader);
    ASSERT_NE(c, nullptr);
    EXPECT_EQ(c->headerIndex, 0);
    EXPECT_EQ(c->pixelIndex, 1);
}

TEST(RawReadContainer, MissingPixelBlockGivesMinus21) {
    int rc = 0;
    EXPECT_FALSE(readBytes(KqRawBuilder().header(2, 2, 0).comment("no pixels").bytes(), &rc));
    EXPECT_EQ(rc, -21);
}

TEST(RawReadContainer, PixelBlockShorterThanTheImageGivesMinus21) {
    int rc = 0;
    EXPECT_FALSE(readBytes(container(2, 2, {1, 2, 3}), &rc));
    EXPECT_EQ(rc, -21);
    EXPECT_FALSE(readBytes(container(0xFFFFFFF0u, 0xFFFFFFF0u, {1, 2, 3}), &rc));
    EXPECT_EQ(rc, -21);
    EXPECT_FALSE(readBytes(container(0, 3, {}), &rc));
    EXPECT_EQ(rc, -21);
}

TEST(RawReadContainer, TruncatedContainerGivesMinus21RatherThanAPrompt) {
    std::string bytes = container(2, 2, {1, 2, 3, 4});
    bytes.resize(bytes.size() - 3);
    int rc = 0;
    EXPECT_FALSE(readBytes(bytes, &rc));
    EXPECT_EQ(rc, -21);
}

// --- bit depth from the largest sample --------------------------------------

struct DepthCase {
    std::uint16_t largest;
    std::uint16_t bits;
};

class RawReadDepth : public testing::TestWithParam<DepthCase> {};

TEST_P(RawReadDepth, ComesFromTheLargestSampleWithTenAsTheFloor) {
    const DepthCase c = GetParam();
    int rc = 0;
    for (const std::string& bytes :
         {container(2, 1, {3, c.largest}), rawtest::fixedHeaderFile(2, 1, {c.largest, 3})}) {
        ImagePtr image = readBytes(bytes, &rc);
        ASSERT_TRUE(image);
        EXPECT_EQ(image->bitsPerSample, c.bits);
        const float white = static_cast<float>(1u << c.bits);
        for (int ch = 0; ch < 4; ++ch) {
            EXPECT_EQ(image->level[ch].whiteVal, white);
            EXPECT_EQ(image->clip[ch].maxClip, white);
            EXPECT_EQ(image->level[ch].blackVal, 0.0f);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Samples, RawReadDepth,
                         testing::Values(DepthCase{0, 10}, DepthCase{700, 10}, DepthCase{1023, 10},
                                         DepthCase{1024, 11}, DepthCase{4000, 12},
                                         DepthCase{65535, 16}));

// --- NKRAW -------------------------------------------------------------------

TEST(RawReadNkraw, RecognisedByItsMagicAndCarriesItsHeader) {
    int rc = 1;
    ImagePtr image = readBytes(rawtest::nkrawFile(2, 2, {1, 2, 3, 2000}), &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(rc, 0);
    EXPECT_EQ(image->fileType, kFileNkRaw);
    EXPECT_EQ(image->cfa[1], kCfaGrbg);
    EXPECT_EQ(image->bitsPerSample, 11);
    EXPECT_EQ(rawtest::samplesOf(image.get()), (std::vector<std::uint16_t>{1, 2, 3, 2000}));
    EXPECT_EQ(std::memcmp(image->rawHeader, "NKRAWHDR", 8), 0);
}

TEST(RawReadNkraw, WrongSizeGivesMinus22) {
    int rc = 0;
    EXPECT_FALSE(readBytes(rawtest::nkrawFile(2, 2, {1, 2, 3}), &rc));
    EXPECT_EQ(rc, -22);
    EXPECT_FALSE(readBytes(rawtest::nkrawFile(2, 2, {1, 2, 3, 4, 5}), &rc));
    EXPECT_EQ(rc, -22);
}

TEST(RawRead, NoKnownTypeWithoutAConsoleGivesMinus4) {
    int rc = 0;
    EXPECT_FALSE(readBytes("just some bytes", &rc));
    EXPECT_EQ(rc, -4);
    EXPECT_FALSE(readBytes("", &rc));
    EXPECT_EQ(rc, -4);
}

TEST(RawRead, MissingFileGivesMinus1) {
    int rc = 0;
    EXPECT_EQ(rawRead("/nonexistent/dir/file.raw", &rc), nullptr);
    EXPECT_EQ(rc, -1);
}

TEST(RawRead, ReadsAFileFromDisk) {
    testing_support::TempDir dir;
    testing_support::writeFile(dir.file("in.kqraw"), container(2, 1, {8, 9}));
    int rc = 1;
    ImagePtr image(rawRead(dir.file("in.kqraw").c_str(), &rc));
    ASSERT_TRUE(image);
    EXPECT_EQ(rawtest::samplesOf(image.get()), (std::vector<std::uint16_t>{8, 9}));
}

// --- layout given on the console ------------------------------------------

img::RawLayout layout(std::uint32_t w, std::uint32_t h, std::uint32_t bits,
                      std::uint64_t header = 0, std::uint32_t images = 1, bool little = true) {
    img::RawLayout l;
    l.width = w;
    l.height = h;
    l.bitDepth = bits;
    l.cfa = kCfaBggr;
    l.littleEndian = little;
    l.images = images;
    l.headerSize = header;
    return l;
}

ImagePtr readWith(const std::string& bytes, const img::RawLayout& l, int* rc) {
    img::MemorySource source(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    ImageBuffer* image = nullptr;
    *rc = img::readWithLayout(source, l, &image);
    return ImagePtr(image);
}

TEST(RawReadLayout, SixteenBitSamplesInEitherByteOrderBehindAHeader) {
    int rc = 1;
    ImagePtr image = readWith("HDR\x01\x02\x03\x04", layout(2, 1, 12, 3, 1, true), &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(rc, 0);
    EXPECT_EQ(rawtest::samplesOf(image.get()), (std::vector<std::uint16_t>{0x0201, 0x0403}));
    EXPECT_EQ(image->bitsPerSample, 12);
    EXPECT_EQ(image->cfa[1], kCfaBggr);
    EXPECT_EQ(image->fileType, kFileFixRaw);
    image = readWith("HDR\x01\x02\x03\x04", layout(2, 1, 12, 3, 1, false), &rc);
    ASSERT_TRUE(image);
    EXPECT_EQ(rawtest::samplesOf(image.get()), (std::vector<std::uint16_t>{0x0102, 0x0304}));
}

TEST(RawReadLayout, PixelSizeFollowsFromTheFileSize) {
    int rc = 0;
    ImagePtr mono8 = readWith("abcd", layout(2, 2, 8), &rc);
    ASSERT_TRUE(mono8);
    EXPECT_EQ(mono8->dataType, kDataUint8);
    EXPECT_EQ(mono8->pixelType, kPixelRaw);
    ImagePtr rgb8 = readWith(std::string(12, 'x'), layout(2, 2, 8), &rc);
    ASSERT_TRUE(rgb8);
    EXPECT_EQ(rgb8->pixelType, kPixelRgb);
    EXPECT_EQ(rgb8->samplesPerPixel, 3);
    ImagePtr rgb16 = readWith(std::string(24, 'x'), layout(2, 1, 16, 0, 2), &rc);
    ASSERT_TRUE(rgb16);
    EXPECT_EQ(rgb16->dataType, kDataUint16);
    EXPECT_EQ(rgb16->numberOfImages, 2u);
}

TEST(RawReadLayout, MismatchesGiveMinus23) {
    int rc = 0;
    EXPECT_FALSE(readWith(std::string(5, 'x'), layout(2, 2, 8), &rc));
    EXPECT_EQ(rc, -23);
    EXPECT_FALSE(readWith(std::string(4, 'x'), layout(2, 2, 10), &rc)); // 10 bits in a byte
    EXPECT_EQ(rc, -23);
    EXPECT_FALSE(readWith(std::string(4, 'x'), layout(2, 2, 8, 9), &rc)); // header too big
    EXPECT_EQ(rc, -23);
    EXPECT_FALSE(readWith(std::string(4, 'x'), layout(0, 2, 8), &rc));
    EXPECT_EQ(rc, -23);
    EXPECT_FALSE(
        readWith(std::string(4, 'x'), layout(0xFFFFFFFFu, 0xFFFFFFFFu, 8, 0, 0xFFFFFFFFu), &rc));
    EXPECT_EQ(rc, -23);
}

int fixedAnswer(void* context, img::RawLayout* l) {
    *l = *static_cast<const img::RawLayout*>(context);
    return 0;
}

int noAnswer(void*, img::RawLayout*) {
    return img::kIoError;
}

TEST(RawReadLayout, ConsoleIsAskedOnlyAfterEveryKnownType) {
    const std::string bytes("\x10\x00\x20\x00", 4);
    img::RawLayout answer = layout(1, 2, 8);
    img::MemorySource source(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    int rc = 1;
    ImagePtr image(img::rawReadSource(source, fixedAnswer, &answer, &rc));
    ASSERT_TRUE(image);
    EXPECT_EQ(image->height, 2);
    EXPECT_EQ(image->dataType, kDataUint16);
    img::MemorySource again(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    EXPECT_FALSE(img::rawReadSource(again, noAnswer, nullptr, &rc));
    EXPECT_EQ(rc, -2);
}

} // namespace
} // namespace img
