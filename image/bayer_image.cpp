#include "image/bayer_image.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>

#include "image/error_detail.h"
#include "image/file_ptr.h"
#include "image/hex_text.h"
#include "image/image_messages.h"
#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "image/kqraw_fixed_header.h"
#include "image/raw_metadata.h"
#include "image/raw_reader.h"
#include "image/sample_memory.h"
#include "image/sample_scaling.h"

#include <sys/stat.h>

namespace img {

namespace {

[[noreturn]] void fail(const char* text) {
    throw std::runtime_error(text);
}

// Why a capture could not be read, for the line under "Cannot read kqraw
// image.": the system's reason when the file does not open, else what the
// reader found wrong with it.
std::string readFailureReason(const std::string& path, int rc) {
    const img::FilePtr file(std::fopen(path.c_str(), "rb"));
    if (!file)
        return systemReason(path, errno);
    const int first = std::fgetc(file.get());
    const int error = std::ferror(file.get()) ? errno : 0;
    if (error != 0)
        return systemReason(path, error);
    if (first == EOF)
        return path + ": the file is empty";
    struct stat info;
    if (stat(path.c_str(), &info) == 0 && !S_ISREG(info.st_mode))
        return path + ": a device or pipe that gives no KQRAW2 or KQRAW raw image";
    switch (rc) {
    case img::kIoError:
        return path + ": a read error, or the file is shorter than its layout declares";
    case img::kSizeMismatch:
        return path + ": the file holds fewer samples than its header declares (truncated)";
    case img::kRawBadContainer:
        return path + ": truncated or damaged (a block or the pixel data runs past the end of "
                      "the file, or the header or pixel block is missing)";
    case img::kRawBadLayout:
        return path + ": the layout given on the console does not match the file";
    case img::kUnsupported:
        return path + ": an image layout the tool does not support";
    case img::kNoMemory:
        return path + ": too large to read (a device that does not end?), or not enough memory";
    default:
        return path + ": not a KQRAW2 or KQRAW raw image";
    }
}

// Copy metadata with the object's messages for each failure.
void copyMetadataOrThrow(ImageBuffer* target, const ImageBuffer* source) {
    switch (img::copyRawMetadata(target, source)) {
    case img::MetadataCopy::kCopied:
        return;
    case img::MetadataCopy::kTargetHasFileType:
        fail(img::msg::kAlreadyHasFileType);
    case img::MetadataCopy::kCopyFailed:
        fail(img::msg::kCannotCopyMetadata);
    case img::MetadataCopy::kOutOfMemory:
        fail(img::msg::kCannotAllocateMetadata);
    }
}

// Capture data of a headerless raw file as a container: header block, capture
// block and SENSORINFO with the serial number. Null when out of memory.
KqRawContainer* headerlessContainer(float exposureTime, float gain, const std::string& serial) {
    KqRawContainerPtr container(kqrawContainerCreate());
    if (!container)
        return nullptr;
    KqRawBlockPtr header(kqrawBlockCreateHeader());
    if (!header || !kqrawContainerSetHeader(container.get(), header.get()))
        return nullptr;
    header.release();
    KqRawBlockPtr capture(kqrawBlockCreateCapture());
    bool set =
        capture && kqrawBlockSetFloat(capture.get(), img::kqcap::kExposureTime, exposureTime);
    for (std::uint32_t c = 0; c < 4; ++c)
        set = set && kqrawBlockSetFloat(capture.get(), img::kqcap::kGain0 + 4 * c, gain);
    if (!set || !kqrawContainerAdd(container.get(), capture.get()))
        return nullptr;
    capture.release();
    KqRawBlockPtr info(kqrawBlockCreateSensorInfo());
    if (!info || !kqrawBlockSetSerialNumber(info.get(), serial.c_str()) ||
        !kqrawContainerAdd(container.get(), info.get()))
        return nullptr;
    info.release();
    return container.release();
}

// The same capture data in a fresh fixed header. Null when out of memory.
KqRawFixedHeader* headerlessFixedHeader(float exposureTime, float gain, const std::string& serial,
                                        const std::string& sensorGuid) {
    KqRawFixedHeader* header = kqrawFixedHeaderCreate();
    if (!header)
        return nullptr;
    kqrawFixedSetFloat(header, img::kqfix::kExposureFloat, exposureTime);
    for (std::uint32_t c = 0; c < 4; ++c)
        kqrawFixedSetFloat(header, img::kqfix::kGain0 + 4 * c, gain);
    if (!sensorGuid.empty())
        kqrawFixedSet64(header, img::kqfix::kSensorGuid, img::parseHex64(sensorGuid.c_str()));
    img::parseHexBytes(serial.c_str(), header->bytes + img::kqfix::kSerial,
                       img::kqfix::kSerialSize);
    return header;
}

} // namespace

void throwCannotReadCapture(const std::string& path, int result) {
    if (result == img::kImageTooLarge)
        fail(img::msg::kImageTooLarge);
    throw DetailedError<std::runtime_error>(readFailureReason(path, result),
                                            img::msg::kCannotReadKqraw);
}

void BayerImage::read(const std::string& path) {
    buffer_.reset();
    int rc = img::kOk;
    ImagePtr raw(rawRead(path.c_str(), &rc));
    if (!raw)
        throwCannotReadCapture(path, rc);
    adoptRaw(std::move(raw), rc);
}

void BayerImage::adoptRaw(ImagePtr raw, int readResult) {
    buffer_.reset();
    if (!raw)
        fail(readResult == img::kImageTooLarge ? img::msg::kImageTooLarge
                                               : img::msg::kCannotReadKqraw);
    int rc = img::kOk;
    // The image takes over the raw samples' block, widened to floats where
    // the reader left room for them: loading then never holds the raw samples
    // and a float copy at once.
    ImagePtr image(imageCreate(raw->width, raw->height, raw->bitsPerSample, raw->samplesPerPixel,
                               raw->numberOfImages, raw->cfa[0], raw->cfa[1], raw->pixelType,
                               raw->bufferType, kDataNone, &rc));
    if (!image)
        fail(img::msg::kCannotAllocateImage);
    copyMetadataOrThrow(image.get(), raw.get());
    const int widened = img::widenSamplesToFloat(raw.get());
    if (widened == img::kNoMemory)
        fail(img::msg::kCannotAllocateImage);
    if (widened != img::kOk)
        fail(img::msg::kCannotReadKqraw);
    image->data = raw->data;
    image->dataType = kDataReal32;
    raw->data = nullptr;
    buffer_ = std::move(image);
}

void BayerImage::adoptHeader(const ImageBuffer& raw) {
    buffer_.reset();
    int rc = img::kOk;
    ImagePtr image(imageCreate(raw.width, raw.height, raw.bitsPerSample, raw.samplesPerPixel,
                               raw.numberOfImages, raw.cfa[0], raw.cfa[1], raw.pixelType,
                               raw.bufferType, kDataNone, &rc));
    if (!image)
        fail(img::msg::kCannotAllocateImage);
    copyMetadataOrThrow(image.get(), &raw);
    image->dataType = kDataReal32;
    buffer_ = std::move(image);
}

void BayerImage::createFromHeaderless(std::int32_t width, std::int32_t height, std::uint16_t bits,
                                      std::uint32_t cfa, float exposureTime, float gain,
                                      const std::string& serialNumber,
                                      const std::string& sensorGuid, bool fixedHeader,
                                      bool withSamples) {
    buffer_.reset();
    if (width >= 0 && height >= 0 &&
        img::checkSampleMemory(static_cast<std::uint64_t>(width),
                               static_cast<std::uint64_t>(height)) != img::kOk)
        fail(img::msg::kImageTooLarge);
    int rc = img::kOk;
    ImagePtr image(imageCreate(width, height, bits, 1, 1, 0, cfa, kPixelRaw, kBufferRawCfa,
                               withSamples ? kDataReal32 : kDataNone, &rc));
    if (!image)
        fail(img::msg::kCannotAllocateImage);
    image->dataType = kDataReal32;
    if (fixedHeader) {
        image->rawHeader = headerlessFixedHeader(exposureTime, gain, serialNumber, sensorGuid);
        image->fileType = kFileKqRaw;
    } else {
        image->rawHeader = headerlessContainer(exposureTime, gain, serialNumber);
        image->fileType = kFileKqRaw2;
    }
    if (!image->rawHeader)
        fail(img::msg::kCannotAllocateMetadataHeaderless);
    buffer_ = std::move(image);
}

void BayerImage::createLike(const BayerImage& templateImage, std::int32_t width,
                            std::int32_t height, std::uint16_t samplesPerPixel, std::uint32_t cfa0,
                            std::uint32_t cfa1, std::uint32_t pixelType, std::uint32_t bufferType) {
    const ImageBuffer* pattern = templateImage.buffer();
    if (!pattern)
        fail(img::msg::kCannotAllocateImage);
    if (&templateImage != this)
        buffer_.reset();
    int rc = img::kOk;
    ImagePtr image(imageCreate(width, height, pattern->bitsPerSample, samplesPerPixel,
                               pattern->numberOfImages, cfa0, cfa1, pixelType, bufferType,
                               pattern->dataType, &rc));
    if (!image || img::copyRawMetadata(image.get(), pattern) != img::MetadataCopy::kCopied)
        fail(img::msg::kCannotAllocateImage);
    buffer_ = std::move(image);
}

void BayerImage::copy(const BayerImage& source) {
    if (&source == this)
        return;
    const ImageBuffer* from = source.buffer();
    if (!from)
        fail(img::msg::kCannotCopyImage);
    buffer_.reset();
    int rc = img::kOk;
    ImagePtr image(imageCreate(
        from->width, from->height, from->bitsPerSample, from->samplesPerPixel, from->numberOfImages,
        from->cfa[0], from->cfa[1], from->pixelType, from->bufferType, from->dataType, &rc));
    if (!image)
        fail(img::msg::kCannotCopyImage);
    if (from->data && image->data)
        std::memcpy(image->data, from->data,
                    static_cast<std::size_t>(imageTotalSamples(from, -1) *
                                             imageSampleBytes(from->dataType)));
    std::memcpy(image->level, from->level, sizeof image->level);
    std::memcpy(image->clip, from->clip, sizeof image->clip);
    if (img::copyRawMetadata(image.get(), from) != img::MetadataCopy::kCopied)
        fail(img::msg::kCannotCopyImage);
    buffer_ = std::move(image);
}

void BayerImage::copyMetadata(const BayerImage& source) {
    if (!buffer_ || !source.buffer())
        fail(img::msg::kCannotCopyMetadata);
    copyMetadataOrThrow(buffer_.get(), source.buffer());
}

bool BayerImage::samePixels(const BayerImage& other) const {
    const ImageBuffer* a = buffer_.get();
    const ImageBuffer* b = other.buffer();
    if (!a || !b || a->width != b->width || a->height != b->height ||
        a->samplesPerPixel != b->samplesPerPixel || a->dataType != kDataReal32 ||
        b->dataType != kDataReal32)
        return false;
    const std::uint64_t count = imageTotalSamples(a, -1);
    if (count != imageTotalSamples(b, -1))
        return false;
    const auto* p = static_cast<const float*>(a->data);
    const auto* q = static_cast<const float*>(b->data);
    for (std::uint64_t i = 0; i < count; ++i)
        if (!(p[i] == q[i]))
            return false;
    return true;
}

} // namespace img
