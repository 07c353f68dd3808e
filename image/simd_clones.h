#pragma once

namespace img {

// A hot kernel marked LSC_VECTOR_CLONES is built a second time for AVX2 and
// picked at load time where the processor has it. The wider vectors do the
// same operations on each element (there is no contraction into fused
// multiply-adds), so results are the same bits on every build. Sanitizer
// builds keep one version: their run-time set-up and load-time resolvers do
// not mix.

#if defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(memory_sanitizer)
#define LSC_SANITIZED_BUILD 1
#endif
#endif
#if defined(__SANITIZE_ADDRESS__)
#define LSC_SANITIZED_BUILD 1
#endif

#if defined(__x86_64__) && defined(__GNUC__) && !defined(LSC_SANITIZED_BUILD)
#define LSC_VECTOR_CLONES __attribute__((target_clones("avx2", "default")))
#else
#define LSC_VECTOR_CLONES
#endif

} // namespace img
