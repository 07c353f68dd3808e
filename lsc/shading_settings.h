#pragma once
// What the configuration says about sampling, fitting, correcting and
// evaluating one run: read once (config/fit_settings.h), then handed to each
// stage as a constant.

#include "lsc/shading_sample.h"

namespace lsc {

// Patch breakpoints as fractions of the image's width and height.
struct PatchLayout {
    double left = 0.25, center = 0.5; // of the width
    double top = 0.25, middle = 0.5;  // of the height
};

struct ShadingSettings {
    PatchLayout layout;           // lsc.*PatchFactor or the patch sizes in pixels
    bool autoPatchLayout = false; // lsc.patch_layout = auto: the run picks the layout

    // Samples
    float blackLevel = 0.0f;    // proc.black_level, fraction of full scale
    int sampleAngleStep = 1;    // lsc.sampling_factor, degrees
    int sampleMargin = 0;       // lsc.sampling_margin, per mille of the width
    int sampleWindow = 1;       // lsc.sample_window: Bayer blocks per side of a sample's median
    int awbFilterSize = 100;    // lsc.awb_avg_filter_size
    int procSamplingFactor = 1; // shared.proc_sampling_factor

    // Fit
    bool greenBalance = false;    // lsc.green_balance
    float falloff = 0.0f;         // lsc.falloff_factor / 100
    bool averageChannels = false; // lsc.avg_luma
    float maxGain = 6.0f;         // lsc.max_gain: ceiling of gain samples and control points
    float maxRmsError = 0.2f;     // lsc.max_rms_err: bound of each channel's RMS fit deviation
    float maxError = 0.2f;        // lsc.max_err: bound of each channel's largest fit deviation
    bool logFitError = false;     // lsc.log_err_flag: print the fit deviation of each channel
    bool quiet = false;           // --quiet: no progress lines from the fit

    // Correction and evaluation
    unsigned applyStep = 1;       // apply_lsc.sampling_factor
    float maxDeltaAb = 10.0f;     // apply_lsc.max_delta_ab
    float maxLumaResidual = 0.0f; // apply_lsc.max_luma_residual, per cent; 0: no bound
    float lumaNormalizeFactor = 0.75f;
    int deltaAbBlocks[2] = {0, 0}; // horizontal, vertical
    float ccm[3][3] = {{1, 0, 0}, {0, 1, 0}, {0, 0, 1}};
};

} // namespace lsc
