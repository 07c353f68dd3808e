#pragma once
// The delta ab files and the acceptance threshold.

#include <string>

#include "lsc/processing_context.h"

namespace prep {

// The delta file: one line per block row, every value with five decimals
// followed by ",", and an empty line at the end.
std::string formatDeltaFile(const ProcessingContext& context);
// "meanChroma, maxDelta, deltaStdDev" with six significant digits, and a line feed.
std::string formatStatsFile(const ProcessingContext& context);

// Both written through OutputFile. A file that cannot be created throws the
// std::string "Cannot open file : " + path; a failed write throws
// "Cannot write file : " + path, also as a std::string.
void writeDeltaFile(const std::string& path, const ProcessingContext& context);
void writeStatsFile(const std::string& path, const ProcessingContext& context);

// Throws std::range_error when maxDelta is above the threshold (or not a
// number); a value equal to the threshold passes.
void checkDeltaThreshold(float maxDelta, float threshold);

} // namespace prep
