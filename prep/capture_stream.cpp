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
#include "prep/image_checks.h"
#include "prep/mosaic_stream.h"

namespace prep {
namespace {

[[noreturn]] void cannotRead(int result = img::kIoError) {
    throw std::runtime_error(result == img::kImageTooLarge ? img::msg::kImageTooLarge
                                                           : img::msg::kCannotReadKqraw);
}

// Rows are read a band at a time: large enough for few reads, small enough
// to stay in the cache on their way to the preparation.
constexpr std::size_t kBandBytes = 256 * 1024;

// Hands the width x height samples at `samplesAt` to addRows(rows, count),
// a band of rows at a time.
template <typename AddRows>
void readBands(img::ByteSource& source, std::uint64_t samplesAt, std::int32_t width,
               std::int32_t height, std::vector<std::uint16_t>& band, const AddRows& addRows) {
    const std::size_t rowSamples = static_cast<std::size_t>(width);
    const std::size_t bandRows = std::max<std::size_t>(1, kBandBytes / (2 * rowSamples));
    band.resize(bandRows * rowSamples);
    if (!source.seek(samplesAt))
        cannotRead();
    for (std::int32_t y = 0; y < height;) {
        const std::size_t rows =
            std::min<std::size_t>(bandRows, static_cast<std::size_t>(height - y));
        if (!img::readSamplesLE(source, band.data(), rows * rowSamples))
            cannotRead();
        addRows(band.data(), rows);
        y += static_cast<std::int32_t>(rows);
    }
}

} // namespace

CaptureLoad loadPrepared(const std::string& path, const MosaicPreparation& settings,
                         BayerImage& input, BayerImage& prepared,
                         SampleStatistics* inputStatistics) {
    input.reset();
    int rc = img::kOk;
    std::unique_ptr<img::ByteSource> source(img::openSource(path.c_str(), &rc));
    if (!source)
        cannotRead();
    ImageBuffer* header = nullptr;
    std::uint64_t samplesAt = 0;
    rc = img::rawReadHeaderOnly(*source, &header, &samplesAt);
    ImagePtr raw(header);
    if (rc == img::kWrongFormat) {
        // Other formats, and files of no known type (asked on the console).
        if (!source->seek(0))
            cannotRead();
        ImagePtr whole(img::rawReadSource(*source, img::askOnConsole, nullptr, &rc));
        input.adoptRaw(std::move(whole), rc);
        return CaptureLoad::kWholeImage;
    }
    if (rc != img::kOk || !raw)
        cannotRead(rc);

    const std::int32_t width = raw->width, height = raw->height;
    if (patternSize(raw->cfa[0], raw->cfa[1]) != 2 || raw->samplesPerPixel != 1 ||
        !MosaicStream::accepts(width, height, settings)) {
        rc = img::readDeferredSamples(*source, samplesAt, raw.get());
        if (rc != img::kOk)
            cannotRead(rc);
        input.adoptRaw(std::move(raw));
        return CaptureLoad::kWholeImage;
    }

    MosaicStream stream(width, height, settings);
    const std::size_t rowSamples = static_cast<std::size_t>(width);
    std::vector<std::uint16_t> band;
    if (inputStatistics) {
        // The statistics convert every sample at the depth that the largest
        // sample sets: one pass to find it before the one that measures.
        std::uint16_t largest = 0;
        readBands(*source, samplesAt, width, height, band,
                  [&](const std::uint16_t* rows, std::size_t count) {
                      largest = std::max(largest, img::largestSample(rows, count * rowSamples));
                  });
        stream.measureSamples(fullScale(img::bitsForLargestSample(largest)));
    }
    readBands(*source, samplesAt, width, height, band,
              [&](const std::uint16_t* rows, std::size_t count) {
                  for (std::size_t r = 0; r < count; ++r)
                      stream.addRow(rows + r * rowSamples);
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

} // namespace prep
