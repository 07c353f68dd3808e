// The fixed-header readers (strict read and conversion into a container).
// A whole header is 298672 bytes, too large to mutate well, so a shorter
// input is spread over one: its first 112 bytes are the named fields, the
// rest lands at the end marker (+298668) and the pixels behind it.

#include <cstdint>
#include <cstring>
#include <vector>

#include "image/byte_source.h"
#include "image/image_buffer.h"
#include "image/kqraw_container.h"
#include "image/kqraw_fixed_header.h"

using namespace img;

namespace {

constexpr std::size_t kFieldBytes = 112;

void readBoth(const std::uint8_t* data, std::size_t size) {
    MemorySource strict(data, size, "fuzz");
    ImageBuffer* image = nullptr;
    (void)kqrawFixedRead(strict, &image); // only that it neither crashes nor leaks
    imageRelease(image);
    MemorySource converted(data, size, "fuzz");
    KqRawContainer* container = nullptr;
    (void)kqrawFixedToContainer(converted, &container);
    kqrawContainerRelease(container);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size >= kKqRawFixedHeaderSize) {
        readBoth(data, size);
        return 0;
    }
    const std::size_t head = size < kFieldBytes ? size : kFieldBytes;
    // One buffer for all runs: the bytes between the fields and the marker
    // stay zero, so each run only rewrites its own head and tail.
    static std::vector<std::uint8_t> file(kKqRawFixedHeaderSize);
    std::memset(file.data(), 0, kFieldBytes);
    std::memcpy(file.data(), data, head);
    file.resize(kKqRawFixedHeaderSize - 4 + (size - head));
    if (size > head)
        std::memcpy(file.data() + kKqRawFixedHeaderSize - 4, data + head, size - head);
    readBoth(file.data(), file.size());
    return 0;
}
