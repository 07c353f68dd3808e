#pragma once
// One tagged block of the chunked raw container (file type KQRAW2): a 16-byte
// tag, 16 reserved bytes, a 32-bit payload size and the payload, all
// little-endian. In memory COMMENT, MAKERNOTE and SENSORINFO are held as
// parsed strings and PIXELDATA as 16-bit samples in host order; every other
// block keeps its payload byte for byte. Procedural and noexcept.

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <memory>

#include "image/byte_source.h"

namespace img {

constexpr std::size_t kKqRawTagSize = 16;
constexpr std::size_t kKqRawBlockHeaderSize = 36;
constexpr std::uint32_t kKqRawFileHeaderPayloadSize = 36;
constexpr std::uint32_t kKqRawCapturePayloadSize = 56;
constexpr std::uint32_t kKqRawPixelLeadSize = 8; // the two words before the samples

namespace kqtag {
inline constexpr char kFileHeader[] = "KQRAWFILE_111107";
inline constexpr char kPixels[] = "PIXELDATA_111107";
inline constexpr char kCapture[] = "CAPTURE___120118";
inline constexpr char kSensorInfo[] = "SENSORINFO120131";
inline constexpr char kComment[] = "COMMENT___120131";
inline constexpr char kMakerNote[] = "MAKERNOTE_120131";
} // namespace kqtag

// Payload offsets of the file header block.
namespace kqhdr {
constexpr std::uint32_t kWidth = 0, kHeight = 4, kBayerCode = 8, kBitsPerSample = 12,
                        kSamplesPerPixel = 16, kNumberOfImages = 20, kSeconds = 24,
                        kMicroseconds = 28;
}
// Payload offsets of the capture block.
namespace kqcap {
constexpr std::uint32_t kVersion = 0, kExposureTime = 4, kSecondValue = 8, kCarried1 = 12,
                        kCarried2 = 16, kGain0 = 28;
}

enum class KqRawForm : std::uint8_t { kOpaque, kPixels, kText, kSensorInfo };

struct KqRawString {
    char* text;           // malloc'd, with a terminator added
    std::uint32_t length; // bytes in the file (the text may hold zero bytes)
};

struct KqRawBlock {
    std::uint8_t tag[kKqRawTagSize];
    std::uint8_t reserved[16]; // zeros in new blocks; carried as read otherwise
    std::uint32_t size;        // payload size; always what kqrawBlockWrite writes
    KqRawForm form;
    std::uint8_t* payload;                  // kOpaque: `size` bytes
    std::uint8_t lead[kKqRawPixelLeadSize]; // kPixels: payload +0 and +4
    std::uint16_t* samples;                 // kPixels: sampleCount samples, host order
    std::uint64_t sampleCount;
    std::uint32_t infoWord; // kSensorInfo: payload +0
    KqRawString strings[3]; // kText: [0]; kSensorInfo: all three
    std::uint8_t* tail;     // kText, kSensorInfo: bytes behind the strings, carried
    std::uint32_t tailSize;
};

void kqrawBlockRelease(KqRawBlock* block) noexcept;
struct KqRawBlockRelease {
    void operator()(KqRawBlock* block) const noexcept { kqrawBlockRelease(block); }
};
using KqRawBlockPtr = std::unique_ptr<KqRawBlock, KqRawBlockRelease>;
bool kqrawBlockHasTag(const KqRawBlock* block, const char* tag) noexcept;
[[nodiscard]] KqRawBlock* kqrawBlockClone(const KqRawBlock* block) noexcept;

// Constructors; null when out of memory (or, for pixels, when the samples do
// not fit a 32-bit size field).
[[nodiscard]] KqRawBlock* kqrawBlockCreateHeader() noexcept; // payload 36, creation time now
[[nodiscard]] KqRawBlock* kqrawBlockCreatePixels(const std::uint16_t* samples,
                                                 std::uint64_t count) noexcept;
[[nodiscard]] KqRawBlock* kqrawBlockCreateCapture() noexcept;    // payload 56, +0 = 2
[[nodiscard]] KqRawBlock* kqrawBlockCreateSensorInfo() noexcept; // +0 = 1, three empty strings
[[nodiscard]] KqRawBlock* kqrawBlockCreateComment(const char* text) noexcept;
[[nodiscard]] KqRawBlock* kqrawBlockCreateMakerNote(const char* text) noexcept;

// Replaces string `index` of a text (0) or SENSORINFO (0-2) block; null
// stores an empty string. Recomputes the size. False when out of memory or
// the block has no such string.
[[nodiscard]] bool kqrawBlockSetString(KqRawBlock* block, int index, const char* text) noexcept;
// The module serial number: the second SENSORINFO string.
[[nodiscard]] bool kqrawBlockSetSerialNumber(KqRawBlock* block, const char* text) noexcept;

// Fields of an opaque payload. False when the field lies outside the payload.
bool kqrawBlockGet32(const KqRawBlock* block, std::uint32_t offset, std::uint32_t* value) noexcept;
[[nodiscard]] bool kqrawBlockGetFloat(const KqRawBlock* block, std::uint32_t offset,
                                      float* value) noexcept;
bool kqrawBlockSet32(KqRawBlock* block, std::uint32_t offset, std::uint32_t value) noexcept;
[[nodiscard]] bool kqrawBlockSetFloat(KqRawBlock* block, std::uint32_t offset,
                                      float value) noexcept;
// Sets the creation time of a file header block from the system clock.
void kqrawHeaderStamp(KqRawBlock* header) noexcept;

// Reads one block at the source's position. Returns 0 and the block; -5 when
// the block header or payload runs past the end of the data; -4 for a pixel
// block whose payload is not the two words and whole 16-bit samples; -3 no
// memory; -2 read error. String blocks whose lengths do not fit the payload
// are kept opaque, with a warning that names the source. With `samplesAt`, a
// pixel block's samples are not read: their position is stored there and the
// block holds none.
[[nodiscard]] int kqrawBlockRead(img::ByteSource& source, KqRawBlock** block,
                                 std::uint64_t* samplesAt = nullptr) noexcept;

// Writes the block; false when a write fails.
[[nodiscard]] bool kqrawBlockWrite(const KqRawBlock* block, std::FILE* file) noexcept;

} // namespace img
