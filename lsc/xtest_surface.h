#pragma once
// The X test: a fixed correction that paints an X-shaped colour distortion,
// so an operator can check that the register path reaches the hardware.

#include "lsc/fit_result.h"

namespace lsc {

// Overwrites the control grids with the fixed X-test grids: red and blue
// identical, the two greens identical, red + green = 1 at every point, and
// large alternating values only in the 2x2 groups on the diagonals next to
// the corners.
void applyXTestSurface(ShadingCorrection& correction);

} // namespace lsc
