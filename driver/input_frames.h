#pragma once
// Several frames of one flat field (--input given up to 16 times), averaged
// before preparation: sensor noise falls by the square root of their number.
// This is the whole-image way, for captures the preparation cannot take as a
// stream (prep/capture_stream.h averages those band by band).

#include <functional>
#include <string>
#include <vector>

#include "image/bayer_image.h"
#include "image/mosaic_rows.h"

namespace driver {

// Reads `paths[0]` into `image` with `read`, then every further frame, and
// leaves their average in `image` (the first frame's capture data kept), in
// whole sample units as prep::averageSample makes it, so the result is the
// streaming average's. One frame at a time is held beside a sum of 32-bit
// integers. Throws std::runtime_error naming the frame when a frame differs
// from the first in size, Bayer order or bit depth (prep::frameDifference).
void readAveragedFrames(img::BayerImage& image, const std::vector<std::string>& paths,
                        const std::function<void(img::BayerImage&, const std::string&)>& read);

// Hands the rows of a whole image to `sink` as whole samples of its depth.
void feedRows(const img::BayerImage& image, img::MosaicRowSink& sink);

} // namespace driver
