#include "image/kqraw_container.h"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "image/byte_order.h"
#include "image/image_messages.h"
#include "image/image_result.h"
#include "image/image_warning.h"
#include "image/kqraw_fixed_header.h"
#include "image/output_file.h"

namespace img {

namespace {

bool isHeaderBlock(const KqRawBlock* block) {
    return kqrawBlockHasTag(block, img::kqtag::kFileHeader) && block->form == KqRawForm::kOpaque &&
           block->size == kKqRawFileHeaderPayloadSize;
}

bool isPixelBlock(const KqRawBlock* block) {
    return kqrawBlockHasTag(block, img::kqtag::kPixels) && block->form == KqRawForm::kPixels;
}

// Puts `block` at *index (releasing what was there) or appends it.
bool placeBlock(KqRawContainer* container, int* index, KqRawBlock* block) {
    if (*index >= 0) {
        kqrawBlockRelease(container->blocks[*index]);
        container->blocks[*index] = block;
        return true;
    }
    if (container->count >= kKqRawMaxBlocks)
        return false;
    *index = container->count;
    container->blocks[container->count++] = block;
    return true;
}

} // namespace

KqRawContainer* kqrawContainerCreate() noexcept {
    auto* container = static_cast<KqRawContainer*>(std::calloc(1, sizeof(KqRawContainer)));
    if (container) {
        container->headerIndex = -1;
        container->pixelIndex = -1;
    }
    return container;
}

void kqrawContainerRelease(KqRawContainer* container) noexcept {
    if (!container)
        return;
    for (int i = 0; i < container->count; ++i)
        kqrawBlockRelease(container->blocks[i]);
    std::free(container);
}

bool kqrawContainerSetHeader(KqRawContainer* container, KqRawBlock* block) noexcept {
    return container && isHeaderBlock(block) &&
           placeBlock(container, &container->headerIndex, block);
}

bool kqrawContainerSetPixels(KqRawContainer* container, KqRawBlock* block) noexcept {
    return container && isPixelBlock(block) && placeBlock(container, &container->pixelIndex, block);
}

bool kqrawContainerAdd(KqRawContainer* container, KqRawBlock* block) noexcept {
    if (!container || !block || container->count >= kKqRawMaxBlocks ||
        kqrawBlockHasTag(block, img::kqtag::kFileHeader) ||
        kqrawBlockHasTag(block, img::kqtag::kPixels))
        return false;
    container->blocks[container->count++] = block;
    return true;
}

int kqrawContainerFind(const KqRawContainer* container, const char* tag) noexcept {
    if (container)
        for (int i = 0; i < container->count; ++i)
            if (kqrawBlockHasTag(container->blocks[i], tag))
                return i;
    return -1;
}

int kqrawContainerFindLast(const KqRawContainer* container, const char* tag) noexcept {
    if (container)
        for (int i = container->count - 1; i >= 0; --i)
            if (kqrawBlockHasTag(container->blocks[i], tag))
                return i;
    return -1;
}

int kqrawContainerCopyBlocks(KqRawContainer* target, const KqRawContainer* source) noexcept {
    if (!target || !source)
        return img::kBadArgument;
    for (int i = 0; i < source->count; ++i) {
        if (i == source->headerIndex || i == source->pixelIndex)
            continue;
        KqRawBlock* copy = kqrawBlockClone(source->blocks[i]);
        if (!copy)
            return img::kNoMemory;
        if (!kqrawContainerAdd(target, copy)) {
            kqrawBlockRelease(copy);
            return img::kUnsupported;
        }
    }
    return img::kOk;
}

namespace {

// The first block must be a 36-byte file header block.
bool startsWithHeaderBlock(img::ByteSource& source) {
    std::uint8_t head[kKqRawBlockHeaderSize];
    if (!source.seek(0) || !source.read(head, sizeof head))
        return false;
    KqRawBlock probe{};
    std::memcpy(probe.tag, head, kKqRawTagSize);
    return kqrawBlockHasTag(&probe, img::kqtag::kFileHeader) &&
           img::loadLE32(head + 32) == kKqRawFileHeaderPayloadSize;
}

// Files that start with format version 1 and a header revision up to 4.
bool looksLikeFixedHeader(img::ByteSource& source) {
    std::uint8_t words[8];
    return source.seek(0) && source.read(words, sizeof words) && img::loadLE32(words) == 1 &&
           img::loadLE32(words + 4) <= 4;
}

// Files the tool reads are a handful of blocks; past 100 the list is full.
// One place stays free for the pixel block until it has come, so that
// surplus blocks never push the image out.
bool roomForOrdinaryBlock(const KqRawContainer* container) {
    return container->count < kKqRawMaxBlocks - (container->pixelIndex < 0 ? 1 : 0);
}

int keepBlock(KqRawContainer* container, KqRawBlock* block, const char* sourceName) {
    if (kqrawBlockHasTag(block, img::kqtag::kFileHeader)) {
        if (!kqrawContainerSetHeader(container, block))
            return img::kRawBadContainer; // a header block of the wrong size
        return img::kOk;
    }
    if (kqrawBlockHasTag(block, img::kqtag::kPixels))
        return kqrawContainerSetPixels(container, block) ? img::kOk : img::kRawBadContainer;
    if (!roomForOrdinaryBlock(container) || !kqrawContainerAdd(container, block)) {
        img::warn(img::msg::kTooManyBlocks, sourceName, img::printableTag(block->tag).c_str());
        kqrawBlockRelease(block);
    }
    return img::kOk;
}

} // namespace

KqRawContainer* kqrawContainerParse(img::ByteSource& source, int* result,
                                    std::uint64_t* samplesAt) noexcept {
    int ignored;
    if (!result)
        result = &ignored;
    if (looksLikeFixedHeader(source)) {
        if (samplesAt) {
            *result = img::kWrongFormat;
            return nullptr;
        }
        KqRawContainer* converted = nullptr;
        *result = kqrawFixedToContainer(source, &converted);
        return converted;
    }
    if (!startsWithHeaderBlock(source)) {
        *result = img::kWrongFormat;
        return nullptr;
    }
    KqRawContainerPtr container(kqrawContainerCreate());
    if (!container || !source.seek(0)) {
        *result = img::kNoMemory;
        return nullptr;
    }
    // A few bytes too few for another block header end the list, as the end of the file does.
    while (source.remaining() >= kKqRawBlockHeaderSize) {
        KqRawBlock* block = nullptr;
        std::uint64_t blockSamplesAt = 0;
        int rc = kqrawBlockRead(source, &block, samplesAt ? &blockSamplesAt : nullptr);
        if (rc == img::kOk) {
            const bool pixels = block->form == KqRawForm::kPixels;
            rc = keepBlock(container.get(), block, source.name());
            if (rc != img::kOk)
                kqrawBlockRelease(block);
            else if (pixels && samplesAt)
                *samplesAt = blockSamplesAt;
        }
        if (rc != img::kOk) {
            // Blocks cut short or malformed: the file is a container, but a broken one.
            *result =
                rc == img::kSizeMismatch || rc == img::kWrongFormat ? img::kRawBadContainer : rc;
            return nullptr;
        }
    }
    *result = img::kOk;
    return container.release();
}

KqRawContainer* kqrawContainerRead(const char* path) noexcept {
    int rc = img::kOk;
    std::unique_ptr<img::ByteSource> source(img::openSource(path, &rc));
    if (!source)
        return nullptr;
    return kqrawContainerParse(*source, &rc);
}

bool kqrawContainerWriteStream(const KqRawContainer* container, std::FILE* file,
                               const KqRawBlock* header, const KqRawBlock* pixels) noexcept {
    if (!container || !file)
        return false;
    if (!header && container->headerIndex >= 0)
        header = container->blocks[container->headerIndex];
    if (!pixels && container->pixelIndex >= 0)
        pixels = container->blocks[container->pixelIndex];
    if (!isHeaderBlock(header) || !isPixelBlock(pixels))
        return false;
    if (!kqrawBlockWrite(header, file))
        return false;
    for (int i = 0; i < container->count; ++i) {
        if (i == container->headerIndex)
            continue;
        const KqRawBlock* block = i == container->pixelIndex ? pixels : container->blocks[i];
        if (!kqrawBlockWrite(block, file))
            return false;
    }
    return container->pixelIndex >= 0 || kqrawBlockWrite(pixels, file);
}

bool kqrawContainerWrite(const KqRawContainer* container, const char* path) noexcept {
    OutputFile output;
    if (!path || !output.open(path))
        return false;
    if (!kqrawContainerWriteStream(container, output.stream())) {
        output.abort();
        return false;
    }
    return output.commit();
}

} // namespace img
