#include "image/kqraw_fixed_header.h"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "image/bayer_code.h"
#include "image/byte_order.h"
#include "image/image_messages.h"
#include "image/image_result.h"
#include "image/image_warning.h"
#include "image/malloc_ptr.h"
#include "image/raw_samples.h"
#include "image/sample_memory.h"

namespace img {

namespace {

using HeaderPtr = img::MallocPtr<KqRawFixedHeader>;

// Reads the header from the start of the source. -4 when the source is shorter.
int readHeader(img::ByteSource& source, HeaderPtr* header) {
    if (source.size() < kKqRawFixedHeaderSize)
        return img::kWrongFormat;
    header->reset(static_cast<KqRawFixedHeader*>(std::malloc(sizeof(KqRawFixedHeader))));
    if (!*header)
        return img::kNoMemory;
    if (!source.seek(0) || !source.read((*header)->bytes, kKqRawFixedHeaderSize))
        return img::kIoError;
    return img::kOk;
}

} // namespace

KqRawFixedHeader* kqrawFixedHeaderCreate() noexcept {
    auto* header = static_cast<KqRawFixedHeader*>(std::calloc(1, sizeof(KqRawFixedHeader)));
    if (!header)
        return nullptr;
    kqrawFixedSet32(header, img::kqfix::kVersion, 1);
    kqrawFixedSet32(header, img::kqfix::kRevision, 1);
    kqrawFixedSet32(header, img::kqfix::kMagic, img::kqfix::kMagicValue);
    kqrawFixedSet32(header, img::kqfix::kEndMarker, img::kqfix::kEndMarkerValue);
    return header;
}

std::uint32_t kqrawFixedGet32(const KqRawFixedHeader* header, std::uint32_t offset) noexcept {
    return img::loadLE32(header->bytes + offset);
}
std::uint64_t kqrawFixedGet64(const KqRawFixedHeader* header, std::uint32_t offset) noexcept {
    return img::loadLE64(header->bytes + offset);
}
float kqrawFixedGetFloat(const KqRawFixedHeader* header, std::uint32_t offset) noexcept {
    return img::loadLEFloat(header->bytes + offset);
}
void kqrawFixedSet32(KqRawFixedHeader* header, std::uint32_t offset, std::uint32_t value) noexcept {
    img::storeLE32(header->bytes + offset, value);
}
void kqrawFixedSet64(KqRawFixedHeader* header, std::uint32_t offset, std::uint64_t value) noexcept {
    img::storeLE64(header->bytes + offset, value);
}
void kqrawFixedSetFloat(KqRawFixedHeader* header, std::uint32_t offset, float value) noexcept {
    img::storeLEFloat(header->bytes + offset, value);
}

int kqrawFixedRead(img::ByteSource& source, ImageBuffer** out, std::uint64_t* samplesAt) noexcept {
    *out = nullptr;
    HeaderPtr header;
    int rc = readHeader(source, &header);
    if (rc != img::kOk)
        return rc;
    if (kqrawFixedGet32(header.get(), img::kqfix::kVersion) != 1 ||
        kqrawFixedGet32(header.get(), img::kqfix::kEndMarker) != img::kqfix::kEndMarkerValue)
        return img::kWrongFormat;
    const std::uint32_t width = kqrawFixedGet32(header.get(), img::kqfix::kWidth);
    const std::uint32_t height = kqrawFixedGet32(header.get(), img::kqfix::kHeight);
    const std::uint64_t expected = kKqRawFixedHeaderSize + 2 * (std::uint64_t{width} * height);
    if (img::samplesFit(source.size(), kKqRawFixedHeaderSize, width, height) &&
        source.size() > expected)
        img::warn(img::msg::kFixedHeaderTooBig, source.name());
    ImageBuffer* image = nullptr;
    rc = img::readRawImage(
        source, kKqRawFixedHeaderSize, width, height,
        img::cfaOfBayerCode(kqrawFixedGet32(header.get(), img::kqfix::kBayerCode)), &image,
        samplesAt);
    if (rc != img::kOk)
        return rc;
    image->fileType = kFileKqRaw;
    image->rawHeader = header.release();
    *out = image;
    return img::kOk;
}

namespace {

// Offset of the first end marker word from +108 on, 0 when there is none.
std::uint32_t findEndMarker(const KqRawFixedHeader* header) {
    for (std::uint32_t offset = img::kqfix::kFirstTable; offset <= img::kqfix::kEndMarker;
         offset += 4)
        if (kqrawFixedGet32(header, offset) == img::kqfix::kEndMarkerValue)
            return offset;
    return 0;
}

KqRawBlock* captureBlockOf(const KqRawFixedHeader* header) {
    KqRawBlock* capture = kqrawBlockCreateCapture();
    if (!capture)
        return nullptr;
    // A new capture block holds both fields.
    const bool set =
        kqrawBlockSetFloat(capture, img::kqcap::kExposureTime,
                           static_cast<float>(kqrawFixedGet32(header, img::kqfix::kExposureFixed)) /
                               65536.0f) &&
        kqrawBlockSetFloat(capture, img::kqcap::kSecondValue,
                           static_cast<float>(kqrawFixedGet32(header, img::kqfix::kSecondValue)) /
                               65536.0f);
    if (!set) {
        kqrawBlockRelease(capture);
        return nullptr;
    }
    kqrawBlockSet32(capture, img::kqcap::kCarried1,
                    kqrawFixedGet32(header, img::kqfix::kExposureFloat));
    kqrawBlockSet32(capture, img::kqcap::kCarried2, kqrawFixedGet32(header, img::kqfix::kWord48));
    for (std::uint32_t c = 0; c < 4; ++c)
        kqrawBlockSet32(capture, img::kqcap::kGain0 + 4 * c,
                        kqrawFixedGet32(header, img::kqfix::kGain0 + 4 * c));
    return capture;
}

} // namespace

int kqrawFixedToContainer(img::ByteSource& source, KqRawContainer** out) noexcept {
    *out = nullptr;
    HeaderPtr header;
    int rc = readHeader(source, &header);
    if (rc != img::kOk)
        return rc;
    const KqRawFixedHeader* h = header.get();
    if (kqrawFixedGet32(h, img::kqfix::kVersion) != 1 ||
        kqrawFixedGet32(h, img::kqfix::kRevision) >= 5 ||
        kqrawFixedGet32(h, img::kqfix::kMagic) != img::kqfix::kMagicValue)
        return img::kWrongFormat;
    const std::uint32_t marker = findEndMarker(h);
    if (marker == 0)
        return img::kWrongFormat;
    const std::uint32_t width = kqrawFixedGet32(h, img::kqfix::kWidth);
    const std::uint32_t height = kqrawFixedGet32(h, img::kqfix::kHeight);
    const std::uint64_t pixelOffset = std::uint64_t{marker} + 4;
    if (width == 0 || height == 0 || !img::samplesFit(source.size(), pixelOffset, width, height))
        return img::kRawBadContainer;
    const std::uint64_t count = std::uint64_t{width} * height;
    if (count > (UINT32_MAX - kKqRawPixelLeadSize) / 2) // a pixel block size is 32 bits
        return img::kRawBadContainer;
    const int fits = img::checkSampleMemory(width, height);
    if (fits != img::kOk)
        return fits;

    KqRawContainerPtr container(kqrawContainerCreate());
    KqRawBlock* headerBlock = kqrawBlockCreateHeader();
    if (!container || !headerBlock || !kqrawContainerSetHeader(container.get(), headerBlock)) {
        kqrawBlockRelease(headerBlock);
        return img::kNoMemory;
    }
    kqrawBlockSet32(headerBlock, img::kqhdr::kWidth, width);
    kqrawBlockSet32(headerBlock, img::kqhdr::kHeight, height);
    kqrawBlockSet32(headerBlock, img::kqhdr::kBayerCode,
                    kqrawFixedGet32(h, img::kqfix::kBayerCode));

    KqRawBlock* pixels = kqrawBlockCreatePixels(nullptr, 0);
    if (!pixels || !kqrawContainerSetPixels(container.get(), pixels)) {
        kqrawBlockRelease(pixels);
        return img::kNoMemory;
    }
    auto* samples = static_cast<std::uint16_t*>(std::malloc(static_cast<std::size_t>(count * 2)));
    if (!samples)
        return img::kNoMemory;
    std::free(pixels->samples);
    pixels->samples = samples;
    pixels->sampleCount = count;
    pixels->size = static_cast<std::uint32_t>(kKqRawPixelLeadSize + 2 * count);
    if (!source.seek(pixelOffset) || !img::readSamplesLE(source, samples, count))
        return img::kIoError;

    KqRawBlock* capture = captureBlockOf(h);
    if (!capture || !kqrawContainerAdd(container.get(), capture)) {
        kqrawBlockRelease(capture);
        return img::kNoMemory;
    }
    *out = container.release();
    return img::kOk;
}

} // namespace img
