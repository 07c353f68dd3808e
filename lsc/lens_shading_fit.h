#pragma once
// Fits the lens-shading correction: per channel a target surface, gains at the
// sample points and a 3 x 3 patch surface through them.

#include <iosfwd>

#include "image/bayer_image.h"
#include "lsc/fit_result.h"
#include "lsc/shading_sample.h"
#include "lsc/shading_settings.h"

namespace lsc {

// The image the samples were measured on, which the deviation check
// (sample_deviation.h) reads again: the levelled image they were taken from,
// or, for samples read from a file (they may come from another capture), the
// prepared image with the black level still in.
struct SampleOrigin {
    const img::BayerImage& image;
    bool fromImage;
};

// Turns the samples into gains, fits one patch surface per channel and
// returns the correction (with settings.layout) only when all four channels
// succeeded and passed the checks. Progress lines go to `messages` unless
// quiet; with settings.logFitError each channel's fit deviation follows its
// "Fitting surface" line (see deviationLine).
// Checks, in this order (std::runtime_error, see fit_checks.h): a gain the fit
// uses above settings.maxGain (before fitting); after all four fits, an RMS
// deviation above settings.maxRmsError, then a largest deviation above
// settings.maxError (`deviations` is set before these, so it holds them also
// when a bound ends the run); a fitted control point above settings.maxGain.
// Also throws std::runtime_error for a patch geometry that leaves a patch
// without pixels and for zero, negative or non-finite gains; apan::exception
// 220 when there are fewer samples than control points, 230/231 from the
// solvers.
FitResult fitLensShading(const SampleSet& samples, const SampleOrigin& origin,
                         const ShadingSettings& settings, std::ostream& messages,
                         FitDeviations& deviations);

// The automatic layout's trial fit: `channel` alone, quietly, without the
// deviation check (which does not depend on the layout); every grid of the
// result is that channel's. Throws as fitLensShading.
FitResult fitTrialChannel(const SampleSet& samples, const img::BayerImage& levelled,
                          const ShadingSettings& settings, int channel);

} // namespace lsc
