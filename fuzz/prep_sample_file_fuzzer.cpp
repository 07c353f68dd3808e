// Feeds arbitrary text to the sample file parser. The parser may only throw
// std::runtime_error (a refused file); anything else, a crash or a sample
// outside the image is a bug. What it accepts is written out and read back:
// the second reading must write the same text as the first.

#include <cstdint>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <string_view>

#include "prep/sample_file.h"

using lsc::SampleSet;
using lsc::shadingSample;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    constexpr std::int32_t kWidth = 648, kHeight = 486;
    const prep::SampleFileScale scale{1023, 4};
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    SampleSet set;
    try {
        set = prep::parseSampleFile(text, kWidth, kHeight, scale);
    } catch (const std::runtime_error&) {
        return 0;
    }
    for (const shadingSample& sample : set.samples)
        if (sample.x >= static_cast<std::uint32_t>(kWidth) ||
            sample.y >= static_cast<std::uint32_t>(kHeight))
            std::abort();
    try {
        const std::string first =
            prep::formatSampleFile(set.targetLevels, set.samples, kWidth, kHeight, scale);
        const SampleSet again = prep::parseSampleFile(first, kWidth, kHeight, scale);
        if (again.samples.size() != set.samples.size() ||
            prep::formatSampleFile(again.targetLevels, again.samples, kWidth, kHeight, scale) !=
                first)
            std::abort();
    } catch (const std::runtime_error&) {
        std::abort(); // a file the tool wrote must read back
    }
    return 0;
}
