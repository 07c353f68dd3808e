// Feeds arbitrary bytes to the calibration data parser and dumps whatever it
// accepts. The parser reports bad data only as std::runtime_error.

#include <cstddef>
#include <cstdint>
#include <sstream>
#include <stdexcept>

#include "blob/blob_dump.h"
#include "blob/blob_parser.h"
#include "config/config_node.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    config_node_impl root("root");
    config_node& calibration = root.child("calibration");
    config_node& config = root.child("config");
    try {
        const blob::BlobVersions versions = blob::parseBlob(data, size, calibration, config);
        std::ostringstream text;
        blob::writeCalibrationText(calibration, "reference.", config, "fuzz", "0", versions, text);
    } catch (const std::runtime_error&) {
    }
    return 0;
}
