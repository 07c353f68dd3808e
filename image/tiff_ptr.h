#pragma once
// Ownership of a libtiff handle, so every early return closes it.

#include <memory>

#include <tiffio.h>

namespace img {

struct TiffClose {
    void operator()(TIFF* tiff) const noexcept { TIFFClose(tiff); }
};
using TiffPtr = std::unique_ptr<TIFF, TiffClose>;

} // namespace img
