#include "image/raw_reader.h"

#include "image/image_result.h"

ImageBuffer* rawRead(const char*, int* result) noexcept {
    if (result)
        *result = img::kUnsupported;
    return nullptr;
}
