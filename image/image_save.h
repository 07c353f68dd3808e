#pragma once
// Saves an image in one of the library's file formats, picking the writer by
// format number. Procedural and noexcept: results are the codes of
// image/image_result.h.

#include "image/image_buffer.h"

namespace img {

// Format numbers of imageSave. The raw formats share their numbers with FileType.
constexpr int kFormatFixRaw = 2;
constexpr int kFormatKqRaw = 3;
constexpr int kFormatKqRaw2 = 4;
constexpr int kFormatTiff = 6;
constexpr int kFormatBmp = 7;
constexpr int kFormatJpeg = 8;
constexpr int kFormatPnm = 9; // binary PPM (three samples) or PGM (one sample)

constexpr int kDefaultJpegQuality = 90;

// Writes `image` to `path` in `format`. parameters may be null; JPEG takes
// parameters[0] as its quality (0-100), 90 when parameterCount is 0.
// Returns 0; -5 for a null image or one without samples; -6 when BMP or JPEG
// is asked for an image that is not 8-bit MONO or interleaved RGB with plain
// levels; -4 for an unknown format; otherwise the writer's code (-1 open,
// -2 write error, -3 no memory).
[[nodiscard]] int imageSave(const char* path, const ImageBuffer* image, int format,
                            const int* parameters, int parameterCount) noexcept;

} // namespace img
