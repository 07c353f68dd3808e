#pragma once
// Fits the lens-shading correction: per channel a target surface, gains at the
// sample points and a 3 x 3 patch surface through them.

#include <iosfwd>

#include "lsc/processing_context.h"

// Needs the samples and target levels of collectSamples (or samples read
// from a file). Turns the samples into gains (in place), fits one patch
// surface per channel and writes the result to context.controlGrids only when
// all four channels succeeded and passed the checks. Progress lines go to
// `messages` unless quiet; with context.logFitError each channel's fit
// deviation follows its "Fitting surface" line (see deviationLine).
// Checks, in this order (std::runtime_error, see fit_checks.h): a gain the fit
// uses above context.maxGain (before fitting); after all four fits, an RMS
// deviation above context.maxRmsError, then a largest deviation above
// context.maxError (the deviations stay in the context); a fitted control
// point above context.maxGain.
// Also throws std::runtime_error for a patch geometry that leaves a patch
// without pixels and for zero, negative or non-finite gains; apan::exception
// 220 when there are fewer samples than control points, 230/231 from the
// solvers.
void fitLensShading(ProcessingContext& context, std::ostream& messages);
