#pragma once
// The two hot conversions between raw samples and the normalised floats that
// the Bayer image object holds (1.0 = full scale of the bit depth). Each runs
// once over the data.

#include <cstdint>

#include "image/image_buffer.h"

namespace img {

// out[i] = (s & (2^bits - 1)) / (2^bits - 1) for every sample of a UINT8 or
// UINT16 image (bits 1..16). False for other data types; with bits 0 every
// output is 0.
[[nodiscard]] bool normaliseSamples(const ImageBuffer* raw, float* out) noexcept;

// The same conversion, after which the image holds REAL32 samples. A block
// from allocateWidenableSamples (the raw readers' blocks) is converted where
// it lies, so loading never holds the raw samples and a float copy at once;
// any other block is converted into a new one. Result: kOk; kNoMemory (the
// image is unchanged); kUnsupported for data types other than UINT8 and
// UINT16 or no samples.
[[nodiscard]] int widenSamplesToFloat(ImageBuffer* raw) noexcept;

// out[i] = min(2^bits - 1, v * (2^bits - 1) + 0.5 truncated); negative
// results and NaN give 0. bits 0..16.
void quantiseSamples(const float* in, std::uint64_t count, unsigned bits,
                     std::uint16_t* out) noexcept;

} // namespace img
