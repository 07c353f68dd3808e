#pragma once
// Applies the fitted correction to the working Bayer image.

#include "lsc/processing_context.h"

// Writes gain x (pixel - black level) for every pixel of every
// applyStep-th 2x2 block of context.image into a new REAL32 Bayer image in
// context.corrected, of (W div applyStep) x (H div applyStep) rounded down
// to even, with the input's cfa and bit depth. Gains come from
// context.controlGrids, patch geometry from the context's fractions.
// Throws std::runtime_error for a missing or non-float image, an applyStep
// below 1, an image smaller than 2 x applyStep in either direction, a patch
// geometry that leaves a patch without pixels, and when the output image
// cannot be allocated ("Unable to allocate image memory.", context.corrected
// left empty).
void applyLensShading(ProcessingContext& context);
