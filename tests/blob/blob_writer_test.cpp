#include <cmath>
#include <functional>
#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "blob/blob_layout.h"
#include "blob/blob_parser.h"
#include "blob/blob_writer.h"
#include "blob_test_builder.h"
#include "reference_md5.h"

namespace blob {

using config::config_node;
using config::config_node_impl;
namespace {

using test::Bytes;

std::uint64_t readBig(const Bytes& bytes, std::size_t at, int count) {
    std::uint64_t value = 0;
    for (int i = 0; i < count; ++i)
        value = value << 8 | bytes.at(at + static_cast<std::size_t>(i));
    return value;
}

// The (type, offset) table of a blob, up to and including the digest entry.
std::vector<std::pair<std::uint16_t, std::uint16_t>> table(const Bytes& blob) {
    std::vector<std::pair<std::uint16_t, std::uint16_t>> entries;
    for (std::size_t at = 8;; at += 4) {
        entries.emplace_back(readBig(blob, at, 2), readBig(blob, at + 2, 2));
        if (entries.back().first == kDigestBlock)
            return entries;
    }
}

std::size_t blockOffset(const Bytes& blob, std::uint16_t type, int occurrence = 0) {
    for (const auto& [entryType, offset] : table(blob))
        if (entryType == type && occurrence-- == 0)
            return offset;
    ADD_FAILURE() << "no block of type " << type;
    return 0;
}

class BlobWriter : public ::testing::Test {
protected:
    BlobWriter() {
        set("shared.block_name", "reference");
        set("shared.block_num_flag", "0");
        set("shared.block_num", "0");
        set("shared.light_source", "0");
        set("shared.program_number", "0");
        set("shared.cfg_file_date", "2012-05-01T10:30");
        set("blob.compression_flag", "1");
        set("blob.compression_res", "s3.8");
    }

    void set(const std::string& path, const std::string& value) {
        config.child_path(path).set(value);
    }
    void setGrids(const std::string& base, const std::function<float(int, int, int)>& value) {
        for (int c = 0; c < 4; ++c)
            for (int i = 0; i < 10; ++i)
                for (int j = 0; j < 10; ++j) {
                    std::ostringstream text;
                    text << value(c, i, j);
                    set(base + kControlPointNames[c] + "[" + std::to_string(i) + "][" +
                            std::to_string(j) + "]",
                        text.str());
                }
    }
    void setFocus(int set_, const std::string& posture, int pairs) {
        const std::string head = "module.af.set[" + std::to_string(set_) + "].";
        set(head + "posture", posture);
        set(head + "macro", "100");
        set(head + "hyper", "200");
        set(head + "inf", "300");
        set(head + "settle_time", "40");
        set(head + "hysteresis", "5");
        for (int k = 0; k < pairs; ++k) {
            set(head + "FDN_dist_pair[" + std::to_string(k) + "][0]", std::to_string(k));
            set(head + "FDN_dist_pair[" + std::to_string(k) + "][1]", std::to_string(10 * k));
        }
    }

    Bytes generate() { return generateBlob(blobSourcesFromConfig(config), version, warnings); }
    std::string failure() {
        try {
            generate();
        } catch (const std::runtime_error& e) {
            return e.what();
        }
        return "(generated)";
    }

    config_node_impl root{"root"};
    config_node& config = root.child("config");
    ToolVersion version{1, 7, 2};
    std::ostringstream warnings;
};

// ---- Layout, tool block and digest ----

TEST_F(BlobWriter, BareCalibrationDataGivesToolAndDigestOnly) {
    const Bytes blob = generate();
    ASSERT_EQ(blob.size(), 8u + 2 * 4 + 13 + 16);
    EXPECT_EQ(Bytes(blob.begin(), blob.begin() + 8), (Bytes{0xCA, 0x1B, 0xA7, 0xED, 1, 4, 0, 0}));
    EXPECT_EQ(table(blob),
              (std::vector<std::pair<std::uint16_t, std::uint16_t>>{{0x0003, 16}, {0xB10B, 29}}));
    EXPECT_EQ(Bytes(blob.begin() + 16, blob.begin() + 29),
              (Bytes{13, 1, 7, 2, 0, 0, 0, 0, 0x4F, 0x9F, 0xBB, 0x28, 0}));
    EXPECT_TRUE(warnings.str().empty());
}

TEST_F(BlobWriter, DigestIsTheMd5OfEverythingBeforeIt) {
    const Bytes blob = generate();
    const Bytes covered(blob.begin(), blob.end() - 16);
    const auto expected = test::referenceMd5(covered);
    EXPECT_TRUE(std::equal(expected.begin(), expected.end(), blob.end() - 16));
}

TEST_F(BlobWriter, ProgramNumberIsTheLastToolByte) {
    set("shared.program_number", "255");
    EXPECT_EQ(generate().at(28), 255);
    set("shared.program_number", "256");
    EXPECT_EQ(failure(), "Value for shared.program_number does not fit in the binary calibration "
                         "data, value must be between 0 and 255.");
}

TEST_F(BlobWriter, MissingDateWarnsOnceAndWritesZero) {
    set("shared.cfg_file_date", "");
    const Bytes blob = generate();
    EXPECT_EQ(warnings.str(),
              "WARNING: No shared.cfg_file_date attribute specified in config file.\n");
    EXPECT_EQ(readBig(blob, 16 + 4, 8), 0u);
}

TEST_F(BlobWriter, AbsentDateKeyWarnsToo) {
    config_node_impl bare("root");
    config_node& other = bare.child("config");
    for (const char* key : {"block_name", "block_num_flag", "block_num", "program_number"})
        other.child("shared").child(key).set(config.find("shared").find(key).as_string());
    generateBlob(blobSourcesFromConfig(other), version, warnings);
    EXPECT_EQ(warnings.str(),
              "WARNING: No shared.cfg_file_date attribute specified in config file.\n");
}

TEST_F(BlobWriter, MalformedDateIsRefused) {
    set("shared.cfg_file_date", "2012-05-01 10:30");
    EXPECT_EQ(failure(),
              "Invalid value for shared.cfg_file_date attribute (must be YYYY-MM-DDTHH:MM).");
}

TEST_F(BlobWriter, BlocksFollowTheTableInFixedOrder) {
    set("reference.serial_no", "0a1b");
    setGrids("reference.", [](int, int, int) { return 1.0f; });
    for (const char* name : {"R", "GR", "GB", "B"})
        set(std::string("reference.") + name, "512");
    setFocus(0, "'H'", 1);
    setFocus(1, "'V'", 0);
    const Bytes blob = generate();
    const auto entries = table(blob);
    ASSERT_EQ(entries.size(), 7u);
    const std::uint16_t types[] = {0x0001, 0x0003, 0x0010, 0x0020, 0x0030, 0x0030, 0xB10B};
    const std::size_t sizes[] = {4, 13, 4 + 600, 10, 18 + 8, 18};
    std::size_t offset = 8 + 7 * 4;
    for (std::size_t i = 0; i < entries.size(); ++i) {
        EXPECT_EQ(entries[i].first, types[i]);
        EXPECT_EQ(entries[i].second, offset);
        if (i < 6)
            offset += sizes[i];
    }
    EXPECT_EQ(blob.size(), offset + 16);
}

TEST_F(BlobWriter, OffsetsThatWouldWrapAreRefused) {
    for (int s = 0; s < 32; ++s) // 32 sets of 255 pairs: about 66 KB
        setFocus(s, "H", 255);
    EXPECT_EQ(failure(),
              "Binary calibration data too large: block offsets must stay below 64 KiB.");
}

// ---- Tracking data ----

TEST_F(BlobWriter, SerialBecomesTheTrackingBlock) {
    set("reference.serial_no", "0A1bFF");
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kTrackingBlock);
    EXPECT_EQ(Bytes(blob.begin() + at, blob.begin() + at + 5), (Bytes{0, 5, 0x0A, 0x1B, 0xFF}));
}

TEST_F(BlobWriter, QuotedSerialIsReadWithoutItsQuotes) {
    set("reference.serial_no", "\"0a1b\"");
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kTrackingBlock);
    EXPECT_EQ(Bytes(blob.begin() + at, blob.begin() + at + 4), (Bytes{0, 4, 0x0A, 0x1B}));
}

TEST_F(BlobWriter, EmptySerialGivesNoTrackingBlock) {
    set("reference.serial_no", "\"\"");
    EXPECT_EQ(table(generate()).front().first, kToolBlock);
}

TEST_F(BlobWriter, ModuleSerialServesWhenTheRegisterFileHasNone) {
    set("reference.serial_no", "\"\"");
    set("module.serial_no", "c0de");
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kTrackingBlock);
    EXPECT_EQ(Bytes(blob.begin() + at, blob.begin() + at + 4), (Bytes{0, 4, 0xC0, 0xDE}));
}

TEST_F(BlobWriter, SerialThatIsNotHexIsRefused) {
    set("reference.serial_no", "0a1");
    EXPECT_EQ(failure(), "Value for reference.serial_no is not a valid serial number, it must be "
                         "an even number of hexadecimal digits.");
    set("reference.serial_no", "\"SN-01\"");
    EXPECT_EQ(failure(), "Value for reference.serial_no is not a valid serial number, it must be "
                         "an even number of hexadecimal digits.");
}

// ---- Lens shading ----

TEST_F(BlobWriter, ControlPointsArePackedInChannelAndRowOrder) {
    setGrids("reference.", [](int c, int i, int j) {
        return c == 0 && i == 0 && j == 0 ? 1.5f : c == 3 && i == 9 && j == 9 ? -1.5f : 0.0f;
    });
    set("shared.light_source", "2");
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kLscBlock);
    EXPECT_EQ(Bytes(blob.begin() + at, blob.begin() + at + 6), (Bytes{2, 3, 8, 0, 0x18, 0x00}));
    EXPECT_EQ(blob[at + 4 + 598], 0x09); // last code 0x980
    EXPECT_EQ(blob[at + 4 + 599], 0x80);
}

TEST_F(BlobWriter, NoLightSourceIsStoredWithAllBitsSet) {
    set("shared.light_source", "-1");
    setGrids("reference.", [](int, int, int) { return 1.0f; });
    for (const char* name : {"R", "GR", "GB", "B"})
        set(std::string("reference.") + name, "1");
    const Bytes blob = generate();
    EXPECT_EQ(blob[blockOffset(blob, kLscBlock)], 0xFF);
    EXPECT_EQ(readBig(blob, blockOffset(blob, kAwbBlock), 2), 0xFFFFu);
}

TEST_F(BlobWriter, ControlPointsUnderTheBlockNumber) {
    set("shared.block_num_flag", "1");
    set("shared.block_num", "2");
    setGrids("reference.ctrlPoints[2].", [](int, int, int) { return 0.5f; });
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kLscBlock);
    EXPECT_EQ(readBig(blob, at + 4, 2), 0x0800u); // two codes of 0x080
}

TEST_F(BlobWriter, UncompressedDataIsNotSupported) {
    setGrids("reference.", [](int, int, int) { return 1.0f; });
    set("blob.compression_flag", "0");
    EXPECT_EQ(failure(), "Only compressed LSC data is supported.");
}

TEST_F(BlobWriter, MalformedFormatIsRefused) {
    setGrids("reference.", [](int, int, int) { return 1.0f; });
    set("blob.compression_res", "s38");
    EXPECT_EQ(failure(), "Invalid compression format in configuration file.");
}

TEST_F(BlobWriter, CodesOfAtMostSixteenBits) {
    setGrids("reference.", [](int, int, int) { return 100.0f; });
    set("blob.compression_res", "s7.8");
    const Bytes blob = generate();
    EXPECT_EQ(blob[blockOffset(blob, kLscBlock) + 1], 7);
    set("blob.compression_res", "s8.8");
    EXPECT_EQ(failure(), "Compressed data values larger than 16 bits are not supported.");
}

TEST_F(BlobWriter, ControlPointCountMayNotBeGiven) {
    setGrids("reference.", [](int, int, int) { return 1.0f; });
    set("blob.ctrlPointsCount", "400");
    EXPECT_EQ(failure(), "Specifying the number of control points is not is not supported.");
}

TEST_F(BlobWriter, ControlPointOutsideTheFormatRange) {
    setGrids("reference.",
             [](int c, int i, int j) { return c == 1 && i == 4 && j == 4 ? 8.0f : 1.0f; });
    const std::string expected =
        "Lens shading value (8) is outside of the range allowed for the "
        "lensShading.compression_res value specified in the configuration file.\n"
        "Possible reasons include poor calibration image, invalid configuration file, or "
        "configuration file values that do not match the sensor being used.\n";
    EXPECT_EQ(failure(), expected);
    EXPECT_THROW(generate(), std::range_error);
    setGrids("reference.", [](int, int, int) { return 7.99609375f; });
    EXPECT_NO_THROW(generate());
    setGrids("reference.", [](int, int, int) { return -7.99609375f; });
    EXPECT_NO_THROW(generate());
}

TEST_F(BlobWriter, NotANumberIsOutsideEveryRange) {
    setGrids("reference.", [](int, int, int) { return std::nanf(""); });
    EXPECT_EQ(failure().rfind("Lens shading value (nan) is outside of the range", 0), 0u);
}

TEST_F(BlobWriter, MissingControlPointRaisesTheTreeError) {
    set("reference.controlPointR[0][0]", "1");
    try {
        generate();
        ADD_FAILURE() << "generated with 399 control points missing";
    } catch (const std::invalid_argument& e) {
        EXPECT_STREQ(e.what(), "None node does not have a value");
    }
}

// ---- White balance ----

TEST_F(BlobWriter, WhiteBalanceAverages) {
    set("shared.light_source", "3");
    set("reference.R", "512");
    set("reference.GR", "1023");
    set("reference.GB", "1000");
    set("reference.B", "65535");
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kAwbBlock);
    EXPECT_EQ(Bytes(blob.begin() + at, blob.begin() + at + 10),
              (Bytes{0, 3, 0x02, 0x00, 0x03, 0xFF, 0x03, 0xE8, 0xFF, 0xFF}));
}

TEST_F(BlobWriter, AverageWiderThanSixteenBitsIsRefused) {
    for (const char* name : {"R", "GR", "GB", "B"})
        set(std::string("reference.") + name, "1");
    set("reference.GB", "65536");
    EXPECT_EQ(failure(), "Value for reference.GB does not fit in the binary calibration data, "
                         "value must be between 0 and 65535.");
}

// ---- Focus calibration ----

TEST_F(BlobWriter, FocusSetInTheWideLayout) {
    setFocus(0, "'H'", 2);
    set("module.af.set[0].macro", "4294967295");
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kFocusBlock);
    const Bytes expected = {'H', 0xFF, 0xFF, 0xFF, 0xFF, 0, 0, 0, 200, 0, 0, 1, 44, 0, 40, 0, 5,
                            2,   0,    0,    0,    0,    0, 0, 0, 0,   0, 0, 0, 1,  0, 0,  0, 10};
    EXPECT_EQ(Bytes(blob.begin() + at, blob.begin() + at + expected.size()), expected);
}

TEST_F(BlobWriter, PostureWithoutQuotesIsItsFirstCharacter) {
    setFocus(0, "V", 0);
    const Bytes blob = generate();
    EXPECT_EQ(blob[blockOffset(blob, kFocusBlock)], 'V');
}

TEST_F(BlobWriter, GivenPairCountIsUsed) {
    setFocus(0, "H", 3);
    set("module.af.set[0].num_pairs", "1");
    const Bytes blob = generate();
    const std::size_t at = blockOffset(blob, kFocusBlock);
    EXPECT_EQ(blob[at + 17], 1);
    EXPECT_EQ(blockOffset(blob, kDigestBlock), at + 18 + 8);
}

TEST_F(BlobWriter, PairCountBeyondThePairsNamesTheMissingPair) {
    setFocus(0, "H", 1);
    set("module.af.set[0].num_pairs", "2");
    EXPECT_EQ(failure(), "Missing value for module.af.set[0].FDN_dist_pair[1].");
}

TEST_F(BlobWriter, MissingFocusValueIsNamed) {
    set("module.af.set[0].posture", "'H'");
    set("module.af.set[0].macro", "1");
    EXPECT_EQ(failure(), "Missing value for module.af.set[0].hyper.");
}

TEST_F(BlobWriter, SetsEndAtTheFirstMissingPosture) {
    setFocus(0, "H", 0);
    setFocus(2, "H", 0); // set[1] exists only as a gap
    std::size_t focusBlocks = 0;
    for (const auto& entry : table(generate()))
        focusBlocks += entry.first == kFocusBlock;
    EXPECT_EQ(focusBlocks, 1u);
}

TEST_F(BlobWriter, FocusValuesWiderThanTheirFieldsAreRefused) {
    const struct {
        const char* key;
        const char* value;
        const char* message;
    } cases[] = {
        {"settle_time", "65536",
         "Value for module.af.set[0].settle_time does not fit in the binary calibration data, "
         "value must be between 0 and 65535."},
        {"hysteresis", "70000",
         "Value for module.af.set[0].hysteresis does not fit in the binary calibration data, "
         "value must be between 0 and 65535."},
        {"macro", "4294967296",
         "Value for module.af.set[0].macro does not fit in the binary calibration data, value "
         "must be between 0 and 4294967295."},
        {"inf", "-1",
         "Value for module.af.set[0].inf does not fit in the binary calibration data, value "
         "must be between 0 and 4294967295."},
        {"num_pairs", "256",
         "Value for module.af.set[0].num_pairs does not fit in the binary calibration data, "
         "value must be between 0 and 255."},
        {"FDN_dist_pair[0][1]", "-5",
         "Value for module.af.set[0].FDN_dist_pair[0][1] does not fit in the binary calibration "
         "data, value must be between 0 and 4294967295."},
        {"hyper", "1.5", "Value for module.af.set[0].hyper is not a whole number."},
    };
    for (const auto& c : cases) {
        setFocus(0, "H", 1);
        set(std::string("module.af.set[0].") + c.key, c.value);
        EXPECT_EQ(failure(), c.message) << c.key;
        set(std::string("module.af.set[0].") + c.key, "1"); // restore a valid value
    }
}

TEST_F(BlobWriter, MoreThan255PairsAreRefused) {
    setFocus(0, "H", 256);
    EXPECT_EQ(failure(), "Value for module.af.set[0].FDN_dist_pair has more than 255 pairs, more "
                         "than the binary calibration data can hold.");
}

} // namespace
} // namespace blob
