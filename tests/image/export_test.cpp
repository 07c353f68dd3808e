// Every export format through imageSave: the files written are golden files
// under tests/data/image/export/, the refusals one table.

#include <cmath>
#include <csetjmp>
#include <cstdint>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <jpeglib.h>

#include "image/image_buffer.h"
#include "image/image_result.h"
#include "image/image_save.h"
#include "raw_test_files.h"
#include "tests/blob/golden_file.h"
#include "tests/support/temp_dir.h"
#include "tools/flatfield/flat_field.h"

namespace img {
namespace {

using testing_support::fileExists;
using testing_support::readFile;
using testing_support::TempDir;

ImagePtr make(std::int32_t w, std::int32_t h, std::uint16_t bits, std::uint16_t spp,
              std::uint32_t cfa, std::uint32_t pixel, std::uint32_t buffer, std::uint32_t type,
              const std::vector<double>& values = {}) {
    int rc = 0;
    ImagePtr image(imageCreate(w, h, bits, spp, 1, 0, cfa, pixel, buffer, type, &rc));
    EXPECT_EQ(rc, 0);
    for (std::size_t i = 0; i < values.size(); ++i) {
        if (type == kDataUint8)
            static_cast<std::uint8_t*>(image->data)[i] = static_cast<std::uint8_t>(values[i]);
        else if (type == kDataUint16)
            static_cast<std::uint16_t*>(image->data)[i] = static_cast<std::uint16_t>(values[i]);
        else
            static_cast<float*>(image->data)[i] = static_cast<float>(values[i]);
    }
    return image;
}

ImagePtr rgb(std::int32_t w, std::int32_t h, std::uint32_t buffer = kBufferInterleaved) {
    std::vector<double> values(static_cast<std::size_t>(3 * w * h));
    for (std::size_t i = 0; i < values.size(); ++i)
        values[i] = static_cast<double>(1 + i + i / 9); // 1..9, 11..19, ...
    return make(w, h, 8, 3, 0, kPixelRgb, buffer, kDataUint8, values);
}

ImagePtr mono(std::int32_t w, std::int32_t h, const std::vector<double>& values = {}) {
    return make(w, h, 8, 1, 0, kPixelMono, kBufferInterleaved, kDataUint8, values);
}

ImagePtr raw16(std::int32_t w, std::int32_t h, std::uint16_t bits,
               const std::vector<double>& values) {
    return make(w, h, bits, 1, kCfaGbrg, kPixelRaw, kBufferRawCfa, kDataUint16, values);
}

ImagePtr withMetadata(ImagePtr image) {
    EXPECT_EQ(imageSetMetadata(image.get(), "SerialNumber", "0a1b"), 0);
    EXPECT_EQ(imageSetMetadata(image.get(), "Note", "two\nlines"), 0);
    return image;
}

ImagePtr rawWithLevels() {
    ImagePtr image =
        withMetadata(raw16(4, 2, 10, {1023, 1022, 1021, 1020, 1019, 1018, 1017, 1016}));
    image->level[0].blackVal = 64.0f;
    image->clip[0].maxClip = 1000.5f;
    return image;
}

ImagePtr floats() {
    return make(4, 1, 32, 1, kCfaRggb, kPixelRaw, kBufferRawCfa, kDataReal32,
                {0.5, 1.5, -0.25, std::nan("")});
}

ImagePtr fromFile(const std::string& bytes) {
    int rc = 0;
    ImagePtr image = rawtest::readBytes(bytes, &rc);
    EXPECT_EQ(rc, 0);
    return image;
}

// A container's header block records when it was written (bytes 60 to 67).
std::string written(const std::string& path, int format) {
    std::string bytes = readFile(path);
    if (format == 4)
        bytes.replace(60, 8, 8, '\0');
    return bytes;
}

// An image as tests/data/image/exports.txt describes it.
ImagePtr described(std::istringstream& in) {
    std::string kind;
    std::int32_t w = 0, h = 0;
    std::uint16_t bits = 8;
    in >> kind >> w >> h;
    if (kind.rfind("raw", 0) == 0)
        in >> bits;
    std::vector<double> values;
    for (double v = 0; in >> v;)
        values.push_back(v);
    if (kind == "floats" || kind == "levels" || kind == "nkraw")
        return kind == "floats"   ? floats()
               : kind == "levels" ? rawWithLevels()
                                  : fromFile(rawtest::nkrawFile(2, 1, {1, 1500}));
    if (kind == "mono")
        return mono(w, h, values);
    if (kind == "raw")
        return raw16(w, h, bits, values);
    if (kind == "raw+meta")
        return withMetadata(raw16(w, h, bits, values));
    return rgb(w, h, kind == "rgbp" ? kBufferPlanar : kBufferInterleaved);
}

TEST(Export, WritesTheGoldenFiles) {
    TempDir dir;
    const std::vector<std::string> rows = testing_support::dataRows("image/exports.txt");
    EXPECT_EQ(rows.size(), 15u);
    for (const std::string& row : rows) {
        std::istringstream in(row);
        std::string name;
        int format = 0;
        in >> name >> format;
        const ImagePtr image = described(in);
        ASSERT_EQ(imageSave(dir.file(name).c_str(), image.get(), format, nullptr, 0), 0) << row;
        testing_support::expectGolden("image/export/" + name, written(dir.file(name), format));
    }
}

TEST(Export, FixedHeaderAndContainerInputsAreStoredBackAsRead) {
    TempDir dir;
    std::string fixed = rawtest::fixedHeaderFile(3, 1, {1, 2, 3000}, 3);
    for (std::size_t at = 108; at < 16492; at += 997)
        fixed[at] = static_cast<char>(at);  // unnamed fields travel unchanged
    rawtest::putU32(fixed, 32, 20 * 65536); // revision 3: fixed-point exposure
    ASSERT_EQ(imageSave(dir.file("a").c_str(), fromFile(fixed).get(), 3, nullptr, 0), 0);
    EXPECT_TRUE(readFile(dir.file("a")) == fixed);
    // A container keeps its blocks byte for byte; header and pixels follow the image.
    const std::string input = flatfield::KqRawBuilder()
                                  .header(2, 1, 0x52474742)
                                  .pixels({3, 2000})
                                  .block("M3DATA____111107", "m3", 2, "0123456789abcdef")
                                  .sensorInfo("", "SN", "")
                                  .bytes();
    ImagePtr image = fromFile(input);
    static_cast<std::uint16_t*>(image->data)[0] = 99;
    ASSERT_EQ(imageSave(dir.file("b").c_str(), image.get(), 4, nullptr, 0), 0);
    testing_support::expectGolden("image/export/container_stored_back.kqraw2",
                                  written(dir.file("b"), 4));
    ASSERT_EQ(
        imageSave(dir.file("c").c_str(), fromFile(readFile(dir.file("b"))).get(), 4, nullptr, 0),
        0);
    EXPECT_EQ(written(dir.file("c"), 4), written(dir.file("b"), 4)); // container unchanged
}

// The images the refusal table names.
ImagePtr named(const std::string& name) {
    ImagePtr image = name == "rgb" ? rgb(2, 2) : name == "mono" ? mono(1, 1) : nullptr;
    if (name == "raw8" || name == "raw10" || name == "black" || name == "clip" || name == "free")
        image = raw16(1, 1, name == "raw8" ? 8 : 10, {1});
    if (name == "black")
        image->level[3].blackVal = 1.0f;
    if (name == "clip")
        image->clip[1].maxClip = 512.0f;
    if (name == "free") { // the samples are gone
        std::free(image->data);
        image->data = nullptr;
    }
    if (name == "darkened") {
        image = rgb(2, 2);
        image->level[2].whiteVal = 255.0f;
    }
    const struct {
        const char* name;
        std::uint16_t bits, spp;
        std::uint32_t cfa, pixel, buffer, type;
    } layouts[] = {{"float", 10, 1, kCfaRggb, kPixelRaw, kBufferRawCfa, kDataReal32},
                   {"nodata", 8, 3, 0, kPixelRgb, kBufferInterleaved, kDataNone},
                   {"mono16", 16, 1, 0, kPixelMono, kBufferInterleaved, kDataUint16},
                   {"yuv420", 8, 3, 0, kPixelYuv420, kBufferPlanar, kDataUint8},
                   {"yuv422", 8, 3, 0, kPixelYuv422, kBufferPlanar, kDataUint8},
                   {"two", 8, 2, 0, kPixelOther, kBufferInterleaved, kDataUint8}};
    for (const auto& l : layouts)
        if (name == l.name)
            image = make(4, 4, l.bits, l.spp, l.cfa, l.pixel, l.buffer, l.type);
    return image;
}

TEST(Export, RefusalsHaveTheirCodesAndLeaveNoFile) {
    TempDir dir;
    const std::vector<std::string> rows = testing_support::dataRows("image/export_refusals.txt");
    EXPECT_GT(rows.size(), 30u);
    for (const std::string& row : rows) {
        std::istringstream words(row);
        std::string image, where;
        int format = 0, rc = 0;
        ASSERT_TRUE(words >> image >> format >> where >> rc) << row;
        const std::string path = where == "file"      ? dir.file("x")
                                 : where == "missing" ? dir.file("none/x")
                                                      : where;
        EXPECT_EQ(imageSave(path.c_str(), named(image).get(), format, nullptr, 0), rc) << row;
        EXPECT_FALSE(fileExists(dir.file("x"))) << row;
    }
}

// JPEG files are checked through libjpeg rather than byte for byte.
struct DecodedJpeg {
    bool ok = false;
    unsigned width = 0, height = 0;
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

// The result goes through a pointer so that nothing in this frame needs to
// survive the long jump.
void decodeInto(const std::string& bytes, DecodedJpeg* out) {
    jpeg_decompress_struct decoder;
    DecodeErrors errors;
    decoder.err = jpeg_std_error(&errors.base);
    errors.base.error_exit = failDecode;
    if (setjmp(errors.jump)) {
        jpeg_destroy_decompress(&decoder);
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
    out->row.resize(std::size_t{decoder.output_width} * std::size_t(decoder.output_components));
    while (decoder.output_scanline < decoder.output_height) {
        JSAMPROW rows[1] = {out->row.data()};
        jpeg_read_scanlines(&decoder, rows, 1);
    }
    jpeg_finish_decompress(&decoder);
    jpeg_destroy_decompress(&decoder);
    out->ok = true;
}

DecodedJpeg jpeg(const ImagePtr& image, int quality, bool given = true) {
    TempDir dir;
    const int parameters[] = {quality};
    EXPECT_EQ(imageSave(dir.file("a.jpg").c_str(), image.get(), 8, parameters, given), 0);
    DecodedJpeg decoded;
    decodeInto(readFile(dir.file("a.jpg")), &decoded);
    EXPECT_TRUE(decoded.ok);
    return decoded;
}

TEST(Export, JpegSizeComponentsCommentsAndQuality) {
    const DecodedJpeg colour = jpeg(rgb(37, 21), 90);
    EXPECT_EQ(colour.width, 37u);
    EXPECT_EQ(colour.height, 21u);
    EXPECT_EQ(colour.components, 3);
    EXPECT_TRUE(colour.comments.empty());
    EXPECT_EQ(jpeg(mono(8, 3), 75).components, 1);
    EXPECT_EQ(jpeg(withMetadata(rgb(4, 4)), 90).comments,
              (std::vector<std::string>{"# MCF_MetadataBegin = \"SerialNumber\" 4\n0a1b\n"
                                        "# MCF_MetadataEnd = \"SerialNumber\"\n",
                                        "# MCF_MetadataBegin = \"Note\" 9\ntwo\nlines\n"
                                        "# MCF_MetadataEnd = \"Note\"\n"}));
    // The standard luminance table starts at 16: quality 50 keeps it, 90 scales it
    // by 0.2, and 90 is the default; 300 is clamped to 100 (44 if it wrapped as a
    // byte), -20 to the coarsest baseline step.
    const std::pair<int, unsigned> steps[] = {{50, 16}, {90, 3}, {300, 1}, {-20, 255}};
    for (const auto& [quality, step] : steps)
        EXPECT_EQ(jpeg(rgb(8, 8), quality).firstLuminanceStep, step) << quality;
    EXPECT_EQ(jpeg(rgb(8, 8), 50, false).firstLuminanceStep, 3u);
    // A comment marker holds at most 65533 bytes: the library error leaves no file.
    TempDir dir;
    const ImagePtr huge = rgb(4, 4);
    ASSERT_EQ(imageSetMetadata(huge.get(), "Huge", std::string(70000, 'x').c_str()), 0);
    EXPECT_EQ(imageSave(dir.file("huge.jpg").c_str(), huge.get(), 8, nullptr, 0), -2);
    EXPECT_FALSE(fileExists(dir.file("huge.jpg")));
}

} // namespace
} // namespace img
