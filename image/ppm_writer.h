#pragma once
// Binary portable pixmap (three samples) and greymap (one sample) output.

#include "image/image_buffer.h"

namespace img {

// Writes the first image of the record as binary PGM (one sample a pixel) or
// PPM (three), with the image's properties, levels and metadata as header
// comments. Integer samples keep their values, clipped to 2^bits - 1 (at most
// 65535); float samples are scaled so that 1.0 becomes 65535. Samples above
// 255 take two bytes, most significant first. Returns 0; -1 the file cannot
// be opened; -2 a write, the flush or the close failed; -3 no memory; -5 no
// samples; -6 any other sample count, sub-sampled YUV planes or an unknown
// data type.
[[nodiscard]] int ppmWrite(const char* path, const ImageBuffer* image) noexcept;

} // namespace img
