#pragma once
// Byte layout of the binary calibration data: a header, a table of
// (block type, offset) entries ending with the digest entry, then the blocks
// in table order. Every number is big-endian.

#include <cstddef>
#include <cstdint>

namespace blob {

inline constexpr std::uint32_t kMagic = 0xCA1BA7EDu;
inline constexpr std::uint8_t kVersion = 1;
inline constexpr std::uint8_t kMinorVersion = 4;
// Minor versions below this one store focus values in 16 bits.
inline constexpr std::uint8_t kWideFocusMinorVersion = 4;

inline constexpr std::size_t kHeaderSize = 8;     // magic, version, minor, two zero bytes
inline constexpr std::size_t kTableEntrySize = 4; // 16-bit type, 16-bit offset
inline constexpr std::size_t kMaxOffset = 0xFFFF; // offsets are 16-bit

enum BlockType : std::uint16_t {
    kTrackingBlock = 0x0001,
    kToolBlock = 0x0003,
    kLscBlock = 0x0010,
    kAwbBlock = 0x0020,
    kFocusBlock = 0x0030,
    kDigestBlock = 0xB10B,
};

// Tracking data: 16-bit length counting itself, then the serial bytes.
inline constexpr std::size_t kTrackingLengthSize = 2;
inline constexpr std::size_t kMaxSerialBytes = 0xFFFF - kTrackingLengthSize;

// Calibration tool: size byte, three version bytes, 64-bit date, program number.
inline constexpr std::size_t kToolBlockSize = 13;

// Lens shading: light source, integer bits, fraction bits, zero, packed codes.
inline constexpr std::size_t kLscHeaderSize = 4;
inline constexpr int kGridSide = 10;
inline constexpr int kGridPointsPerChannel = kGridSide * kGridSide;
inline constexpr int kLscChannels = 4;
inline constexpr int kLscCodeCount = kLscChannels * kGridPointsPerChannel;
inline constexpr const char* kControlPointNames[kLscChannels] = {"controlPointR", "controlPointGR",
                                                                 "controlPointGB", "controlPointB"};

// White balance: light source and the averages R, GR, GB, B, 16 bits each.
inline constexpr std::size_t kAwbBlockSize = 10;
inline constexpr const char* kAwbNames[4] = {"R", "GR", "GB", "B"};

// Focus calibration, one block per set: posture, macro, hyper, inf,
// settle_time, hysteresis, pair count, pairs. Narrow: 16-bit values.
inline constexpr std::size_t kNarrowFocusHeaderSize = 12;
inline constexpr std::size_t kNarrowFocusPairSize = 4;
inline constexpr std::size_t kWideFocusHeaderSize = 18;
inline constexpr std::size_t kWideFocusPairSize = 8;
inline constexpr unsigned kMaxFocusPairs = 0xFF;

inline constexpr std::size_t kDigestSize = 16;

} // namespace blob
