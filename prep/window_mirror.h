#pragma once
// Window coordinates beyond an image edge, mirrored back into it with the edge
// sample repeated (-1 reads 0, n reads n - 1). Shared by the filters that read
// a window around every target position.

#include <cstddef>
#include <cstdint>

namespace prep {

// Mirrors `i` into 0..n-1 (n at least 1). A single reflection covers every
// window the image is wide enough for; on an image narrower than the window
// the reflection repeats instead of reading outside the image.
inline std::size_t mirrorIndex(std::int64_t i, std::int64_t n) {
    if (i >= 0 && i < n)
        return static_cast<std::size_t>(i);
    const std::int64_t period = 2 * n;
    i %= period;
    if (i < 0)
        i += period;
    return static_cast<std::size_t>(i < n ? i : period - 1 - i);
}

} // namespace prep
