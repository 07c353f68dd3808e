#pragma once
// How far the flat field at the sample points departs from a lens shading,
// measured on noise-robust gains so that sensor noise and the curvature of a
// strong shading do not count, while a blotch, a dead cluster or a defect on
// a sample does. These are the figures the fit-deviation bounds
// (lsc.max_err, lsc.max_rms_err) judge.

#include <vector>

#include "lsc/fit_checks.h"
#include "lsc/shading_sample.h"
#include "lsc/working_image.h"

namespace lsc {

// Side, in Bayer blocks, of the median window of the robust gains: at least
// this, or the run's own sample window when that is larger.
inline constexpr int kCheckWindow = 5;

// For each sample inside the image (holding measured values, before they
// become gains) and each channel, the larger of two figures, both in the
// logarithm of the level (so about relative: 0.1 is 10 %):
// - outlier: |ln(v / m)|, m the median of the channel over the check window
//   around the sample and v the sample's own value (what the fit will use);
// - bend: the second difference of ln m at the sample and two points spaced
//   d along x (and, separately, along y; the larger counts): on either side
//   of the sample, or both beyond it on the side that has room at the image
//   border (an axis too short for three points is skipped). The positions
//   are where the median windows are centred once clipped at the border, and
//   the difference is taken for that unequal spacing. d is 3 % of the image
//   width, and at least a window width so that the neighbours' windows stay
//   off the sample's.
// The logarithm of a lens shading is smooth and nearly straight towards the
// borders, so it bends by a per cent or two between points that close; a
// blotch of 15 % on the sample bends it by about 0.3, a defect or a blotch
// that the sample sees and its window does not shows as an outlier.
// Samples read from a file may come from another capture: then only the
// bend counts, and the image, which still holds the black level, has
// `blackLevel` taken off its medians (with samples from the image, pass 0).
// max and rms are over the samples; a level that is not positive gives
// infinity.
void measureSampleDeviations(const WorkingImage& image, const std::vector<shadingSample>& samples,
                             int sampleWindow, bool samplesFromImage, float blackLevel,
                             FitDeviation deviations[kChannels]);

} // namespace lsc
