#pragma once
// TIFF output of any image the library holds, through libtiff.

#include "image/image_buffer.h"

namespace img {

// Writes one uncompressed image (the first, when the record holds several)
// with the image's properties, levels and metadata in the ImageDescription
// tag. Samples are stored at the width of their data type (8, 16 or 32 bits;
// signed integers and floats marked as such). Returns 0; -1 the file cannot be
// opened; -2 libtiff or a write, flush or close failed; -3 no memory; -5 no
// samples; -6 sub-sampled YUV planes or a data type without a sample width.
[[nodiscard]] int tiffWrite(const char* path, const ImageBuffer* image) noexcept;

} // namespace img
