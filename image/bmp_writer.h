#pragma once
// Windows bitmap output of 8-bit images.

#include "image/image_buffer.h"

namespace img {

// Writes an 8-bit MONO image (8-bit grey palette) or an 8-bit interleaved RGB
// image (24-bit BGR) as an uncompressed bottom-up BMP. Returns 0; -1 the file
// cannot be opened; -2 a write, the flush or the close failed; -3 no row
// buffer; -5 no samples; -6 not one or three UINT8 samples a pixel, or a file
// too large for the format's 32-bit size field.
[[nodiscard]] int bmpWrite(const char* path, const ImageBuffer* image) noexcept;

} // namespace img
