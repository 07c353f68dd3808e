#pragma once
// The chunked raw container (file type KQRAW2) in memory.

struct KqRawContainer;

// Releases every block, then the container. Null is accepted.
void kqrawContainerRelease(KqRawContainer* container) noexcept;
