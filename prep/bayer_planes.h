#pragma once
// Splitting a colour-filter mosaic into its colour planes, plain
// down-sampling, and weaving the planes back into a mosaic.
//
// Plane image layout: pixel type OTHER, buffer type INTERLEAVED, REAL32, with
// width W / p, height H / p (truncating) and p * p * N channels for a mosaic of
// N channels and pattern size p. The channels of one pixel lie together:
// sample (x, y, k) is at index (y * width + x) * channels + k. Channel
// k = r * p + c holds the mosaic pixel at column p * x + c, row p * y + r.

#include <cstdint>

#include "image/bayer_image.h"

namespace prep {

// Pattern size of a colour-filter pattern: 2 for a 2 x 2 pattern (first word
// 0, second word with a colour code in bits 16-19 and nothing below), else 4
// when the low 4 bits of the first word are set, else 1.
int patternSize(std::uint32_t cfa0, std::uint32_t cfa1);

// Size of a dimension after down-sampling by `factor`: (size + factor - 1) / factor.
std::int32_t downsampledSize(std::int32_t size, int factor);

// The plane image of a mosaic (first channel of the mosaic; the channels of a
// multi-channel mosaic beyond the first p * p are zero).
img::BayerImage split(const img::BayerImage& mosaic);

// Plain decimation: target(x, y, k) = planes(factor * x, factor * y, k). The
// target is (re)created here with the down-sampled size and the same channels.
void downsample(const img::BayerImage& planes, int factor, img::BayerImage& target);

// The mosaic of a plane image with p * p channels: width and height times p,
// one channel, pixel type RAW with the given cfa words. Throws
// std::invalid_argument for a plane image of another channel count or cfa
// words of another pattern size.
img::BayerImage weave(const img::BayerImage& planes, int p, std::uint32_t cfa0, std::uint32_t cfa1);

} // namespace prep
