#include "image/demosaic.h"

#include "image/image_result.h"

ImageBuffer* demosaicToRgb8(const ImageBuffer*, int* result) noexcept {
    if (result)
        *result = img::kUnsupported;
    return nullptr;
}
