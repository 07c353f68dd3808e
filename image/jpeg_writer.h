#pragma once
// JPEG output of 8-bit images through libjpeg.

#include "image/image_buffer.h"

namespace img {

// Writes an 8-bit MONO (greyscale) or interleaved RGB image as a baseline JPEG
// of the given quality (clamped to 0-100), with one comment marker for each
// metadata entry, in list order. Returns 0; -1 the file cannot be opened;
// -2 the library reported an error (also a failed write, flush or close);
// -3 no memory; -5 no samples; -6 not one or three UINT8 samples a pixel.
[[nodiscard]] int jpegWrite(const char* path, const ImageBuffer* image, int quality) noexcept;

} // namespace img
