#pragma once
// MD5 digest (RFC 1321) of a byte range, the checksum of the calibration data.

#include <array>
#include <cstddef>
#include <cstdint>

namespace blob {

using Md5Digest = std::array<std::uint8_t, 16>;

// Throws std::runtime_error when the crypto library fails (out of memory).
Md5Digest md5(const std::uint8_t* data, std::size_t size);

} // namespace blob
