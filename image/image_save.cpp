#include "image/image_save.h"

#include "image/bmp_writer.h"
#include "image/image_result.h"
#include "image/jpeg_writer.h"
#include "image/ppm_writer.h"
#include "image/raw_writer.h"
#include "image/tiff_writer.h"

namespace img {

int imageSave(const char* path, const ImageBuffer* image, int format, const int* parameters,
              int parameterCount) noexcept {
    if (!image || !image->data || imageTotalSamples(image, -1) == 0)
        return img::kSizeMismatch;
    if (!path)
        return img::kBadArgument;
    switch (format) {
    case img::kFormatFixRaw:
    case img::kFormatKqRaw:
    case img::kFormatKqRaw2:
        return rawWrite(path, image, static_cast<std::uint32_t>(format));
    case img::kFormatTiff:
        return tiffWrite(path, image);
    case img::kFormatBmp:
        if (!imageIsEightBitDisplay(image))
            return img::kUnsupported;
        return bmpWrite(path, image);
    case img::kFormatJpeg: {
        if (!imageIsEightBitDisplay(image))
            return img::kUnsupported;
        const bool given = parameters && parameterCount > 0;
        return jpegWrite(path, image, given ? parameters[0] : img::kDefaultJpegQuality);
    }
    case img::kFormatPnm:
        return ppmWrite(path, image);
    default:
        // What the raw writer answers for any other file type.
        return img::kWrongFormat;
    }
}

} // namespace img
