#pragma once
// 16-bit raw samples: little-endian in files, host order in memory, and the
// bit depth that the raw readers derive from the largest sample.

#include <cstdint>
#include <cstdio>

#include "image/byte_source.h"
#include "image/image_buffer.h"

namespace img {

// Reads `count` little-endian samples at the source's position into host order.
// False when they are not all there (count * 2 is checked before the read).
[[nodiscard]] bool readSamplesLE(ByteSource& source, std::uint16_t* samples,
                                 std::uint64_t count) noexcept;
// The same for samples stored in either byte order.
bool readSamples16(ByteSource& source, std::uint16_t* samples, std::uint64_t count,
                   bool littleEndianFile) noexcept;
// Writes samples in host order as little-endian. False when a write fails.
[[nodiscard]] bool writeSamplesLE(std::FILE* file, const std::uint16_t* samples,
                                  std::uint64_t count) noexcept;

std::uint16_t largestSample(const std::uint16_t* samples, std::uint64_t count) noexcept;
// Bit length of the largest sample, and 10 when that is below 10.
std::uint16_t bitsForLargestSample(std::uint16_t largest) noexcept;
// Sets bitsPerSample from the largest sample of a UINT16 image, whiteVal and
// maxClip of all four channels to 2^bits, blackVal and minClip to 0.
void applyLargestSampleDepth(ImageBuffer* image) noexcept;
// The same for a depth already known.
void applySampleDepth(ImageBuffer* image, std::uint16_t bits) noexcept;

// Makes a RAW, RAW_CFA, UINT16 image of width x height (one sample a pixel,
// one image) and fills it with the samples at `offset` of the source; the bit
// depth comes from the largest sample. Result: 0; -5 when a dimension is 0 or
// beyond 32-bit signed range, or the samples run past the end of the data;
// -3; -2. With `samplesAt`, the samples are left unread (the image has no
// sample block yet) and their position is stored there.
[[nodiscard]] int readRawImage(ByteSource& source, std::uint64_t offset, std::uint32_t width,
                               std::uint32_t height, std::uint32_t cfa, ImageBuffer** image,
                               std::uint64_t* samplesAt = nullptr) noexcept;

// Reads the samples that a header-only read left at `samplesAt` into a new
// block of the UINT16 image, and takes the depth from the largest. 0, -3, -2.
[[nodiscard]] int readDeferredSamples(ByteSource& source, std::uint64_t samplesAt,
                                      ImageBuffer* image) noexcept;

// True when width x height 16-bit samples fit between `offset` and the end of
// a source of `size` bytes, computed in 64 bits.
bool samplesFit(std::uint64_t size, std::uint64_t offset, std::uint32_t width,
                std::uint32_t height) noexcept;

} // namespace img
