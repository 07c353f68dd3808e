#pragma once
// Loading a flat-field capture and preparing it in one pass over its
// samples: the rows go from the file straight into the preparation
// (prep/mosaic_stream.h), so no full-resolution image is made. Used unless
// something needs the input image itself (its exports, its statistics, the
// identity test).

#include <string>
#include <vector>

#include "image/bayer_image.h"
#include "image/mosaic_rows.h"
#include "prep/image_checks.h"
#include "prep/mosaic_preparation.h"

namespace prep {

enum class CaptureLoad {
    kPrepared,   // `input` holds the capture's header only, `prepared` the result
    kWholeImage, // `input` holds the whole image; the caller prepares it
    kNotRead,    // (several frames) nothing was kept: the caller loads them whole
};

// Reads the raw file at `path`. A KQRAW fixed-header file or KQRAW2 container
// of a single-channel 2 x 2 Bayer mosaic is prepared as it is read; any other
// file (other formats, patterns or sizes the preparation refuses) is loaded
// whole, as BayerImage::read does. Failures throw as BayerImage::read does
// ("Cannot read kqraw image." and the allocation message). With
// `inputStatistics`, a prepared capture's samples are also measured there as
// sampleStatistics would measure the whole image (the samples are then read
// twice: the depth that converts them is known after the last one).
// `rows`, if given, also receives every row of a prepared capture.
[[nodiscard]] CaptureLoad loadPrepared(const std::string& path, const MosaicPreparation& settings,
                                       img::BayerImage& input, img::BayerImage& prepared,
                                       SampleStatistics* inputStatistics = nullptr,
                                       img::MosaicRowSink* rows = nullptr);

// The same for several frames of one flat field, averaged band by band as
// they are read (one band of each frame in memory, prep::averageSample per
// sample), when every frame is a container or fixed-header file the
// preparation takes as a stream; `input` then holds the first frame's header.
// Otherwise kNotRead (nothing kept). Throws prep::throwFrameMismatch's error
// for a frame that differs from the first in size, Bayer order or bit depth
// (the depth that each frame's largest sample sets), and as loadPrepared for
// a frame that cannot be read.
[[nodiscard]] CaptureLoad loadAveragedPrepared(const std::vector<std::string>& paths,
                                               const MosaicPreparation& settings,
                                               img::BayerImage& input, img::BayerImage& prepared,
                                               img::MosaicRowSink* rows = nullptr);

} // namespace prep
