#pragma once
// Memory for large sample blocks. Released with std::free like any other
// block of the library.

#include <cstddef>
#include <cstdint>

namespace img {

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
