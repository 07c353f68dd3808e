// The synthetic flat-field generator, the raw file builders, the flatgen tool
// and the bundled example files.

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <map>
#include <set>
#include <sstream>
#include <tuple>

#include <gtest/gtest.h>

#include "tests/support/flat_field.h"
#include "tests/support/module_shading.h"
#include "tests/support/temp_dir.h"
#include "tests/support/tool_runner.h"

using namespace testing_support;

namespace {

std::uint32_t u32At(const std::string& bytes, std::size_t at) {
    std::uint32_t value = 0;
    for (int i = 3; i >= 0; --i)
        value = value << 8 | std::uint8_t(bytes.at(at + std::size_t(i)));
    return value;
}

float f32At(const std::string& bytes, std::size_t at) {
    const std::uint32_t bits = u32At(bytes, at);
    float value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

FlatFieldShape smallShape() {
    FlatFieldShape shape;
    shape.width = 64;
    shape.height = 48;
    return shape;
}

// --- Levels -------------------------------------------------------------------

TEST(FlatFieldLevels, GreenFallsFromTheCentreLevelToTheCornerLevel) {
    const FlatField field = makeFlatField(smallShape());
    const double cx = 31.5, cy = 23.5;
    EXPECT_NEAR(field.level(1, cx, cy), 0.8, 1e-12);
    for (auto [x, y] : {std::pair{0, 0}, {63, 0}, {0, 47}, {63, 47}})
        EXPECT_NEAR(field.level(2, x, y) / field.level(2, cx, cy), 0.5, 1e-12);
    double previous = 2.0;
    for (int step = 0; step <= 10; ++step) {
        const double t = step / 10.0;
        const double value = field.level(1, cx * (1 - t), cy * (1 - t));
        EXPECT_LT(value, previous);
        previous = value;
    }
}

TEST(FlatFieldLevels, RedFallsAndBlueRisesAgainstGreenTowardsTheCorners) {
    FlatFieldShape shape = smallShape();
    shape.colourShading = 0.1;
    const FlatField field = makeFlatField(shape);
    const double cx = 31.5, cy = 23.5;
    EXPECT_NEAR(field.level(0, cx, cy) / field.level(1, cx, cy), 0.55, 1e-12);
    EXPECT_NEAR(field.level(3, cx, cy) / field.level(1, cx, cy), 0.65, 1e-12);
    EXPECT_NEAR(field.level(0, 0, 0) / field.level(1, 0, 0), 0.55 * 0.9, 1e-12);
    EXPECT_NEAR(field.level(3, 0, 0) / field.level(1, 0, 0), 0.65 * 1.1, 1e-12);
}

TEST(FlatFieldLevels, BrightestGreenSitsAtAnOffCentreOpticalCentre) {
    FlatFieldShape shape = smallShape();
    shape.centerX = 0.25;
    shape.centerY = 0.75;
    const FlatField field = makeFlatField(shape);
    const double cx = 0.25 * 63, cy = 0.75 * 47;
    EXPECT_NEAR(field.level(1, cx, cy), 0.8, 1e-12);
    EXPECT_LT(field.level(1, cx + 1, cy), 0.8);
    EXPECT_LT(field.level(1, cx, cy - 1), 0.8);
}

TEST(FlatFieldLevels, NoiselessSamplesAreTheRoundedLevelPlusTheBlackLevel) {
    FlatFieldShape shape = smallShape();
    shape.bits = 12;
    shape.blackLevel = 64;
    const FlatField field = makeFlatField(shape);
    ASSERT_EQ(field.samples.size(), 64u * 48u);
    for (int y = 0; y < 48; ++y)
        for (int x = 0; x < 64; ++x) {
            const double expected =
                std::floor(field.level(field.channelAt(x, y), x, y) * 4095 + 0.5) + 64;
            ASSERT_EQ(field.samples[std::size_t(y) * 64 + std::size_t(x)], expected)
                << x << "," << y;
        }
}

TEST(FlatFieldLevels, SamplesClipToTheBitDepth) {
    FlatFieldShape shape = smallShape();
    shape.bits = 1;
    shape.centerLevel = 3.0;
    shape.cornerLevel = 1.0;
    for (std::uint16_t s : makeFlatField(shape).samples)
        ASSERT_EQ(s, 1);
    shape.bits = 16;
    shape.centerLevel = 0.5;
    shape.blackLevel = -40000;
    for (std::uint16_t s : makeFlatField(shape).samples)
        ASSERT_EQ(s, 0);
}

TEST(FlatFieldLevels, NoiseHasTheRequestedSpreadAroundTheLevel) {
    FlatFieldShape shape = smallShape();
    shape.width = shape.height = 256;
    shape.bits = 14;
    shape.cornerLevel = 1.0;
    shape.colourShading = 0.0;
    shape.centerLevel = 0.5;
    for (double& level : shape.channelLevel)
        level = 1.0;
    shape.noise = 0.01;
    const FlatField field = makeFlatField(shape);
    double sum = 0, squares = 0;
    for (float v : field.normalized()) {
        sum += v;
        squares += double(v) * v;
    }
    const double n = double(field.samples.size());
    const double mean = sum / n;
    EXPECT_NEAR(mean, 0.5, 0.0005);
    EXPECT_NEAR(std::sqrt(squares / n - mean * mean), 0.01, 0.0003);
}

TEST(FlatFieldLevels, DefectsAreDistinctHotAndDeadPixels) {
    FlatFieldShape shape = smallShape();
    shape.defects = 7;
    const FlatField field = makeFlatField(shape);
    EXPECT_EQ(field.hotPixels.size(), 4u);
    EXPECT_EQ(field.deadPixels.size(), 3u);
    std::set<std::size_t> positions;
    for (std::size_t at : field.hotPixels) {
        EXPECT_EQ(field.samples.at(at), 1023);
        positions.insert(at);
    }
    for (std::size_t at : field.deadPixels) {
        EXPECT_EQ(field.samples.at(at), 0);
        positions.insert(at);
    }
    EXPECT_EQ(positions.size(), 7u);

    shape.width = shape.height = 2;
    shape.defects = 100; // more than there are pixels: every pixel, once
    const FlatField tiny = makeFlatField(shape);
    EXPECT_EQ(tiny.hotPixels.size() + tiny.deadPixels.size(), 4u);
}

TEST(FlatFieldLevels, NormalizedMasksToTheBitDepth) {
    FlatFieldShape shape = smallShape();
    FlatField field = makeFlatField(shape);
    field.samples[0] = 0xFFFF;
    field.samples[1] = 0;
    field.samples[2] = 0x0400 | 511;
    const std::vector<float> values = field.normalized();
    EXPECT_EQ(values[0], 1.0f);
    EXPECT_EQ(values[1], 0.0f);
    EXPECT_EQ(values[2], 511.0f / 1023.0f);
}

TEST(FlatFieldLevels, RefusesShapesItCannotRender) {
    const auto refused = [](auto change) {
        FlatFieldShape shape = smallShape();
        change(shape);
        EXPECT_THROW(makeFlatField(shape), std::invalid_argument);
    };
    refused([](FlatFieldShape& s) { s.width = 0; });
    refused([](FlatFieldShape& s) { s.height = -3; });
    refused([](FlatFieldShape& s) { s.width = s.height = 1 << 15; });
    refused([](FlatFieldShape& s) { s.bits = 0; });
    refused([](FlatFieldShape& s) { s.bits = 17; });
    refused([](FlatFieldShape& s) { s.cfa = 0x12340000; });
    refused([](FlatFieldShape& s) { s.cornerLevel = 0.0; });
    refused([](FlatFieldShape& s) { s.cornerLevel = 1.5; });
    refused([](FlatFieldShape& s) { s.noise = -0.1; });
    refused([](FlatFieldShape& s) { s.defects = -1; });
}

// --- Bayer orders -------------------------------------------------------------

struct OrderCase {
    const char* name;
    std::uint32_t cfa;
    std::uint32_t code;
    int channels[4]; // of (0,0), (1,0), (0,1), (1,1)
};

class FlatFieldOrder : public ::testing::TestWithParam<OrderCase> {};

TEST_P(FlatFieldOrder, MapsPixelsToChannelsAndCodes) {
    const OrderCase& order = GetParam();
    FlatFieldShape shape = smallShape();
    shape.cfa = order.cfa;
    shape.cornerLevel = 1.0;
    shape.colourShading = 0.0;
    shape.channelLevel[0] = 0.2;
    shape.channelLevel[1] = 0.4;
    shape.channelLevel[2] = 0.6;
    shape.channelLevel[3] = 0.8;
    const FlatField field = makeFlatField(shape);
    const int at[4][2] = {{0, 0}, {1, 0}, {0, 1}, {1, 1}};
    for (int i = 0; i < 4; ++i) {
        for (int shift = 0; shift < 4; shift += 2) { // the pattern repeats every two pixels
            const int x = at[i][0] + shift, y = at[i][1] + shift;
            EXPECT_EQ(field.channelAt(x, y), order.channels[i]);
            const double expected = 0.8 * 0.2 * (order.channels[i] + 1) * 1023;
            EXPECT_EQ(field.samples[std::size_t(y) * 64 + std::size_t(x)],
                      std::floor(expected + 0.5));
        }
    }
    EXPECT_EQ(bayerCodeOf(order.cfa), order.code);
    EXPECT_EQ(bayerOrderName(order.cfa), order.name);
    EXPECT_EQ(cfaOfBayerOrder(order.name), order.cfa);
}

INSTANTIATE_TEST_SUITE_P(AllOrders, FlatFieldOrder,
                         ::testing::Values(OrderCase{"RGGB", 0x23340000, 0x52474742, {0, 1, 2, 3}},
                                           OrderCase{"GRBG", 0x32430000, 0x47524247, {1, 0, 3, 2}},
                                           OrderCase{"GBRG", 0x34230000, 0x47425247, {2, 3, 0, 1}},
                                           OrderCase{"BGGR", 0x43320000, 0x42474752, {3, 2, 1, 0}}),
                         [](const auto& param) { return std::string(param.param.name); });

TEST(FlatFieldOrderNames, UnknownPatternsHaveNoCodeOrName) {
    EXPECT_EQ(bayerCodeOf(0), 0u);
    EXPECT_EQ(bayerCodeOf(0x23340001), 0u);
    EXPECT_EQ(bayerOrderName(0x12340000), "");
    EXPECT_EQ(cfaOfBayerOrder("rggb"), 0u);
}

// --- Determinism --------------------------------------------------------------

TEST(FlatFieldSeed, SameSeedGivesTheSameImageAndAnotherSeedDoesNot) {
    FlatFieldShape shape = smallShape();
    shape.noise = 0.01;
    shape.defects = 4;
    const FlatField first = makeFlatField(shape);
    EXPECT_EQ(makeFlatField(shape).samples, first.samples);
    EXPECT_EQ(makeFlatField(shape).hotPixels, first.hotPixels);
    shape.seed = 2;
    const FlatField other = makeFlatField(shape);
    EXPECT_NE(other.samples, first.samples);
    EXPECT_NE(other.hotPixels, first.hotPixels);
}

// --- File builders --------------------------------------------------------------

CaptureInfo sampleCapture() {
    CaptureInfo capture;
    capture.exposureTime = 12.5f;
    const float gains[4] = {1.5f, 1.0f, 1.25f, 2.0f};
    std::copy(gains, gains + 4, capture.gains);
    capture.serialNumber = "00112233445566778899aabbccddeeff";
    capture.sensorGuid = 0x0123456789ABCDEFull;
    return capture;
}

TEST(RawFileBuilders, Kqraw2HoldsHeaderPixelsCaptureAndSensorInfoBlocks) {
    FlatFieldShape shape = smallShape();
    shape.width = 4;
    shape.height = 2;
    shape.cfa = 0x43320000; // BGGR
    shape.bits = 12;
    const FlatField field = makeFlatField(shape);
    const std::string bytes = kqraw2FileBytes(field, sampleCapture());

    const std::size_t pixelsAt = 72, captureAt = pixelsAt + 36 + 8 + 16;
    const std::size_t sensorAt = captureAt + 36 + 56;
    ASSERT_EQ(bytes.size(), sensorAt + 36 + 4 + 4 + 4 + 32 + 4);

    EXPECT_EQ(bytes.substr(0, 16), "KQRAWFILE_111107");
    EXPECT_EQ(bytes.substr(16, 16), std::string(16, '\0'));
    EXPECT_EQ(u32At(bytes, 32), 36u);
    const std::uint32_t header[9] = {4, 2, 0x42474752, 12, 1, 1, 1796115600, 0, 0};
    for (std::size_t i = 0; i < 9; ++i)
        EXPECT_EQ(u32At(bytes, 36 + 4 * i), header[i]) << "header word " << i;
    EXPECT_EQ(bytes.substr(44, 4), "RGGB"); // BGGR's code, least significant byte first

    EXPECT_EQ(bytes.substr(pixelsAt, 16), "PIXELDATA_111107");
    EXPECT_EQ(u32At(bytes, pixelsAt + 32), 8u + 16u);
    EXPECT_EQ(u32At(bytes, pixelsAt + 36), 1u);
    EXPECT_EQ(u32At(bytes, pixelsAt + 40), 0u);
    for (std::size_t i = 0; i < 8; ++i) {
        const std::size_t at = pixelsAt + 44 + 2 * i;
        EXPECT_EQ(std::uint8_t(bytes[at]) | std::uint8_t(bytes[at + 1]) << 8, field.samples[i]);
    }

    EXPECT_EQ(bytes.substr(captureAt, 16), "CAPTURE___120118");
    EXPECT_EQ(u32At(bytes, captureAt + 32), 56u);
    EXPECT_EQ(u32At(bytes, captureAt + 36), 2u);
    EXPECT_EQ(f32At(bytes, captureAt + 36 + 4), 12.5f);
    for (std::size_t at = 8; at < 28; at += 4)
        EXPECT_EQ(u32At(bytes, captureAt + 36 + at), 0u);
    EXPECT_EQ(f32At(bytes, captureAt + 36 + 28), 1.5f);
    EXPECT_EQ(f32At(bytes, captureAt + 36 + 32), 1.0f);
    EXPECT_EQ(f32At(bytes, captureAt + 36 + 36), 1.25f);
    EXPECT_EQ(f32At(bytes, captureAt + 36 + 40), 2.0f);

    EXPECT_EQ(bytes.substr(sensorAt, 16), "SENSORINFO120131");
    EXPECT_EQ(u32At(bytes, sensorAt + 32), 4u + 4u + 36u + 4u);
    EXPECT_EQ(u32At(bytes, sensorAt + 36), 1u);
    EXPECT_EQ(u32At(bytes, sensorAt + 40), 0u);
    EXPECT_EQ(u32At(bytes, sensorAt + 44), 32u);
    EXPECT_EQ(bytes.substr(sensorAt + 48, 32), "00112233445566778899aabbccddeeff");
    EXPECT_EQ(u32At(bytes, sensorAt + 80), 0u);
}

TEST(RawFileBuilders, FixedHeaderFileCarriesCaptureDataAtItsOffsets) {
    FlatFieldShape shape = smallShape();
    shape.width = 3;
    shape.height = 2;
    shape.cfa = 0x32430000; // GRBG
    const FlatField field = makeFlatField(shape);
    const std::string bytes = fixedHeaderFileBytes(field, sampleCapture());
    ASSERT_EQ(bytes.size(), 298672u + 12u);
    EXPECT_EQ(u32At(bytes, 0), 1u);
    EXPECT_EQ(u32At(bytes, 4), 1u);
    EXPECT_EQ(u32At(bytes, 8), 3u);
    EXPECT_EQ(u32At(bytes, 12), 2u);
    EXPECT_EQ(u32At(bytes, 16), 0x47524247u);
    EXPECT_EQ(u32At(bytes, 20), 0u);
    EXPECT_EQ(u32At(bytes, 24), 0x89ABCDEFu);
    EXPECT_EQ(u32At(bytes, 28), 0x01234567u);
    EXPECT_EQ(u32At(bytes, 32), 12u * 65536u + 32768u);
    EXPECT_EQ(f32At(bytes, 36), 12.5f);
    EXPECT_EQ(f32At(bytes, 68), 1.5f);
    EXPECT_EQ(f32At(bytes, 80), 2.0f);
    EXPECT_EQ(bytes.substr(88, 16),
              std::string("\x00\x11\x22\x33\x44\x55\x66\x77\x88\x99\xaa\xbb\xcc\xdd\xee\xff", 16));
    EXPECT_EQ(u32At(bytes, 104), 0xDEADBEEFu);
    EXPECT_EQ(u32At(bytes, 298668), 0xCAFEFEEDu);
    EXPECT_EQ(bytes.find_first_not_of('\0', 108), 298668u); // unnamed fields stay zero
    EXPECT_EQ(bytes.substr(298672), headerlessFileBytes(field));
}

TEST(RawFileBuilders, FixedHeaderRefusesSerialNumbersThatAreNotHexBytes) {
    const FlatField field = makeFlatField(smallShape());
    for (const char* serial : {"abc", "0g", "00112233445566778899aabbccddeeff00"}) {
        CaptureInfo capture;
        capture.serialNumber = serial;
        EXPECT_THROW(fixedHeaderFileBytes(field, capture), std::invalid_argument) << serial;
    }
    CaptureInfo shortSerial;
    shortSerial.serialNumber = "A1b2";
    const std::string bytes = fixedHeaderFileBytes(field, shortSerial);
    EXPECT_EQ(bytes.substr(88, 16), std::string("\xa1\xb2", 2) + std::string(14, '\0'));
}

TEST(RawFileBuilders, HeaderlessFileIsLittleEndianSamplesOnly) {
    FlatFieldShape shape = smallShape();
    shape.width = 2;
    shape.height = 1;
    FlatField field = makeFlatField(shape);
    field.samples = {0x0102, 0xA0B0};
    EXPECT_EQ(headerlessFileBytes(field), std::string("\x02\x01\xB0\xA0", 4));
}

TEST(RawFileBuilders, DetailsTextDescribesTheHeaderlessFile) {
    FlatFieldShape shape = smallShape();
    shape.cfa = 0x34230000;
    shape.bits = 12;
    const FlatField field = makeFlatField(shape);
    EXPECT_EQ(headerlessDetailsText(field, sampleCapture()),
              "image.width = 64\n"
              "image.height = 48\n"
              "image.bit_res = 12\n"
              "image.bayer_order = GBRG\n"
              "image.exp_time = 12.5\n"
              "image.gain = 1.5\n"
              "image.sensor_guid = 123456789abcdef\n"
              "image.serial_no = 00112233445566778899aabbccddeeff\n");
    EXPECT_EQ(headerlessDetailsText(field),
              "image.width = 64\nimage.height = 48\nimage.bit_res = 12\n"
              "image.bayer_order = GBRG\nimage.exp_time = 33\nimage.gain = 1\n");
}

TEST(RawFileBuilders, BuilderWritesBlocksAsGivenEvenWhenTheyLie) {
    const std::string reserved = "0123456789abcdef";
    const std::string bytes = KqRawBuilder()
                                  .block("MAKERNOTE_120131", "xyz", 1000, reserved)
                                  .comment("hi")
                                  .raw("tail")
                                  .bytes();
    ASSERT_EQ(bytes.size(), 36u + 3u + 36u + 6u + 4u);
    EXPECT_EQ(bytes.substr(16, 16), reserved);
    EXPECT_EQ(u32At(bytes, 32), 1000u);
    EXPECT_EQ(bytes.substr(36, 3), "xyz");
    EXPECT_EQ(bytes.substr(39, 16), "COMMENT___120131");
    EXPECT_EQ(u32At(bytes, 39 + 32), 6u);
    EXPECT_EQ(u32At(bytes, 39 + 36), 2u);
    EXPECT_EQ(bytes.substr(39 + 40), "hitail");
    EXPECT_THROW(KqRawBuilder().block("SHORT_TAG", ""), std::invalid_argument);
    EXPECT_THROW(KqRawBuilder().block("CAMSTATE__120118", "", 0, "short"), std::invalid_argument);
}

// --- flatgen and the example files ----------------------------------------------

const std::string kSourceDir = LSC_SOURCE_DIR;

std::string flatgenPath() {
    const std::string lsc = LSC_BINARY;
    return lsc.substr(0, lsc.rfind('/') + 1) + "flatgen";
}

int runFlatgen(const std::string& arguments) {
    return std::system(
        (toolCommandPrefix() + flatgenPath() + " " + arguments + " >/dev/null 2>&1").c_str());
}

// The parameters that examples/README.md gives for examples/flatfield.kqraw.
FlatFieldShape exampleShape() {
    FlatFieldShape shape;
    shape.cornerLevel = 0.55;
    shape.colourShading = 0.05;
    shape.noise = 0.003;
    shape.defects = 6;
    shape.seed = 2026;
    return shape;
}

CaptureInfo exampleCapture() {
    CaptureInfo capture;
    capture.serialNumber = "0123456789abcdef0123456789abcdef";
    return capture;
}

TEST(Flatgen, WritesEachFormatLikeTheBuilders) {
    TempDir dir;
    const FlatField field = makeFlatField(exampleShape());
    const CaptureInfo capture = exampleCapture();
    const std::string common = "--corner 0.55 --colour-shading 0.05 --noise 0.003 --defects 6 "
                               "--seed 2026 --serial 0123456789abcdef0123456789abcdef ";
    ASSERT_EQ(runFlatgen(common + dir.file("a.kqraw")), 0);
    EXPECT_EQ(readFile(dir.file("a.kqraw")), kqraw2FileBytes(field, capture));
    ASSERT_EQ(runFlatgen(common + "--format kqraw " + dir.file("b.kqraw")), 0);
    EXPECT_EQ(readFile(dir.file("b.kqraw")), fixedHeaderFileBytes(field, capture));
    ASSERT_EQ(runFlatgen(common + "--format=raw " + dir.file("c.raw")), 0);
    EXPECT_EQ(readFile(dir.file("c.raw")), headerlessFileBytes(field));
    EXPECT_EQ(readFile(dir.file("c.raw.txt")), headerlessDetailsText(field, capture));
}

TEST(Flatgen, RejectsBadArgumentsWithoutWritingAnything) {
    TempDir dir;
    const std::string out = dir.file("x.kqraw");
    for (const char* bad : {"--bits 17", "--order rggb", "--width 12x", "--noise", "--frobnicate 1",
                            "--format tiff", "--centre 0.5"}) {
        EXPECT_NE(runFlatgen(std::string(bad) + " " + out), 0) << bad;
        EXPECT_FALSE(fileExists(out)) << bad;
    }
    EXPECT_NE(runFlatgen(""), 0);
    EXPECT_EQ(runFlatgen("--help"), 0);
}

TEST(ExampleFiles, FlatFieldIsWhatTheDocumentedCommandGenerates) {
    const std::string bytes = readFile(kSourceDir + "/examples/flatfield.kqraw");
    EXPECT_TRUE(bytes == kqraw2FileBytes(makeFlatField(exampleShape()), exampleCapture()))
        << "examples/flatfield.kqraw differs from the command in examples/README.md";
}

// Plain `section.key = value;` lines of the example; lists and comments are skipped.
std::map<std::string, std::string> exampleSettings() {
    std::istringstream text(readFile(kSourceDir + "/examples/lsc.cfg"));
    std::map<std::string, std::string> settings;
    for (std::string line; std::getline(text, line);) {
        const std::size_t equals = line.find(" = "), end = line.find(';');
        if (line.empty() || !std::isalpha(std::uint8_t(line[0])) || equals == std::string::npos ||
            end == std::string::npos || line[equals + 3] == '{')
            continue;
        settings[line.substr(0, equals)] = line.substr(equals + 3, end - equals - 3);
    }
    return settings;
}

// The preparation the tool applies before its checks: each Bayer plane is
// median-filtered 3 x 3 (mirrored at the borders) and decimated by 4.
std::pair<int, int> preparedRange(const FlatField& field) {
    const int width = field.shape.width / 2, height = field.shape.height / 2;
    const auto mirror = [](int i, int n) { return i < 0 ? -1 - i : i >= n ? 2 * n - 1 - i : i; };
    int low = 1 << 16, high = -1;
    for (int plane = 0; plane < 4; ++plane) {
        for (int y = 0; y < height; y += 4)
            for (int x = 0; x < width; x += 4) {
                std::uint16_t window[9];
                int n = 0;
                for (int dy = -1; dy <= 1; ++dy)
                    for (int dx = -1; dx <= 1; ++dx) {
                        const int px = 2 * mirror(x + dx, width) + plane % 2;
                        const int py = 2 * mirror(y + dy, height) + plane / 2;
                        window[n++] =
                            field.samples[std::size_t(py) * std::size_t(field.shape.width) +
                                          std::size_t(px)];
                    }
                std::nth_element(window, window + 4, window + 9);
                low = std::min(low, int(window[4]));
                high = std::max(high, int(window[4]));
            }
    }
    return {low, high};
}

TEST(ExampleFiles, FlatFieldPassesTheExampleConfigurationChecks) {
    auto settings = exampleSettings();
    ASSERT_EQ(settings["shared.bit_res"], "10");
    ASSERT_EQ(settings["shared.proc_sampling_factor"], "4");
    ASSERT_EQ(settings["proc.median_filter_size"], "3");
    ASSERT_EQ(settings["proc.black_level"], "0");
    const int minimum = std::stoi(settings.at("proc.min_pixel_val"));
    const int maximum = std::stoi(settings.at("proc.max_pixel_val"));
    const int peak = std::stoi(settings.at("proc.peak_pixel_min"));
    EXPECT_TRUE(0 <= minimum && minimum <= maximum && maximum <= 1023 && peak <= maximum);

    const FlatField field = makeFlatField(exampleShape());
    const auto [low, high] = preparedRange(field);
    EXPECT_GE(low, minimum);
    EXPECT_LE(high, maximum);
    EXPECT_GE(high, peak);
    EXPECT_EQ(settings["lsc.imageWidth"], "640");
    EXPECT_EQ(settings["lsc.imageHeight"], "480");
    EXPECT_EQ(settings["shared.cfg_file_date"], "2026-12-01T09:00");
}

TEST(ExampleFiles, ConfigurationValuesLieInTheirRanges) {
    const std::map<std::string, std::pair<double, double>> ranges = {
        {"shared.light_source", {-1, 255}},
        {"shared.block_num_flag", {0, 1}},
        {"shared.block_num", {0, 255}},
        {"shared.program_number", {0, 255}},
        {"shared.proc_sampling_factor", {1, 100}},
        {"shared.bit_res", {4, 15}},
        {"shared.fuse_id_bytes", {0, 16}},
        {"shared.jpeg_quality", {0, 100}},
        {"blob.compression_flag", {0, 1}},
        {"blob.log_flag", {0, 1}},
        {"blob.write_flag", {0, 1}},
        {"proc.median_filter_flag", {0, 1}},
        {"proc.median_filter_size", {1, 10}},
        {"proc.debug", {0, 1}},
        {"lsc.sampling_factor", {1, 100}},
        {"lsc.sampling_margin", {0, 500}},
        {"lsc.leftPatchFactor", {0, 0.5}},
        {"lsc.centerPatchFactor", {0, 1}},
        {"lsc.topPatchFactor", {0, 0.5}},
        {"lsc.middlePatchFactor", {0, 1}},
        {"lsc.falloff_factor", {0, 100}},
        {"lsc.wb_avgs_flag", {0, 1}},
        {"lsc.log_err_flag", {0, 1}},
        {"lsc.green_balance", {0, 1}},
        {"lsc.max_gain", {0, 1000}},
        {"lsc.max_rms_err", {0, 1}},
        {"lsc.max_err", {0, 1}},
        {"lsc.avg_luma", {0, 1}},
        {"lsc.awb_avg_filter_size", {1, 160}},
        {"apply_lsc.max_delta_ab", {0, 10}},
        {"apply_lsc.test_max_delta_ab", {0, 10}},
        {"apply_lsc.sampling_factor", {1, 100}},
        {"apply_lsc.luma_normalize_factor", {0, 1}},
    };
    const auto settings = exampleSettings();
    for (const auto& [key, range] : ranges) {
        ASSERT_EQ(settings.count(key), 1u) << key;
        const double value = std::stod(settings.at(key));
        EXPECT_TRUE(range.first <= value && value <= range.second) << key << " = " << value;
    }
    EXPECT_EQ(settings.at("shared.block_name"), "reference");
}

} // namespace

// ---- shading measured on real modules ------------------------------------------

// A tuning file whose cell (column c, row r) has luminance gain 1 + c / 16 +
// r / 8 and colour gains Cr = 2 and Cb = 1.5 at 3000 K, 1.5 and 2 at 6000 K.
std::string syntheticTuning() {
    std::ostringstream lum, cr3000, cb3000, cr6000, cb6000;
    for (int r = 0; r < 12; ++r)
        for (int c = 0; c < 16; ++c) {
            const char* comma = r + c > 0 ? ", " : "";
            lum << comma << 1.0 + c / 16.0 + r / 8.0;
            cr3000 << comma << 2.0;
            cb3000 << comma << 1.5;
            cr6000 << comma << 1.5;
            cb6000 << comma << 2.0;
        }
    return "{\"version\": 2.0, \"algorithms\": [{\"rpi.black_level\": {}}, {\"rpi.alsc\": {"
           "\"luminance_lut\": [" +
           lum.str() +
           "],"
           "\"calibrations_Cr\": [{\"ct\": 3000, \"table\": [" +
           cr3000.str() +
           "]},"
           "{\"ct\": 6000, \"table\": [" +
           cr6000.str() +
           "]}],"
           "\"calibrations_Cb\": [{\"ct\": 3000, \"table\": [" +
           cb3000.str() +
           "]},"
           "{\"ct\": 6000, \"table\": [" +
           cb6000.str() + "]}]}}]}";
}

TEST(ModuleShadingRender, CellCentresCarryTheTableValuesAtTheNearestColourTemperature) {
    TempDir dir;
    writeFile(dir.file("tuning.json"), syntheticTuning());
    // 41 pixels a cell: every cell centre falls on a pixel centre.
    FlatFieldShape shape;
    shape.width = 16 * 41;
    shape.height = 12 * 41;
    shape.bits = 16;
    for (const auto& [temperature, cr, cb] : {std::tuple{3500.0, 2.0, 1.5}, {5000.0, 1.5, 2.0}}) {
        shape.module = std::make_shared<const ModuleShading>(
            ModuleShading::fromTuningFile(dir.file("tuning.json"), temperature));
        const FlatField field = makeFlatField(shape);
        for (int r = 0; r < 12; ++r)
            for (int c = 0; c < 16; ++c) {
                const int x = 41 * c + 20, y = 41 * r + 20;
                const int k = field.channelAt(x, y);
                // Relative to the brightest green, 1 / lum of cell (0, 0) = 1 / 1.
                const double lum = 1.0 + c / 16.0 + r / 8.0;
                const double colour = k == 0 ? cr : k == 3 ? cb : 1.0;
                const double expected = shape.centerLevel / (lum * colour);
                EXPECT_NEAR(field.exact[std::size_t(y) * shape.width + x], expected, 1e-6)
                    << temperature << " cell " << c << "," << r;
                EXPECT_NEAR(field.samples[std::size_t(y) * shape.width + x] / 65535.0, expected,
                            1e-5);
            }
        // Beyond the outer centres the shading keeps falling.
        EXPECT_LT(field.exact[std::size_t(shape.height - 1) * shape.width + shape.width - 2],
                  field.exact[std::size_t(12 * 41 - 21) * shape.width + 16 * 41 - 22]);
    }
}

TEST(ModuleShadingRender, ReadsTheModulesTablesAndRefusesFilesItCannotUse) {
    const ModuleShading imx219 = ModuleShading::fromTuningFile(
        std::string(LSC_SOURCE_DIR) + "/tests/data/real_modules/rpi_imx219.json", 5900);
    EXPECT_EQ(imx219.crTemperature, 6000);
    // Green 1 / lum relative to the brightest (lum 1.004); red also / Cr.
    EXPECT_NEAR(imx219.cell(1, 0, 0), 1.004 / 2.716, 1e-12);
    EXPECT_NEAR(imx219.cell(0, 0, 0), 1.004 / (2.716 * 2.179), 1e-12);
    EXPECT_NEAR(imx219.cell(3, 0, 0), 1.004 / (2.716 * 1.374), 1e-12);

    TempDir dir;
    const std::pair<const char*, const char*> bad[] = {
        {"not json", "not a JSON file"},
        {"{\"algorithms\": [{\"rpi.awb\": {}}]}", "no rpi.alsc block"},
        {"{\"rpi.alsc\": {\"luminance_lut\": [1, 2], \"calibrations_Cr\": [], "
         "\"calibrations_Cb\": []}}",
         "expected 192 gains"},
    };
    for (const auto& [text, message] : bad) {
        writeFile(dir.file("bad.json"), text);
        try {
            ModuleShading::fromTuningFile(dir.file("bad.json"), 5000);
            ADD_FAILURE() << text;
        } catch (const std::runtime_error& error) {
            EXPECT_NE(std::string(error.what()).find(message), std::string::npos) << error.what();
        }
    }
}

TEST(ModuleShadingRender, PhotonNoiseGrowsWithTheSquareRootOfTheLevel) {
    FlatFieldShape shape;
    shape.width = 16 * 41;
    shape.height = 12 * 41;
    shape.fullWell = 5000;
    shape.module = std::make_shared<const ModuleShading>(ModuleShading::fromTuningFile(
        std::string(LSC_SOURCE_DIR) + "/tests/data/real_modules/rpi_ov5647.json", 5000));
    const FlatField field = makeFlatField(shape);
    // Green pixels near the brightest level (0.8): sqrt(0.8 / 5000) of full scale.
    double sum = 0, sumOfSquares = 0;
    int count = 0;
    for (std::size_t i = 0; i < field.samples.size(); ++i)
        if (field.exact[i] > 0.78f) {
            const double difference = field.samples[i] / 1023.0 - field.exact[i];
            sum += difference;
            sumOfSquares += difference * difference;
            ++count;
        }
    ASSERT_GT(count, 1000);
    EXPECT_NEAR(std::sqrt(sumOfSquares / count - (sum / count) * (sum / count)),
                std::sqrt(0.8 / 5000), 0.0015);
}
