#pragma once
// What the calibration report shows about one run. The pipeline fills it as
// its stages go; the report is written at the end, also after a failure, and
// then shows what failed and everything computed before.

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "lsc/shading_sample.h"

namespace report {

// Per-channel block means of a Bayer image, row-major, blocks x blocks.
struct ChannelBlockMeans {
    int columns = 0;
    int rows = 0;
    std::vector<float> mean[lsc::kChannels];
};

struct RunReport {
    // Verdict: empty failure text means the run passed.
    bool finished = false;             // the run reached "Completed."
    std::string failedStage;           // what the run was doing when it failed
    std::string failureMessage;        // the error lines as printed ("ERROR: ...")
    int exitStatus = 0;                // of a failed run
    bool xtest = false;                // the register file holds the X-test surface
    std::vector<std::string> warnings; // the "WARNING: " lines, without that prefix

    // The run
    std::string toolVersion; // "3.8.1"
    std::string commandLine; // arguments after the program name
    std::vector<std::pair<std::string, std::string>> changedSettings; // key, value

    // The input files named on the command line (option, path), in order
    std::vector<std::pair<std::string, std::string>> inputFiles;
    // The outputs this run finished writing (option, path), in order
    std::vector<std::pair<std::string, std::string>> outputs;

    // The input
    bool haveInput = false;
    std::string inputPath;
    std::string serialNumber;
    int framesAveraged = 1;
    std::int32_t width = 0, height = 0;
    std::string bayerOrder; // "RGGB", ...
    int bitDepth = 0;
    float exposureTime = 0.0f;
    float gains[lsc::kChannels] = {0, 0, 0, 0};

    // The prepared image: shading before correction, relative to each channel's peak
    bool havePrepared = false;
    std::int32_t preparedWidth = 0, preparedHeight = 0;
    ChannelBlockMeans shadingBefore;

    // The fit
    bool haveFit = false;
    double fractions[4] = {0.25, 0.5, 0.25, 0.5}; // left, centre, top, middle
    float controlGrids[lsc::kChannels][lsc::kGridPoints] = {};
    std::vector<std::pair<std::uint32_t, std::uint32_t>> samplePoints; // prepared-image pixels
    float targetLevels[lsc::kChannels] = {0, 0, 0, 0};
    bool haveFitError = false;
    float deviationMax[lsc::kChannels] = {0, 0, 0, 0};
    float deviationRms[lsc::kChannels] = {0, 0, 0, 0};
    float maxRmsBound = 0.0f, maxErrorBound = 0.0f, maxGain = 0.0f;

    // After the correction and white balance
    bool haveResidual = false;
    ChannelBlockMeans residualAfter; // relative deviation from each channel's mean
    bool haveWhiteBalance = false;
    float measuredRatios[2] = {0, 0};  // R/G, B/G before correction (target levels)
    float flattenedRatios[2] = {0, 0}; // R/G, B/G after white balance

    // Luminance residual of the white-balanced image over the delta-ab grid
    bool haveLuma = false;
    float lumaResidual = 0.0f; // fraction
    float lumaBound = 0.0f;    // per cent; 0: no bound

    // Delta ab, when the stage ran
    bool haveDelta = false;
    int deltaColumns = 0, deltaRows = 0;
    std::vector<float> delta;
    float threshold = 0.0f, maxDelta = 0.0f, meanChroma = 0.0f, deltaStdDev = 0.0f;

    // How "Exposure time = " and "Sensor gain = " were printed: in debug mode
    // the input statistics come first and leave the messages in fixed notation.
    bool inspectionInFixedNotation = false;
};

} // namespace report
