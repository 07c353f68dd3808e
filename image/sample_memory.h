#pragma once
// Memory for large sample blocks. Released with std::free like any other
// block of the library.

#include <cstddef>
#include <cstdint>

namespace img {

// The largest image the tool loads: 1 GiB of float samples (268,435,456
// samples, for example 16384 x 16384 pixels of one sample). A declared size
// beyond it is refused before anything is allocated, whatever the input
// (a raw container, a fixed-header file, a headerless dump, a stream).
constexpr std::uint64_t kMaxSampleMemory = std::uint64_t{1} << 30;
constexpr std::uint64_t kMaxImageSamples = kMaxSampleMemory / sizeof(float);

// kOk when an image of width x height pixels of `samplesPerPixel` samples
// (and `images` images) stays within kMaxSampleMemory, else kImageTooLarge
// (image_result.h), whose text is msg::kImageTooLarge. Every loader asks
// this before it allocates samples.
[[nodiscard]] int checkSampleMemory(std::uint64_t width, std::uint64_t height,
                                    std::uint64_t samplesPerPixel = 1,
                                    std::uint64_t images = 1) noexcept;

// malloc for small blocks. A block of several megabytes is aligned to 2 MiB
// and, where the system offers it, advised for transparent huge pages: a
// 12-megapixel float image otherwise takes some 12000 page faults to touch,
// which costs more than converting its samples.
void* allocateSamples(std::size_t bytes) noexcept;

// A block for `count` raw samples of `sampleBytes` bytes each (1 or 2) with
// room to turn them into floats where they lie (img::widenSamplesToFloat).
// The room is address space only until the floats are written. Null when out
// of memory or the size does not fit.
void* allocateWidenableSamples(std::uint64_t count, std::size_t sampleBytes) noexcept;

// True when `block` (from the functions above) holds at least `bytes` bytes.
// False where the allocator cannot tell.
bool blockHolds(const void* block, std::uint64_t bytes) noexcept;

} // namespace img
