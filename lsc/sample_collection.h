#pragma once
// Collects the sample points of the flat field that the surface fit works on.

#include <iosfwd>

#include "lsc/processing_context.h"

// Removes the black level from the working image (in place, clamped to 0..1),
// takes 2x2 Bayer samples on a sine-spaced grid (densest at the borders) and
// along the patch borders (with context.sampleWindow above 1, each value is
// the channel's median over that many blocks per side around the sample's
// block, see windowMedians), stores them in context.samples, computes
// context.targetLevels and, unless quiet, prints the sample count on
// `messages`. Samples whose 2x2 block would leave the image or the margin are
// not taken. Throws std::runtime_error for a missing or non-float image and
// for settings the sampling cannot use (angle step below 1, negative margin,
// preparation sampling factor below 1, a sample window that is even or
// outside 1..15).
void collectSamples(ProcessingContext& context, std::ostream& messages);
