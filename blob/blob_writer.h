#pragma once
// Builds the binary calibration data from the calibration values held in the
// configuration tree.

#include <array>
#include <cstdint>
#include <ostream>
#include <vector>

#include "blob/blob_sources.h"

namespace blob {

using ToolVersion = std::array<std::uint8_t, 3>; // major, minor, patch

// Lays out tracking (when there is a non-empty serial number), tool, lens
// shading (when there are control points), white balance (when there are
// averages) and one focus block per autofocus set, then the digest.
// `warnings` receives the line about a missing configuration date. Every
// failure throws std::runtime_error (std::range_error for control points the
// value code cannot hold); nothing is returned then.
std::vector<std::uint8_t> generateBlob(const BlobSources& sources, const ToolVersion& toolVersion,
                                       std::ostream& warnings);

} // namespace blob
