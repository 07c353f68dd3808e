#pragma once
// The image library's plain image record and the functions that create,
// describe and release it. Procedural: no exceptions; results are the codes of
// image/image_result.h.

#include <cstdint>
#include <cstdio>
#include <memory>

namespace img {

enum PixelType : std::uint32_t {
    kPixelNone = 0,
    kPixelOther = 1,
    kPixelRaw = 2,
    kPixelMono = 3,
    kPixelRgb = 4,
    kPixelYuv = 5,
    kPixelYuv422 = 6,
    kPixelYuv420 = 7,
};
enum BufferType : std::uint32_t {
    kBufferNone = 0,
    kBufferOther = 1,
    kBufferRawCfa = 2,
    kBufferRawSplit = 3,
    kBufferInterleaved = 4,
    kBufferPlanar = 5,
};
enum DataType : std::uint32_t {
    kDataNone = 0,
    kDataOther = 1,
    kDataUint8 = 2,
    kDataUint16 = 3,
    kDataInt32 = 4,
    kDataReal32 = 5,
};
enum FileType : std::uint32_t {
    kFileNone = 0,
    kFileOther = 1,
    kFileFixRaw = 2,
    kFileKqRaw = 3,
    kFileKqRaw2 = 4,
    kFileNkRaw = 5,
};

// The four Bayer orders as the second cfa word (first word 0).
constexpr std::uint32_t kCfaRggb = 0x23340000;
constexpr std::uint32_t kCfaGrbg = 0x32430000;
constexpr std::uint32_t kCfaGbrg = 0x34230000;
constexpr std::uint32_t kCfaBggr = 0x43320000;

// Raw headers the record can carry (owned through rawHeader, by fileType).
constexpr std::size_t kKqRawFixedHeaderSize = 298672;
constexpr std::size_t kNkRawHeaderSize = 102572;

struct MetadataEntry {
    char* key;
    char* value;
    MetadataEntry* next;
};

struct LevelPair {
    float blackVal;
    float whiteVal;
};
struct ClipPair {
    float minClip;
    float maxClip;
};

struct ImageBuffer {
    std::int32_t width;
    std::int32_t height;
    std::uint16_t bitsPerSample;
    std::uint16_t samplesPerPixel;
    std::uint32_t numberOfImages;
    std::uint32_t cfa[2];
    std::uint32_t pixelType;
    std::uint32_t bufferType;
    std::uint32_t dataType;
    void* data;
    LevelPair level[4];
    ClipPair clip[4];
    std::uint32_t fileType;
    MetadataEntry* metadata;
    void* rawHeader; // KqRawFixedHeader, KqRawContainer or NKRAW block, by fileType
};

// Creates an image and its sample block. Result in *result: 0, -1 (width or
// height below 1), -6 (samplesPerPixel does not suit the pixel type), -3 (no
// memory, or a block too large to address). Data type NONE gets no block;
// OTHER is refused (-6).
[[nodiscard]] ImageBuffer* imageCreate(std::int32_t width, std::int32_t height,
                                       std::uint16_t bitsPerSample, std::uint16_t samplesPerPixel,
                                       std::uint32_t numberOfImages, std::uint32_t cfa0,
                                       std::uint32_t cfa1, std::uint32_t pixelType,
                                       std::uint32_t bufferType, std::uint32_t dataType,
                                       int* result) noexcept;

// Releases the samples, metadata and raw header. Null is accepted.
void imageRelease(ImageBuffer* image) noexcept;

struct ImageRelease {
    void operator()(ImageBuffer* image) const noexcept { imageRelease(image); }
};
using ImagePtr = std::unique_ptr<ImageBuffer, ImageRelease>;

// Width and height of plane `plane`; -1 for a plane outside 0..samplesPerPixel-1.
[[nodiscard]] int imagePlaneSize(const ImageBuffer* image, int plane, std::int32_t* width,
                                 std::int32_t* height) noexcept;
// Samples of one plane, or of all planes and images when plane is -1; 0 on a bad plane.
std::uint64_t imageTotalSamples(const ImageBuffer* image, int plane) noexcept;
// Bytes per sample of the data type (0 for NONE and OTHER).
std::size_t imageSampleBytes(std::uint32_t dataType) noexcept;

// Metadata: keys compare without regard to case.
const MetadataEntry* imageFindMetadata(const ImageBuffer* image, const char* key) noexcept;
// Replaces the value of an entry with the same key, else appends. With `copy`
// the strings are duplicated; without it the image takes ownership of them
// (they must come from malloc). 0, or -1 when out of memory.
[[nodiscard]] int imageSetMetadata(ImageBuffer* image, char* key, char* value, bool copy) noexcept;
[[nodiscard]] int imageSetMetadata(ImageBuffer* image, const char* key, const char* value) noexcept;
// Clears the metadata list and releases the raw header.
void imageClearMetadata(ImageBuffer* image) noexcept;
// Clears the target's metadata, copies every entry, then a fixed KQRAW or
// NKRAW header byte for byte (a KQRAW2 container is not copied). 0 or -1.
[[nodiscard]] int imageCopyMetadata(ImageBuffer* target, const ImageBuffer* source) noexcept;

// True for 8-bit MONO or interleaved RGB with the plain 0..256 levels.
bool imageIsEightBitDisplay(const ImageBuffer* image) noexcept;

// Names the library prints; "NEW-UNKNOWN" for values outside each table.
const char* pixelTypeName(std::uint32_t value) noexcept;
const char* bufferTypeName(std::uint32_t value) noexcept;
const char* dataTypeName(std::uint32_t value) noexcept;
const char* fileTypeName(std::uint32_t value) noexcept;
// The 2x2 pattern as four letters ("RGGB"), in one static buffer that each call overwrites.
const char* cfaPatternName(std::uint32_t cfa1) noexcept;

// Scalar I/O on a stdio stream in the byte order asked for. 0, or -1 when
// fewer bytes than needed were transferred.
int streamRead8(std::FILE* file, std::uint8_t* value) noexcept;
int streamRead16(std::FILE* file, bool bigEndian, std::uint16_t* value) noexcept;
int streamRead32(std::FILE* file, bool bigEndian, std::uint32_t* value) noexcept;
int streamRead64(std::FILE* file, bool bigEndian, std::uint64_t* value) noexcept;
[[nodiscard]] int streamReadFloat(std::FILE* file, bool bigEndian, float* value) noexcept;
int streamWrite8(std::FILE* file, std::uint8_t value) noexcept;
int streamWrite16(std::FILE* file, bool bigEndian, std::uint16_t value) noexcept;
int streamWrite32(std::FILE* file, bool bigEndian, std::uint32_t value) noexcept;
int streamWrite64(std::FILE* file, bool bigEndian, std::uint64_t value) noexcept;
[[nodiscard]] int streamWriteFloat(std::FILE* file, bool bigEndian, float value) noexcept;

} // namespace img
