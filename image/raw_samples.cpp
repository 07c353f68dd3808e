#include "image/raw_samples.h"

#include <cstdint>

#include "image/byte_order.h"
#include "image/image_result.h"
#include "image/sample_memory.h"

namespace img {

bool readSamples16(ByteSource& source, std::uint16_t* samples, std::uint64_t count,
                   bool littleEndianFile) noexcept {
    if (count > SIZE_MAX / 2 || count * 2 > source.remaining())
        return false;
    if (!source.read(samples, static_cast<std::size_t>(count * 2)))
        return false;
    if (littleEndianFile != kHostIsLittleEndian)
        for (std::uint64_t i = 0; i < count; ++i)
            samples[i] = swap16(samples[i]);
    return true;
}

bool readSamplesLE(ByteSource& source, std::uint16_t* samples, std::uint64_t count) noexcept {
    return readSamples16(source, samples, count, true);
}

bool writeSamplesLE(std::FILE* file, const std::uint16_t* samples, std::uint64_t count) noexcept {
    if (count > SIZE_MAX / 2)
        return false;
    if (kHostIsLittleEndian) {
        const std::size_t bytes = static_cast<std::size_t>(count * 2);
        return bytes == 0 || std::fwrite(samples, 1, bytes, file) == bytes;
    }
    std::uint8_t chunk[8192];
    for (std::uint64_t done = 0; done < count;) {
        std::size_t n = 0;
        for (; n < sizeof chunk / 2 && done < count; ++n, ++done)
            storeLE16(chunk + 2 * n, samples[done]);
        if (std::fwrite(chunk, 2, n, file) != n)
            return false;
    }
    return true;
}

std::uint16_t largestSample(const std::uint16_t* samples, std::uint64_t count) noexcept {
    std::uint16_t largest = 0;
    for (std::uint64_t i = 0; i < count; ++i)
        largest = samples[i] > largest ? samples[i] : largest;
    return largest;
}

std::uint16_t bitsForLargestSample(std::uint16_t largest) noexcept {
    std::uint16_t bits = 0;
    while (bits < 16 && (largest >> bits) != 0)
        ++bits;
    return bits < 10 ? 10 : bits;
}

void applyLargestSampleDepth(ImageBuffer* image) noexcept {
    applySampleDepth(
        image, bitsForLargestSample(largestSample(static_cast<const std::uint16_t*>(image->data),
                                                  imageTotalSamples(image, -1))));
}

void applySampleDepth(ImageBuffer* image, std::uint16_t bits) noexcept {
    image->bitsPerSample = bits;
    const float white = static_cast<float>(1u << bits);
    for (int channel = 0; channel < 4; ++channel) {
        image->level[channel] = {0.0f, white};
        image->clip[channel] = {0.0f, white};
    }
}

bool samplesFit(std::uint64_t size, std::uint64_t offset, std::uint32_t width,
                std::uint32_t height) noexcept {
    // Each factor is below 2^32, so the product cannot wrap in 64 bits;
    // doubling it can, hence the division.
    const std::uint64_t samples = std::uint64_t{width} * height;
    return offset <= size && samples <= (size - offset) / 2;
}

int readRawImage(ByteSource& source, std::uint64_t offset, std::uint32_t width,
                 std::uint32_t height, std::uint32_t cfa, ImageBuffer** out,
                 std::uint64_t* samplesAt) noexcept {
    *out = nullptr;
    if (width == 0 || height == 0 || width > INT32_MAX || height > INT32_MAX ||
        !samplesFit(source.size(), offset, width, height))
        return kSizeMismatch;
    int rc = checkSampleMemory(width, height);
    if (rc != kOk)
        return rc;
    ImagePtr image(imageCreate(static_cast<std::int32_t>(width), static_cast<std::int32_t>(height),
                               16, 1, 1, 0, cfa, kPixelRaw, kBufferRawCfa, kDataNone, &rc));
    if (!image)
        return rc == kBadArgument ? kSizeMismatch : rc;
    image->dataType = kDataUint16;
    if (samplesAt) {
        *samplesAt = offset;
        *out = image.release();
        return kOk;
    }
    rc = readDeferredSamples(source, offset, image.get());
    if (rc != kOk)
        return rc;
    *out = image.release();
    return kOk;
}

int readDeferredSamples(ByteSource& source, std::uint64_t samplesAt, ImageBuffer* image) noexcept {
    const std::uint64_t count = imageTotalSamples(image, -1);
    // With room for floats: the samples usually become the input image.
    image->data = allocateWidenableSamples(count, sizeof(std::uint16_t));
    if (!image->data)
        return kNoMemory;
    if (!source.seek(samplesAt) ||
        !readSamplesLE(source, static_cast<std::uint16_t*>(image->data), count))
        return kIoError;
    applyLargestSampleDepth(image);
    return kOk;
}

} // namespace img
