#pragma once
// Several frames of one flat field (--input given up to 16 times), averaged
// before preparation: sensor noise falls by the square root of their number.

#include "image/bayer_image.h"

#include <functional>
#include <string>
#include <vector>

// Reads `paths[0]` into `image` with `read`, then every further frame, and
// leaves their average in `image` (the first frame's capture data kept). The
// sum is held in double precision, so N copies of one frame average to that
// frame exactly. Throws std::runtime_error naming the frame when a frame
// differs from the first in size, Bayer order or bit depth (the samples are
// fractions of the frame's own full scale, so frames of two depths do not add
// up, whatever shared.bit_res says).
void readAveragedFrames(BayerImage& image, const std::vector<std::string>& paths,
                        const std::function<void(BayerImage&, const std::string&)>& read);
