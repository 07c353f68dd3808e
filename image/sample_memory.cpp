#include "image/sample_memory.h"

#include <cstdlib>
#include <initializer_list>

#include "image/image_result.h"

#if defined(__GLIBC__) || defined(__BIONIC__)
#include <malloc.h>
#endif

#include <sys/mman.h>

namespace img {

namespace {
constexpr std::size_t kHugePage = std::size_t{2} << 20;
constexpr std::size_t kLargeBlock = 4 * kHugePage;
} // namespace

int checkSampleMemory(std::uint64_t width, std::uint64_t height, std::uint64_t samplesPerPixel,
                      std::uint64_t images) noexcept {
    // Divided rather than multiplied: no product of the factors can wrap.
    std::uint64_t room = kMaxImageSamples;
    for (std::uint64_t factor : {width, height, samplesPerPixel, images}) {
        if (factor == 0)
            return kOk;
        if (factor > room)
            return kImageTooLarge;
        room /= factor;
    }
    return kOk;
}

void* allocateSamples(std::size_t bytes) noexcept {
#if defined(MADV_HUGEPAGE)
    if (bytes >= kLargeBlock) {
        void* block = nullptr;
        if (posix_memalign(&block, kHugePage, bytes) != 0)
            return nullptr;
        madvise(block, bytes & ~(kHugePage - 1), MADV_HUGEPAGE); // advice only: failure is fine
        return block;
    }
#endif
    return std::malloc(bytes > 0 ? bytes : 1);
}

void* allocateWidenableSamples(std::uint64_t count, std::size_t sampleBytes) noexcept {
    const std::uint64_t bytes = count * sizeof(float);
    if (sampleBytes > sizeof(float) || count > SIZE_MAX / sizeof(float))
        return nullptr;
    return allocateSamples(static_cast<std::size_t>(bytes));
}

bool blockHolds(const void* block, std::uint64_t bytes) noexcept {
#if defined(__GLIBC__) || defined(__BIONIC__)
    return block && malloc_usable_size(const_cast<void*>(block)) >= bytes;
#else
    (void)block;
    (void)bytes;
    return false;
#endif
}

} // namespace img
