#pragma once
// The report's record of a run, filled from each stage's result as the run
// goes: what the calibration report and the run result show.

#include <optional>
#include <string>

#include "image/bayer_image.h"
#include "lsc/fit_result.h"
#include "lsc/shading_sample.h"
#include "lsc/shading_settings.h"
#include "prep/delta_ab.h"
#include "report/run_report.h"

namespace report {

// The input image as the run reads it: `depth` is the run's bit depth,
// `frames` the number averaged; with `fixedNotation` the inspection lines
// were printed after the debug statistics.
void recordInput(RunReport& report, const img::BayerImage& input, const std::string& path,
                 int depth, int frames, bool fixedNotation);

// The prepared image; with `shading`, also its block means relative to each
// channel's peak, the black level taken out (the report's shading map).
void recordPrepared(RunReport& report, const img::BayerImage& prepared, float blackLevel,
                    bool shading);

// The sample points the fit used, in prepared-image pixels.
void recordSamples(RunReport& report, const lsc::SampleSet& samples);

// A correction the run holds: the fit's, or the one the binary data stored.
void recordFit(RunReport& report, const lsc::ShadingCorrection& correction,
               const float (&targetLevels)[lsc::kChannels]);

// The fit's deviations and the bounds they were judged by; also for a fit a
// bound ended.
void recordDeviations(RunReport& report, const lsc::FitDeviations& deviations,
                      const lsc::ShadingSettings& settings);

// R/G and B/G of the target levels.
void recordMeasuredRatios(RunReport& report, float red, float blue);

// R/G and B/G after the white balance; with `residual`, the balanced image's
// block means as deviations from each channel's mean.
void recordWhiteBalance(RunReport& report, float red, float blue, const img::BayerImage& balanced,
                        bool residual);

void recordLuminance(RunReport& report, std::optional<float> residual, float boundPercent);

void recordDeltaAb(RunReport& report, const prep::DeltaAbResult& delta, float threshold);

} // namespace report
