#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "raw_test_files.h"
#include "tests/support/flat_field.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

using testing_support::KqRawBuilder;
using testing_support::TempDir;

struct ContainerRelease {
    void operator()(KqRawContainer* c) const noexcept { kqrawContainerRelease(c); }
};
using ContainerPtr = std::unique_ptr<KqRawContainer, ContainerRelease>;

const std::string kRggb = rawtest::u32(0x52474742);

ContainerPtr parse(const std::string& bytes, int* rc) {
    img::MemorySource source(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size(),
                             "test.kqraw");
    return ContainerPtr(kqrawContainerParse(source, rc));
}

KqRawBuilder minimal() {
    return std::move(KqRawBuilder().header(2, 2, 0x52474742).pixels({1, 2, 3, 4}));
}

std::string tag(const char* text) {
    return std::string(text, 16);
}

TEST(KqRawContainerParse, ReadsBlocksInOrderWithHeaderAndPixelPositions) {
    const float gains[4] = {1.0f, 2.0f, 3.0f, 4.0f};
    int rc = 1;
    ContainerPtr c = parse(
        minimal().capture(33.0f, gains).sensorInfo("a", "SN42", "c").comment("hi").bytes(), &rc);
    ASSERT_TRUE(c);
    EXPECT_EQ(rc, 0);
    EXPECT_EQ(c->count, 5);
    EXPECT_EQ(c->headerIndex, 0);
    EXPECT_EQ(c->pixelIndex, 1);
    const KqRawBlock* pixels = c->blocks[1];
    ASSERT_EQ(pixels->sampleCount, 4u);
    EXPECT_EQ(pixels->samples[3], 4);
    float exposure = 0;
    EXPECT_TRUE(kqrawBlockGetFloat(c->blocks[2], img::kqcap::kExposureTime, &exposure));
    EXPECT_EQ(exposure, 33.0f);
    const KqRawBlock* info = c->blocks[3];
    ASSERT_EQ(info->form, KqRawForm::kSensorInfo);
    EXPECT_EQ(info->infoWord, 1u);
    EXPECT_STREQ(info->strings[1].text, "SN42");
    EXPECT_STREQ(c->blocks[4]->strings[0].text, "hi");
    EXPECT_EQ(kqrawContainerFind(c.get(), img::kqtag::kComment), 4);
    EXPECT_EQ(kqrawContainerFind(c.get(), img::kqtag::kMakerNote), -1);
}

TEST(KqRawContainerParse, RejectsFirstBlockThatIsNotTheFileHeader) {
    int rc = 0;
    EXPECT_FALSE(parse(KqRawBuilder().pixels({1}).header(1, 1, 0).bytes(), &rc));
    EXPECT_EQ(rc, -4);
}

TEST(KqRawContainerParse, RejectsFirstSizeFieldOtherThan36) {
    int rc = 0;
    const std::string payload(36, '\0');
    EXPECT_FALSE(
        parse(KqRawBuilder().block(tag(img::kqtag::kFileHeader), payload, 40).bytes(), &rc));
    EXPECT_EQ(rc, -4);
}

TEST(KqRawContainerParse, RefusesBlockSizeRunningPastTheEndBeforeAllocating) {
    int rc = 0;
    EXPECT_FALSE(parse(minimal().block(tag("OPAQUE__________"), "abc", 0xFFFFFFF0u).bytes(), &rc));
    EXPECT_EQ(rc, -21);
    std::string cut = minimal().bytes();
    cut.resize(cut.size() - 1); // pixel block one byte short
    EXPECT_FALSE(parse(cut, &rc));
    EXPECT_EQ(rc, -21);
}

TEST(KqRawContainerParse, RefusesPixelBlockWithoutWholeSamples) {
    int rc = 0;
    EXPECT_FALSE(parse(
        KqRawBuilder().header(1, 1, 0).block(tag(img::kqtag::kPixels), "1234567").bytes(), &rc));
    EXPECT_EQ(rc, -21);
    EXPECT_FALSE(parse(KqRawBuilder()
                           .header(1, 1, 0)
                           .block(tag(img::kqtag::kPixels), std::string(11, '\0'))
                           .bytes(),
                       &rc));
    EXPECT_EQ(rc, -21);
}

TEST(KqRawContainerParse, IgnoresATrailingPieceShorterThanABlockHeader) {
    int rc = 1;
    ContainerPtr c = parse(minimal().raw("xyz").bytes(), &rc);
    ASSERT_TRUE(c);
    EXPECT_EQ(c->count, 2);
}

TEST(KqRawContainerParse, SecondHeaderBlockReplacesTheFirstInPlace) {
    int rc = 0;
    ContainerPtr c = parse(minimal().header(7, 9, 0).bytes(), &rc);
    ASSERT_TRUE(c);
    EXPECT_EQ(c->count, 2);
    std::uint32_t width = 0;
    kqrawBlockGet32(c->blocks[c->headerIndex], img::kqhdr::kWidth, &width);
    EXPECT_EQ(width, 7u);
}

TEST(KqRawContainerParse, DropsBlocksBeyondTheHundredthWithAWarning) {
    KqRawBuilder builder = minimal();
    for (int i = 0; i < 99; ++i)
        builder.comment("note " + std::to_string(i));
    int rc = 0;
    testing::internal::CaptureStderr();
    ContainerPtr c = parse(builder.bytes(), &rc);
    const std::string warning = testing::internal::GetCapturedStderr();
    ASSERT_TRUE(c);
    EXPECT_EQ(c->count, 100);
    EXPECT_STREQ(c->blocks[99]->strings[0].text, "note 97");
    EXPECT_EQ(warning, "WARNING: Raw container 'test.kqraw' holds more than 100 blocks; block "
                       "'COMMENT___120131' dropped.\n");
}

TEST(KqRawContainerParse, KeepsRoomForAPixelBlockThatComesAfterManyOthers) {
    KqRawBuilder builder = KqRawBuilder().header(1, 1, 0);
    for (int i = 0; i < 120; ++i)
        builder.comment("x");
    builder.pixels({9});
    int rc = 0;
    testing::internal::CaptureStderr();
    ContainerPtr c = parse(builder.bytes(), &rc);
    testing::internal::GetCapturedStderr();
    ASSERT_TRUE(c);
    EXPECT_EQ(c->count, 100);
    ASSERT_GE(c->pixelIndex, 0);
    EXPECT_EQ(c->blocks[c->pixelIndex]->samples[0], 9);
}

TEST(KqRawContainerParse, StringLengthsBeyondThePayloadKeepTheBlockAsRead) {
    const std::string payload = rawtest::u32(1) + rawtest::u32(2) + "ab" + rawtest::u32(50) + "x";
    int rc = 0;
    testing::internal::CaptureStderr();
    ContainerPtr c = parse(minimal().block(tag(img::kqtag::kSensorInfo), payload).bytes(), &rc);
    const std::string warning = testing::internal::GetCapturedStderr();
    ASSERT_TRUE(c);
    const KqRawBlock* info = c->blocks[2];
    EXPECT_EQ(info->form, KqRawForm::kOpaque);
    ASSERT_EQ(info->size, payload.size());
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(info->payload), info->size), payload);
    EXPECT_EQ(warning, "WARNING: Raw container 'test.kqraw': the strings of block "
                       "'SENSORINFO120131' do not fit its size; block kept as read.\n");
}

TEST(KqRawContainerParse, BytesBehindTheStringsAreCarried) {
    const std::string payload = rawtest::u32(3) + "abc" + "PAD";
    int rc = 0;
    ContainerPtr c = parse(minimal().block(tag(img::kqtag::kMakerNote), payload).bytes(), &rc);
    ASSERT_TRUE(c);
    const KqRawBlock* note = c->blocks[2];
    EXPECT_EQ(note->form, KqRawForm::kText);
    EXPECT_STREQ(note->strings[0].text, "abc");
    EXPECT_EQ(note->tailSize, 3u);
    EXPECT_EQ(note->size, payload.size());
}

TEST(KqRawContainerParse, ConvertsAFixedHeaderFileWhoseMarkerIsEarly) {
    std::string bytes = rawtest::fixedHeaderFile(2, 1, {}, 1);
    rawtest::putU32(bytes, 298668, 0);       // not at the end...
    rawtest::putU32(bytes, 200, 0xCAFEFEED); // ...but here: pixels follow at 204
    rawtest::putU32(bytes, 32, 33 * 65536);
    rawtest::putU32(bytes, 36, 0x11223344);
    rawtest::putU32(bytes, 40, 65536 / 2);
    rawtest::putU32(bytes, 48, 0x55667788);
    rawtest::putFloat(bytes, 68 + 8, 2.5f);
    bytes.replace(204, 4, rawtest::samplesLE({700, 13}));
    int rc = 1;
    ContainerPtr c = parse(bytes, &rc);
    ASSERT_TRUE(c);
    EXPECT_EQ(rc, 0);
    const KqRawBlock* pixels = c->blocks[c->pixelIndex];
    ASSERT_EQ(pixels->sampleCount, 2u);
    EXPECT_EQ(pixels->samples[0], 700);
    EXPECT_EQ(pixels->samples[1], 13);
    const int capture = kqrawContainerFind(c.get(), img::kqtag::kCapture);
    ASSERT_GE(capture, 0);
    float value = 0;
    std::uint32_t word = 0;
    ASSERT_TRUE(kqrawBlockGetFloat(c->blocks[capture], img::kqcap::kExposureTime, &value));
    EXPECT_EQ(value, 33.0f);
    ASSERT_TRUE(kqrawBlockGetFloat(c->blocks[capture], img::kqcap::kSecondValue, &value));
    EXPECT_EQ(value, 0.5f);
    kqrawBlockGet32(c->blocks[capture], img::kqcap::kCarried1, &word);
    EXPECT_EQ(word, 0x11223344u);
    kqrawBlockGet32(c->blocks[capture], img::kqcap::kCarried2, &word);
    EXPECT_EQ(word, 0x55667788u);
    ASSERT_TRUE(kqrawBlockGetFloat(c->blocks[capture], img::kqcap::kGain0 + 8, &value));
    EXPECT_EQ(value, 2.5f);
    kqrawBlockGet32(c->blocks[c->headerIndex], img::kqhdr::kBayerCode, &word);
    EXPECT_EQ(word, 0x52474742u);
}

TEST(KqRawContainerParse, FixedHeaderPixelsBehindTheMarkerAreCheckedAgainstTheSize) {
    std::string bytes = rawtest::fixedHeaderFile(1000, 1000, {}, 1);
    rawtest::putU32(bytes, 298668, 0);
    rawtest::putU32(bytes, 200, 0xCAFEFEED);
    int rc = 0;
    EXPECT_FALSE(parse(bytes, &rc));
    EXPECT_EQ(rc, -21);
    rawtest::putU32(bytes, 4, 5); // revision 5: not a fixed-header file at all
    EXPECT_FALSE(parse(bytes, &rc));
    EXPECT_EQ(rc, -4);
}

TEST(KqRawContainerApi, AddRefusesHeaderAndPixelTagsAndAFullList) {
    ContainerPtr c(kqrawContainerCreate());
    KqRawBlock* header = kqrawBlockCreateHeader();
    EXPECT_FALSE(kqrawContainerAdd(c.get(), header));
    EXPECT_FALSE(kqrawContainerSetPixels(c.get(), header));
    EXPECT_TRUE(kqrawContainerSetHeader(c.get(), header));
    for (int i = 1; i < kKqRawMaxBlocks; ++i)
        ASSERT_TRUE(kqrawContainerAdd(c.get(), kqrawBlockCreateComment("c")));
    KqRawBlock* extra = kqrawBlockCreateComment("too many");
    EXPECT_FALSE(kqrawContainerAdd(c.get(), extra));
    kqrawBlockRelease(extra);
    EXPECT_EQ(kqrawContainerFindLast(c.get(), img::kqtag::kComment), kKqRawMaxBlocks - 1);
}

TEST(KqRawContainerApi, SettersKeepTheSizeFieldInStepWithTheContent) {
    KqRawBlock* info = kqrawBlockCreateSensorInfo();
    EXPECT_EQ(info->size, 4u + 3 * 4);
    EXPECT_TRUE(kqrawBlockSetSerialNumber(info, "0123abcd"));
    EXPECT_EQ(info->size, 4u + 3 * 4 + 8);
    EXPECT_TRUE(kqrawBlockSetSerialNumber(info, nullptr));
    EXPECT_STREQ(info->strings[1].text, "");
    EXPECT_EQ(info->size, 4u + 3 * 4);
    kqrawBlockRelease(info);
    KqRawBlock* comment = kqrawBlockCreateComment("hello");
    EXPECT_EQ(comment->size, 9u);
    EXPECT_FALSE(kqrawBlockSetString(comment, 1, "no second string"));
    kqrawBlockRelease(comment);
    KqRawBlock* capture = kqrawBlockCreateCapture();
    std::uint32_t word = 0;
    EXPECT_TRUE(kqrawBlockGet32(capture, 0, &word));
    EXPECT_EQ(word, 2u);
    EXPECT_FALSE(kqrawBlockGet32(capture, 53, &word));
    kqrawBlockRelease(capture);
}

TEST(KqRawContainerWrite, RoundTripsEveryBlockWithReservedBytesAndOrder) {
    const std::string reserved = "reserved-bytes!!";
    const std::string bytes = KqRawBuilder()
                                  .header(2, 1, 0x47425247)
                                  .block(tag("CAMSTATE__120118"), "camera state", 12, reserved)
                                  .pixels({5, 6})
                                  .sensorInfo("first", "serial", "third")
                                  .block(tag("SOMETHINGNEW0001"), std::string("\0\1\2", 3))
                                  .comment("")
                                  .bytes();
    int rc = 0;
    ContainerPtr c = parse(bytes, &rc);
    ASSERT_TRUE(c);
    TempDir dir;
    ASSERT_TRUE(kqrawContainerWrite(c.get(), dir.file("out.kqraw").c_str()));
    EXPECT_EQ(testing_support::readFile(dir.file("out.kqraw")), bytes);
    ContainerPtr again(kqrawContainerRead(dir.file("out.kqraw").c_str()));
    ASSERT_TRUE(again);
    EXPECT_EQ(again->count, 6);
}

TEST(KqRawContainerWrite, RefusesAContainerWithoutHeaderOrPixels) {
    ContainerPtr c(kqrawContainerCreate());
    TempDir dir;
    EXPECT_FALSE(kqrawContainerWrite(c.get(), dir.file("a").c_str()));
    ASSERT_TRUE(kqrawContainerSetHeader(c.get(), kqrawBlockCreateHeader()));
    EXPECT_FALSE(kqrawContainerWrite(c.get(), dir.file("a").c_str()));
    EXPECT_FALSE(testing_support::fileExists(dir.file("a")));
    EXPECT_EQ(kqrawContainerRead(dir.file("missing").c_str()), nullptr);
}

} // namespace
} // namespace img
