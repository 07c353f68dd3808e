#include "prep/prep_image.h"

#include <cstdint>
#include <stdexcept>

#include "image/image_messages.h"
#include "prep/prep_messages.h"

#include <sys/mman.h>

namespace prep {

using img::BayerImage;
using img::ImageBuffer;
using img::imageCreate;
using img::kDataReal32;
using img::kPixelYuv420;
using img::kPixelYuv422;
namespace {

// Large images are first written right after allocation; asking for huge pages
// spares one page fault per 4 KiB, which costs more than the copy itself.
void preferHugePages(void* data, std::size_t bytes) {
#ifdef MADV_HUGEPAGE
    constexpr std::uintptr_t kHuge = 2u << 20;
    if (bytes < 2 * kHuge)
        return;
    const std::uintptr_t start =
        (reinterpret_cast<std::uintptr_t>(data) + kHuge - 1) & ~(kHuge - 1);
    const std::uintptr_t end = (reinterpret_cast<std::uintptr_t>(data) + bytes) & ~(kHuge - 1);
    if (end > start)
        madvise(reinterpret_cast<void*>(start), end - start, MADV_HUGEPAGE); // advice only
#else
    (void)data;
    (void)bytes;
#endif
}

} // namespace

BayerImage createFloatImage(std::int32_t width, std::int32_t height, std::uint16_t bitsPerSample,
                            std::uint16_t channels, std::uint32_t cfa0, std::uint32_t cfa1,
                            std::uint32_t pixelType, std::uint32_t bufferType) {
    int result = 0;
    BayerImage image;
    image.reset(imageCreate(width, height, bitsPerSample, channels, 1, cfa0, cfa1, pixelType,
                            bufferType, kDataReal32, &result));
    if (image.empty())
        throw std::runtime_error(img::msg::kCannotAllocateImage);
    preferHugePages(image.pixels(), sampleCount(image) * sizeof(float));
    return image;
}

void requireFloatImage(const BayerImage& image) {
    const ImageBuffer* buffer = image.buffer();
    if (!buffer || !buffer->data || buffer->dataType != kDataReal32 || buffer->width < 1 ||
        buffer->height < 1 || buffer->samplesPerPixel < 1 || buffer->numberOfImages != 1 ||
        buffer->pixelType == kPixelYuv422 || buffer->pixelType == kPixelYuv420)
        throw std::invalid_argument(msg::kNotFloatImage);
}

std::size_t sampleCount(const BayerImage& image) {
    // The block was allocated for this many samples, so the product fits size_t.
    return static_cast<std::size_t>(image.width()) * static_cast<std::size_t>(image.height()) *
           image.channels();
}

} // namespace prep
