#pragma once
// The older fixed-header raw file (file type KQRAW): a 298672-byte header of
// little-endian fields, then the pixels. In memory the header is kept as its
// file bytes, so unnamed fields travel unchanged.

#include <cstdint>

#include "image/byte_source.h"
#include "image/image_buffer.h"
#include "image/kqraw_container.h"

namespace img {

struct KqRawFixedHeader {
    std::uint8_t bytes[kKqRawFixedHeaderSize];
};

namespace kqfix {
constexpr std::uint32_t kVersion = 0, kRevision = 4, kWidth = 8, kHeight = 12, kBayerCode = 16,
                        kSensorGuid = 24, kExposureFixed = 32, kExposureFloat = 36,
                        kSecondValue = 40, kWord48 = 48, kGain0 = 68, kSerial = 88,
                        kSerialSize = 16, kMagic = 104, kFirstTable = 108,
                        kEndMarker = kKqRawFixedHeaderSize - 4;
constexpr std::uint32_t kMagicValue = 0xDEADBEEF;
constexpr std::uint32_t kEndMarkerValue = 0xCAFEFEED;
// Revisions from 2 on hold the exposure time as 16.16 fixed point only.
constexpr std::uint32_t kFirstFixedPointRevision = 2;
} // namespace kqfix

// A fresh header (malloc'd, released with std::free): zeros, the magic word,
// version 1, revision 1 and the end marker. Null when out of memory.
KqRawFixedHeader* kqrawFixedHeaderCreate() noexcept;

// Fields; offsets are those of kqfix and must leave room for the value.
std::uint32_t kqrawFixedGet32(const KqRawFixedHeader* header, std::uint32_t offset) noexcept;
std::uint64_t kqrawFixedGet64(const KqRawFixedHeader* header, std::uint32_t offset) noexcept;
float kqrawFixedGetFloat(const KqRawFixedHeader* header, std::uint32_t offset) noexcept;
void kqrawFixedSet32(KqRawFixedHeader* header, std::uint32_t offset, std::uint32_t value) noexcept;
void kqrawFixedSet64(KqRawFixedHeader* header, std::uint32_t offset, std::uint64_t value) noexcept;
void kqrawFixedSetFloat(KqRawFixedHeader* header, std::uint32_t offset, float value) noexcept;

// Reads a fixed-header file strictly: at least a whole header, version 1 and
// the end marker at its end, the pixels right behind it. A file longer than
// the pixels is read with a warning. Result: 0 and a RAW, RAW_CFA, UINT16
// image of file type KQRAW that carries the header; -4 not such a file; -5
// too short for its pixels, or a width or height of 0 or beyond 2^31 - 1;
// -3; -2. With `samplesAt`, the samples are left unread (see readRawImage).
[[nodiscard]] int kqrawFixedRead(img::ByteSource& source, ImageBuffer** image,
                                 std::uint64_t* samplesAt = nullptr) noexcept;

// Converts a fixed-header file into a container: header block, pixel block
// (the pixels start behind the first end marker found from +108 on) and a
// capture block. Result: 0; -4 not a fixed-header file (version, revision,
// magic or end marker wrong, or shorter than a header); -21 a width or height
// of 0, or pixels that run past the end of the data; -3; -2.
[[nodiscard]] int kqrawFixedToContainer(img::ByteSource& source,
                                        KqRawContainer** container) noexcept;

} // namespace img
