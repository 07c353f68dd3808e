// Calibration data survives the whole way: configuration text -> blob ->
// trees -> text dump -> configuration text -> the same blob.

#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "blob/blob_dump.h"
#include "blob/blob_parser.h"
#include "blob/blob_writer.h"
#include "config/config_file.h"

namespace blob {

using config::config_node;
using config::config_node_impl;
using config::parse_config_text;
namespace {

using Bytes = std::vector<std::uint8_t>;

constexpr char kSettings[] = R"(shared.block_name = reference;
shared.block_num_flag = 0;
shared.block_num = 0;
shared.light_source = -1;
shared.program_number = 9;
shared.cfg_file_date = 2031-12-24T18:05;
blob.compression_flag = 1;
blob.compression_res = s3.8;
)";

// What the register file and the autofocus file hold, in their own syntax.
std::string calibrationText(const std::string& controlPointPrefix) {
    std::string text = "reference.serial_no            = 0a1b2c;\n"
                       "reference.GR                   = 1023;\n"
                       "reference.R                    = 512;\n"
                       "reference.B                    = 600;\n"
                       "reference.GB                   = 1001;\n";
    const char* names[] = {"R", "GR", "GB", "B"};
    for (int c = 0; c < 4; ++c)
        for (int i = 0; i < 10; ++i)
            for (int j = 0; j < 10; ++j) {
                // Register-file precision; some values below zero, one
                // negative value that rounds to zero.
                std::ostringstream value;
                value.precision(12);
                value << (c == 2 && i == 0 && j == 0
                              ? -0.001f
                              : 1.1f + 0.0371f * static_cast<float>(c + i * j) -
                                    (i == 9 ? 3.0f : 0.0f));
                text += controlPointPrefix + ".controlPoint" + names[c] + "[" + std::to_string(i) +
                        "][" + std::to_string(j) + "]  = " + value.str() + ";\n";
            }
    text += "module.af.set[0].posture = 'H';\n"
            "module.af.set[0].macro = 4000000000;\n"
            "module.af.set[0].hyper = 250;\n"
            "module.af.set[0].inf = 120;\n"
            "module.af.set[0].settle_time = 65535;\n"
            "module.af.set[0].hysteresis = 4;\n"
            "module.af.set[0].num_pairs = 2;\n"
            "module.af.set[0].FDN_dist_pair[0] = {10, 20};\n"
            "module.af.set[0].FDN_dist_pair[1] = {30, 2147483647};\n"
            "module.af.set[1].posture = 'V';\n"
            "module.af.set[1].macro = 1;\n"
            "module.af.set[1].hyper = 2;\n"
            "module.af.set[1].inf = 3;\n"
            "module.af.set[1].settle_time = 0;\n"
            "module.af.set[1].hysteresis = 0;\n";
    return text;
}

Bytes generateFromText(const std::string& settings, const std::string& calibration) {
    config_node_impl root("root");
    config_node& config = root.child("config");
    parse_config_text(settings, config);
    parse_config_text(calibration, config);
    std::ostringstream warnings;
    return generateBlob(blobSourcesFromConfig(config), {1, 7, 2}, warnings);
}

std::string dumpOf(const Bytes& blob) {
    config_node_impl root("root");
    const BlobVersions versions =
        parseBlob(blob.data(), blob.size(), root.child("calibration"), root.child("config"));
    std::ostringstream text;
    writeCalibrationText(root.child("calibration"), "reference.", root.child("config"),
                         "BlobGenerator", "3.8.1", versions, text);
    return text.str();
}

TEST(BlobRoundTrip, DumpReadBackGivesTheSameBlob) {
    const Bytes first = generateFromText(kSettings, calibrationText("reference"));
    const std::string dump = dumpOf(first);
    // The dump reads back as register file and autofocus file together; its
    // settings lines are comments, so the settings come from the configuration.
    const Bytes second = generateFromText(kSettings, dump);
    EXPECT_EQ(second, first);
    EXPECT_EQ(dumpOf(second), dump);
}

TEST(BlobRoundTrip, DumpHasNoPairCountYetKeepsThePairs) {
    const std::string dump = dumpOf(generateFromText(kSettings, calibrationText("reference")));
    EXPECT_EQ(dump.find("num_pairs"), std::string::npos);
    EXPECT_NE(dump.find("module.af.set[0].FDN_dist_pair[1] = { 30, 2147483647 };\n"),
              std::string::npos);
}

TEST(BlobRoundTrip, ValuesSurviveTheTrip) {
    const std::string dump = dumpOf(generateFromText(kSettings, calibrationText("reference")));
    for (const char* line : {
             "reference.serial_no = 0a1b2c;\n",
             "reference.light_source = -1;\n",
             "# reference.light_id = -1;\n",
             "reference.GB = 1001;\n",
             "reference.controlPointR[0][0] = 1.1015625;\n", // 1.1 to the nearest 1/256
             "reference.controlPointGB[0][0] = -0;\n",
             "module.af.set[0].macro = 4000000000;\n",
             "module.af.set[0].settle_time = 65535;\n",
             "module.af.set[1].posture = 'V';\n",
             "# shared.program_number = 9;\n",
             "# tool.version = 1.7.2;\n",
             "# shared.cfg_file_date = 2031-12-24T18:05;\n",
         })
        EXPECT_NE(dump.find(line), std::string::npos) << line;
}

TEST(BlobRoundTrip, ControlPointsUnderABlockNumberGiveTheSameBlob) {
    const std::string numbered = std::string(kSettings) + "shared.block_num_flag = 1;\n"
                                                          "shared.block_num = 2;\n";
    EXPECT_EQ(generateFromText(numbered, calibrationText("reference.ctrlPoints[2]")),
              generateFromText(kSettings, calibrationText("reference")));
}

TEST(BlobRoundTrip, QuotedEmptySerialGivesNoTrackingBlock) {
    std::string text = calibrationText("reference");
    text.replace(text.find("0a1b2c"), 6, "\"\"");
    const Bytes blob = generateFromText(kSettings, text);
    EXPECT_EQ(blob[8] << 8 | blob[9], 0x0003); // the table starts with the tool block
    EXPECT_EQ(dumpOf(blob).find("serial_no"), std::string::npos);
}

TEST(BlobRoundTrip, EveryChangedByteOfAWrittenBlobIsAcceptedOrRefusedCleanly) {
    const Bytes blob = generateFromText(kSettings, calibrationText("reference"));
    for (std::size_t i = 0; i < blob.size(); ++i) {
        Bytes changed = blob;
        changed[i] ^= 0x5A;
        config_node_impl root("root");
        try {
            parseBlob(changed.data(), changed.size(), root.child("c"), root.child("k"));
            ADD_FAILURE() << "byte " << i << " changed, yet the digest matched";
        } catch (const std::runtime_error& e) {
            const std::string message = e.what();
            EXPECT_TRUE(
                message == "Bad CRC value" || message == "Binary calibration data is corrupt." ||
                message == "Binary calibration data is corrupt or truncated." ||
                message == "Magic number does not match." || message == "Wrong blob version." ||
                message == "Unknown header type found." ||
                message == "Two different light sources in lens shading data." ||
                message == "Compressed data values larger than 32 bits are not supported." ||
                message.rfind("Invalid config file date: ", 0) == 0)
                << "byte " << i << ": " << message;
        }
    }
}

} // namespace
} // namespace blob
