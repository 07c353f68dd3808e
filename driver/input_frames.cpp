#include "driver/input_frames.h"

#include <cstddef>
#include <stdexcept>

namespace {

std::string sizeText(const BayerImage& image) {
    return std::to_string(image.width()) + " x " + std::to_string(image.height()) + " pixels";
}

// What differs between a frame and the first, empty when they agree.
std::string mismatch(const BayerImage& frame, const BayerImage& first) {
    std::string text;
    const auto add = [&](const std::string& part) { text += (text.empty() ? "" : ", ") + part; };
    if (frame.width() != first.width() || frame.height() != first.height())
        add(sizeText(frame) + " against " + sizeText(first));
    if (frame.cfa() != first.cfa()) {
        // The names live in one static buffer: each is copied before the next.
        const std::string frameOrder = cfaPatternName(frame.cfa());
        const std::string firstOrder = cfaPatternName(first.cfa());
        add("Bayer order " + frameOrder + " against " + firstOrder);
    }
    if (frame.bitsPerSample() != first.bitsPerSample())
        add("bit depth " + std::to_string(frame.bitsPerSample()) + " against " +
            std::to_string(first.bitsPerSample()));
    return text;
}

} // namespace

void readAveragedFrames(BayerImage& image, const std::vector<std::string>& paths,
                        const std::function<void(BayerImage&, const std::string&)>& read) {
    read(image, paths.at(0));
    if (paths.size() == 1)
        return;
    const std::size_t count = static_cast<std::size_t>(image.width()) *
                              static_cast<std::size_t>(image.height()) * image.channels();
    float* average = image.pixels();
    std::vector<double> sum(average, average + count);
    for (std::size_t i = 1; i < paths.size(); ++i) {
        BayerImage frame;
        read(frame, paths[i]);
        const std::string difference = mismatch(frame, image);
        if (!difference.empty())
            throw std::runtime_error("Input frame " + std::to_string(i + 1) + " (" + paths[i] +
                                     ") does not match the first frame (" + paths[0] +
                                     "): " + difference + ".");
        const float* samples = frame.pixels();
        for (std::size_t k = 0; k < count; ++k)
            sum[k] += samples[k];
    }
    const double frames = static_cast<double>(paths.size());
    for (std::size_t k = 0; k < count; ++k)
        average[k] = static_cast<float>(sum[k] / frames);
}
