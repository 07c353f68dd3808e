#include "image/raw_reader.h"

#include <cstdlib>
#include <memory>

#include "image/bayer_code.h"
#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "image/kqraw_fixed_header.h"
#include "image/nkraw.h"
#include "image/raw_prompt.h"
#include "image/raw_samples.h"
#include "image/sample_memory.h"

namespace img {

namespace {

// The image of a container: the pixel block hands its samples over rather
// than copying them (the raw writer always builds a new pixel block from the
// image), and the container stays with the image as its raw header.
int imageOfContainer(KqRawContainerPtr container, ImageBuffer** out, bool samplesDeferred) {
    if (container->headerIndex < 0 || container->pixelIndex < 0)
        return kRawBadContainer;
    const KqRawBlock* header = container->blocks[container->headerIndex];
    KqRawBlock* pixels = container->blocks[container->pixelIndex];
    std::uint32_t width = 0, height = 0, code = 0;
    kqrawBlockGet32(header, img::kqhdr::kWidth, &width);
    kqrawBlockGet32(header, img::kqhdr::kHeight, &height);
    kqrawBlockGet32(header, img::kqhdr::kBayerCode, &code);
    if (width == 0 || height == 0 || width > INT32_MAX || height > INT32_MAX ||
        pixels->sampleCount / width < height)
        return kRawBadContainer;

    int rc = kOk;
    ImagePtr image(imageCreate(static_cast<std::int32_t>(width), static_cast<std::int32_t>(height),
                               16, 1, 1, 0, cfaOfBayerCode(code), kPixelRaw, kBufferRawCfa,
                               kDataNone, &rc));
    if (!image)
        return rc;
    image->dataType = kDataUint16;
    image->data = pixels->samples;
    pixels->samples = nullptr;
    pixels->sampleCount = 0;
    pixels->size = kKqRawPixelLeadSize;
    if (!samplesDeferred)
        applyLargestSampleDepth(image.get());
    image->fileType = kFileKqRaw2;
    image->rawHeader = container.release();
    *out = image.release();
    return kOk;
}

int readContainer(ByteSource& source, ImageBuffer** out, std::uint64_t* samplesAt = nullptr) {
    int rc = kOk;
    KqRawContainerPtr container(kqrawContainerParse(source, &rc, samplesAt));
    if (!container)
        return rc;
    return imageOfContainer(std::move(container), out, samplesAt != nullptr);
}

// Bytes a pixel of the layout takes: 1 or 2 (one sample), 3 or 6 (three).
int pixelBytes(ByteSource& source, const RawLayout& layout) {
    if (layout.width == 0 || layout.height == 0 || layout.images == 0 || layout.width > INT32_MAX ||
        layout.height > INT32_MAX || layout.headerSize > source.size())
        return 0;
    const std::uint64_t pixels = std::uint64_t{layout.width} * layout.height;
    const std::uint64_t body = source.size() - layout.headerSize;
    if (pixels > body / layout.images)
        return 0;
    const std::uint64_t allPixels = pixels * layout.images;
    if (body % allPixels != 0)
        return 0;
    const std::uint64_t perPixel = body / allPixels;
    return perPixel == 1 || perPixel == 2 || perPixel == 3 || perPixel == 6
               ? static_cast<int>(perPixel)
               : 0;
}

} // namespace

int readWithLayout(ByteSource& source, const RawLayout& layout, ImageBuffer** out) noexcept {
    *out = nullptr;
    const int bytes = pixelBytes(source, layout);
    const bool wide = bytes == 2 || bytes == 6;
    if (bytes == 0 || layout.bitDepth < 1 || layout.bitDepth > (wide ? 16u : 8u))
        return kRawBadLayout;
    const bool colour = bytes == 3 || bytes == 6;
    int rc = checkSampleMemory(layout.width, layout.height, colour ? 3 : 1, layout.images);
    if (rc != kOk)
        return rc;
    ImagePtr image(imageCreate(
        static_cast<std::int32_t>(layout.width), static_cast<std::int32_t>(layout.height),
        static_cast<std::uint16_t>(layout.bitDepth), colour ? 3 : 1, layout.images, 0, layout.cfa,
        colour ? kPixelRgb : kPixelRaw, colour ? kBufferInterleaved : kBufferRawCfa,
        wide ? kDataUint16 : kDataUint8, &rc));
    if (!image)
        return rc;
    const std::uint64_t samples = imageTotalSamples(image.get(), -1);
    if (!source.seek(layout.headerSize))
        return kIoError;
    const bool read = wide ? readSamples16(source, static_cast<std::uint16_t*>(image->data),
                                           samples, layout.littleEndian)
                           : source.read(image->data, static_cast<std::size_t>(samples));
    if (!read)
        return kIoError;
    // A dump carries no header, so the flattened image can go back out as a dump.
    image->fileType = kFileFixRaw;
    *out = image.release();
    return kOk;
}

int askOnConsole(void*, RawLayout* layout) {
    return askRawLayout(stdin, stdout, stderr, layout);
}

int rawReadHeaderOnly(ByteSource& source, ImageBuffer** out, std::uint64_t* samplesAt) noexcept {
    *out = nullptr;
    int rc = kqrawFixedRead(source, out, samplesAt);
    if (rc != kWrongFormat)
        return rc == kSizeMismatch ? kRawBadContainer : rc;
    if (!source.seek(0))
        return kIoError;
    return readContainer(source, out, samplesAt);
}

ImageBuffer* rawReadSource(ByteSource& source, RawLayoutQuery query, void* context,
                           int* result) noexcept {
    int ignored;
    if (!result)
        result = &ignored;
    ImageBuffer* image = nullptr;

    int rc = kqrawFixedRead(source, &image);
    if (rc != kWrongFormat) {
        *result = rc == kSizeMismatch ? kRawBadContainer : rc;
        return image;
    }
    rc = readContainer(source, &image);
    if (rc != kWrongFormat) {
        *result = rc;
        return image;
    }
    rc = nkrawRead(source, &image);
    if (rc != kWrongFormat) {
        *result = rc == kSizeMismatch ? kRawBadNkraw : rc;
        return image;
    }
    if (!query) {
        *result = kWrongFormat;
        return nullptr;
    }
    RawLayout layout;
    rc = query(context, &layout);
    if (rc == kOk)
        rc = readWithLayout(source, layout, &image);
    *result = rc;
    return image;
}

ImageBuffer* rawReadMemory(const std::uint8_t* data, std::size_t size, const char* name,
                           int* result) noexcept {
    MemorySource source(data, size, name);
    return rawReadSource(source, nullptr, nullptr, result);
}

ImageBuffer* rawRead(const char* path, int* result) noexcept {
    int ignored;
    if (!result)
        result = &ignored;
    std::unique_ptr<img::ByteSource> source(img::openSource(path, result));
    if (!source)
        return nullptr;
    return img::rawReadSource(*source, img::askOnConsole, nullptr, result);
}

} // namespace img
