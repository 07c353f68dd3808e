#pragma once
// Ownership of C-library handles, so every early return closes them.

#include <cstdio>
#include <memory>

namespace img {

struct FileClose {
    void operator()(std::FILE* file) const noexcept { std::fclose(file); }
};
// A stdio stream opened for reading; a stream written to is closed by hand,
// since its close reports whether the data reached the file.
using FilePtr = std::unique_ptr<std::FILE, FileClose>;

} // namespace img
