#include "image/sample_memory.h"

#include <cstdlib>

#include <sys/mman.h>

namespace img {

namespace {
constexpr std::size_t kHugePage = std::size_t{2} << 20;
constexpr std::size_t kLargeBlock = 4 * kHugePage;
} // namespace

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

} // namespace img
