#pragma once
// The rules for averaging several frames of one flat field, shared by the
// streaming preparation and the whole-image load: which frames may be
// averaged, and how an average becomes a sample.

#include <cstdint>
#include <string>

namespace prep {

struct FrameShape {
    std::int32_t width = 0, height = 0;
    std::uint32_t cfa = 0;  // second cfa word
    std::uint16_t bits = 0; // bit depth of the samples
};

// What differs between a frame and the first ("800 x 600 pixels against
// 640 x 480 pixels", "Bayer order GRBG against RGGB", "bit depth 12 against
// 10", joined by ", "); empty when they agree.
std::string frameDifference(const FrameShape& frame, const FrameShape& first);

// Throws std::runtime_error "Input frame <n> (<path>) does not match the first
// frame (<first path>): <difference>." (n counted from 1).
[[noreturn]] void throwFrameMismatch(std::size_t index, const std::string& path,
                                     const std::string& firstPath, const std::string& difference);

// The average of `frames` samples that add up to `sum`, in whole sample
// units (halves rounded up): the preparation works on whole samples, and
// frames that are all the same average to that frame exactly.
inline std::uint16_t averageSample(std::uint32_t sum, std::uint32_t frames) {
    return static_cast<std::uint16_t>((sum + frames / 2) / frames);
}

} // namespace prep
