#include "prep/capture_stream.h"

#include <algorithm>
#include <memory>
#include <stdexcept>
#include <vector>

#include "image/image_messages.h"
#include "image/image_result.h"
#include "image/raw_reader.h"
#include "image/raw_samples.h"
#include "prep/bayer_planes.h"
#include "prep/frame_average.h"
#include "prep/image_checks.h"
#include "prep/mosaic_stream.h"

namespace prep {

using img::throwCannotReadCapture;

using img::BayerImage;
using img::ImageBuffer;
using img::ImagePtr;
namespace {

// A read that stops before the samples the header declares: the file is
// shorter than it says (or the device failed, which the detail then names).
[[noreturn]] void cannotRead(const std::string& path, int result = img::kSizeMismatch) {
    throwCannotReadCapture(path, result);
}

// Rows are read a band at a time: large enough for few reads, small enough
// to stay in the cache on their way to the preparation.
constexpr std::size_t kBandBytes = 256 * 1024;

// Hands the width x height samples at `samplesAt` to addRows(rows, count),
// a band of rows at a time.
template <typename AddRows>
void readBands(const std::string& path, img::ByteSource& source, std::uint64_t samplesAt,
               std::int32_t width, std::int32_t height, std::vector<std::uint16_t>& band,
               const AddRows& addRows) {
    const std::size_t rowSamples = static_cast<std::size_t>(width);
    const std::size_t bandRows = std::max<std::size_t>(1, kBandBytes / (2 * rowSamples));
    band.resize(bandRows * rowSamples);
    if (!source.seek(samplesAt))
        cannotRead(path);
    for (std::int32_t y = 0; y < height;) {
        const std::size_t rows =
            std::min<std::size_t>(bandRows, static_cast<std::size_t>(height - y));
        if (!img::readSamplesLE(source, band.data(), rows * rowSamples))
            cannotRead(path);
        addRows(band.data(), rows);
        y += static_cast<std::int32_t>(rows);
    }
}

} // namespace

CaptureLoad loadPrepared(const std::string& path, const MosaicPreparation& settings,
                         BayerImage& input, BayerImage& prepared, SampleStatistics* inputStatistics,
                         img::MosaicRowSink* rows) {
    input.reset();
    int rc = img::kOk;
    std::unique_ptr<img::ByteSource> source(img::openSource(path.c_str(), &rc));
    if (!source)
        cannotRead(path);
    ImageBuffer* header = nullptr;
    std::uint64_t samplesAt = 0;
    rc = img::rawReadHeaderOnly(*source, &header, &samplesAt);
    ImagePtr raw(header);
    if (rc == img::kWrongFormat) {
        // Other formats, and files of no known type (asked on the console).
        if (!source->seek(0))
            cannotRead(path);
        ImagePtr whole(img::rawReadSource(*source, img::askOnConsole, nullptr, &rc));
        if (!whole)
            cannotRead(path, rc);
        input.adoptRaw(std::move(whole), rc);
        return CaptureLoad::kWholeImage;
    }
    if (rc != img::kOk || !raw)
        cannotRead(path, rc);

    const std::int32_t width = raw->width, height = raw->height;
    if (patternSize(raw->cfa[0], raw->cfa[1]) != 2 || raw->samplesPerPixel != 1 ||
        !MosaicStream::accepts(width, height, settings)) {
        rc = img::readDeferredSamples(*source, samplesAt, raw.get());
        if (rc != img::kOk)
            cannotRead(path, rc);
        input.adoptRaw(std::move(raw));
        return CaptureLoad::kWholeImage;
    }

    MosaicStream stream(width, height, settings);
    if (rows)
        rows->start(width, height);
    const std::size_t rowSamples = static_cast<std::size_t>(width);
    std::vector<std::uint16_t> band;
    if (inputStatistics) {
        // The statistics convert every sample at the depth that the largest
        // sample sets: one pass to find it before the one that measures.
        std::uint16_t largest = 0;
        readBands(path, *source, samplesAt, width, height, band,
                  [&](const std::uint16_t* samples, std::size_t count) {
                      largest = std::max(largest, img::largestSample(samples, count * rowSamples));
                  });
        stream.measureSamples(fullScale(img::bitsForLargestSample(largest)));
    }
    readBands(path, *source, samplesAt, width, height, band,
              [&](const std::uint16_t* samples, std::size_t count) {
                  for (std::size_t r = 0; r < count; ++r) {
                      stream.addRow(samples + r * rowSamples);
                      if (rows)
                          rows->addRow(samples + r * rowSamples);
                  }
              });
    // The depth comes from the largest sample, as when the image is read whole.
    const std::uint16_t bits = img::bitsForLargestSample(stream.largest());
    img::applySampleDepth(raw.get(), bits);
    prepared = stream.finish(bits, raw->cfa[0], raw->cfa[1]);
    input.adoptHeader(*raw);
    if (inputStatistics)
        *inputStatistics = stream.statistics();
    return CaptureLoad::kPrepared;
}

namespace {

// One frame opened for the averaged stream: its source, header and band.
struct StreamedFrame {
    std::unique_ptr<img::ByteSource> source;
    ImagePtr header;
    std::uint64_t samplesAt = 0;
    std::vector<std::uint16_t> band;
    std::uint16_t largest = 0;
};

} // namespace

CaptureLoad loadAveragedPrepared(const std::vector<std::string>& paths,
                                 const MosaicPreparation& settings, BayerImage& input,
                                 BayerImage& prepared, img::MosaicRowSink* rows) {
    input.reset();
    std::vector<StreamedFrame> frames(paths.size());
    for (std::size_t i = 0; i < paths.size(); ++i) {
        StreamedFrame& frame = frames[i];
        int rc = img::kOk;
        frame.source.reset(img::openSource(paths[i].c_str(), &rc));
        if (!frame.source)
            cannotRead(paths[i], rc);
        ImageBuffer* header = nullptr;
        rc = img::rawReadHeaderOnly(*frame.source, &header, &frame.samplesAt);
        frame.header.reset(header);
        if (rc == img::kWrongFormat)
            return CaptureLoad::kNotRead;
        if (rc != img::kOk || !frame.header)
            cannotRead(paths[i], rc);
        const ImageBuffer& h = *frame.header;
        if (patternSize(h.cfa[0], h.cfa[1]) != 2 || h.samplesPerPixel != 1 ||
            !MosaicStream::accepts(h.width, h.height, settings))
            return CaptureLoad::kNotRead;
        const FrameShape first = {frames[0].header->width, frames[0].header->height,
                                  frames[0].header->cfa[1], 0};
        const std::string difference = frameDifference({h.width, h.height, h.cfa[1], 0}, first);
        if (!difference.empty())
            throwFrameMismatch(i, paths[i], paths[0], difference);
        if (!frame.source->seek(frame.samplesAt))
            cannotRead(paths[i]);
    }

    const ImageBuffer& header = *frames[0].header;
    const std::int32_t width = header.width, height = header.height;
    const std::size_t rowSamples = static_cast<std::size_t>(width);
    const std::size_t bandRows = std::max<std::size_t>(1, kBandBytes / (2 * rowSamples));
    MosaicStream stream(width, height, settings);
    if (rows)
        rows->start(width, height);
    std::vector<std::uint32_t> sum(bandRows * rowSamples);
    std::vector<std::uint16_t> average(bandRows * rowSamples);
    const auto count = static_cast<std::uint32_t>(frames.size());
    for (std::int32_t y = 0; y < height;) {
        const std::size_t bandHeight =
            std::min<std::size_t>(bandRows, static_cast<std::size_t>(height - y));
        const std::size_t samples = bandHeight * rowSamples;
        std::fill(sum.begin(), sum.begin() + static_cast<std::ptrdiff_t>(samples), 0u);
        for (std::size_t i = 0; i < frames.size(); ++i) {
            StreamedFrame& frame = frames[i];
            frame.band.resize(samples);
            if (!img::readSamplesLE(*frame.source, frame.band.data(), samples))
                cannotRead(paths[i]);
            frame.largest = std::max(frame.largest, img::largestSample(frame.band.data(), samples));
            for (std::size_t k = 0; k < samples; ++k)
                sum[k] += frame.band[k];
        }
        for (std::size_t k = 0; k < samples; ++k)
            average[k] = averageSample(sum[k], count);
        for (std::size_t r = 0; r < bandHeight; ++r) {
            stream.addRow(average.data() + r * rowSamples);
            if (rows)
                rows->addRow(average.data() + r * rowSamples);
        }
        y += static_cast<std::int32_t>(bandHeight);
    }
    // Each frame's depth comes from its largest sample, as when it is read
    // whole; frames of two depths were converted at two scales.
    const std::uint16_t bits = img::bitsForLargestSample(frames[0].largest);
    for (std::size_t i = 1; i < frames.size(); ++i) {
        const std::uint16_t frameBits = img::bitsForLargestSample(frames[i].largest);
        if (frameBits != bits)
            throwFrameMismatch(i, paths[i], paths[0],
                               frameDifference({width, height, header.cfa[1], frameBits},
                                               {width, height, header.cfa[1], bits}));
    }
    img::applySampleDepth(frames[0].header.get(), bits);
    prepared = stream.finish(bits, header.cfa[0], header.cfa[1]);
    input.adoptHeader(header);
    return CaptureLoad::kPrepared;
}

} // namespace prep
