#pragma once
// The most sample points one fit takes. The least-squares matrix holds a row
// of doubles per sample and unknown, so the count bounds the fit's memory
// (250,000 samples: about 200 MB for a channel) and time. Well above what an
// image gives at lsc.sampling_factor 1 and above a 160,000-point sample file.

#include <cstddef>

namespace lsc {

constexpr std::size_t kMaxSamples = 250000;

// Throws std::runtime_error lsc::msg::kTooManySamples when `count` is above
// kMaxSamples.
void checkSampleCount(std::size_t count);

} // namespace lsc
