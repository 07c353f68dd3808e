// The chunked container parser on arbitrary bytes; what it accepts is copied
// and written back, so the block forms are exercised end to end.

#include <cstdint>
#include <cstdio>

#include "image/byte_source.h"
#include "image/kqraw_container.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    img::MemorySource source(data, size, "fuzz");
    int rc = 0;
    KqRawContainer* container = kqrawContainerParse(source, &rc);
    if (!container)
        return 0;
    KqRawContainer* copy = kqrawContainerCreate();
    if (copy) {
        kqrawContainerCopyBlocks(copy, container);
        kqrawContainerRelease(copy);
    }
    if (std::FILE* sink = std::fopen("/dev/null", "wb")) {
        kqrawContainerWriteStream(container, sink);
        std::fclose(sink);
    }
    kqrawContainerRelease(container);
    return 0;
}
