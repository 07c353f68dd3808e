#include "image/raw_writer.h"

#include "image/image_result.h"

int rawWrite(const char*, const ImageBuffer*, std::uint32_t) noexcept {
    return img::kUnsupported;
}
