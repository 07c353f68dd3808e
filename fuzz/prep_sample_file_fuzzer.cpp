// Feeds arbitrary text to the sample file parser. The parser may only throw
// std::runtime_error (a refused file); anything else, a crash or a sample
// outside the image is a bug.

#include "prep/sample_file.h"

#include <cstdint>
#include <cstdlib>
#include <stdexcept>
#include <string_view>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    constexpr std::int32_t kWidth = 648, kHeight = 486;
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    try {
        const prep::SampleSet set = prep::parseSampleFile(text, kWidth, kHeight, {1023, 4});
        for (const shadingSample& sample : set.samples)
            if (sample.x >= static_cast<std::uint32_t>(kWidth) ||
                sample.y >= static_cast<std::uint32_t>(kHeight))
                std::abort();
    } catch (const std::runtime_error&) {
    }
    return 0;
}
