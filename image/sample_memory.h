#pragma once
// Memory for large sample blocks. Released with std::free like any other
// block of the library.

#include <cstddef>

namespace img {

// malloc for small blocks. A block of several megabytes is aligned to 2 MiB
// and, where the system offers it, advised for transparent huge pages: a
// 12-megapixel float image otherwise takes some 12000 page faults to touch,
// which costs more than converting its samples.
void* allocateSamples(std::size_t bytes) noexcept;

} // namespace img
