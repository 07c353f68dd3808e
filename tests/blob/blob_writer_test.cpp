// The reference calibration (tests/data/blob/reference.cfg) the whole way:
// configuration -> blob -> trees -> text dump -> configuration -> the same
// blob. The blob and its dump are golden files; configurations that must give
// the same blob, and every refusal of the writer, are rows of data files.

#include <fstream>
#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "blob/blob_dump.h"
#include "blob/blob_parser.h"
#include "blob/blob_writer.h"
#include "blob/md5.h"
#include "config/config_file.h"
#include "golden_file.h"

namespace blob {
namespace {

using Bytes = std::vector<std::uint8_t>;
using testing_support::dataPath;
using testing_support::readFile;

const std::string kReference = readFile(dataPath("blob/reference.cfg"));
const std::string kSettings = kReference.substr(0, kReference.find("reference.serial_no"));

Bytes generate(const std::string& text, std::ostream& warnings) {
    config::config_node_impl root("root");
    config::parse_config_text(text, root.child("config"));
    return generateBlob(blobSourcesFromConfig(root.child("config")), {1, 7, 2}, warnings);
}

Bytes generate(const std::string& text) {
    std::ostringstream warnings;
    return generate(text, warnings);
}

std::string dumpOf(const Bytes& blob) {
    config::config_node_impl root("root");
    const BlobVersions versions =
        parseBlob(blob.data(), blob.size(), root.child("calibration"), root.child("config"));
    std::ostringstream text;
    writeCalibrationText(root.child("calibration"), "reference.", root.child("config"),
                         "BlobGenerator", "3.8.1", versions, text);
    return text.str();
}

// Rows of a data file: "<base>|<configuration lines>|<expected>", '#' starts a
// comment line, "\n" in the expected text is a line break.
std::vector<std::array<std::string, 3>> rows(const std::string& name) {
    std::vector<std::array<std::string, 3>> result;
    for (const std::string& line : testing_support::dataRows(name)) {
        const std::size_t a = line.find('|'), b = line.find('|', a + 1);
        std::string expected = line.substr(b + 1);
        for (std::size_t at; (at = expected.find("\\n")) != std::string::npos;)
            expected.replace(at, 2, "\n");
        result.push_back({line.substr(0, a), line.substr(a + 1, b - a - 1), expected});
    }
    return result;
}

std::string base(const std::string& name) {
    return name == "reference" ? kReference : kSettings;
}

TEST(BlobGolden, ReferenceBlobAndItsDumpReadBackToTheSameBlob) {
    std::ostringstream warnings;
    const Bytes blob = generate(kReference, warnings);
    EXPECT_EQ(warnings.str(), "");
    testing_support::expectGolden("blob/reference.blob", std::string(blob.begin(), blob.end()));
    const std::string dump = dumpOf(blob);
    testing_support::expectGolden("blob/reference_dump.txt", dump);
    // The dump's settings lines are comments: the settings come from the configuration.
    EXPECT_EQ(generate(kSettings + dump), blob);
}

TEST(BlobWriter, EquivalentConfigurationsGiveTheSameBlob) {
    const Bytes reference = generate(kReference);
    for (const auto& [from, lines, expected] : rows("blob/writer_equivalents.txt")) {
        std::string text = base(from);
        if (!expected.empty()) // "old=>new" renames every old to new
            for (std::size_t at, arrow = expected.find("=>");
                 (at = text.find(expected.substr(0, arrow))) != std::string::npos;)
                text.replace(at, arrow, expected.substr(arrow + 2));
        EXPECT_EQ(generate(text + lines), reference) << lines << expected;
    }
}

// What generating from `text` gives: "(generated)" or the message it throws.
std::string outcome(const std::string& text) {
    try {
        generate(text);
    } catch (const std::exception& e) {
        return e.what();
    }
    return "(generated)";
}

TEST(BlobWriter, RefusalsNameTheValue) {
    for (const auto& [from, lines, expected] : rows("blob/writer_refusals.txt"))
        EXPECT_EQ(outcome(base(from) + lines), expected.empty() ? "(generated)" : expected)
            << lines;
}

// Without a date the tool block holds zero (after a warning); with an empty
// serial number the table starts with the tool block, without tracking block.
TEST(BlobWriter, MissingDateAndEmptySerial) {
    std::ostringstream warnings;
    const Bytes noDate =
        generate(kSettings.substr(0, kSettings.find("shared.cfg_file_date")), warnings);
    EXPECT_EQ(warnings.str(),
              "WARNING: No shared.cfg_file_date attribute specified in config file.\n");
    testing_support::expectGolden("blob/no_date.blob", std::string(noDate.begin(), noDate.end()));
    const Bytes noSerial = generate(kReference + "reference.serial_no = \"\";");
    testing_support::expectGolden("blob/no_serial.blob",
                                  std::string(noSerial.begin(), noSerial.end()));
}

// `sets` focus sets of `pairs` pairs each.
std::string focusSets(int sets, int pairs) {
    std::string text = kSettings;
    for (int s = 0; s < sets; ++s) {
        const std::string set = "module.af.set[" + std::to_string(s) + "].";
        text += set + "posture = H;" + set + "macro = 1;" + set + "hyper = 1;" + set + "inf = 1;" +
                set + "settle_time = 1;" + set + "hysteresis = 1;";
        for (int k = 0; k < pairs; ++k)
            text += set + "FDN_dist_pair[" + std::to_string(k) + "] = {1, 2};";
    }
    return text;
}

TEST(BlobWriter, SizeLimits) {
    EXPECT_EQ(outcome(focusSets(1, 255)), "(generated)");
    EXPECT_EQ(outcome(focusSets(1, 256)), "Value for module.af.set[0].FDN_dist_pair has more than "
                                          "255 pairs, more than the binary calibration data can "
                                          "hold.");
    EXPECT_EQ(outcome(focusSets(32, 255)), // about 66 KB
              "Binary calibration data too large: block offsets must stay below 64 KiB.");
    // Blocks together cannot be larger than the blob: a table naming one large
    // focus block twice would build a huge tree from a small one.
    Bytes twice = generate(focusSets(1, 255));
    EXPECT_NE(dumpOf(twice).find("FDN_dist_pair[254] = { 1, 2 };"), std::string::npos);
    const std::uint8_t focusEntry[] = {0x00, 0x30, twice[14], twice[15]};
    std::copy(focusEntry, focusEntry + 4, twice.begin() + 8); // over the tool entry
    const Md5Digest digest = md5(twice.data(), twice.size() - 16);
    std::copy(digest.begin(), digest.end(), twice.end() - 16);
    EXPECT_THROW(
        try { dumpOf(twice); } catch (const std::runtime_error& e) {
            EXPECT_STREQ(e.what(), "Binary calibration data is corrupt.");
            throw;
        },
        std::runtime_error);
}

} // namespace
} // namespace blob
