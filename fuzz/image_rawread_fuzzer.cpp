// The generic raw reader. An input whose first byte is odd also answers the
// console questions: bytes 1-28 give the layout, the rest is the file. Any
// other input also goes through the header-only read and the later read of
// the samples it left.

#include <cstdint>
#include <cstring>

#include "image/byte_source.h"
#include "image/image_buffer.h"
#include "image/raw_prompt.h"
#include "image/raw_reader.h"
#include "image/raw_samples.h"

using namespace img;

namespace {

constexpr std::size_t kAnswerBytes = 1 + 28;

int answer(void* context, RawLayout* layout) {
    const auto* p = static_cast<const std::uint8_t*>(context);
    auto word = [p](std::size_t at) {
        std::uint32_t v;
        std::memcpy(&v, p + at, 4);
        return v;
    };
    layout->width = word(1);
    layout->height = word(5);
    layout->bitDepth = word(9) % 20;
    layout->cfa = word(13);
    layout->littleEndian = (word(17) & 1) != 0;
    layout->images = word(21);
    layout->headerSize = word(25);
    return 0;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    int rc = 0;
    if (size >= kAnswerBytes && (data[0] & 1) != 0) {
        MemorySource source(data + kAnswerBytes, size - kAnswerBytes, "fuzz");
        imageRelease(rawReadSource(source, answer, const_cast<std::uint8_t*>(data), &rc));
        return 0;
    }
    imageRelease(rawReadMemory(data, size, "fuzz", &rc));
    MemorySource source(data, size, "fuzz");
    ImageBuffer* header = nullptr;
    std::uint64_t samplesAt = 0;
    if (rawReadHeaderOnly(source, &header, &samplesAt) == 0 && header)
        (void)readDeferredSamples(source, samplesAt, header);
    imageRelease(header);
    return 0;
}
