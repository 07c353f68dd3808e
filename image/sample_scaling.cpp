#include "image/sample_scaling.h"

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
