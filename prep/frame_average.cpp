#include "prep/frame_average.h"

#include <stdexcept>

#include "image/image_buffer.h"

namespace prep {

using img::cfaPatternName;

std::string frameDifference(const FrameShape& frame, const FrameShape& first) {
    std::string text;
    const auto add = [&](const std::string& part) { text += (text.empty() ? "" : ", ") + part; };
    const auto size = [](const FrameShape& shape) {
        return std::to_string(shape.width) + " x " + std::to_string(shape.height) + " pixels";
    };
    if (frame.width != first.width || frame.height != first.height)
        add(size(frame) + " against " + size(first));
    if (frame.cfa != first.cfa) {
        // The names live in one static buffer: each is copied before the next.
        const std::string frameOrder = cfaPatternName(frame.cfa);
        const std::string firstOrder = cfaPatternName(first.cfa);
        add("Bayer order " + frameOrder + " against " + firstOrder);
    }
    if (frame.bits != first.bits)
        add("bit depth " + std::to_string(frame.bits) + " against " + std::to_string(first.bits));
    return text;
}

void throwFrameMismatch(std::size_t index, const std::string& path, const std::string& firstPath,
                        const std::string& difference) {
    throw std::runtime_error("Input frame " + std::to_string(index + 1) + " (" + path +
                             ") does not match the first frame (" + firstPath + "): " + difference +
                             ".");
}

} // namespace prep
