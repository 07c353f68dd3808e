// The chunked container parser on arbitrary bytes. What it accepts is copied
// and written back; a written container must read again and write the same
// bytes a second time, so a block form that loses or changes bytes shows.

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include "image/byte_source.h"
#include "image/kqraw_container.h"

using namespace img;

namespace {

// The container as a file, or false when the writer refuses it.
bool written(const KqRawContainer* container, std::vector<std::uint8_t>& bytes) {
    char* buffer = nullptr;
    std::size_t length = 0;
    std::FILE* sink = open_memstream(&buffer, &length);
    if (!sink)
        return false;
    const bool ok = kqrawContainerWriteStream(container, sink);
    std::fclose(sink);
    bytes.assign(buffer, buffer + length);
    std::free(buffer);
    return ok;
}

void checkRewrite(const KqRawContainer* container) {
    std::vector<std::uint8_t> first;
    if (!written(container, first))
        return;
    MemorySource source(first.data(), first.size(), "rewritten");
    int rc = 0;
    KqRawContainerPtr again(kqrawContainerParse(source, &rc));
    std::vector<std::uint8_t> second;
    if (!again || !written(again.get(), second) || second != first)
        std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    MemorySource source(data, size, "fuzz");
    int rc = 0;
    KqRawContainerPtr container(kqrawContainerParse(source, &rc));
    if (!container)
        return 0;
    KqRawContainerPtr copy(kqrawContainerCreate());
    if (copy)
        (void)kqrawContainerCopyBlocks(copy.get(), container.get());
    checkRewrite(container.get());
    return 0;
}
