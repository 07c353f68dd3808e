#pragma once
// What the driver takes from the command line and the configuration once,
// before the run starts.

#include <string>

#include "config/config_node.h"
#include "driver/command_line.h"

namespace driver {

struct RunSettings {
    // File options (empty: not given)
    std::string input, inputAsJpeg, inputAsBmp, raw, translate, preproc, log, autofocus, calibrate,
        samples, outSamples, flat, jpeg, bmp, delta, stats, binary;
    // Flags
    bool quiet = false, xtest = false, noDelta = false, debug = false;
    // Configuration
    bool medianFilter = true;
    int medianFilterSize = 3;
    int procSamplingFactor = 4;
    std::string sensorGuid;
    float minPixel = 0, maxPixel = 0, peakPixelMin = 0;
    int jpegQuality = 75;
    bool blockNumFlag = false;
    int blockNum = 0;
    std::string blockName;
    int avgLuma = 0;
    int bitRes = 0;
    // ".ctrlPoints[<block_num>]" with shared.block_num_flag, else empty.
    std::string controlPointInfix;
};

RunSettings readRunSettings(const CommandLine& line, const config::config_node& config);

} // namespace driver
