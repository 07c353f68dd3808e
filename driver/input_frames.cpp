#include "driver/input_frames.h"

#include <cmath>
#include <cstddef>
#include <stdexcept>

#include "image/mosaic_rows.h"
#include "prep/frame_average.h"
#include "prep/image_checks.h"

namespace driver {

using img::BayerImage;

namespace {

prep::FrameShape shapeOf(const BayerImage& image) {
    return {image.width(), image.height(), image.cfa(), image.bitsPerSample()};
}

// A sample of the image in whole units of its depth: the reader made it as
// (s & mask) / mask, so this gives s back exactly.
std::uint32_t wholeSample(float value, float mask) {
    return static_cast<std::uint32_t>(std::lround(static_cast<double>(value) * mask));
}

} // namespace

void readAveragedFrames(BayerImage& image, const std::vector<std::string>& paths,
                        const std::function<void(BayerImage&, const std::string&)>& read) {
    read(image, paths.at(0));
    if (paths.size() == 1)
        return;
    const std::size_t count = static_cast<std::size_t>(image.width()) *
                              static_cast<std::size_t>(image.height()) * image.channels();
    const float mask = static_cast<float>(prep::fullScale(image.bitsPerSample()));
    float* average = image.pixels();
    std::vector<std::uint32_t> sum(count);
    for (std::size_t k = 0; k < count; ++k)
        sum[k] = wholeSample(average[k], mask);
    for (std::size_t i = 1; i < paths.size(); ++i) {
        BayerImage frame;
        read(frame, paths[i]);
        const std::string difference = prep::frameDifference(shapeOf(frame), shapeOf(image));
        if (!difference.empty())
            prep::throwFrameMismatch(i, paths[i], paths[0], difference);
        const float* samples = frame.pixels();
        for (std::size_t k = 0; k < count; ++k)
            sum[k] += wholeSample(samples[k], mask);
    }
    // As the reader converts a sample: a true division by the full scale.
    const auto frames = static_cast<std::uint32_t>(paths.size());
    for (std::size_t k = 0; k < count; ++k)
        average[k] = static_cast<float>(prep::averageSample(sum[k], frames)) / mask;
}

void feedRows(const BayerImage& image, img::MosaicRowSink& sink) {
    const float mask = static_cast<float>(prep::fullScale(image.bitsPerSample()));
    const auto width = static_cast<std::size_t>(image.width());
    std::vector<std::uint16_t> row(width);
    const float* samples = image.pixels();
    sink.start(image.width(), image.height());
    for (std::int32_t y = 0; y < image.height(); ++y) {
        for (std::size_t x = 0; x < width; ++x)
            row[x] = static_cast<std::uint16_t>(
                wholeSample(samples[static_cast<std::size_t>(y) * width + x], mask));
        sink.addRow(row.data());
    }
}

} // namespace driver
