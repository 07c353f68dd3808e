#pragma once
// Turns a normalised Bayer sensor image into 8-bit RGB for people to look at.

#include "image/image_buffer.h"

namespace img {

// Bilinear demosaic of a RAW, RAW_CFA, REAL32 image with one sample a pixel
// (1.0 is full scale) into a new RGB, INTERLEAVED, UINT8 image of the same
// size with the plain 0..256 levels; pixels only, no metadata. Of a record
// holding several images the first is used. Result in *result: 0; -6
// (img::kUnsupported) for any other kind of source (or a null one); -4
// (img::kWrongFormat) for a pattern that is not RGGB, GRBG, GBRG or BGGR;
// -5 (img::kSizeMismatch) for a source without samples; -3 (img::kNoMemory).
// The caller releases the image.
ImageBuffer* demosaicToRgb8(const ImageBuffer* source, int* result) noexcept;

} // namespace img
