#pragma once
// Reads binary calibration data back into configuration trees.

#include <array>
#include <cstddef>
#include <cstdint>

#include "config/config_node.h"

namespace blob {

struct BlobVersions {
    std::array<std::uint8_t, 3> blob{}; // bytes 4, 5 and 6 of the header
    std::array<std::uint8_t, 3> tool{}; // from the tool block; zero without one
};

// Checks the header, walks the table up to the digest entry and stores every
// block: serial_no, controlPointR ... controlPointB, R, GR, GB, B and
// module.af.set[n] into `calibration`; shared.light_source,
// blob.compression_res, shared.cfg_file_date and shared.program_number into
// `config`. Throws std::runtime_error with a fixed message on the first
// problem; blocks stored before it stay in the trees. Each block is read and
// checked whole before anything of it is stored.
BlobVersions parseBlob(const std::uint8_t* data, std::size_t size, config::config_node& calibration,
                       config::config_node& config);

} // namespace blob
