#include "report/stage_records.h"

#include <algorithm>

#include "report/report_data.h"

namespace report {

using img::BayerImage;
using img::cfaPatternName;

using lsc::FitDeviations;
using lsc::kChannels;
using lsc::kGridPoints;
using lsc::PatchLayout;
using lsc::SampleSet;
using lsc::ShadingCorrection;
using lsc::shadingSample;
using lsc::ShadingSettings;

namespace {

// The report's block grid: 16 blocks along the longer side, about square.
ChannelBlockMeans reportBlockMeans(const BayerImage& image) {
    const BlockGrid grid = blockGridFor(image.width(), image.height(), 16);
    return blockMeans(image, grid.columns, grid.rows);
}

} // namespace

void recordInput(RunReport& report, const BayerImage& input, const std::string& path, int depth,
                 int frames, bool fixedNotation) {
    report.haveInput = true;
    report.inputPath = path;
    report.width = input.width();
    report.height = input.height();
    report.bayerOrder = cfaPatternName(input.cfa());
    report.bitDepth = depth;
    report.exposureTime = input.exposureTime();
    report.framesAveraged = frames;
    report.serialNumber = input.serialNumber(32);
    report.inspectionInFixedNotation = fixedNotation;
    for (int channel = 0; channel < kChannels; ++channel)
        report.gains[channel] = input.channelGain(channel);
}

void recordPrepared(RunReport& report, const BayerImage& prepared, float blackLevel, bool shading) {
    report.havePrepared = true;
    report.preparedWidth = prepared.width();
    report.preparedHeight = prepared.height();
    if (shading) {
        report.shadingBefore = reportBlockMeans(prepared);
        scaleToPeak(report.shadingBefore, blackLevel);
    }
}

void recordSamples(RunReport& report, const SampleSet& samples) {
    report.samplePoints.clear();
    for (const shadingSample& sample : samples.samples)
        report.samplePoints.emplace_back(sample.x, sample.y);
}

void recordFit(RunReport& report, const ShadingCorrection& correction,
               const float (&targetLevels)[kChannels]) {
    report.haveFit = true;
    const PatchLayout& layout = correction.layout;
    report.fractions[0] = layout.left;
    report.fractions[1] = layout.center;
    report.fractions[2] = layout.top;
    report.fractions[3] = layout.middle;
    std::copy(&correction.controlGrids[0][0],
              &correction.controlGrids[0][0] + kChannels * kGridPoints, &report.controlGrids[0][0]);
    std::copy(targetLevels, targetLevels + kChannels, report.targetLevels);
}

void recordDeviations(RunReport& report, const FitDeviations& deviations,
                      const ShadingSettings& settings) {
    report.maxRmsBound = settings.maxRmsError;
    report.maxErrorBound = settings.maxError;
    report.maxGain = settings.maxGain;
    report.haveFitError = deviations.measured;
    std::copy(deviations.max, deviations.max + kChannels, report.deviationMax);
    std::copy(deviations.rms, deviations.rms + kChannels, report.deviationRms);
}

void recordMeasuredRatios(RunReport& report, float red, float blue) {
    report.measuredRatios[0] = red;
    report.measuredRatios[1] = blue;
}

void recordWhiteBalance(RunReport& report, float red, float blue, const BayerImage& balanced,
                        bool residual) {
    report.haveWhiteBalance = true;
    report.flattenedRatios[0] = red;
    report.flattenedRatios[1] = blue;
    if (residual) {
        report.haveResidual = true;
        report.residualAfter = reportBlockMeans(balanced);
        deviationFromMean(report.residualAfter);
    }
}

void recordLuminance(RunReport& report, std::optional<float> residual, float boundPercent) {
    report.haveLuma = residual.has_value();
    report.lumaResidual = residual.value_or(-1.0f);
    report.lumaBound = boundPercent;
}

void recordDeltaAb(RunReport& report, const prep::DeltaAbResult& delta, float threshold) {
    report.haveDelta = true;
    report.deltaColumns = delta.columns;
    report.deltaRows = delta.rows;
    report.delta = delta.deltaImage;
    report.threshold = threshold;
    report.maxDelta = delta.maxDelta;
    report.meanChroma = delta.meanChroma;
    report.deltaStdDev = delta.deltaStdDev;
}

} // namespace report
