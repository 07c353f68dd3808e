#pragma once
// Automatic patch layout (lsc.patch_layout = auto): where the shading falls
// steeply towards the corners, the default patch borders leave the 10 x 10
// surface short of control points where it needs them, and no fit through
// those borders does better. This tries a few layouts and keeps the one whose
// correction leaves the prepared image flattest; no ground truth is needed.

#include <vector>

#include "image/bayer_image.h"
#include "lsc/shading_settings.h"

namespace lsc {

// The configured layout first, then the symmetric layouts
// whose outer patches take 0.2, 0.3, 0.35 and 0.4 of each side, leaving out
// repeats of the configured one and any that leaves a patch without pixels on
// a width x height image.
std::vector<PatchLayout> candidateLayouts(const PatchLayout& configured, std::uint32_t width,
                                          std::uint32_t height);

// How far the corrected image is from flat: the largest |16 x 16-pixel block
// mean / channel mean - 1| of `channel` (blocks wholly inside the image), or
// over the four channels for -1. Blocks that large keep the noise of one
// capture small against what the layouts change.
double correctedFlatness(const img::BayerImage& corrected, int channel = -1);

struct LayoutChoice {
    PatchLayout layout;
    std::size_t index = 0;        // in candidateLayouts; 0: the configured one
    std::size_t candidates = 0;   // how many were tried
    std::vector<double> flatness; // per candidate; negative when its fit failed
};

// Collects the samples (at half the grid's density along each axis), fits
// and corrects the prepared image (black level included, as the run holds
// it) with each candidate, using the fit settings of `settings` quietly but
// for green/red alone, and picks the one that leaves green/red flattest; a candidate whose fit
// fails is skipped, and when all fail the configured layout stays (the run's own fit then reports
// why). The first of equally flat candidates wins.
LayoutChoice chooseLayout(const img::BayerImage& prepared, const ShadingSettings& settings);

} // namespace lsc
