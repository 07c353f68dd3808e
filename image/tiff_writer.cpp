#include "image/tiff_writer.h"

#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <new>
#include <vector>

#include <tiffio.h>

#include "image/export_messages.h"
#include "image/image_result.h"
#include "image/output_file.h"
#include "image/tiff_ptr.h"

#include <sys/stat.h>
#include <sys/types.h>

namespace img {

namespace {

// libtiff talks to the OutputFile's stream through these; the stream stays
// the OutputFile's to flush, close and rename.
struct StreamTarget {
    std::FILE* stream;
    bool failed;
};

tmsize_t readFromStream(thandle_t handle, void* buffer, tmsize_t size) {
    auto* target = static_cast<StreamTarget*>(handle);
    return size <= 0 ? 0
                     : static_cast<tmsize_t>(
                           std::fread(buffer, 1, static_cast<std::size_t>(size), target->stream));
}

tmsize_t writeToStream(thandle_t handle, void* buffer, tmsize_t size) {
    auto* target = static_cast<StreamTarget*>(handle);
    if (size <= 0)
        return 0;
    const std::size_t written =
        std::fwrite(buffer, 1, static_cast<std::size_t>(size), target->stream);
    if (written != static_cast<std::size_t>(size))
        target->failed = true;
    return static_cast<tmsize_t>(written);
}

toff_t seekInStream(thandle_t handle, toff_t offset, int whence) {
    auto* target = static_cast<StreamTarget*>(handle);
    if (offset > static_cast<toff_t>(INT64_MAX) ||
        fseeko(target->stream, static_cast<off_t>(offset), whence) != 0)
        return static_cast<toff_t>(-1);
    const off_t position = ftello(target->stream);
    return position < 0 ? static_cast<toff_t>(-1) : static_cast<toff_t>(position);
}

int keepStreamOpen(thandle_t) {
    return 0;
}

toff_t streamSize(thandle_t handle) {
    auto* target = static_cast<StreamTarget*>(handle);
    struct stat info;
    if (std::fflush(target->stream) != 0 || fstat(fileno(target->stream), &info) != 0)
        return 0;
    return static_cast<toff_t>(info.st_size);
}

int noMapping(thandle_t, void**, toff_t*) {
    return 0;
}

void noUnmapping(thandle_t, void*, toff_t) {
}

#if TIFFLIB_VERSION >= 20221213
// Errors and warnings end up in the result code, not on the console.
int recordError(TIFF*, void* userData, const char*, const char*, va_list) {
    static_cast<StreamTarget*>(userData)->failed = true;
    return 1;
}
int ignoreWarning(TIFF*, void*, const char*, const char*, va_list) {
    return 1;
}
#endif

TIFF* openTiff(StreamTarget* target, const char* name) {
#if TIFFLIB_VERSION >= 20221213
    TIFFOpenOptions* options = TIFFOpenOptionsAlloc();
    if (!options)
        return nullptr;
    TIFFOpenOptionsSetErrorHandlerExtR(options, recordError, target);
    TIFFOpenOptionsSetWarningHandlerExtR(options, ignoreWarning, nullptr);
    TIFF* tiff = TIFFClientOpenExt(name, "w", target, readFromStream, writeToStream, seekInStream,
                                   keepStreamOpen, streamSize, noMapping, noUnmapping, options);
    TIFFOpenOptionsFree(options);
    return tiff;
#else
    return TIFFClientOpen(name, "w", target, readFromStream, writeToStream, seekInStream,
                          keepStreamOpen, streamSize, noMapping, noUnmapping);
#endif
}

bool setTags(TIFF* tiff, const ImageBuffer& image, const char* description) {
    const bool rawOrMono = image.pixelType == kPixelRaw || image.pixelType == kPixelMono;
    const int bits = static_cast<int>(8 * imageSampleBytes(image.dataType));
    int sampleFormat = SAMPLEFORMAT_UINT;
    if (image.dataType == kDataInt32)
        sampleFormat = SAMPLEFORMAT_INT;
    else if (image.dataType == kDataReal32)
        sampleFormat = SAMPLEFORMAT_IEEEFP;
    return TIFFSetField(tiff, TIFFTAG_IMAGEWIDTH, static_cast<std::uint32_t>(image.width)) &&
           TIFFSetField(tiff, TIFFTAG_IMAGELENGTH, static_cast<std::uint32_t>(image.height)) &&
           TIFFSetField(tiff, TIFFTAG_BITSPERSAMPLE, bits) &&
           TIFFSetField(tiff, TIFFTAG_SAMPLEFORMAT, sampleFormat) &&
           TIFFSetField(tiff, TIFFTAG_ORIENTATION, ORIENTATION_TOPLEFT) &&
           TIFFSetField(tiff, TIFFTAG_COMPRESSION, COMPRESSION_NONE) &&
           TIFFSetField(tiff, TIFFTAG_PHOTOMETRIC,
                        rawOrMono ? PHOTOMETRIC_MINISBLACK : PHOTOMETRIC_RGB) &&
           TIFFSetField(tiff, TIFFTAG_FILLORDER, FILLORDER_MSB2LSB) &&
           TIFFSetField(tiff, TIFFTAG_SAMPLESPERPIXEL, static_cast<int>(image.samplesPerPixel)) &&
           TIFFSetField(tiff, TIFFTAG_PLANARCONFIG,
                        image.bufferType == kBufferPlanar ? PLANARCONFIG_SEPARATE
                                                          : PLANARCONFIG_CONTIG) &&
           TIFFSetField(tiff, TIFFTAG_ROWSPERSTRIP, TIFFDefaultStripSize(tiff, 0)) &&
           TIFFSetField(tiff, TIFFTAG_IMAGEDESCRIPTION, description);
}

// Rows are copied out first: libtiff may byte-swap the buffer it is given,
// and the image is not ours to change.
bool writeRows(TIFF* tiff, const ImageBuffer& image, std::uint8_t* row) {
    const std::uint64_t width = static_cast<std::uint64_t>(image.width);
    const std::uint64_t height = static_cast<std::uint64_t>(image.height);
    const std::uint64_t sampleBytes = imageSampleBytes(image.dataType);
    const auto* data = static_cast<const std::uint8_t*>(image.data);
    const bool planar = image.bufferType == kBufferPlanar;
    const int planes = planar ? image.samplesPerPixel : 1;
    const std::uint64_t rowBytes = width * sampleBytes * (planar ? 1 : image.samplesPerPixel);
    for (int plane = 0; plane < planes; ++plane) {
        const std::uint8_t* planeStart =
            data + static_cast<std::uint64_t>(plane) * height * rowBytes;
        for (std::uint32_t y = 0; y < height; ++y) {
            std::memcpy(row, planeStart + y * rowBytes, static_cast<std::size_t>(rowBytes));
            if (TIFFWriteScanline(tiff, row, y, static_cast<std::uint16_t>(plane)) != 1)
                return false;
        }
    }
    return true;
}

// The ImageDescription text: properties, levels and metadata. Throws std::bad_alloc.
std::string tiffDescription(const ImageBuffer& image) {
    namespace text = img::exportText;
    std::string description = text::kTiffPrefix;
    std::string cfa;
    if (image.pixelType == kPixelRaw)
        text::appendFormatted(cfa, text::kTiffCfa, cfaPatternName(image.cfa[1]));
    text::appendFormatted(description, text::kTiffProperties, image.numberOfImages,
                          pixelTypeName(image.pixelType), cfa.c_str(),
                          bufferTypeName(image.bufferType), dataTypeName(image.dataType));
    text::appendLevelFields(
        description, image,
        {text::kTiffBlackVal, text::kTiffWhiteVal, text::kTiffMinClip, text::kTiffMaxClip}, false);
    for (const MetadataEntry* entry = image.metadata; entry; entry = entry->next) {
        text::appendFormatted(description, text::kTiffMetadataKey, entry->key,
                              static_cast<int>(std::strlen(entry->value)));
        text::appendFormatted(description, text::kTiffMetadataValue, entry->value);
    }
    return description;
}

} // namespace

int tiffWrite(const char* path, const ImageBuffer* image) noexcept {
    if (!image || !image->data || image->width < 1 || image->height < 1 ||
        image->samplesPerPixel < 1)
        return img::kSizeMismatch;
    // Sub-sampled chroma planes have no plain TIFF layout here; writing them
    // as full planes would read past the sample block.
    if (image->pixelType == kPixelYuv422 || image->pixelType == kPixelYuv420 ||
        imageSampleBytes(image->dataType) == 0)
        return img::kUnsupported;
    if (!path)
        return img::kBadArgument;

    std::string description;
    std::vector<std::uint8_t> row;
    try {
        description = tiffDescription(*image);
    } catch (const std::bad_alloc&) {
        return img::kNoMemory;
    }

    OutputFile file;
    if (!file.open(path))
        return img::kBadArgument;
    StreamTarget target{file.stream(), false};
    const img::TiffPtr tiff(openTiff(&target, path));
    if (!tiff)
        return img::kIoError;
    bool ok = setTags(tiff.get(), *image, description.c_str());
    const std::uint64_t expectedRow =
        static_cast<std::uint64_t>(image->width) * imageSampleBytes(image->dataType) *
        (image->bufferType == kBufferPlanar ? 1 : image->samplesPerPixel);
    // The scanline libtiff expects must be exactly one row of the image (and
    // addressable here, which a 32-bit host may not manage).
    ok = ok && expectedRow <= static_cast<std::uint64_t>(PTRDIFF_MAX) &&
         static_cast<std::uint64_t>(TIFFScanlineSize(tiff.get())) == expectedRow;
    if (ok) {
        try {
            row.resize(static_cast<std::size_t>(expectedRow));
        } catch (const std::bad_alloc&) {
            return img::kNoMemory;
        }
        ok = writeRows(tiff.get(), *image, row.data());
    }
    ok = ok && TIFFFlush(tiff.get()) == 1;
    if (!ok || target.failed)
        return img::kIoError;
    return file.commit() ? img::kOk : img::kIoError;
}

} // namespace img
