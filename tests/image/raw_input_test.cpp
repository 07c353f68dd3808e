// Reading raw captures: fixed-header files, containers, NKRAW files and
// headerless files of a layout given on the console.

#include <algorithm>
#include <cstdio>
#include <cstring>

#include <gtest/gtest.h>

#include "image/byte_source.h"
#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "image/kqraw_fixed_header.h"
#include "image/raw_prompt.h"
#include "image/raw_reader.h"
#include "raw_test_files.h"
#include "tests/blob/golden_file.h"
#include "tests/support/temp_dir.h"
#include "tools/flatfield/flat_field.h"

namespace img {
namespace {

using flatfield::KqRawBuilder;
using rawtest::readBytes;
using Samples = std::vector<std::uint16_t>;

std::string container(std::uint32_t w, std::uint32_t h, const Samples& s) {
    return KqRawBuilder().header(w, h, 0x47524247).pixels(s).bytes();
}

std::string cut(std::string bytes, std::size_t count) {
    bytes.resize(bytes.size() - count);
    return bytes;
}

// What a read gives, as one line: the code, then the image's kinds, depth,
// Bayer code and samples (the first eight).
std::string described(int rc, const ImageBuffer* image) {
    std::string text = "rc " + std::to_string(rc);
    if (!image)
        return text + ", no image\n";
    text += std::string(", ") + fileTypeName(image->fileType) + " " +
            pixelTypeName(image->pixelType) + " " + bufferTypeName(image->bufferType) + " " +
            dataTypeName(image->dataType) + " x" + std::to_string(image->samplesPerPixel) + " " +
            std::to_string(image->numberOfImages) + " images " +
            std::to_string(image->bitsPerSample) + " bits " + cfaPatternName(image->cfa[1]) +
            (image->rawHeader ? " header" : "") + ", white/clip/black";
    for (const int ch : {0, 1, 2, 3})
        text += " " + std::to_string(static_cast<int>(image->level[ch].whiteVal)) + "/" +
                std::to_string(static_cast<int>(image->clip[ch].maxClip)) + "/" +
                std::to_string(static_cast<int>(image->level[ch].blackVal));
    text += ":";
    if (image->dataType == kDataUint8 || image->dataType == kDataUint16)
        for (std::uint64_t i = 0; i < std::min<std::uint64_t>(8, imageTotalSamples(image, -1)); ++i)
            text += " " + std::to_string(image->dataType == kDataUint8
                                             ? static_cast<const std::uint8_t*>(image->data)[i]
                                             : static_cast<const std::uint16_t*>(image->data)[i]);
    return text + "\n";
}

// A fixed-header file whose version field is `version` instead of 1.
std::string versioned(std::string file, char version) {
    file[img::kqfix::kVersion] = version;
    return file;
}

TEST(RawRead, EachKindOfFileGivesItsImageOrItsCode) {
    const std::pair<const char*, std::string> cases[] = {
        {"fixed header", rawtest::fixedHeaderFile(3, 2, {0, 1, 2, 3, 4, 700})},
        {"fixed header, 2 bytes short", cut(rawtest::fixedHeaderFile(2, 1, {5, 6}), 2)},
        {"fixed header, huge size", rawtest::fixedHeaderFile(0xFFFFFFF0u, 0xFFFFFFF0u, {1})},
        {"fixed header, no width", rawtest::fixedHeaderFile(0, 5, {})},
        {"container", container(2, 2, {1, 2, 3, 4000})},
        {"container, no pixels", KqRawBuilder().header(2, 2, 0).comment("no pixels").bytes()},
        {"container, 3 of 4 samples", container(2, 2, {1, 2, 3})},
        {"container, huge size", container(0xFFFFFFF0u, 0xFFFFFFF0u, {1, 2, 3})},
        {"container, no width", container(0, 3, {})},
        {"container, cut", cut(container(2, 2, {1, 2, 3, 4}), 3)}, // not a prompt
        {"nkraw", rawtest::nkrawFile(2, 2, {1, 2, 3, 2000})},
        {"nkraw, short", rawtest::nkrawFile(2, 2, {1, 2, 3})},
        {"nkraw, long", rawtest::nkrawFile(2, 2, {1, 2, 3, 4, 5})},
        {"other bytes", "just some bytes"}, // no console to ask
        {"empty", ""},
        {"fixed header, 2 bytes long", rawtest::fixedHeaderFile(2, 1, {5, 6}) + "xx"},
        {"fixed header, version 2", versioned(rawtest::fixedHeaderFile(2, 1, {5, 6}), 2)},
    };
    std::vector<std::pair<std::string, std::string>> files(std::begin(cases), std::end(cases));
    // The depth comes from the largest sample, with ten bits as the floor.
    for (const int largest : {0, 700, 1023, 1024, 4000, 65535}) {
        files.emplace_back("container, largest " + std::to_string(largest),
                           container(2, 1, {3, std::uint16_t(largest)}));
        files.emplace_back("fixed header, largest " + std::to_string(largest),
                           rawtest::fixedHeaderFile(2, 1, {std::uint16_t(largest), 3}));
    }
    std::string text;
    for (const auto& [name, bytes] : files) {
        int rc = 1;
        testing::internal::CaptureStderr();
        const ImagePtr image = readBytes(bytes, &rc);
        text += name + ": " + described(rc, image.get()) + testing::internal::GetCapturedStderr();
    }
    testing_support::expectGolden("image/read/kinds.txt", text);
    int rc = 0;
    ImagePtr fixed = readBytes(rawtest::fixedHeaderFile(1, 1, {1}), &rc);
    EXPECT_EQ(kqrawFixedGet32(static_cast<const KqRawFixedHeader*>(fixed->rawHeader), 104),
              0xDEADBEEFu);
    ImagePtr nkraw = readBytes(rawtest::nkrawFile(1, 1, {1}), &rc);
    EXPECT_EQ(std::memcmp(nkraw->rawHeader, "NKRAWHDR", 8), 0);
    ImagePtr inContainer = readBytes(container(1, 1, {1}), &rc);
    EXPECT_EQ(static_cast<const KqRawContainer*>(inContainer->rawHeader)->pixelIndex, 1);
    EXPECT_EQ(rawRead("/nonexistent/dir/file.raw", &rc), nullptr);
    EXPECT_EQ(rc, -1);
}

RawLayout layout(std::uint32_t w, std::uint32_t h, std::uint32_t bits, std::uint64_t header = 0,
                 std::uint32_t images = 1, bool little = true) {
    RawLayout l;
    l.width = w;
    l.height = h;
    l.bitDepth = bits;
    l.cfa = kCfaBggr;
    l.littleEndian = little;
    l.images = images;
    l.headerSize = header;
    return l;
}

int fixedAnswer(void* context, RawLayout* l) {
    *l = *static_cast<const RawLayout*>(context);
    return 0;
}

int noAnswer(void*, RawLayout*) {
    return kIoError;
}

TEST(RawRead, LayoutFromTheConsoleIsAskedForLastAndMustFitTheFile) {
    const std::pair<std::string, RawLayout> cases[] = {
        {"HDR\x01\x02\x03\x04", layout(2, 1, 12, 3)},
        {"HDR\x01\x02\x03\x04", layout(2, 1, 12, 3, 1, false)},
        {"abcd", layout(2, 2, 8)},
        {std::string(12, 'x'), layout(2, 2, 8)},
        {std::string(24, 'x'), layout(2, 1, 16, 0, 2)},
        {std::string(5, 'x'), layout(2, 2, 8)},
        {std::string(4, 'x'), layout(2, 2, 10)},   // 10 bits in a byte
        {std::string(4, 'x'), layout(2, 2, 8, 9)}, // header larger than the file
        {std::string(4, 'x'), layout(0, 2, 8)},
        {std::string(4, 'x'), layout(0xFFFFFFFFu, 0xFFFFFFFFu, 8, 0, 0xFFFFFFFFu)},
    };
    std::string text;
    for (const auto& [bytes, l] : cases) {
        MemorySource source(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
        int rc = 1;
        ImagePtr image(rawReadSource(source, fixedAnswer, const_cast<RawLayout*>(&l), &rc));
        text += std::to_string(bytes.size()) + " bytes as " + std::to_string(l.width) + "x" +
                std::to_string(l.height) + " " + std::to_string(l.bitDepth) + " bits, " +
                std::to_string(l.images) + " images, header " + std::to_string(l.headerSize) +
                (l.littleEndian ? "" : ", big-endian") + ": " + described(rc, image.get());
    }
    testing_support::expectGolden("image/read/console_layouts.txt", text);
    const std::string bytes("\x10\x00\x20\x00", 4);
    MemorySource source(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    int rc = 0;
    EXPECT_FALSE(rawReadSource(source, noAnswer, nullptr, &rc));
    EXPECT_EQ(rc, -2);
}

struct ContainerRelease {
    void operator()(KqRawContainer* c) const noexcept { kqrawContainerRelease(c); }
};
using ContainerPtr = std::unique_ptr<KqRawContainer, ContainerRelease>;

ContainerPtr parse(const std::string& bytes, int* rc) {
    MemorySource source(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size(),
                        "test.kqraw");
    return ContainerPtr(kqrawContainerParse(source, rc));
}

KqRawBuilder minimal() {
    return std::move(KqRawBuilder().header(2, 2, 0x52474742).pixels({1, 2, 3, 4}));
}

TEST(KqRawContainer, RefusesWhatItCannotHoldBeforeAllocating) {
    std::string earlyMarker = rawtest::fixedHeaderFile(1000, 1000, {}, 1);
    rawtest::putU32(earlyMarker, 298668, 0);
    rawtest::putU32(earlyMarker, 200, 0xCAFEFEED); // pixels would follow at 204
    std::string revision5 = earlyMarker;
    rawtest::putU32(revision5, 4, 5); // not a fixed-header file at all
    const std::pair<std::string, int> cases[] = {
        {KqRawBuilder().pixels({1}).header(1, 1, 0).bytes(), -4},
        {KqRawBuilder().block(kqtag::kFileHeader, std::string(36, '\0'), 40).bytes(), -4},
        {minimal().block("OPAQUE__________", "abc", 0xFFFFFFF0u).bytes(), -21},
        {cut(minimal().bytes(), 1), -21},
        {KqRawBuilder().header(1, 1, 0).block(kqtag::kPixels, "1234567").bytes(), -21},
        {KqRawBuilder().header(1, 1, 0).block(kqtag::kPixels, std::string(11, '\0')).bytes(), -21},
        {earlyMarker, -21},
        {revision5, -4}};
    for (const auto& [bytes, expected] : cases) {
        int rc = 0;
        EXPECT_FALSE(parse(bytes, &rc));
        EXPECT_EQ(rc, expected) << bytes.substr(0, 16);
    }
}

// A parsed container as text, one line a block: tag, form, payload size, then
// the samples, the strings and the size of the tail behind them, or the
// payload bytes in hex (the header's creation time as dots); the warnings follow.
std::string describe(const std::string& bytes) {
    int rc = 1;
    testing::internal::CaptureStderr();
    ContainerPtr c = parse(bytes, &rc);
    const std::string warnings = testing::internal::GetCapturedStderr();
    if (!c)
        return "refused with " + std::to_string(rc) + "\n" + warnings;
    std::string text = "header " + std::to_string(c->headerIndex) + ", pixels " +
                       std::to_string(c->pixelIndex) + "\n";
    for (int i = 0; i < c->count; ++i) {
        const KqRawBlock* b = c->blocks[i];
        text += std::string(reinterpret_cast<const char*>(b->tag), 16) + " form " +
                std::to_string(static_cast<int>(b->form)) + " size " + std::to_string(b->size);
        for (std::uint64_t n = 0; n < b->sampleCount && b->form == KqRawForm::kPixels; ++n)
            text += " " + std::to_string(b->samples[n]);
        const int strings = b->form == KqRawForm::kSensorInfo ? 3 : b->form == KqRawForm::kText;
        if (b->form == KqRawForm::kSensorInfo)
            text += " info " + std::to_string(b->infoWord);
        for (int k = 0; k < strings; ++k)
            text += " '" + std::string(b->strings[k].text) + "'";
        if (strings)
            text += " tail " + std::to_string(b->tailSize);
        for (std::uint32_t n = 0; n < b->size && b->form == KqRawForm::kOpaque; ++n) {
            char hex[4];
            const bool stamp =
                i == c->headerIndex && n >= kqhdr::kSeconds && n < kqhdr::kSeconds + 8;
            std::snprintf(hex, sizeof hex, stamp ? "%s.." : "%s%02x", n % 4 ? "" : " ",
                          b->payload[n]);
            text += hex;
        }
        text += "\n";
    }
    return text + warnings;
}

TEST(KqRawContainer, ParsedBlocksAreGoldenFiles) {
    const float gains[4] = {1.0f, 2.0f, 3.0f, 4.0f};
    KqRawBuilder many = KqRawBuilder().header(1, 1, 0);
    for (int i = 0; i < 120; ++i)
        many.comment("note " + std::to_string(i));
    many.pixels({9}); // room is kept for the pixels after the hundredth block
    std::string earlyMarker = rawtest::fixedHeaderFile(2, 1, {}, 1);
    rawtest::putU32(earlyMarker, 298668, 0);       // not at the end...
    rawtest::putU32(earlyMarker, 200, 0xCAFEFEED); // ...but here: pixels follow at 204
    const std::pair<std::size_t, std::uint32_t> fields[] = {
        {32, 33 * 65536}, {36, 0x11223344}, {40, 65536 / 2}, {48, 0x55667788}, {76, 0x40200000}};
    for (const auto& [at, value] : fields)
        rawtest::putU32(earlyMarker, at, value);
    earlyMarker.replace(204, 4, rawtest::samplesLE({700, 13}));
    const std::pair<const char*, std::string> cases[] = {
        // A trailing piece shorter than a block header is ignored; a second
        // header block replaces the first in place.
        {"in_order", minimal()
                         .capture(33.0f, gains)
                         .sensorInfo("a", "SN42", "c")
                         .comment("hi")
                         .header(7, 9, 0)
                         .raw("xyz")
                         .bytes()},
        {"hundred_blocks", many.bytes()},
        {"strings_beyond_the_payload",
         minimal()
             .block(kqtag::kSensorInfo,
                    rawtest::u32(1) + rawtest::u32(2) + "ab" + rawtest::u32(50) + "x")
             .block(kqtag::kMakerNote, rawtest::u32(3) + "abc" + "PAD")
             .bytes()},
        {"fixed_header_marker_early", earlyMarker},
    };
    for (const auto& [name, bytes] : cases)
        testing_support::expectGolden(std::string("image/container/") + name + ".txt",
                                      describe(bytes));
    int rc = 0;
    ContainerPtr c = parse(minimal().comment("hi").bytes(), &rc);
    EXPECT_EQ(kqrawContainerFind(c.get(), kqtag::kComment), 2);
    EXPECT_EQ(kqrawContainerFind(c.get(), kqtag::kMakerNote), -1);
    EXPECT_EQ(kqrawContainerFindLast(c.get(), kqtag::kFileHeader), 0); // the first block counts
}

TEST(KqRawContainer, ApiKeepsHeaderPixelsSizesAndTheBlockLimit) {
    ContainerPtr c(kqrawContainerCreate());
    testing_support::TempDir dir;
    EXPECT_FALSE(kqrawContainerWrite(c.get(), dir.file("a").c_str())); // no header
    KqRawBlock* header = kqrawBlockCreateHeader();
    EXPECT_FALSE(kqrawContainerAdd(c.get(), header));
    EXPECT_FALSE(kqrawContainerSetPixels(c.get(), header));
    EXPECT_TRUE(kqrawContainerSetHeader(c.get(), header));
    EXPECT_FALSE(kqrawContainerWrite(c.get(), dir.file("a").c_str())); // no pixels
    EXPECT_FALSE(testing_support::fileExists(dir.file("a")));
    EXPECT_EQ(kqrawContainerRead(dir.file("missing").c_str()), nullptr);
    for (int i = 1; i < kKqRawMaxBlocks; ++i)
        ASSERT_TRUE(kqrawContainerAdd(c.get(), kqrawBlockCreateComment("c")));
    KqRawBlockPtr extra(kqrawBlockCreateComment("too many"));
    EXPECT_FALSE(kqrawContainerAdd(c.get(), extra.get()));
    EXPECT_EQ(kqrawContainerFindLast(c.get(), kqtag::kComment), kKqRawMaxBlocks - 1);

    KqRawBlockPtr info(kqrawBlockCreateSensorInfo());
    EXPECT_EQ(info->size, 4u + 3 * 4);
    EXPECT_TRUE(kqrawBlockSetSerialNumber(info.get(), "0123abcd"));
    EXPECT_EQ(info->size, 4u + 3 * 4 + 8);
    EXPECT_TRUE(kqrawBlockSetSerialNumber(info.get(), nullptr));
    EXPECT_STREQ(info->strings[1].text, "");
    EXPECT_EQ(info->size, 4u + 3 * 4);
    KqRawBlockPtr comment(kqrawBlockCreateComment("hello"));
    EXPECT_EQ(comment->size, 9u);
    EXPECT_FALSE(kqrawBlockSetString(comment.get(), 1, "no second string"));
    KqRawBlockPtr capture(kqrawBlockCreateCapture());
    std::uint32_t word = 0;
    EXPECT_TRUE(kqrawBlockGet32(capture.get(), 0, &word));
    EXPECT_EQ(word, 2u);
    EXPECT_FALSE(kqrawBlockGet32(capture.get(), 53, &word));

    // A new header records the system clock, past January 2038 too (64-bit time).
    // std::time may read a coarse clock a tick behind the stamp's: one second of slack.
    const auto before = static_cast<std::int64_t>(std::time(nullptr));
    kqrawHeaderStamp(header);
    std::uint32_t seconds = 0, microseconds = 0;
    ASSERT_TRUE(kqrawBlockGet32(header, kqhdr::kSeconds, &seconds));
    ASSERT_TRUE(kqrawBlockGet32(header, kqhdr::kMicroseconds, &microseconds));
    EXPECT_GE(seconds, before);
    EXPECT_LE(seconds, static_cast<std::int64_t>(std::time(nullptr)) + 1);
    EXPECT_LT(microseconds, 1000000u);
    EXPECT_GE(sizeof(std::time_t), 8u);
}

TEST(KqRawContainer, WritesEveryBlockBackWithReservedBytesAndOrder) {
    const std::string bytes = KqRawBuilder()
                                  .header(2, 1, 0x47425247)
                                  .block("CAMSTATE__120118", "camera state", 12, "reserved-bytes!!")
                                  .pixels({5, 6})
                                  .sensorInfo("first", "serial", "third")
                                  .block("SOMETHINGNEW0001", std::string("\0\1\2", 3))
                                  .comment("")
                                  .bytes();
    int rc = 0;
    ContainerPtr c = parse(bytes, &rc);
    ASSERT_TRUE(c);
    testing_support::TempDir dir;
    ASSERT_TRUE(kqrawContainerWrite(c.get(), dir.file("out.kqraw").c_str()));
    EXPECT_EQ(testing_support::readFile(dir.file("out.kqraw")), bytes);
    ContainerPtr again(kqrawContainerRead(dir.file("out.kqraw").c_str()));
    ASSERT_TRUE(again);
    EXPECT_EQ(again->count, 6);
}

} // namespace
} // namespace img
