#include "image/nkraw.h"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "image/bayer_code.h"
#include "image/byte_order.h"
#include "image/image_result.h"
#include "image/malloc_ptr.h"
#include "image/raw_samples.h"

namespace img {

int nkrawRead(img::ByteSource& source, ImageBuffer** out) noexcept {
    *out = nullptr;
    if (source.size() < kNkRawHeaderSize)
        return img::kWrongFormat;
    img::MallocPtr<std::uint8_t> header(static_cast<std::uint8_t*>(std::malloc(kNkRawHeaderSize)));
    if (!header)
        return img::kNoMemory;
    if (!source.seek(0) || !source.read(header.get(), kNkRawHeaderSize))
        return img::kIoError;
    if (std::memcmp(header.get(), img::nkraw::kMagic, img::nkraw::kMagicSize) != 0)
        return img::kWrongFormat;
    const std::uint32_t width = img::loadLE32(header.get() + img::nkraw::kWidth);
    const std::uint32_t height = img::loadLE32(header.get() + img::nkraw::kHeight);
    // The pixels must fill the file exactly; the division keeps it in 64 bits.
    const std::uint64_t pixelBytes = source.size() - kNkRawHeaderSize;
    if (pixelBytes % 2 != 0 || pixelBytes / 2 != std::uint64_t{width} * height)
        return img::kSizeMismatch;
    ImageBuffer* image = nullptr;
    const int rc = img::readRawImage(
        source, kNkRawHeaderSize, width, height,
        img::cfaOfBayerCode(img::loadLE32(header.get() + img::nkraw::kBayerCode)), &image);
    if (rc != img::kOk)
        return rc;
    image->fileType = kFileNkRaw;
    image->rawHeader = header.release();
    *out = image;
    return img::kOk;
}

void nkrawCaptureToFixedHeader(const std::uint8_t* nk, KqRawFixedHeader* header) noexcept {
    const std::uint64_t microseconds = img::loadLE32(nk + img::nkraw::kExposureMicroseconds);
    kqrawFixedSet32(header, img::kqfix::kExposureFixed,
                    static_cast<std::uint32_t>((microseconds * 65536 + 500000) / 1000000));
    const std::int64_t gainStep = img::loadLE32(nk + img::nkraw::kGainStep);
    kqrawFixedSet32(header, img::kqfix::kSecondValue,
                    static_cast<std::uint32_t>((gainStep - 8) * 16384));
    const std::uint32_t numerator = img::loadLE32(nk + img::nkraw::kGainNumerator);
    const std::uint32_t denominator = img::loadLE32(nk + img::nkraw::kGainDenominator);
    const float gain =
        denominator == 0 ? 0.0f : static_cast<float>(numerator) / static_cast<float>(denominator);
    for (std::uint32_t c = 0; c < 4; ++c)
        kqrawFixedSetFloat(header, img::kqfix::kGain0 + 4 * c, gain);
}

} // namespace img
