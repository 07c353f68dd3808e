#include "image/sample_scaling.h"

#include <cstdlib>
#include <cstring>

#include "image/image_result.h"
#include "image/sample_memory.h"

namespace img {

namespace {

template <typename Sample>
void normalise(const Sample* in, std::uint64_t count, unsigned bits, float* out) {
    const auto mask = static_cast<std::uint32_t>((std::uint64_t{1} << bits) - 1);
    if (mask == 0) {
        for (std::uint64_t i = 0; i < count; ++i)
            out[i] = 0.0f;
        return;
    }
    // A true division, not a multiplication by the reciprocal: the full-scale
    // sample must come out as exactly 1.0.
    const float scale = static_cast<float>(mask);
    for (std::uint64_t i = 0; i < count; ++i)
        out[i] = static_cast<float>(in[i] & mask) / scale;
}

// The conversion from the last sample to the first, in the block that holds
// the samples and is large enough for the floats. Float i takes bytes
// [4i, 4i + 4), which hold no sample below index i, so every sample is read
// before its bytes are written; a chunk is copied out first so that the
// loop works on separate memory.
template <typename Sample> void normaliseInPlace(void* block, std::uint64_t count, unsigned bits) {
    constexpr std::uint64_t kChunk = 4096;
    Sample chunk[kChunk];
    auto* bytes = static_cast<unsigned char*>(block);
    float* out = static_cast<float*>(block);
    std::uint64_t end = count;
    while (end > 0) {
        const std::uint64_t begin = end > kChunk ? end - kChunk : 0;
        const std::uint64_t n = end - begin;
        std::memcpy(chunk, bytes + begin * sizeof(Sample),
                    static_cast<std::size_t>(n) * sizeof(Sample));
        normalise(chunk, n, bits, out + begin);
        end = begin;
    }
}

} // namespace

bool normaliseSamples(const ImageBuffer* raw, float* out) noexcept {
    const std::uint64_t count = imageTotalSamples(raw, -1);
    if (raw->dataType == kDataUint16) {
        const unsigned bits = raw->bitsPerSample < 16 ? raw->bitsPerSample : 16;
        normalise(static_cast<const std::uint16_t*>(raw->data), count, bits, out);
        return true;
    }
    if (raw->dataType == kDataUint8) {
        const unsigned bits = raw->bitsPerSample < 8 ? raw->bitsPerSample : 8;
        normalise(static_cast<const std::uint8_t*>(raw->data), count, bits, out);
        return true;
    }
    return false;
}

int widenSamplesToFloat(ImageBuffer* raw) noexcept {
    if (!raw || !raw->data || (raw->dataType != kDataUint16 && raw->dataType != kDataUint8))
        return kUnsupported;
    const std::uint64_t count = imageTotalSamples(raw, -1);
    if (count > SIZE_MAX / sizeof(float))
        return kNoMemory;
    const std::uint64_t bytes = count * sizeof(float);
    if (!blockHolds(raw->data, bytes)) {
        // No room where the samples lie: convert into a new block.
        auto* floats = static_cast<float*>(allocateSamples(static_cast<std::size_t>(bytes)));
        if (!floats)
            return kNoMemory;
        if (!normaliseSamples(raw, floats)) {
            std::free(floats);
            return kUnsupported;
        }
        std::free(raw->data);
        raw->data = floats;
    } else if (raw->dataType == kDataUint16) {
        normaliseInPlace<std::uint16_t>(raw->data, count,
                                        raw->bitsPerSample < 16 ? raw->bitsPerSample : 16);
    } else {
        normaliseInPlace<std::uint8_t>(raw->data, count,
                                       raw->bitsPerSample < 8 ? raw->bitsPerSample : 8);
    }
    raw->dataType = kDataReal32;
    return kOk;
}

void quantiseSamples(const float* in, std::uint64_t count, unsigned bits,
                     std::uint16_t* out) noexcept {
    const auto largest = static_cast<std::uint16_t>((1u << (bits < 16 ? bits : 16)) - 1);
    const float scale = static_cast<float>(largest);
    for (std::uint64_t i = 0; i < count; ++i) {
        const float v = in[i] * scale + 0.5f;
        // Written so that NaN fails the first test and lands on 0.
        out[i] = !(v > 0.0f) ? 0 : v >= scale ? largest : static_cast<std::uint16_t>(v);
    }
}

} // namespace img
