#pragma once
// Everything the fit, the correction and the evaluation share for one run:
// the working image, the settings copied out of the configuration, the
// samples and the fitted control grids. Owned by the run driver.

#include <cstdint>
#include <vector>

#include "image/bayer_image.h"

inline constexpr int kChannels = 4;     // red, green/red, green/blue, blue
inline constexpr int kGridPoints = 100; // 10 x 10 control points per channel

// Display names of the four channels, in channel order.
inline constexpr const char* kChannelNames[kChannels] = {"red", "green/red", "green/blue", "blue"};

// One sample point of the flat field: even pixel coordinates of a 2x2 Bayer
// block and one value per channel (measured levels, later the gains).
struct shadingSample {
    std::uint32_t x;
    std::uint32_t y;
    float value[kChannels];
};

struct ProcessingContext {
    // Images
    BayerImage image;     // working (prepared) Bayer image, samples in 0..1
    BayerImage corrected; // the flattened image the correction leaves here

    // Fit settings (defaults are those in force before the configuration is copied in)
    bool greenBalance = false;
    float blackLevel = 0.0f; // fraction of full scale
    int sampleAngleStep = 1; // lsc.sampling_factor, degrees
    int sampleMargin = 0;    // lsc.sampling_margin, per mille of the width
    float falloff = 0.0f;    // lsc.falloff_factor / 100
    double leftFraction = 0.25, centerFraction = 0.5;
    double topFraction = 0.25, middleFraction = 0.5;
    bool averageChannels = false; // lsc.avg_luma
    bool quiet = false;
    int awbFilterSize = 100;  // lsc.awb_avg_filter_size
    int sampleWindow = 1;     // lsc.sample_window: Bayer blocks per side of a sample's median
    float maxGain = 6.0f;     // lsc.max_gain: ceiling of gain samples and control points
    float maxRmsError = 0.2f; // lsc.max_rms_err: bound of each channel's RMS fit deviation
    float maxError = 0.2f;    // lsc.max_err: bound of each channel's largest fit deviation
    bool logFitError = false; // lsc.log_err_flag: print the fit deviation of each channel
    // The automatic layout's trial fits: 0..3 fits that channel alone (the
    // other grids get copies of it) and skips the sample deviation check,
    // which does not depend on the layout; -1 (the run's fit): everything.
    int trialChannel = -1;

    // Preparation and evaluation settings
    int procSamplingFactor = 1; // shared.proc_sampling_factor
    unsigned applyStep = 1;     // apply_lsc.sampling_factor
    float maxDeltaAb = 10.0f;
    float maxLumaResidual = 0.0f; // apply_lsc.max_luma_residual, per cent; 0: no bound
    bool autoPatchLayout = false; // lsc.patch_layout = auto: the fit picks the patch factors
    float lumaNormalizeFactor = 0.75f;
    int deltaAbBlocks[2] = {0, 0}; // horizontal, vertical
    float ccm[3][3] = {{1, 0, 0}, {0, 1, 0}, {0, 0, 1}};

    // Fit results
    float targetLevels[kChannels] = {0, 0, 0, 0};
    std::vector<shadingSample> samples;
    // True when collectSamples took the samples from the working image (and
    // took the black level out of it); false for samples read from a file.
    bool samplesFromImage = false;
    float controlGrids[kChannels][kGridPoints] = {};
    // How far each channel's fitted surface lies from its gain samples, in
    // gain units; set once all four channels are fitted, also when a bound
    // then ends the run.
    bool fitDeviationMeasured = false;
    float fitDeviationMax[kChannels] = {0, 0, 0, 0};
    float fitDeviationRms[kChannels] = {0, 0, 0, 0};
    float whiteBalance[kChannels] = {0, 0, 0, 0}; // read back from calibration data

    // Evaluation results
    std::vector<float> deltaImage; // deltaAbBlocks[0] x deltaAbBlocks[1], row-major
    float meanChroma = 0.0f;
    float maxDelta = 0.0f;
    float deltaStdDev = 0.0f;
    float lumaResidual = -1.0f; // fraction; negative: not measured
};
