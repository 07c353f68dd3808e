#pragma once
// The maker-specific raw file (file type NKRAW). The tool only recognises it,
// reads its pixels and carries its 102572-byte header; the few fields it
// uses are laid out here (little-endian, like the other raw files):
//
//   +0   8 bytes  "NKRAWHDR"   recognises the file
//   +8   u32      width
//   +12  u32      height
//   +16  u32      Bayer order code (as in the KQRAW headers)
//   +20  u32      exposure time in microseconds
//   +24  u32      gain step g
//   +28  u32      channel gain numerator
//   +32  u32      channel gain denominator
//   everything else up to +102572 is carried unread; then width x height
//   16-bit samples and nothing behind them.

#include <cstdint>

#include "image/byte_source.h"
#include "image/image_buffer.h"
#include "image/kqraw_fixed_header.h"

namespace img {

namespace nkraw {
inline constexpr char kMagic[] = "NKRAWHDR";
constexpr std::uint32_t kMagicSize = 8, kWidth = 8, kHeight = 12, kBayerCode = 16,
                        kExposureMicroseconds = 20, kGainStep = 24, kGainNumerator = 28,
                        kGainDenominator = 32;
} // namespace nkraw

// Result: 0 and a RAW, RAW_CFA, UINT16 image of file type NKRAW carrying the
// header (bit depth from the largest sample, as for the other raw files); -4
// not an NKRAW file; -5 a file whose size is not header plus pixels, or a
// width or height of 0 or beyond 2^31 - 1; -3; -2.
[[nodiscard]] int nkrawRead(img::ByteSource& source, ImageBuffer** image) noexcept;

// Puts the capture data of an NKRAW header into a fixed KQRAW header: the
// exposure time as 16.16 fixed point at +32, (g - 8) * 16384 at +40 and the
// gain quotient as all four channel gains (0 when the denominator is 0).
void nkrawCaptureToFixedHeader(const std::uint8_t* nkrawHeader, KqRawFixedHeader* header) noexcept;

} // namespace img
