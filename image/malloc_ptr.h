#pragma once
// Ownership of blocks that the image library allocates with malloc (raw
// headers, sample blocks), so every early return frees them.

#include <cstdlib>
#include <memory>

namespace img {

struct FreeDeleter {
    void operator()(void* p) const noexcept { std::free(p); }
};
template <typename T> using MallocPtr = std::unique_ptr<T, FreeDeleter>;

} // namespace img
