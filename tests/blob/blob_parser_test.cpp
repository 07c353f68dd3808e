// Reading the reference blob (tests/data/blob/reference.blob) with bytes
// changed: every row of blob_corruptions.txt changes it and names the message
// the parser must give, or a line its text dump must then hold.

#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "blob/blob_dump.h"
#include "blob/blob_parser.h"
#include "blob/md5.h"
#include "config/config_file.h"
#include "golden_file.h"

namespace blob {
namespace {

using Bytes = std::vector<std::uint8_t>;
using testing_support::dataPath;
using testing_support::readFile;

// Applies the words of a row: AT=HEX writes bytes at AT (from the end where
// AT is negative), AT^HEX xors them, cut=N keeps the first N bytes, drop=N
// removes the last N, pad=N appends N bytes and sign rewrites the digest.
Bytes changed(Bytes blob, const std::string& words) {
    std::istringstream in(words);
    for (std::string word; in >> word;) {
        const std::size_t op = word.find_first_of("=^");
        const std::string head = word.substr(0, op), tail = word.substr(op + 1);
        if (word == "sign") {
            const Md5Digest digest = md5(blob.data(), blob.size() - 16);
            std::copy(digest.begin(), digest.end(), blob.end() - 16);
        } else if (head == "cut" || head == "drop" || head == "pad") {
            const std::size_t n = std::stoul(tail);
            blob.resize(head == "cut"    ? n
                        : head == "drop" ? blob.size() - n
                                         : blob.size() + n,
                        0xEE);
        } else {
            const long at = std::stol(head);
            std::size_t to =
                at < 0 ? blob.size() - static_cast<std::size_t>(-at) : static_cast<std::size_t>(at);
            for (std::size_t i = 0; i < tail.size(); i += 2, ++to) {
                const auto byte =
                    static_cast<std::uint8_t>(std::stoul(tail.substr(i, 2), nullptr, 16));
                blob.at(to) =
                    word[op] == '=' ? byte : static_cast<std::uint8_t>(blob.at(to) ^ byte);
            }
        }
    }
    return blob;
}

// The message parsing `blob` throws, or its text dump.
std::string outcome(const Bytes& blob) {
    config::config_node_impl root("root");
    try {
        const BlobVersions versions =
            parseBlob(blob.data(), blob.size(), root.child("calibration"), root.child("config"));
        std::ostringstream text;
        text << std::hex << std::showbase; // numbers ignore the stream's format
        writeCalibrationText(root.child("calibration"), "reference.", root.child("config"),
                             "BlobGenerator", "3.8.1", versions, text);
        return text.str();
    } catch (const std::exception& e) {
        return e.what();
    }
}

TEST(BlobParser, ChangedBytesGiveTheirMessage) {
    const std::string golden = readFile(dataPath("blob/reference.blob"));
    const Bytes reference(golden.begin(), golden.end());
    const std::vector<std::string> rows = testing_support::dataRows("blob/blob_corruptions.txt");
    EXPECT_GT(rows.size(), 30u);
    for (const std::string& row : rows) {
        const std::size_t bar = row.find('|');
        const std::string expected = row.substr(bar + 1),
                          result = outcome(changed(reference, row.substr(0, bar)));
        if (expected.rfind("ok:", 0) == 0)
            EXPECT_NE(result.find(expected.substr(3) + "\n"), std::string::npos) << row << "\n"
                                                                                 << result;
        else
            EXPECT_EQ(result, expected) << row;
    }
}

TEST(BlobParser, EveryChangedByteIsRefusedCleanly) {
    const std::string golden = readFile(dataPath("blob/reference.blob"));
    for (std::size_t i = 0; i < golden.size(); ++i) {
        Bytes blob(golden.begin(), golden.end());
        blob[i] ^= 0x5A;
        const std::string result = outcome(blob);
        EXPECT_TRUE(result.find('\n') == std::string::npos && !result.empty())
            << "byte " << i << " changed, yet the digest matched";
    }
}

// A calibration tree the parser does not make: a module serial, pairs without
// a count, a negative count.
TEST(BlobDump, TreeWrittenAsText) {
    config::config_node_impl root("root");
    config::parse_config_text(readFile(dataPath("blob/tree.cfg")), root.child("calibration"));
    std::ostringstream text;
    text << std::hex << std::showbase;
    writeCalibrationText(root.child("calibration"), "p.", root.child("config"), "t", "1",
                         BlobVersions{{1, 4, 0}, {}}, text);
    testing_support::expectGolden("blob/tree_dump.txt", text.str());
}

} // namespace
} // namespace blob
