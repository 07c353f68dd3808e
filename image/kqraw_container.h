#pragma once
// The chunked raw container (file type KQRAW2) in memory: up to 100 owned
// blocks in list order, with the positions of the file header block and the
// pixel block. Procedural and noexcept.

#include <cstdint>
#include <memory>

#include "image/byte_source.h"
#include "image/kqraw_block.h"

namespace img {

constexpr int kKqRawMaxBlocks = 100;

struct KqRawContainer {
    int headerIndex; // -1 = none
    int pixelIndex;  // -1 = none
    int count;
    KqRawBlock* blocks[kKqRawMaxBlocks];
};

[[nodiscard]] KqRawContainer* kqrawContainerCreate() noexcept;
// Releases every block, then the container. Null is accepted.
void kqrawContainerRelease(KqRawContainer* container) noexcept;
struct KqRawContainerRelease {
    void operator()(KqRawContainer* c) const noexcept { kqrawContainerRelease(c); }
};
using KqRawContainerPtr = std::unique_ptr<KqRawContainer, KqRawContainerRelease>;

// The three take ownership of `block` when they return true. Set header and
// set pixels replace (and release) a block already held in that role, else
// append; they refuse any other tag, and a header block whose payload is not
// 36 bytes. Add refuses the header and pixel tags and a full container.
[[nodiscard]] bool kqrawContainerSetHeader(KqRawContainer* container, KqRawBlock* block) noexcept;
[[nodiscard]] bool kqrawContainerSetPixels(KqRawContainer* container, KqRawBlock* block) noexcept;
[[nodiscard]] bool kqrawContainerAdd(KqRawContainer* container, KqRawBlock* block) noexcept;

// Index of the first (or last) block with the tag, -1 when there is none.
int kqrawContainerFind(const KqRawContainer* container, const char* tag) noexcept;
int kqrawContainerFindLast(const KqRawContainer* container, const char* tag) noexcept;

// Appends a copy of every block of `source` except its header and pixel
// blocks, in order. 0, -3 (no memory) or -6 (no room left).
[[nodiscard]] int kqrawContainerCopyBlocks(KqRawContainer* target,
                                           const KqRawContainer* source) noexcept;

// Parses a container, or converts a fixed-header KQRAW file into one, from
// the source's start. Result: 0; -4 not a container; -21 a container (or
// fixed-header file) whose blocks are cut short or malformed; -3; -2. With
// `samplesAt`, only a container is accepted (-4 for a fixed-header file) and
// its pixel block's samples are left unread, their position stored there.
[[nodiscard]] KqRawContainer* kqrawContainerParse(img::ByteSource& source, int* result,
                                                  std::uint64_t* samplesAt = nullptr) noexcept;
// Reads a container file; null on any failure.
[[nodiscard]] KqRawContainer* kqrawContainerRead(const char* path) noexcept;

// Writes the header block, then every other block in list order. `pixels`,
// when given, is written in place of the container's pixel block (or after
// the last block when the container has none), and `header` in place of its
// header block. False without a header or a pixel block, or when a write fails.
[[nodiscard]] bool kqrawContainerWriteStream(const KqRawContainer* container, std::FILE* file,
                                             const KqRawBlock* header = nullptr,
                                             const KqRawBlock* pixels = nullptr) noexcept;
// Writes a container file through a temporary beside the target.
[[nodiscard]] bool kqrawContainerWrite(const KqRawContainer* container, const char* path) noexcept;

} // namespace img
