#include "lsc/sample_limit.h"

#include <stdexcept>

#include "lsc/lsc_messages.h"

namespace lsc {

void checkSampleCount(std::size_t count) {
    if (count > kMaxSamples)
        throw std::runtime_error(msg::kTooManySamples);
}

} // namespace lsc
