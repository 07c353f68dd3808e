#include "image/raw_metadata.h"

#include <cstdlib>
#include <memory>

#include "image/image_result.h"
#include "image/kqraw_container.h"

namespace img {

MetadataCopy copyRawMetadata(ImageBuffer* target, const ImageBuffer* source) noexcept {
    if (target->fileType != kFileNone)
        return MetadataCopy::kTargetHasFileType;
    if (source->fileType != kFileKqRaw2) {
        if (imageCopyMetadata(target, source) != kOk)
            return MetadataCopy::kCopyFailed;
        target->fileType = source->fileType;
        return MetadataCopy::kCopied;
    }
    const auto* blocks = static_cast<const KqRawContainer*>(source->rawHeader);
    if (blocks) {
        KqRawContainerPtr container(kqrawContainerCreate());
        KqRawBlock* header = kqrawBlockCreateHeader();
        if (!container || !header || !kqrawContainerSetHeader(container.get(), header)) {
            kqrawBlockRelease(header);
            return MetadataCopy::kOutOfMemory;
        }
        if (kqrawContainerCopyBlocks(container.get(), blocks) != kOk)
            return MetadataCopy::kOutOfMemory;
        std::free(target->rawHeader); // without a file type it can only be a plain block
        target->rawHeader = container.release();
    }
    target->fileType = kFileKqRaw2;
    return MetadataCopy::kCopied;
}

} // namespace img
