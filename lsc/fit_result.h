#pragma once
// What the surface fit gives: the correction the register file, the binary
// data and the corrected images are made from, and how well it fits.

#include "lsc/shading_sample.h"
#include "lsc/shading_settings.h"

namespace lsc {

// Everything the correction of an image needs besides the black level.
struct ShadingCorrection {
    PatchLayout layout;
    float controlGrids[kChannels][kGridPoints] = {};
};

struct FitResult {
    ShadingCorrection correction;
    // The samples' target levels, the greens made equal under lsc.green_balance.
    float targetLevels[kChannels] = {0, 0, 0, 0};
};

// How far each channel's fitted surface lies from its gain samples, in gain
// units; measured once all four channels are fitted, also when a bound then
// ends the run.
struct FitDeviations {
    bool measured = false;
    float max[kChannels] = {0, 0, 0, 0};
    float rms[kChannels] = {0, 0, 0, 0};
};

} // namespace lsc
