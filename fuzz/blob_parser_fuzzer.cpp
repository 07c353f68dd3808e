// Feeds arbitrary bytes to the calibration data parser and dumps whatever it
// accepts. The parser reports bad data only as std::runtime_error. A mutated
// blob almost never carries a matching digest, so each input is parsed twice:
// as given, and with the digest its table points at recomputed, so that the
// blocks behind a changed byte still reach the dump.

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <sstream>
#include <stdexcept>
#include <vector>

#include "blob/blob_dump.h"
#include "blob/blob_parser.h"
#include "blob/md5.h"
#include "config/config_node.h"

using config::config_node;
using config::config_node_impl;

namespace {

void parseAndDump(const std::uint8_t* data, std::size_t size) {
    config_node_impl root("root");
    config_node& calibration = root.child("calibration");
    config_node& config = root.child("config");
    try {
        const blob::BlobVersions versions = blob::parseBlob(data, size, calibration, config);
        std::ostringstream text;
        blob::writeCalibrationText(calibration, "reference.", config, "fuzz", "0", versions, text);
    } catch (const std::runtime_error&) {
    }
}

// Writes the digest of the bytes before the first digest entry's block into
// that block. False when the table holds no digest entry that fits.
bool sealDigest(std::vector<std::uint8_t>& blob) {
    constexpr std::size_t kTableStart = 8, kEntrySize = 4, kDigestSize = 16;
    for (std::size_t entry = kTableStart; entry + kEntrySize <= blob.size(); entry += kEntrySize) {
        const unsigned type = (blob[entry] << 8) | blob[entry + 1];
        const std::size_t offset = (blob[entry + 2] << 8) | blob[entry + 3];
        if (type != 0xB10B)
            continue;
        if (offset + kDigestSize > blob.size())
            return false;
        const blob::Md5Digest digest = blob::md5(blob.data(), offset);
        std::memcpy(blob.data() + offset, digest.data(), kDigestSize);
        return true;
    }
    return false;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    parseAndDump(data, size);
    std::vector<std::uint8_t> sealed(data, data + size);
    if (sealDigest(sealed) && std::memcmp(sealed.data(), data, size) != 0)
        parseAndDump(sealed.data(), sealed.size());
    return 0;
}
