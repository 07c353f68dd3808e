#include "image/raw_writer.h"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "image/bayer_code.h"
#include "image/byte_order.h"
#include "image/image_result.h"
#include "image/kqraw_container.h"
#include "image/kqraw_fixed_header.h"
#include "image/malloc_ptr.h"
#include "image/nkraw.h"
#include "image/output_file.h"
#include "image/raw_samples.h"

namespace img {

namespace {

// RAW, RAW_CFA, UINT16, no black level or lower clip, and one white level
// (equal to the upper clip) on every channel.
bool hasPlainRawLevels(const ImageBuffer* image) {
    if (image->pixelType != kPixelRaw || image->bufferType != kBufferRawCfa ||
        image->dataType != kDataUint16 || image->samplesPerPixel != 1)
        return false;
    const float white = image->level[0].whiteVal;
    for (int c = 0; c < 4; ++c)
        if (image->level[c].blackVal != 0.0f || image->clip[c].minClip != 0.0f ||
            image->level[c].whiteVal != white || image->clip[c].maxClip != white)
            return false;
    return true;
}

std::uint64_t pixelCount(const ImageBuffer* image) {
    return static_cast<std::uint64_t>(image->width) * static_cast<std::uint64_t>(image->height);
}

const std::uint16_t* samplesOf(const ImageBuffer* image) {
    return static_cast<const std::uint16_t*>(image->data);
}

int writeFixRaw(std::FILE* file, const ImageBuffer* image) {
    return img::writeSamplesLE(file, samplesOf(image), pixelCount(image)) ? img::kOk
                                                                          : img::kIoError;
}

int writeKqRaw(std::FILE* file, const ImageBuffer* image) {
    img::MallocPtr<KqRawFixedHeader> header(kqrawFixedHeaderCreate());
    if (!header)
        return img::kNoMemory;
    if (image->fileType == kFileKqRaw && image->rawHeader) {
        std::memcpy(header.get(), image->rawHeader, sizeof(KqRawFixedHeader));
    } else if (image->fileType == kFileNkRaw && image->rawHeader) {
        nkrawCaptureToFixedHeader(static_cast<const std::uint8_t*>(image->rawHeader), header.get());
    }
    kqrawFixedSet32(header.get(), img::kqfix::kWidth, static_cast<std::uint32_t>(image->width));
    kqrawFixedSet32(header.get(), img::kqfix::kHeight, static_cast<std::uint32_t>(image->height));
    kqrawFixedSet32(header.get(), img::kqfix::kVersion, 1);
    // A header of revision 2 or later holds its exposure time only as fixed
    // point at +32; calling it revision 1 would make readers take +36 instead.
    if (kqrawFixedGet32(header.get(), img::kqfix::kRevision) < img::kqfix::kFirstFixedPointRevision)
        kqrawFixedSet32(header.get(), img::kqfix::kRevision, 1);
    kqrawFixedSet32(header.get(), img::kqfix::kBayerCode, img::bayerCodeOfCfa(image->cfa[1]));
    if (std::fwrite(header->bytes, 1, sizeof header->bytes, file) != sizeof header->bytes ||
        !img::writeSamplesLE(file, samplesOf(image), pixelCount(image)))
        return img::kIoError;
    return img::kOk;
}

int writeKqRaw2(std::FILE* file, const ImageBuffer* image) {
    const std::uint64_t count = pixelCount(image);
    if (count > (UINT32_MAX - kKqRawPixelLeadSize) / 2) // the block size field is 32 bits
        return img::kUnsupported;
    const KqRawContainer* own = image->fileType == kFileKqRaw2
                                    ? static_cast<const KqRawContainer*>(image->rawHeader)
                                    : nullptr;
    KqRawContainerPtr empty;
    if (!own) {
        empty.reset(kqrawContainerCreate());
        if (!empty)
            return img::kNoMemory;
        own = empty.get();
    }
    // The image's container is left as it is: the new header and pixel
    // blocks are written in place of its own.
    KqRawBlockPtr header(own->headerIndex >= 0 ? kqrawBlockClone(own->blocks[own->headerIndex])
                                               : kqrawBlockCreateHeader());
    if (!header)
        return img::kNoMemory;
    kqrawBlockSet32(header.get(), img::kqhdr::kWidth, static_cast<std::uint32_t>(image->width));
    kqrawBlockSet32(header.get(), img::kqhdr::kHeight, static_cast<std::uint32_t>(image->height));
    kqrawBlockSet32(header.get(), img::kqhdr::kBayerCode, img::bayerCodeOfCfa(image->cfa[1]));
    kqrawBlockSet32(header.get(), img::kqhdr::kBitsPerSample, image->bitsPerSample);
    kqrawBlockSet32(header.get(), img::kqhdr::kSamplesPerPixel, image->samplesPerPixel);
    kqrawBlockSet32(header.get(), img::kqhdr::kNumberOfImages, image->numberOfImages);
    kqrawHeaderStamp(header.get());

    // A new pixel block that borrows the image's samples for the write.
    KqRawBlock pixels{};
    std::memcpy(pixels.tag, img::kqtag::kPixels, kKqRawTagSize);
    pixels.form = KqRawForm::kPixels;
    img::storeLE32(pixels.lead, 1);
    pixels.samples = const_cast<std::uint16_t*>(samplesOf(image));
    pixels.sampleCount = count;
    pixels.size = static_cast<std::uint32_t>(kKqRawPixelLeadSize + 2 * count);
    return kqrawContainerWriteStream(own, file, header.get(), &pixels) ? img::kOk : img::kIoError;
}

} // namespace

int rawWrite(const char* path, const ImageBuffer* image, std::uint32_t fileType) noexcept {
    if (!image || !image->data)
        return img::kSizeMismatch;
    if (fileType != kFileFixRaw && fileType != kFileKqRaw && fileType != kFileKqRaw2)
        return img::kWrongFormat;
    const float lowestWhite = fileType == kFileFixRaw ? 1.0f : 1024.0f;
    if (!hasPlainRawLevels(image) || !(image->level[0].whiteVal >= lowestWhite) ||
        image->level[0].whiteVal > 65536.0f)
        return img::kUnsupported;
    OutputFile output;
    if (!path || !output.open(path))
        return img::kBadArgument;
    int rc = fileType == kFileFixRaw  ? writeFixRaw(output.stream(), image)
             : fileType == kFileKqRaw ? writeKqRaw(output.stream(), image)
                                      : writeKqRaw2(output.stream(), image);
    if (rc != img::kOk) {
        output.abort();
        return rc;
    }
    return output.commit() ? img::kOk : img::kIoError;
}

} // namespace img
