#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "blob/blob_parser.h"
#include "blob_test_builder.h"

namespace blob {

using config::config_node;
using config::config_node_impl;
namespace {

using test::BlobBuilder;
using test::Bytes;
using test::Focus;

class BlobParser : public ::testing::Test {
protected:
    BlobVersions parse(const Bytes& bytes) {
        return parseBlob(bytes.data(), bytes.size(), calibration, config);
    }
    std::string failure(const Bytes& bytes) {
        try {
            parse(bytes);
        } catch (const std::runtime_error& e) {
            return e.what();
        }
        return "(accepted)";
    }
    std::string value(const config_node& node, const std::string& path) {
        return node.find_path(path).as_string();
    }
    static Bytes tool() { return test::toolBlock(2, 4, 10, 1335868200, 7); }

    config_node_impl root{"root"};
    config_node& calibration = root.child("calibration");
    config_node& config = root.child("config");
};

// ---- Header ----

TEST_F(BlobParser, RefusesDataShorterThanTheHeader) {
    EXPECT_EQ(failure({0xCA, 0x1B, 0xA7, 0xED, 1, 4, 0}),
              "Binary calibration data is corrupt or truncated.");
    EXPECT_EQ(failure({}), "Binary calibration data is corrupt or truncated.");
}

TEST_F(BlobParser, ChangedMagicFailsBeforeAnyBlockIsRead) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob[3] ^= 0x01;
    EXPECT_EQ(failure(blob), "Magic number does not match.");
    EXPECT_FALSE(config.find("shared").valid());
}

TEST_F(BlobParser, RefusesOtherMajorVersions) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob[4] = 2;
    EXPECT_EQ(failure(blob), "Wrong blob version.");
}

TEST_F(BlobParser, ReturnsTheBlobVersionBytesAndTheToolVersion) {
    Bytes blob = BlobBuilder().minor(5).block(kToolBlock, tool()).build();
    blob[6] = 9;
    test::resign(blob);
    const BlobVersions versions = parse(blob);
    EXPECT_EQ(versions.blob, (std::array<std::uint8_t, 3>{1, 5, 9}));
    EXPECT_EQ(versions.tool, (std::array<std::uint8_t, 3>{2, 4, 10}));
}

// ---- Table ----

TEST_F(BlobParser, ToolAndDigestAloneAreValid) {
    parse(BlobBuilder().block(kToolBlock, tool()).build());
    EXPECT_EQ(value(config, "shared.program_number"), "7");
    EXPECT_FALSE(calibration.find("controlPointR").valid());
}

TEST_F(BlobParser, DigestAloneIsValid) {
    const BlobVersions versions = parse(BlobBuilder().build());
    EXPECT_EQ(versions.tool, (std::array<std::uint8_t, 3>{0, 0, 0}));
}

TEST_F(BlobParser, EntryPointingIntoTheTableIsCorrupt) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob[10] = 0;
    blob[11] = 11; // the tool entry at 8..11 points at 11
    EXPECT_EQ(failure(blob), "Binary calibration data is corrupt.");
}

TEST_F(BlobParser, EntryJustBehindItselfIsAllowed) {
    // The white-balance entry at 8..11 pointing at 12, where the digest entry
    // starts: the table rules allow it; only the digest then disagrees.
    Bytes blob = BlobBuilder().block(kAwbBlock, test::awbBlock(0, 1, 2, 3, 4)).build();
    blob[11] = 12;
    EXPECT_EQ(failure(blob), "Bad CRC value");
}

TEST_F(BlobParser, BlockRunningPastTheEndIsTruncated) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob.resize(blob.size() - 16 - 2); // no digest, tool block cut short
    EXPECT_EQ(failure(blob), "Binary calibration data is corrupt or truncated.");
}

TEST_F(BlobParser, OffsetBeyondTheEndIsTruncated) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob[10] = 0xFF;
    EXPECT_EQ(failure(blob), "Binary calibration data is corrupt or truncated.");
}

TEST_F(BlobParser, TableThatNeverReachesTheDigestIsTruncated) {
    EXPECT_EQ(failure({0xCA, 0x1B, 0xA7, 0xED, 1, 4, 0, 0}),
              "Binary calibration data is corrupt or truncated.");
    EXPECT_EQ(failure({0xCA, 0x1B, 0xA7, 0xED, 1, 4, 0, 0, 0xB1, 0x0B}),
              "Binary calibration data is corrupt or truncated.");
}

TEST_F(BlobParser, UnknownBlockType) {
    Bytes blob = BlobBuilder().block(0x0002, {1, 2, 3}).build();
    EXPECT_EQ(failure(blob), "Unknown header type found.");
}

TEST_F(BlobParser, ChangedDigestByteIsABadChecksum) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob.back() ^= 0x80;
    EXPECT_EQ(failure(blob), "Bad CRC value");
}

TEST_F(BlobParser, DigestCutShortIsTruncated) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob.pop_back();
    EXPECT_EQ(failure(blob), "Binary calibration data is corrupt or truncated.");
}

TEST_F(BlobParser, BytesAfterTheDigestAreIgnored) {
    Bytes blob = BlobBuilder().block(kToolBlock, tool()).build();
    blob.resize(blob.size() + 100, 0xEE);
    EXPECT_NO_THROW(parse(blob));
}

TEST_F(BlobParser, TableThatReusesOneBlockManyTimesIsCorrupt) {
    // Many entries at one large focus block would build a huge tree from a
    // small blob; blocks together cannot be larger than the blob.
    Focus focus;
    focus.pairs.assign(255, {1, 2});
    BlobBuilder builder;
    builder.block(kFocusBlock, test::focusBlock(focus));
    Bytes blob = builder.build();
    // Insert more focus entries, all pointing at the one block.
    const std::size_t copies = 3;
    Bytes grown(blob.begin(), blob.begin() + 8);
    const std::size_t shift = 4 * copies;
    const std::uint16_t offset = static_cast<std::uint16_t>(16 + shift);
    for (std::size_t i = 0; i <= copies; ++i)
        test::put(grown, (std::uint32_t{kFocusBlock} << 16) | offset, 4);
    test::put(grown,
              (std::uint32_t{kDigestBlock} << 16) |
                  static_cast<std::uint16_t>(offset + (blob.size() - 16 - 16)),
              4);
    grown.insert(grown.end(), blob.begin() + 16, blob.end() - 16);
    grown.resize(grown.size() + 16);
    test::resign(grown);
    EXPECT_EQ(failure(grown), "Binary calibration data is corrupt.");
}

// ---- Tracking data ----

TEST_F(BlobParser, SerialBecomesLowercaseHex) {
    parse(BlobBuilder().block(kTrackingBlock, test::trackingBlock({0x0A, 0x1B, 0xFF})).build());
    EXPECT_EQ(value(calibration, "serial_no"), "0a1bff");
}

TEST_F(BlobParser, EmptySerialIsStoredEmpty) {
    parse(BlobBuilder().block(kTrackingBlock, test::trackingBlock({})).build());
    EXPECT_EQ(value(calibration, "serial_no"), "");
}

TEST_F(BlobParser, TrackingLengthBelowItsOwnSizeIsCorrupt) {
    for (std::uint8_t length : {std::uint8_t{0}, std::uint8_t{1}}) {
        EXPECT_EQ(failure(BlobBuilder().block(kTrackingBlock, {0, length, 0, 0}).build()),
                  "Binary calibration data is corrupt.");
    }
}

TEST_F(BlobParser, TrackingLengthPastTheEndIsTruncated) {
    Bytes blob = BlobBuilder().block(kTrackingBlock, {0xFF, 0xFF, 1, 2}).build();
    EXPECT_EQ(failure(blob), "Binary calibration data is corrupt or truncated.");
    EXPECT_FALSE(calibration.find("serial_no").valid());
}

// ---- Calibration tool ----

TEST_F(BlobParser, ToolBlockGivesDateAndProgramNumber) {
    parse(BlobBuilder().block(kToolBlock, tool()).build());
    EXPECT_EQ(value(config, "shared.cfg_file_date"), "2012-05-01T10:30");
    EXPECT_EQ(value(config, "shared.program_number"), "7");
}

TEST_F(BlobParser, DateUsesAll64Bits) {
    parse(BlobBuilder().block(kToolBlock, test::toolBlock(1, 7, 2, 4102444800, 0)).build());
    EXPECT_EQ(value(config, "shared.cfg_file_date"), "2100-01-01T00:00");
    parse(BlobBuilder()
              .block(kToolBlock, test::toolBlock(1, 7, 2, static_cast<std::uint64_t>(-86400), 0))
              .build());
    EXPECT_EQ(value(config, "shared.cfg_file_date"), "1969-12-31T00:00");
}

TEST_F(BlobParser, DateBeyondFourDigitYearsIsRefused) {
    EXPECT_EQ(failure(BlobBuilder()
                          .block(kToolBlock, test::toolBlock(1, 7, 2, 0x7FFFFFFFFFFFFFFFull, 0))
                          .build()),
              "Invalid config file date: 9223372036854775807");
    EXPECT_EQ(failure(BlobBuilder()
                          .block(kToolBlock, test::toolBlock(1, 7, 2, 0x8000000000000000ull, 0))
                          .build()),
              "Invalid config file date: -9223372036854775808");
}

// ---- Lens shading ----

TEST_F(BlobParser, LensShadingCodesBecomeControlPoints) {
    // s3.8: 1.5 is 0x180, -1.5 is 0x980; every other point 0.25 (0x040).
    const auto code = [](int n) { return n == 0 ? 0x180 : n == 399 ? 0x980 : 0x040; };
    parse(BlobBuilder().block(kLscBlock, test::lscBlock(2, 3, 8, code)).build());
    EXPECT_EQ(value(calibration, "controlPointR[0][0]"), "1.5");
    EXPECT_EQ(value(calibration, "controlPointR[0][1]"), "0.25");
    EXPECT_EQ(value(calibration, "controlPointGB[9][9]"), "0.25");
    EXPECT_EQ(value(calibration, "controlPointB[9][9]"), "-1.5");
    EXPECT_EQ(value(config, "blob.compression_res"), "s3.8");
    EXPECT_EQ(value(config, "shared.light_source"), "2");
}

TEST_F(BlobParser, ChannelsFollowEachOtherInOrder) {
    const auto code = [](int n) { return (n / 100 + 1) << 8; }; // channel c holds c + 1
    parse(BlobBuilder().block(kLscBlock, test::lscBlock(0, 3, 8, code)).build());
    EXPECT_EQ(value(calibration, "controlPointR[5][5]"), "1");
    EXPECT_EQ(value(calibration, "controlPointGR[5][5]"), "2");
    EXPECT_EQ(value(calibration, "controlPointGB[5][5]"), "3");
    EXPECT_EQ(value(calibration, "controlPointB[5][5]"), "4");
}

TEST_F(BlobParser, PackedCodesShorterThanFourHundredAreTruncated) {
    Bytes blob =
        BlobBuilder().block(kLscBlock, test::lscBlock(0, 3, 8, [](int) { return 0; })).build();
    blob.resize(blob.size() - 16 - 1); // no digest, and the last code byte missing
    EXPECT_EQ(failure(blob), "Binary calibration data is corrupt or truncated.");
    EXPECT_FALSE(calibration.find("controlPointR").valid());
    EXPECT_FALSE(config.find("shared").find("light_source").valid());
}

TEST_F(BlobParser, CodesWiderThan32BitsAreRefused) {
    const Bytes blob = BlobBuilder().block(kLscBlock, {0, 200, 200, 0}).build();
    EXPECT_EQ(failure(blob), "Compressed data values larger than 32 bits are not supported.");
}

TEST_F(BlobParser, ReadsThirtyTwoBitCodes) {
    const auto code = [](int) { return 0x00018000u; }; // 1.5 in s15.16
    parse(BlobBuilder().block(kLscBlock, test::lscBlock(0, 15, 16, code)).build());
    EXPECT_EQ(value(calibration, "controlPointB[9][9]"), "1.5");
    EXPECT_EQ(value(config, "blob.compression_res"), "s15.16");
}

// ---- White balance and light source ----

TEST_F(BlobParser, WhiteBalanceAverages) {
    parse(BlobBuilder().block(kAwbBlock, test::awbBlock(3, 512, 1023, 1000, 600)).build());
    EXPECT_EQ(value(calibration, "R"), "512");
    EXPECT_EQ(value(calibration, "GR"), "1023");
    EXPECT_EQ(value(calibration, "GB"), "1000");
    EXPECT_EQ(value(calibration, "B"), "600");
    EXPECT_EQ(value(config, "shared.light_source"), "3");
}

TEST_F(BlobParser, DifferentLightSourcesAreRefused) {
    const Bytes blob = BlobBuilder()
                           .block(kLscBlock, test::lscBlock(2, 3, 8, [](int) { return 0; }))
                           .block(kAwbBlock, test::awbBlock(3, 1, 1, 1, 1))
                           .build();
    EXPECT_EQ(failure(blob), "Two different light sources in lens shading data.");
}

TEST_F(BlobParser, NoLightSourceIsTheSameInBothWidths) {
    // shared.light_source = -1 is stored as 0xFF and 0xFFFF.
    parse(BlobBuilder()
              .block(kLscBlock, test::lscBlock(0xFF, 3, 8, [](int) { return 0; }))
              .block(kAwbBlock, test::awbBlock(0xFFFF, 1, 1, 1, 1))
              .build());
    EXPECT_EQ(value(config, "shared.light_source"), "-1");
}

TEST_F(BlobParser, LightSource255IsTheSameInBothWidths) {
    parse(BlobBuilder()
              .block(kLscBlock, test::lscBlock(0xFF, 3, 8, [](int) { return 0; }))
              .block(kAwbBlock, test::awbBlock(0x00FF, 1, 1, 1, 1))
              .build());
    EXPECT_EQ(value(config, "shared.light_source"), "255");
}

TEST_F(BlobParser, LightSourcesAreNotComparedByTheirLowBitsOnly) {
    EXPECT_EQ(failure(BlobBuilder()
                          .block(kLscBlock, test::lscBlock(2, 3, 8, [](int) { return 0; }))
                          .block(kAwbBlock, test::awbBlock(0x0102, 1, 1, 1, 1))
                          .build()),
              "Two different light sources in lens shading data.");
    EXPECT_EQ(failure(BlobBuilder()
                          .block(kAwbBlock, test::awbBlock(0xFFFF, 1, 1, 1, 1))
                          .block(kAwbBlock, test::awbBlock(0x00FF, 1, 1, 1, 1))
                          .build()),
              "Two different light sources in lens shading data.");
}

// ---- Focus calibration ----

TEST_F(BlobParser, FocusSetsFollowTheTableOrder) {
    Focus first;
    first.posture = 'H';
    first.macro = 4000000000u;
    first.hyper = 200;
    first.inf = 100;
    first.settle = 65535;
    first.hysteresis = 3;
    first.pairs = {{1, 2}, {3000000000u, 4}};
    Focus second;
    second.posture = 'V';
    parse(BlobBuilder()
              .block(kFocusBlock, test::focusBlock(first))
              .block(kFocusBlock, test::focusBlock(second))
              .build());
    const config_node& set = calibration.find_path("module.af.set[0]");
    EXPECT_EQ(value(set, "posture"), "H");
    EXPECT_EQ(value(set, "macro"), "4000000000");
    EXPECT_EQ(value(set, "hyper"), "200");
    EXPECT_EQ(value(set, "inf"), "100");
    EXPECT_EQ(value(set, "settle_time"), "65535");
    EXPECT_EQ(value(set, "hysteresis"), "3");
    EXPECT_EQ(value(set, "num_pairs"), "2");
    EXPECT_EQ(value(set, "FDN_dist_pair[1][0]"), "3000000000");
    EXPECT_EQ(value(set, "FDN_dist_pair[1][1]"), "4");
    EXPECT_EQ(value(calibration, "module.af.set[1].posture"), "V");
    EXPECT_EQ(value(calibration, "module.af.set[1].num_pairs"), "0");
}

TEST_F(BlobParser, MinorVersion3UsesTheNarrowFocusLayout) {
    Focus focus;
    focus.macro = 0x1234;
    focus.inf = 0xFFFF;
    focus.settle = 7;
    focus.pairs = {{5, 6}};
    parse(BlobBuilder().minor(3).block(kFocusBlock, test::focusBlock(focus, false)).build());
    EXPECT_EQ(value(calibration, "module.af.set[0].macro"), "4660");
    EXPECT_EQ(value(calibration, "module.af.set[0].inf"), "65535");
    EXPECT_EQ(value(calibration, "module.af.set[0].settle_time"), "7");
    EXPECT_EQ(value(calibration, "module.af.set[0].FDN_dist_pair[0][1]"), "6");
}

TEST_F(BlobParser, PairCountRunningPastTheBlobIsTruncated) {
    Focus focus;
    focus.pairs = {{1, 2}};
    Bytes block = test::focusBlock(focus);
    block[17] = 200; // claims 200 pairs, holds one
    EXPECT_EQ(failure(BlobBuilder().block(kFocusBlock, block).build()),
              "Binary calibration data is corrupt or truncated.");
    EXPECT_FALSE(calibration.find("module").valid());
}

} // namespace
} // namespace blob
