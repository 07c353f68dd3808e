#pragma once
// Writes a 16-bit raw sensor image as a file of the given type: FIXRAW (bare
// samples), KQRAW (fixed header) or KQRAW2 (chunked container).

#include <cstdint>

#include "image/image_buffer.h"

namespace img {

// Result: 0; -1 the file cannot be opened; -2 a write failed; -3 no memory;
// -4 a file type other than FIXRAW, KQRAW or KQRAW2; -5 null image or no
// samples; -6 the image is not RAW/RAW_CFA/UINT16 with plain levels, or its
// white level does not suit the file type.
[[nodiscard]] int rawWrite(const char* path, const ImageBuffer* image,
                           std::uint32_t fileType) noexcept;

} // namespace img
