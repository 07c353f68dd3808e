#include "prep/bayer_planes.h"

#include <cstring>
#include <stdexcept>

#include "image/image_messages.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"

namespace prep {

using img::BayerImage;
using img::ImageBuffer;
using img::kBufferInterleaved;
using img::kBufferRawCfa;
using img::kPixelOther;
using img::kPixelRaw;
namespace {

// The common case, a single-channel 2 x 2 pattern, with two row pointers.
void splitTwoByTwo(const float* in, std::size_t mosaicWidth, float* out, std::size_t width,
                   std::size_t height) {
    for (std::size_t y = 0; y < height; ++y) {
        const float* top = in + 2 * y * mosaicWidth;
        const float* bottom = top + mosaicWidth;
        for (std::size_t x = 0; x < width; ++x, out += 4) {
            out[0] = top[2 * x];
            out[1] = top[2 * x + 1];
            out[2] = bottom[2 * x];
            out[3] = bottom[2 * x + 1];
        }
    }
}

void weaveTwoByTwo(const float* in, std::size_t width, std::size_t height, float* out,
                   std::size_t mosaicWidth) {
    for (std::size_t y = 0; y < height; ++y) {
        float* top = out + 2 * y * mosaicWidth;
        float* bottom = top + mosaicWidth;
        for (std::size_t x = 0; x < width; ++x, in += 4) {
            top[2 * x] = in[0];
            top[2 * x + 1] = in[1];
            bottom[2 * x] = in[2];
            bottom[2 * x + 1] = in[3];
        }
    }
}

} // namespace

int patternSize(std::uint32_t cfa0, std::uint32_t cfa1) {
    if (cfa0 == 0 && (cfa1 & 0xFFFFu) == 0 && (cfa1 & 0xF0000u) != 0)
        return 2;
    if ((cfa0 & 0xFu) != 0)
        return 4;
    return 1;
}

std::int32_t downsampledSize(std::int32_t size, int factor) {
    if (factor < 1)
        throw std::invalid_argument(msg::kBadSamplingFactor);
    return static_cast<std::int32_t>((std::int64_t{size} + factor - 1) / factor);
}

BayerImage split(const BayerImage& mosaic) {
    requireFloatImage(mosaic);
    const ImageBuffer* source = mosaic.buffer();
    const int p = patternSize(source->cfa[0], source->cfa[1]);
    const std::int32_t width = mosaic.width() / p;
    const std::int32_t height = mosaic.height() / p;
    const std::size_t mosaicChannels = mosaic.channels();
    const std::size_t channels = static_cast<std::size_t>(p * p) * mosaicChannels;
    if (width < 1 || height < 1 || channels > UINT16_MAX)
        throw std::invalid_argument(msg::kNotFloatImage);

    BayerImage planes = createFloatImage(width, height, mosaic.bitsPerSample(),
                                         static_cast<std::uint16_t>(channels), 0, 0, kPixelOther,
                                         kBufferInterleaved);
    float* out = planes.pixels();
    if (mosaicChannels > 1)
        std::memset(out, 0, sampleCount(planes) * sizeof(float));
    const float* in = mosaic.pixels();
    const std::size_t mosaicWidth = static_cast<std::size_t>(mosaic.width());
    if (p == 2 && mosaicChannels == 1) {
        splitTwoByTwo(in, mosaicWidth, out, static_cast<std::size_t>(width),
                      static_cast<std::size_t>(height));
        return planes;
    }
    for (std::size_t y = 0; y < static_cast<std::size_t>(height); ++y) {
        for (std::size_t x = 0; x < static_cast<std::size_t>(width); ++x) {
            float* pixel = out + (y * width + x) * channels;
            for (std::size_t r = 0; r < static_cast<std::size_t>(p); ++r) {
                const float* row = in + ((p * y + r) * mosaicWidth + p * x) * mosaicChannels;
                for (std::size_t c = 0; c < static_cast<std::size_t>(p); ++c)
                    pixel[r * p + c] = row[c * mosaicChannels];
            }
        }
    }
    return planes;
}

void downsample(const BayerImage& planes, int factor, BayerImage& target) {
    requireFloatImage(planes);
    const std::int32_t width = downsampledSize(planes.width(), factor);
    const std::int32_t height = downsampledSize(planes.height(), factor);
    const std::size_t channels = planes.channels();
    target = createFloatImage(width, height, planes.bitsPerSample(), planes.channels(), 0, 0,
                              kPixelOther, kBufferInterleaved);
    const float* in = planes.pixels();
    float* out = target.pixels();
    const std::size_t sourceWidth = static_cast<std::size_t>(planes.width());
    const std::size_t pixelBytes = channels * sizeof(float);
    for (std::size_t y = 0; y < static_cast<std::size_t>(height); ++y) {
        const float* row = in + factor * y * sourceWidth * channels;
        for (std::size_t x = 0; x < static_cast<std::size_t>(width); ++x, out += channels)
            std::memcpy(out, row + factor * x * channels, pixelBytes);
    }
}

BayerImage weave(const BayerImage& planes, int p, std::uint32_t cfa0, std::uint32_t cfa1) {
    requireFloatImage(planes);
    // p above 255 cannot match a 16-bit channel count (and p * p could overflow).
    if (p < 1 || p > 255 || planes.channels() != p * p)
        throw std::invalid_argument(msg::kInvalidWeaveFormat);
    if (patternSize(cfa0, cfa1) != p)
        throw std::invalid_argument(msg::kInvalidWeavePattern);
    const std::int64_t width = std::int64_t{planes.width()} * p;
    const std::int64_t height = std::int64_t{planes.height()} * p;
    if (width > INT32_MAX || height > INT32_MAX)
        throw std::runtime_error(img::msg::kCannotAllocateImage);

    BayerImage mosaic =
        createFloatImage(static_cast<std::int32_t>(width), static_cast<std::int32_t>(height),
                         planes.bitsPerSample(), 1, cfa0, cfa1, kPixelRaw, kBufferRawCfa);
    const float* in = planes.pixels();
    float* out = mosaic.pixels();
    const std::size_t planeWidth = static_cast<std::size_t>(planes.width());
    const std::size_t channels = planes.channels();
    const std::size_t mosaicWidth = static_cast<std::size_t>(width);
    if (p == 2) {
        weaveTwoByTwo(in, planeWidth, static_cast<std::size_t>(planes.height()), out, mosaicWidth);
        return mosaic;
    }
    for (std::size_t y = 0; y < static_cast<std::size_t>(planes.height()); ++y) {
        for (std::size_t x = 0; x < planeWidth; ++x) {
            const float* pixel = in + (y * planeWidth + x) * channels;
            for (std::size_t r = 0; r < static_cast<std::size_t>(p); ++r) {
                float* row = out + (p * y + r) * mosaicWidth + p * x;
                for (std::size_t c = 0; c < static_cast<std::size_t>(p); ++c)
                    row[c] = pixel[r * p + c];
            }
        }
    }
    return mosaic;
}

} // namespace prep
