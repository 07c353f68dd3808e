#pragma once
// Carries the capture data of one image over to another: the metadata list
// and a fixed header as they are, a chunked container as a new container
// that holds copies of its blocks (but a new file header block and no pixel
// block, which the raw writer makes from the image).

#include "image/image_buffer.h"

namespace img {

enum class MetadataCopy { kCopied, kTargetHasFileType, kCopyFailed, kOutOfMemory };

// The target must not have a file type yet; it takes the source's.
[[nodiscard]] MetadataCopy copyRawMetadata(ImageBuffer* target, const ImageBuffer* source) noexcept;

} // namespace img
