// Writing a Bayer image out: as 16-bit raw samples (KQRAW files) or, through
// the demosaic, as 8-bit RGB (JPEG and BMP).

#include <stdexcept>

#include "image/bayer_image.h"
#include "image/demosaic.h"
#include "image/image_messages.h"
#include "image/image_result.h"
#include "image/image_save.h"
#include "image/raw_metadata.h"
#include "image/raw_writer.h"
#include "image/sample_scaling.h"

namespace img {

namespace {

[[noreturn]] void fail(const char* text) {
    throw std::runtime_error(text);
}

ImagePtr demosaicOrThrow(const ImageBuffer* image) {
    int rc = img::kOk;
    ImagePtr rgb(demosaicToRgb8(image, &rc));
    if (rgb)
        return rgb;
    if (rc == img::kUnsupported)
        fail(img::msg::kNotStorableAsJpeg);
    if (rc == img::kWrongFormat)
        fail(img::msg::kInvalidBayerPattern);
    fail(img::msg::kCannotStoreKqraw);
}

} // namespace

void BayerImage::storeKqraw(const std::string& path) const {
    const ImageBuffer* image = buffer_.get();
    if (!image || image->dataType != kDataReal32 || !image->data)
        fail(img::msg::kCannotStoreKqraw);
    int rc = img::kOk;
    ImagePtr raw(imageCreate(image->width, image->height, image->bitsPerSample,
                             image->samplesPerPixel, image->numberOfImages, image->cfa[0],
                             image->cfa[1], image->pixelType, image->bufferType, kDataUint16, &rc));
    if (!raw)
        fail(img::msg::kCannotStoreKqraw);
    img::quantiseSamples(static_cast<const float*>(image->data), imageTotalSamples(image, -1),
                         raw->bitsPerSample, static_cast<std::uint16_t*>(raw->data));
    if (img::copyRawMetadata(raw.get(), image) != img::MetadataCopy::kCopied)
        fail(img::msg::kCannotStoreKqraw);
    // An NKRAW image goes out as a fixed-header file: the KQRAW writer
    // translates its capture data. A capture described on the console has
    // no raw file type to keep: written as a bare dump it could not be read
    // back, so it is refused.
    const std::uint32_t fileType = raw->fileType == kFileNkRaw ? kFileKqRaw : raw->fileType;
    if (fileType != kFileKqRaw && fileType != kFileKqRaw2)
        fail(img::msg::kCannotStoreKqraw);
    if (rawWrite(path.c_str(), raw.get(), fileType) != img::kOk)
        fail(img::msg::kCannotStoreKqraw);
}

void BayerImage::storeJpeg(const std::string& path, int quality) const {
    ImagePtr rgb = demosaicOrThrow(buffer_.get());
    const int parameters[1] = {quality};
    if (imageSave(path.c_str(), rgb.get(), img::kFormatJpeg, parameters, 1) != img::kOk)
        fail(img::msg::kCannotStoreJpeg);
}

void BayerImage::storeBmp(const std::string& path) const {
    ImagePtr rgb = demosaicOrThrow(buffer_.get());
    if (imageSave(path.c_str(), rgb.get(), img::kFormatBmp, nullptr, 0) != img::kOk)
        fail(img::msg::kCannotStoreBmp);
}

} // namespace img
