#pragma once
// Headerless raw input: a bare dump of little-endian 16-bit samples, described
// by a small text "details" file (size, bit depth, Bayer order, capture data).

#include <cstdint>
#include <string>

#include "image/bayer_image.h"
#include "image/mosaic_rows.h"
#include "prep/image_checks.h"
#include "prep/mosaic_preparation.h"

namespace driver {

struct HeaderlessRawDetails {
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint16_t bits = 0;
    std::uint32_t cfa = 0;
    float exposureTime = 100.0f;
    float gain = 1.0f;
    std::string sensorGuid;
    std::string serialNumber;
};

// Reads and checks the details text. `defaultBits` is used when the file
// gives no image.bit_res. Throws apan::exception (262, 263) or a standard
// error with a clear message for anything it cannot accept.
HeaderlessRawDetails parseHeaderlessDetails(std::istream& text, std::uint16_t defaultBits);

// Loads the raw file described by the details file into `target`.
// `fixedHeader` selects the raw header the image carries (and so the format
// in which it is later stored). With `preparation` and `prepared`, the rows
// go straight into the preparation when it accepts the size: `target` then
// holds the capture data only, `prepared` the prepared mosaic, and the result
// is true; `inputStatistics`, if given, then receives the statistics of the
// input samples, and `rows`, if given, every row of the streamed samples. Throws apan::exception
// 202, 210, 262, 263, 264.
bool loadHeaderlessRaw(img::BayerImage& target, const std::string& rawPath,
                       std::uint16_t defaultBits, const std::string& detailsPath, bool fixedHeader,
                       const prep::MosaicPreparation* preparation = nullptr,
                       img::BayerImage* prepared = nullptr,
                       prep::SampleStatistics* inputStatistics = nullptr,
                       img::MosaicRowSink* rows = nullptr);

} // namespace driver
