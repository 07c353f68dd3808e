// Image buffers: creation and its refusals, planes, metadata, names, stream
// scalars, widening samples to floats, demosaicing and large files.

#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <sstream>
#include <string>
#include <tuple>

#include <gtest/gtest.h>

#include "image/byte_source.h"
#include "image/demosaic.h"
#include "image/image_buffer.h"
#include "image/image_result.h"
#include "image/sample_memory.h"
#include "image/sample_scaling.h"
#include "tests/blob/golden_file.h"
#include "tests/support/temp_dir.h"

#include <fcntl.h>
#include <unistd.h>

namespace img {
namespace {

ImagePtr create(std::int32_t w, std::int32_t h, std::uint16_t bits, std::uint16_t spp,
                std::uint32_t pixel, std::uint32_t buffer, std::uint32_t type, int* rc,
                std::uint32_t images = 1, std::uint32_t cfa = kCfaRggb) {
    return ImagePtr(imageCreate(w, h, bits, spp, images, 0, cfa, pixel, buffer, type, rc));
}

// A type by the name its naming function gives it.
std::uint32_t byName(const char* (*name)(std::uint32_t) noexcept, const std::string& wanted) {
    std::uint32_t value = 0;
    while (wanted != name(value) && value < 9)
        ++value;
    return value;
}

TEST(ImageCreate, LevelsCfaAndRefusals) {
    std::string text;
    for (const std::string& row : testing_support::dataRows("image/create_cases.txt")) {
        std::istringstream in(row);
        std::int32_t w = 0, h = 0;
        std::uint32_t bits = 0, spp = 0, images = 0;
        std::string pixel, buffer, type;
        ASSERT_TRUE(in >> w >> h >> bits >> spp >> pixel >> buffer >> type >> images) << row;
        int rc = 1;
        const ImagePtr image =
            create(w, h, static_cast<std::uint16_t>(bits), static_cast<std::uint16_t>(spp),
                   byName(pixelTypeName, pixel), byName(bufferTypeName, buffer),
                   byName(dataTypeName, type), &rc, images);
        std::ostringstream line;
        line << row << ": rc " << rc;
        if (image) {
            line << ", bits " << image->bitsPerSample << ", cfa " << std::hex << image->cfa[1]
                 << std::dec << ", file " << image->fileType << ", data "
                 << (image->data != nullptr) << ", white/clip/black/min";
            for (int ch = 0; ch < 4; ++ch)
                line << " " << image->level[ch].whiteVal << "/" << image->clip[ch].maxClip << "/"
                     << image->level[ch].blackVal << "/" << image->clip[ch].minClip;
        }
        text += line.str() + "\n";
    }
    testing_support::expectGolden("image/create_results.txt", text);
}

TEST(ImageBuffer, PlanesMetadataDisplayTestAndNames) {
    int rc = 0;
    // YUV 4:2:0 chroma planes are half size rounded up, 4:2:2 keep the height.
    ImagePtr yuv420 = create(5, 3, 8, 3, kPixelYuv420, kBufferPlanar, kDataUint8, &rc);
    std::int32_t w = 0, h = 0;
    EXPECT_EQ(imagePlaneSize(yuv420.get(), 1, &w, &h), 0);
    EXPECT_EQ(std::make_pair(w, h), std::make_pair(3, 2));
    EXPECT_EQ(imagePlaneSize(yuv420.get(), 2, &w, &h), 0);
    EXPECT_EQ(std::make_pair(w, h), std::make_pair(2, 2));
    EXPECT_EQ(imagePlaneSize(yuv420.get(), 3, &w, &h), -1);
    EXPECT_EQ(imageTotalSamples(yuv420.get(), -1), 15u + 6u + 4u);
    ImagePtr yuv422 = create(5, 3, 8, 3, kPixelYuv422, kBufferPlanar, kDataUint8, &rc, 2);
    EXPECT_EQ(imageTotalSamples(yuv422.get(), 1), 9u);
    EXPECT_EQ(imageTotalSamples(yuv422.get(), -1), 2u * (15 + 9 + 6));

    // Keys compare without case and the last value wins; copying replaces the
    // entries and takes a fixed header byte for byte; clearing frees both.
    ImagePtr source = create(1, 1, 8, 1, kPixelRaw, kBufferRawCfa, kDataUint8, &rc);
    ImagePtr target = create(1, 1, 8, 1, kPixelRaw, kBufferRawCfa, kDataUint8, &rc);
    EXPECT_EQ(imageSetMetadata(source.get(), "Exposure", "1"), 0);
    EXPECT_EQ(imageSetMetadata(source.get(), "Gain", "2"), 0);
    EXPECT_EQ(imageSetMetadata(source.get(), "EXPOSURE", "3"), 0);
    const MetadataEntry* entry = imageFindMetadata(source.get(), "exposure");
    ASSERT_NE(entry, nullptr);
    EXPECT_STREQ(entry->value, "3");
    ASSERT_NE(entry->next, nullptr);
    EXPECT_STREQ(entry->next->key, "Gain");
    EXPECT_EQ(entry->next->next, nullptr);
    ASSERT_EQ(imageSetMetadata(target.get(), "old", "gone"), kOk);
    auto* header = static_cast<unsigned char*>(std::malloc(kKqRawFixedHeaderSize));
    for (std::size_t i = 0; i < kKqRawFixedHeaderSize; ++i)
        header[i] = static_cast<unsigned char>(i * 7);
    source->rawHeader = header;
    source->fileType = kFileKqRaw;
    EXPECT_EQ(imageCopyMetadata(target.get(), source.get()), 0);
    EXPECT_EQ(imageFindMetadata(target.get(), "old"), nullptr);
    EXPECT_NE(imageFindMetadata(target.get(), "GAIN"), nullptr);
    ASSERT_NE(target->rawHeader, nullptr);
    EXPECT_NE(target->rawHeader, source->rawHeader);
    EXPECT_EQ(std::memcmp(target->rawHeader, header, kKqRawFixedHeaderSize), 0);
    EXPECT_EQ(imageCopyMetadata(source.get(), source.get()), 0);
    EXPECT_NE(imageFindMetadata(source.get(), "gain"), nullptr);
    imageClearMetadata(source.get());
    EXPECT_EQ(source->metadata, nullptr);
    EXPECT_EQ(source->rawHeader, nullptr);

    // Eight-bit display images: mono or interleaved RGB with plain levels.
    ImagePtr rgb = create(2, 2, 8, 3, kPixelRgb, kBufferInterleaved, kDataUint8, &rc);
    EXPECT_TRUE(imageIsEightBitDisplay(rgb.get()));
    rgb->level[2].blackVal = 1.0f;
    EXPECT_FALSE(imageIsEightBitDisplay(rgb.get()));
    EXPECT_FALSE(imageIsEightBitDisplay(
        create(2, 2, 8, 3, kPixelRgb, kBufferPlanar, kDataUint8, &rc).get()));
    EXPECT_FALSE(imageIsEightBitDisplay(
        create(2, 2, 8, 1, kPixelRaw, kBufferRawCfa, kDataUint8, &rc).get()));
    EXPECT_TRUE(imageIsEightBitDisplay(
        create(2, 2, 8, 1, kPixelMono, kBufferRawCfa, kDataUint8, &rc).get()));

    EXPECT_STREQ(pixelTypeName(7), "YUV420");
    EXPECT_STREQ(pixelTypeName(8), "NEW-UNKNOWN");
    EXPECT_STREQ(bufferTypeName(3), "RAW_SPLIT");
    EXPECT_STREQ(bufferTypeName(6), "NEW-UNKNOWN");
    EXPECT_STREQ(dataTypeName(5), "REAL32");
    EXPECT_STREQ(fileTypeName(5), "NKRAW");
    EXPECT_STREQ(fileTypeName(6), "NEW-UNKNOWN");
    EXPECT_STREQ(cfaPatternName(kCfaRggb), "RGGB");
    EXPECT_STREQ(cfaPatternName(kCfaBggr), "BGGR");
    EXPECT_STREQ(cfaPatternName(0x1560A000), "OECX");
    EXPECT_STREQ(cfaPatternName(0x789F0000), "MYWX");
}

TEST(ImageStreamIo, ScalarsRoundTripInBothByteOrders) {
    std::FILE* file = std::tmpfile();
    ASSERT_NE(file, nullptr);
    // In order, each returning 0 (&& sequences them).
    EXPECT_TRUE(!streamWrite16(file, true, 0x1234) && !streamWrite32(file, false, 0xA1B2C3D4u) &&
                !streamWrite64(file, true, 0x0102030405060708ull) &&
                !streamWriteFloat(file, false, 1.5f) && !streamWrite8(file, 0xEE));
    EXPECT_EQ(testing_support::readStream(file),
              std::string("\x12\x34\xD4\xC3\xB2\xA1\x01\x02\x03\x04\x05\x06\x07\x08\x00\x00\xC0"
                          "\x3F\xEE",
                          19));
    std::rewind(file);
    std::uint16_t v16 = 0;
    std::uint32_t v32 = 0;
    std::uint64_t v64 = 0;
    float f = 0;
    std::uint8_t v8 = 0;
    EXPECT_TRUE(!streamRead16(file, true, &v16) && !streamRead32(file, false, &v32) &&
                !streamRead64(file, true, &v64) && !streamReadFloat(file, false, &f) &&
                !streamRead8(file, &v8));
    EXPECT_EQ(std::make_tuple(v16, v32, v64, f, v8),
              std::make_tuple(std::uint16_t{0x1234}, 0xA1B2C3D4u, 0x0102030405060708ull, 1.5f,
                              std::uint8_t{0xEE}));
    EXPECT_EQ(streamRead32(file, false, &v32), -1);
    std::fclose(file);
}

// A raw image; with `room`, its block is the kind the raw readers allocate.
ImagePtr rawImage(std::int32_t w, std::int32_t h, std::uint16_t bits, std::uint32_t type,
                  bool room = false) {
    int rc = kOk;
    ImagePtr image = create(w, h, bits, 1, kPixelRaw, kBufferRawCfa, room ? kDataNone : type, &rc);
    if (room) {
        image->data = allocateWidenableSamples(std::uint64_t(w) * std::uint64_t(h),
                                               type == kDataUint16 ? 2 : 1);
        image->dataType = type;
    }
    return image;
}

TEST(WidenSamplesToFloat, MatchesTheCopyingConversionInPlaceOrNot) {
    // 131 x 97 spans several of the in-place chunks and ends in a partial one.
    const std::pair<int, std::uint32_t> formats[] = {{1, kDataUint16},  {10, kDataUint16},
                                                     {12, kDataUint16}, {16, kDataUint16},
                                                     {4, kDataUint8},   {8, kDataUint8}};
    for (bool room : {true, false})
        for (const auto& [bits, type] : formats) {
            ImagePtr image = rawImage(131, 97, static_cast<std::uint16_t>(bits), type, room);
            const std::size_t count = 131 * 97;
            for (std::size_t i = 0; i < count; ++i) {
                const auto value = static_cast<std::uint32_t>(i * 2654435761u >> 7);
                if (type == kDataUint16)
                    static_cast<std::uint16_t*>(image->data)[i] = static_cast<std::uint16_t>(value);
                else
                    static_cast<std::uint8_t*>(image->data)[i] = static_cast<std::uint8_t>(value);
            }
            std::vector<float> copied(count);
            ASSERT_TRUE(normaliseSamples(image.get(), copied.data()));
            const void* before = image->data;
            ASSERT_EQ(widenSamplesToFloat(image.get()), kOk);
            EXPECT_EQ(image->dataType, kDataReal32);
            EXPECT_EQ(std::memcmp(image->data, copied.data(), count * sizeof(float)), 0) << bits;
            EXPECT_TRUE(!room || image->data == before) << "converted where the samples lie";
        }
    // Full scale is one and bits above the depth are masked.
    ImagePtr image = rawImage(3, 1, 10, kDataUint16);
    const std::uint16_t samples[] = {1023, 0xFFFF, 0};
    std::memcpy(image->data, samples, sizeof samples);
    ASSERT_EQ(widenSamplesToFloat(image.get()), kOk);
    EXPECT_EQ(
        std::vector<float>(static_cast<float*>(image->data), static_cast<float*>(image->data) + 3),
        (std::vector<float>{1.0f, 1.0f, 0.0f}));
    // Other data types are refused and left alone.
    ImagePtr floats = rawImage(4, 4, 32, kDataReal32);
    EXPECT_EQ(widenSamplesToFloat(floats.get()), kUnsupported);
    EXPECT_EQ(floats->dataType, kDataReal32);
    EXPECT_EQ(widenSamplesToFloat(rawImage(4, 4, 16, kDataNone).get()), kUnsupported);
    EXPECT_EQ(widenSamplesToFloat(nullptr), kUnsupported);
}

ImagePtr bayer(std::int32_t w, std::int32_t h, std::uint32_t cfa,
               const std::vector<float>& values) {
    int rc = 0;
    ImagePtr image = create(w, h, 10, 1, kPixelRaw, kBufferRawCfa, kDataReal32, &rc, 1, cfa);
    std::copy(values.begin(), values.end(), static_cast<float*>(image->data));
    return image;
}

// The demosaiced image as "r,g,b r,g,b ..." rows.
std::string demosaiced(const ImagePtr& source) {
    int rc = 1;
    const ImagePtr rgb(demosaicToRgb8(source.get(), &rc));
    EXPECT_EQ(rc, 0);
    EXPECT_EQ(rgb->pixelType, kPixelRgb);
    EXPECT_EQ(rgb->bufferType, kBufferInterleaved);
    EXPECT_TRUE(imageIsEightBitDisplay(rgb.get()));
    std::string text;
    const auto* p = static_cast<const std::uint8_t*>(rgb->data);
    for (std::int32_t i = 0; i < rgb->width * rgb->height; ++i, p += 3)
        text += std::to_string(p[0]) + "," + std::to_string(p[1]) + "," + std::to_string(p[2]) +
                (i % rgb->width == rgb->width - 1 ? "\n" : " ");
    return text;
}

std::vector<float> steps(const std::vector<int>& values) { // steps of 1/255 convert back exactly
    std::vector<float> result;
    for (int v : values)
        result.push_back(static_cast<float>(v) / 255.0f);
    return result;
}

// Each case's demosaiced rows, in demosaic.txt: a 3 x 3 RGGB image (cross and
// diagonal averages at the blue site, row and column pairs at green sites,
// missing neighbours seen twice), a flat colour in every order (it comes back
// everywhere, borders included), clamping (NaN is black, half steps round up)
// and lines of one pixel, which read nothing beyond the samples.
TEST(Demosaic, InterpolatesEachSiteFromItsNeighboursMirroredAtTheEdges) {
    std::string text =
        demosaiced(bayer(3, 3, kCfaRggb, steps({8, 16, 40, 4, 100, 12, 24, 32, 200})));
    for (const std::uint32_t cfa : {kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr}) {
        const std::string letters = cfaPatternName(cfa);
        std::vector<float> values;
        for (int y = 0; y < 5; ++y)
            for (int x = 0; x < 7; ++x) {
                const char colour = letters[static_cast<std::size_t>((y & 1) * 2 + (x & 1))];
                values.push_back(colour == 'R' ? 0.2f : colour == 'G' ? 0.4f : 0.8f);
            }
        text += letters + "\n" + demosaiced(bayer(7, 5, cfa, values));
    }
    text += demosaiced(bayer(2, 2, kCfaRggb, {1.5f, -0.3f, -0.3f, std::nanf("")})) +
            demosaiced(bayer(2, 2, kCfaRggb, {0.5f, 1.0f, 1.0f, 0.0f})) +
            demosaiced(bayer(1, 1, kCfaRggb, {0.5f})) +
            demosaiced(bayer(1, 4, kCfaGrbg, steps({10, 20, 30, 40}))) +
            demosaiced(bayer(5, 1, kCfaBggr, steps({10, 20, 30, 40, 50})));
    testing_support::expectGolden("image/demosaic.txt", text);
    // Only normalised Bayer images of the four orders.
    int rc = 0;
    const ImagePtr refused[] = {
        nullptr, rawImage(2, 2, 10, kDataUint16),
        create(2, 2, 32, 1, kPixelMono, kBufferInterleaved, kDataReal32, &rc),
        bayer(2, 2, 0x23330000, {0, 0, 0, 0})};
    for (const ImagePtr& image : refused) {
        EXPECT_EQ(demosaicToRgb8(image.get(), &rc), nullptr);
        EXPECT_EQ(rc, &image == &refused[3] ? -4 : -6);
    }
}

// Sizes and offsets past 2 GiB, which a 32-bit host only reaches with 64-bit
// file offsets. The sparse file is written with the 64-bit calls whatever
// off_t is, so that a build without large-file support fails instead of skipping.
TEST(FileSource, ReadsBothEndsOfAFileLargerThanTwoGibibytes) {
    testing_support::TempDir dir;
    const std::string path = dir.file("large.raw");
    constexpr std::uint64_t kTail = std::uint64_t{3} << 30;
    const int fd = ::open(path.c_str(), O_CREAT | O_WRONLY | O_TRUNC | O_LARGEFILE, 0600);
    ASSERT_GE(fd, 0);
    const bool written = ::pwrite64(fd, "head", 4, 0) == 4 &&
                         ::pwrite64(fd, "tail end", 8, static_cast<off64_t>(kTail)) == 8;
    ::close(fd);
    if (!written)
        GTEST_SKIP() << "the file system holds no sparse 3 GiB file";
    int result = 1;
    std::unique_ptr<ByteSource> source(openSource(path.c_str(), &result));
    ASSERT_EQ(result, 0);
    EXPECT_EQ(source->size(), kTail + 8);
    char text[8] = {};
    ASSERT_TRUE(source->seek(kTail) && source->read(text, 8));
    EXPECT_EQ(std::string(text, 8), "tail end");
    EXPECT_EQ(source->remaining(), 0u);
    ASSERT_TRUE(source->seek(0) && source->read(text, 4));
    EXPECT_EQ(std::string(text, 4), "head");
}

} // namespace
} // namespace img
