#include "image/image_buffer.h"

#include <cstdlib>
#include <cstring>

#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "image/sample_memory.h"

#include <strings.h>

namespace img {

namespace {

// Planes 1 and 2 of the YUV 4:2:2 and 4:2:0 types are narrower (and, for
// 4:2:0, shorter) than the image.
void planeDimensions(const ImageBuffer* image, int plane, std::uint64_t* width,
                     std::uint64_t* height) {
    std::uint64_t w = static_cast<std::uint64_t>(image->width);
    std::uint64_t h = static_cast<std::uint64_t>(image->height);
    if ((image->pixelType == kPixelYuv422 || image->pixelType == kPixelYuv420) && plane > 0) {
        w = plane == 1 ? (w + 1) / 2 : w / 2;
        if (image->pixelType == kPixelYuv420)
            h = (h + 1) / 2;
    }
    *width = w;
    *height = h;
}

// Size of the sample block, false when it is empty or cannot be addressed.
// Every step is checked: planes x images x sample size can wrap even 64 bits,
// and on a 32-bit host width * height * 4 alone can pass SIZE_MAX.
bool sampleBlockBytes(const ImageBuffer* image, std::uint64_t* bytes) {
    std::uint64_t samples = 0;
    for (int plane = 0; plane < image->samplesPerPixel; ++plane) {
        std::uint64_t w, h;
        planeDimensions(image, plane, &w, &h);
        if (w * h > UINT64_MAX - samples) // each factor is below 2^31
            return false;
        samples += w * h;
    }
    const std::uint64_t sampleSize = imageSampleBytes(image->dataType);
    if (samples == 0 || image->numberOfImages == 0 ||
        samples > UINT64_MAX / image->numberOfImages / sampleSize)
        return false;
    *bytes = samples * image->numberOfImages * sampleSize;
    return *bytes <= SIZE_MAX;
}

char* duplicate(const char* text) {
    const std::size_t length = std::strlen(text) + 1;
    char* copy = static_cast<char*>(std::malloc(length));
    if (copy)
        std::memcpy(copy, text, length);
    return copy;
}

void releaseRawHeader(ImageBuffer* image) {
    if (image->fileType == kFileKqRaw2)
        kqrawContainerRelease(static_cast<KqRawContainer*>(image->rawHeader));
    else
        std::free(image->rawHeader);
    image->rawHeader = nullptr;
}

const char* nameOf(std::uint32_t value, const char* const* names, std::uint32_t count) {
    return value < count ? names[value] : "NEW-UNKNOWN";
}

} // namespace

std::size_t imageSampleBytes(std::uint32_t dataType) noexcept {
    switch (dataType) {
    case kDataUint8:
        return 1;
    case kDataUint16:
        return 2;
    case kDataInt32:
    case kDataReal32:
        return 4;
    default:
        return 0;
    }
}

ImageBuffer* imageCreate(std::int32_t width, std::int32_t height, std::uint16_t bitsPerSample,
                         std::uint16_t samplesPerPixel, std::uint32_t numberOfImages,
                         std::uint32_t cfa0, std::uint32_t cfa1, std::uint32_t pixelType,
                         std::uint32_t bufferType, std::uint32_t dataType, int* result) noexcept {
    int ignored;
    if (!result)
        result = &ignored;
    if (width < 1 || height < 1) {
        *result = img::kBadArgument;
        return nullptr;
    }
    const bool anyCount = pixelType == kPixelNone || pixelType == kPixelOther;
    const bool single = pixelType == kPixelRaw || pixelType == kPixelMono;
    if (!anyCount && samplesPerPixel != (single ? 1 : 3)) {
        *result = img::kUnsupported;
        return nullptr;
    }
    if (dataType == kDataOther) {
        *result = img::kUnsupported;
        return nullptr;
    }

    ImagePtr image(static_cast<ImageBuffer*>(std::calloc(1, sizeof(ImageBuffer))));
    if (!image) {
        *result = img::kNoMemory;
        return nullptr;
    }
    const std::uint16_t widthOfType = dataType == kDataUint8    ? 8
                                      : dataType == kDataUint16 ? 16
                                                                : 32;
    image->width = width;
    image->height = height;
    image->bitsPerSample = bitsPerSample < widthOfType ? bitsPerSample : widthOfType;
    image->samplesPerPixel = samplesPerPixel;
    image->numberOfImages = numberOfImages;
    image->cfa[0] = pixelType == kPixelRaw ? cfa0 : 0;
    image->cfa[1] = pixelType == kPixelRaw ? cfa1 : 0;
    image->pixelType = pixelType;
    image->bufferType = bufferType;
    image->dataType = dataType;
    // 2^bits as a float; 32 bits give 0, as the levels have always read.
    const float white = image->bitsPerSample >= 32
                            ? 0.0f
                            : static_cast<float>(std::uint64_t{1} << image->bitsPerSample);
    for (int channel = 0; channel < 4; ++channel) {
        image->level[channel] = {0.0f, white};
        image->clip[channel] = {0.0f, white};
    }
    image->fileType = kFileNone;

    if (dataType == kDataNone) {
        *result = img::kOk;
        return image.release();
    }
    std::uint64_t bytes = 0;
    if (!sampleBlockBytes(image.get(), &bytes)) {
        *result = img::kNoMemory;
        return nullptr;
    }
    image->data = img::allocateSamples(static_cast<std::size_t>(bytes));
    if (!image->data) {
        *result = img::kNoMemory;
        return nullptr;
    }
    *result = img::kOk;
    return image.release();
}

void imageRelease(ImageBuffer* image) noexcept {
    if (!image)
        return;
    imageClearMetadata(image);
    std::free(image->data);
    std::free(image);
}

int imagePlaneSize(const ImageBuffer* image, int plane, std::int32_t* width,
                   std::int32_t* height) noexcept {
    if (!image || plane < 0 || plane >= image->samplesPerPixel)
        return img::kBadArgument;
    std::uint64_t w, h;
    planeDimensions(image, plane, &w, &h);
    *width = static_cast<std::int32_t>(w);
    *height = static_cast<std::int32_t>(h);
    return img::kOk;
}

std::uint64_t imageTotalSamples(const ImageBuffer* image, int plane) noexcept {
    if (!image || plane < -1 || plane >= image->samplesPerPixel)
        return 0;
    std::uint64_t total = 0;
    const int first = plane < 0 ? 0 : plane;
    const int last = plane < 0 ? image->samplesPerPixel - 1 : plane;
    for (int p = first; p <= last; ++p) {
        std::uint64_t w, h;
        planeDimensions(image, p, &w, &h);
        total += w * h;
    }
    return total * (plane < 0 ? image->numberOfImages : 1);
}

const MetadataEntry* imageFindMetadata(const ImageBuffer* image, const char* key) noexcept {
    if (!image || !key)
        return nullptr;
    for (const MetadataEntry* entry = image->metadata; entry; entry = entry->next)
        if (strcasecmp(entry->key, key) == 0)
            return entry;
    return nullptr;
}

int imageSetMetadata(ImageBuffer* image, char* key, char* value, bool copy) noexcept {
    if (!image || !key || !value)
        return img::kBadArgument;
    if (copy) {
        key = duplicate(key);
        value = duplicate(value);
        if (!key || !value) {
            std::free(key);
            std::free(value);
            return img::kBadArgument;
        }
    }
    MetadataEntry** link = &image->metadata;
    for (; *link; link = &(*link)->next) {
        if (strcasecmp((*link)->key, key) == 0) {
            std::free((*link)->value);
            (*link)->value = value;
            std::free(key);
            return img::kOk;
        }
    }
    auto* entry = static_cast<MetadataEntry*>(std::malloc(sizeof(MetadataEntry)));
    if (!entry) {
        std::free(key);
        std::free(value);
        return img::kBadArgument;
    }
    *entry = {key, value, nullptr};
    *link = entry;
    return img::kOk;
}

int imageSetMetadata(ImageBuffer* image, const char* key, const char* value) noexcept {
    return imageSetMetadata(image, const_cast<char*>(key), const_cast<char*>(value), true);
}

void imageClearMetadata(ImageBuffer* image) noexcept {
    if (!image)
        return;
    for (MetadataEntry* entry = image->metadata; entry;) {
        MetadataEntry* next = entry->next;
        std::free(entry->key);
        std::free(entry->value);
        std::free(entry);
        entry = next;
    }
    image->metadata = nullptr;
    releaseRawHeader(image);
}

int imageCopyMetadata(ImageBuffer* target, const ImageBuffer* source) noexcept {
    if (!target || !source)
        return img::kBadArgument;
    if (target == source)
        return img::kOk;
    imageClearMetadata(target);
    for (const MetadataEntry* entry = source->metadata; entry; entry = entry->next)
        if (imageSetMetadata(target, entry->key, entry->value) != img::kOk)
            return img::kBadArgument;
    if (!source->rawHeader)
        return img::kOk;
    std::size_t size = 0;
    if (source->fileType == kFileKqRaw)
        size = kKqRawFixedHeaderSize;
    else if (source->fileType == kFileNkRaw)
        size = kNkRawHeaderSize;
    if (size == 0)
        return img::kOk;
    void* header = std::malloc(size);
    if (!header)
        return img::kBadArgument;
    std::memcpy(header, source->rawHeader, size);
    target->rawHeader = header;
    target->fileType = source->fileType;
    return img::kOk;
}

bool imageIsEightBitDisplay(const ImageBuffer* image) noexcept {
    if (!image || image->dataType != kDataUint8)
        return false;
    const bool mono = image->pixelType == kPixelMono;
    const bool rgb = image->pixelType == kPixelRgb && image->bufferType == kBufferInterleaved;
    if (!mono && !rgb)
        return false;
    const int channels = image->samplesPerPixel < 4 ? image->samplesPerPixel : 4;
    for (int c = 0; c < channels; ++c) {
        if (image->level[c].blackVal != 0.0f || image->clip[c].minClip != 0.0f ||
            image->level[c].whiteVal != 256.0f || image->clip[c].maxClip != 256.0f)
            return false;
    }
    return true;
}

const char* pixelTypeName(std::uint32_t value) noexcept {
    static const char* const names[] = {"NONE", "OTHER", "RAW",    "MONO",
                                        "RGB",  "YUV",   "YUV422", "YUV420"};
    return nameOf(value, names, 8);
}

const char* bufferTypeName(std::uint32_t value) noexcept {
    static const char* const names[] = {"NONE",      "OTHER",       "RAW_CFA",
                                        "RAW_SPLIT", "INTERLEAVED", "PLANAR"};
    return nameOf(value, names, 6);
}

const char* dataTypeName(std::uint32_t value) noexcept {
    static const char* const names[] = {"NONE", "OTHER", "UINT8", "UINT16", "INT32", "REAL32"};
    return nameOf(value, names, 6);
}

const char* fileTypeName(std::uint32_t value) noexcept {
    static const char* const names[] = {"NONE", "OTHER", "FIXRAW", "KQRAW", "KQRAW2", "NKRAW"};
    return nameOf(value, names, 6);
}

const char* cfaPatternName(std::uint32_t cfa1) noexcept {
    static char text[5];
    static const char letters[] = "XORGBECMYW";
    for (int i = 0; i < 4; ++i) {
        const std::uint32_t code = (cfa1 >> (28 - 4 * i)) & 0xF;
        text[i] = code < 10 ? letters[code] : 'X';
    }
    text[4] = '\0';
    return text;
}

namespace {

int readBytes(std::FILE* file, std::size_t count, bool bigEndian, std::uint64_t* value) {
    unsigned char bytes[8];
    if (std::fread(bytes, 1, count, file) != count)
        return -1;
    std::uint64_t v = 0;
    for (std::size_t i = 0; i < count; ++i)
        v |= std::uint64_t{bytes[i]} << (8 * (bigEndian ? count - 1 - i : i));
    *value = v;
    return 0;
}

int writeBytes(std::FILE* file, std::size_t count, bool bigEndian, std::uint64_t value) {
    unsigned char bytes[8];
    for (std::size_t i = 0; i < count; ++i)
        bytes[i] = static_cast<unsigned char>(value >> (8 * (bigEndian ? count - 1 - i : i)));
    return std::fwrite(bytes, 1, count, file) == count ? 0 : -1;
}

} // namespace

int streamRead8(std::FILE* file, std::uint8_t* value) noexcept {
    std::uint64_t v;
    if (readBytes(file, 1, false, &v) != 0)
        return -1;
    *value = static_cast<std::uint8_t>(v);
    return 0;
}

int streamRead16(std::FILE* file, bool bigEndian, std::uint16_t* value) noexcept {
    std::uint64_t v;
    if (readBytes(file, 2, bigEndian, &v) != 0)
        return -1;
    *value = static_cast<std::uint16_t>(v);
    return 0;
}

int streamRead32(std::FILE* file, bool bigEndian, std::uint32_t* value) noexcept {
    std::uint64_t v;
    if (readBytes(file, 4, bigEndian, &v) != 0)
        return -1;
    *value = static_cast<std::uint32_t>(v);
    return 0;
}

int streamRead64(std::FILE* file, bool bigEndian, std::uint64_t* value) noexcept {
    return readBytes(file, 8, bigEndian, value);
}

int streamReadFloat(std::FILE* file, bool bigEndian, float* value) noexcept {
    std::uint32_t bits;
    if (streamRead32(file, bigEndian, &bits) != 0)
        return -1;
    std::memcpy(value, &bits, sizeof bits);
    return 0;
}

int streamWrite8(std::FILE* file, std::uint8_t value) noexcept {
    return writeBytes(file, 1, false, value);
}

int streamWrite16(std::FILE* file, bool bigEndian, std::uint16_t value) noexcept {
    return writeBytes(file, 2, bigEndian, value);
}

int streamWrite32(std::FILE* file, bool bigEndian, std::uint32_t value) noexcept {
    return writeBytes(file, 4, bigEndian, value);
}

int streamWrite64(std::FILE* file, bool bigEndian, std::uint64_t value) noexcept {
    return writeBytes(file, 8, bigEndian, value);
}

int streamWriteFloat(std::FILE* file, bool bigEndian, float value) noexcept {
    std::uint32_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    return writeBytes(file, 4, bigEndian, bits);
}

} // namespace img
