#pragma once
// The level each channel of a flat field should be brought to: the brightest
// local mean of the channel's half-resolution plane.

#include "lsc/working_image.h"

namespace lsc {

// For each channel (channel order) the largest box mean of odd size
// windowSize over the channel's (W div 2) x (H div 2) plane. The window is
// clipped at the plane borders (mean over the pixels inside). A window size
// below 1 means 1. Channels of an empty plane get 0.
void targetLevelsOf(const WorkingImage& image, int windowSize, float levels[4]);

} // namespace lsc
